// Outputs, and when they get their names.
#include "tools/files/output_file.h"

#include <gtest/gtest.h>

#include "tests/tools/temporary_directory.h"
#include "tools/base/temporary_files.h"

namespace {

using namespace tool;
using tooltest::TemporaryDirectory;

TEST(OutputFile, AHardEndRemovesWhatIsTemporary) {
  const TemporaryDirectory directory;
  const auto open = OutputFile::create(directory.file("a"));
  const auto done = OutputFile::create(directory.file("b"));
  EXPECT_FALSE(done.value()->commit());
  removeTemporaryFiles();
  EXPECT_EQ(directory.names(), std::vector<std::string>{"b"});
}

}  // namespace
