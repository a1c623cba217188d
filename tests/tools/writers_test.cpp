// Outputs: what is in them, and when they get their names.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>

#include "tests/tools/temporary_directory.h"
#include "tools/base/temporary_files.h"
#include "tools/files/output_file.h"
#include "tools/files/picture_writer.h"

namespace {

using namespace tool;
using tooltest::contentOf;
using tooltest::TemporaryDirectory;

Picture pictureOf(Size size, uint8_t value) {
  Picture picture;
  picture.resize(size);
  std::fill(picture.bytes.begin(), picture.bytes.end(), value);
  return picture;
}

std::span<const uint8_t> bytesOf(std::string_view text) {
  return {reinterpret_cast<const uint8_t*>(text.data()), text.size()};
}

std::unique_ptr<PictureWriter> writerTo(const std::string& path, const std::string& format = "") {
  auto writer = createPictureWriter(path, format, {{30000, 1001}, "420jpeg", "4:3"});
  if (!writer.ok()) return nullptr;
  return std::move(writer.value());
}

TEST(PictureWriter, ChoosesTheFormatByOptionThenByName) {
  const std::string raw = "aaaaaaaaaaaabbbbbbbbbbbb";
  const std::string y4m =
      "YUV4MPEG2 W4 H2 F30000:1001 Ip A4:3 C420jpeg\nFRAME\naaaaaaaaaaaaFRAME\nbbbbbbbbbbbb";
  const struct {
    const char* name;
    const char* format;
    const std::string& content;
  } cases[] = {{"a.y4m", "", y4m},    {"a.yuv", "", raw}, {"a.i420", "", raw},  {"a", "", y4m},
               {"a.y4m", "raw", raw}, {"yuv", "", y4m},   {"a.yuv", "y4m", y4m}};
  for (const auto& each : cases) {
    const TemporaryDirectory directory;
    const auto writer = writerTo(directory.file(each.name), each.format);
    ASSERT_NE(writer, nullptr);
    EXPECT_FALSE(writer->write(pictureOf({4, 2}, 'a')));
    EXPECT_FALSE(writer->write(pictureOf({4, 2}, 'b')));
    EXPECT_FALSE(writer->finish());
    EXPECT_EQ(contentOf(directory.file(each.name)), each.content) << each.name << " " << each.format;
  }
}

TEST(PictureWriter, RefusesASizeChangeInY4mAndTakesItInRaw) {
  const TemporaryDirectory directory;
  const auto write = [&](const char* name) {
    const auto writer = writerTo(directory.file(name));
    EXPECT_FALSE(writer->write(pictureOf({4, 2}, 'a')));
    const Outcome outcome = writer->write(pictureOf({2, 2}, 'b'));
    return outcome ? outcome : writer->finish();
  };
  const Outcome failed = write("a.y4m");
  ASSERT_TRUE(failed);
  EXPECT_NE(failed->text.find("from 4x2 to 2x2"), std::string::npos) << failed->text;
  EXPECT_FALSE(write("a.yuv"));
  EXPECT_FALSE(writerTo(directory.file("empty.yuv"))->finish());
  EXPECT_EQ(directory.names(), std::vector<std::string>{"a.yuv"});
  EXPECT_EQ(contentOf(directory.file("a.yuv")), "aaaaaaaaaaaabbbbbb");
}

// Through a link, which stays one, and with the mode that the file had.
TEST(OutputFile, HasItsNameOnlyWhenComplete) {
  const TemporaryDirectory directory;
  const std::string path = directory.write("a", "old");
  chmod(path.c_str(), 0640);
  const std::string link = directory.file("link");
  ASSERT_EQ(symlink("a", link.c_str()), 0);
  for (const bool abandoned : {true, false}) {
    const auto file = OutputFile::create(link);
    ASSERT_TRUE(file.ok());
    EXPECT_FALSE(file.value()->write(bytesOf("new")));
    EXPECT_EQ(contentOf(path), "old");
    EXPECT_EQ(directory.names().size(), 3U);
    EXPECT_FALSE(!abandoned && file.value()->commit());
  }
  EXPECT_EQ(contentOf(path), "new");
  EXPECT_TRUE(std::filesystem::is_symlink(link));
  EXPECT_EQ(directory.names().size(), 2U);
  struct stat status {};
  EXPECT_EQ(stat(path.c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 0777, 0640U);
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
