// Inputs that are cut short, hostile or slow; outputs, and when they get their names.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>
#include <thread>

#include "tests/tools/temporary_directory.h"
#include "tools/base/temporary_files.h"
#include "tools/files/frame_source.h"
#include "tools/files/output_file.h"

namespace {

using namespace tool;
using tooltest::TemporaryDirectory;

constexpr size_t kPicture = 4 * 2 * 3 / 2;  // bytes, of 4x2

std::string pictureOf(char value) {
  return std::string(kPicture, value);
}

// Opens a file and reads it up to a failure: the first byte of each picture, and what the failure says.
std::pair<std::string, std::string> readAll(const std::string& path, std::optional<Size> size) {
  auto source = openFrameSource({path, size, {}}, {});
  if (!source.ok()) return {"", source.failure().text};
  std::string pictures;
  for (Picture picture;; pictures += static_cast<char>(picture.bytes.at(0))) {
    const auto more = source.value()->next(picture);
    if (!more.ok()) return {pictures, more.failure().text};
    if (!more.value()) return {pictures, ""};
    EXPECT_EQ(picture.bytes.size(), kPicture);
  }
}

TEST(FrameSource, SaysWhatIsWrongWithAnInput) {
  const TemporaryDirectory directory;
  const std::string head = "YUV4MPEG2 W4 H2 F30:1\n";
  const struct {
    std::string content;
    std::optional<Size> size;
    std::string pictures;  // that could be read before it
    std::string complaint;
  } cases[] = {
      {"", {}, "", "is empty"},
      {"anything", {}, "", "--size"},
      {pictureOf('a') + "bbb", Size{4, 2}, "a", "ends in the middle of picture 1 (3 of 12 bytes)"},
      {head + "FRAME\n" + pictureOf('a'), Size{4, 2}, "", "leave --size out"},
      {head + "FRAME\n" + pictureOf('a') + "FRAME\nbb", {}, "a", "ends in the middle of picture 1"},
      {head + "FRAME\n" + pictureOf('a') + "FRAME\n", {}, "a", "ends where frame 1 should have its picture"},
      {head + "FRAMES\n" + pictureOf('a'), {}, "", "something else where frame 0"},
      {"YUV4MPEG2 " + std::string(5000, 'x'), {}, "", "no end of its Y4M header"},
      {"YUV4MPEG2 W4\n", {}, "", "no picture size"},
      {"YUV4MPEG2 W4 H-2\n", {}, "", "bad header word \"H-2\""},
      {"YUV4MPEG2 W8192 H8194\n", {}, "", "bad header word \"H8194\""},
      {"YUV4MPEG2 W4 H2 C422\n", {}, "", "yuv420p"},
      {"YUV4MPEG2 W5 H2 F30:1\n", {}, "", "5x2 is an odd size"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.content.substr(0, 60));
    const auto [pictures, failure] = readAll(directory.write("in", each.content), each.size);
    EXPECT_EQ(pictures, each.pictures);
    EXPECT_NE(failure.find(each.complaint), std::string::npos) << failure;
    EXPECT_NE(failure.find("/in: "), std::string::npos) << failure;
  }
}

TEST(FrameSource, ReadsAPipeThatComesInDrops) {
  const TemporaryDirectory directory;
  const std::string path = directory.file("pipe");
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  const std::jthread writer([&] {
    std::ofstream pipe(path);
    for (const char byte : "YUV4MPEG2 W4 H2\nFRAME\n" + pictureOf('a') + "FRAME\n" + pictureOf('b'))
      pipe << byte << std::flush;
  });
  EXPECT_EQ(readAll(path, {}), std::pair(std::string("ab"), std::string()));
}

TEST(OutputFile, AHardEndRemovesWhatIsTemporary) {
  const TemporaryDirectory directory;
  const auto open = OutputFile::create(directory.file("a"));
  const auto done = OutputFile::create(directory.file("b"));
  EXPECT_FALSE(done.value()->commit());
  removeTemporaryFiles();
  EXPECT_EQ(directory.names(), std::vector<std::string>{"b"});
}

}  // namespace
