// Outputs: what is in them, and when they get their names.
#include <gtest/gtest.h>
#include <signal.h>
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
  {
    const auto y4m = writerTo(directory.file("a.y4m"));
    EXPECT_FALSE(y4m->write(pictureOf({4, 2}, 'a')));
    const Outcome failed = y4m->write(pictureOf({2, 2}, 'b'));
    ASSERT_TRUE(failed);
    EXPECT_NE(failed->text.find("from 4x2 to 2x2"), std::string::npos) << failed->text;
  }
  const auto raw = writerTo(directory.file("a.yuv"));
  EXPECT_FALSE(raw->write(pictureOf({4, 2}, 'a')));
  EXPECT_FALSE(raw->write(pictureOf({2, 2}, 'b')));
  EXPECT_FALSE(raw->finish());
  EXPECT_EQ(directory.names(), std::vector<std::string>{"a.yuv"});
  EXPECT_EQ(contentOf(directory.file("a.yuv")), "aaaaaaaaaaaabbbbbb");
}

TEST(PictureWriter, LeavesNoFileWithoutAPicture) {
  const TemporaryDirectory directory;
  for (const char* name : {"a.y4m", "a.yuv"}) EXPECT_FALSE(writerTo(directory.file(name))->finish());
  EXPECT_TRUE(directory.names().empty());
}

TEST(OutputFile, HasItsNameOnlyWhenComplete) {
  const TemporaryDirectory directory;
  const std::string path = directory.write("a", "old");
  chmod(path.c_str(), 0640);
  {
    const auto abandoned = OutputFile::create(path);
    ASSERT_TRUE(abandoned.ok());
    EXPECT_FALSE(abandoned.value()->write(bytesOf("new")));
    EXPECT_EQ(contentOf(path), "old");
    EXPECT_EQ(directory.names().size(), 2U);
  }
  EXPECT_EQ(directory.names().size(), 1U);
  EXPECT_EQ(contentOf(path), "old");

  const auto file = OutputFile::create(path);
  EXPECT_FALSE(file.value()->write(bytesOf("new")));
  EXPECT_FALSE(file.value()->commit());
  EXPECT_EQ(contentOf(path), "new");
  EXPECT_EQ(directory.names().size(), 1U);
  struct stat status {};
  EXPECT_EQ(stat(path.c_str(), &status), 0);
  EXPECT_EQ(status.st_mode & 0777, 0640U);
}

TEST(OutputFile, ReplacesWhatALinkPointsTo) {
  const TemporaryDirectory directory;
  const std::string path = directory.write("target", "old");
  ASSERT_EQ(symlink("target", directory.file("link").c_str()), 0);
  const auto file = OutputFile::create(directory.file("link"));
  EXPECT_FALSE(file.value()->write(bytesOf("new")));
  EXPECT_FALSE(file.value()->commit());
  EXPECT_EQ(contentOf(path), "new");
  EXPECT_TRUE(std::filesystem::is_symlink(directory.file("link")));
}

TEST(OutputFile, SaysWhyItCannotBeWritten) {
  const TemporaryDirectory directory;
  for (const std::string& path : {directory.file("missing/a"), directory.file("")}) {
    const auto file = OutputFile::create(path);
    ASSERT_FALSE(file.ok());
    EXPECT_EQ(file.failure().code, ExitCode::Output);
    EXPECT_NE(file.failure().text.find(path), std::string::npos) << file.failure().text;
  }

  const auto full = OutputFile::create("/dev/full");
  ASSERT_TRUE(full.ok());
  const Outcome noSpace = full.value()->write(bytesOf("x"));
  ASSERT_TRUE(noSpace);
  EXPECT_NE(noSpace->text.find("/dev/full: no space left"), std::string::npos) << noSpace->text;

  signal(SIGPIPE, SIG_IGN);
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  close(ends[0]);
  const auto broken = OutputFile::create("/dev/fd/" + std::to_string(ends[1]));
  ASSERT_FALSE(broken.ok() && !broken.value()->write(bytesOf("x")));
  close(ends[1]);
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
