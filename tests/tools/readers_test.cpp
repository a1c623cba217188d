// Inputs: good, cut short, hostile.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <thread>

#include "tests/tools/temporary_directory.h"
#include "tools/files/byte_reader.h"
#include "tools/files/frame_source.h"

namespace {

using namespace tool;
using tooltest::TemporaryDirectory;

constexpr size_t kPicture = 4 * 2 * 3 / 2;  // bytes, of 4x2

std::string pictureOf(char value) {
  return std::string(kPicture, value);
}

// Opens the content as a file and reads it to its end. What was read: the first byte of each picture, and
// what went wrong.
struct ReadAll {
  std::string pictures;
  std::string failure;
  ExitCode code = ExitCode::Done;
  Size size;
  VideoTraits traits;
  std::optional<uint64_t> count;
};

ReadAll readAll(const std::string& content, std::optional<Size> size = {},
                std::optional<FrameRate> rate = {}) {
  const TemporaryDirectory directory;
  ReadAll result;
  const auto note = [&result](const Failure& failure) {
    result.failure = failure.text;
    result.code = failure.code;
  };
  auto source = openFrameSource({directory.write("in", content), size, rate}, {});
  if (!source.ok()) {
    note(source.failure());
    return result;
  }
  result.size = source.value()->size();
  result.traits = source.value()->traits();
  result.count = source.value()->frameCount();
  Picture picture;
  for (;;) {
    const auto more = source.value()->next(picture);
    if (!more.ok()) note(more.failure());
    if (!more.ok() || !more.value()) return result;
    EXPECT_EQ(picture.bytes.size(), kPicture);
    result.pictures += static_cast<char>(picture.bytes[0]);
  }
}

TEST(FrameSource, ReadsPicturesAndWhatTheHeaderSays) {
  const ReadAll read = readAll("YUV4MPEG2 W4 H2 F30000:1001 Ip A4:3 C420paldv XYSCSS=420 \nFRAME\n" +
                               pictureOf('a') + "FRAME Ip XZ\n" + pictureOf('b'));
  EXPECT_EQ(read.pictures, "ab");
  EXPECT_EQ(read.failure, "");
  EXPECT_EQ(read.size, (Size{4, 2}));
  EXPECT_EQ(read.traits.rate, (FrameRate{30000, 1001}));
  EXPECT_EQ(read.traits.chroma, "420paldv");
  EXPECT_EQ(read.traits.pixelAspect, "4:3");

  const ReadAll plain = readAll("YUV4MPEG2 W4 H2 F0:0\nFRAME\n" + pictureOf('a'), {}, FrameRate{15, 1});
  EXPECT_EQ(plain.pictures, "a");
  EXPECT_EQ(plain.traits.rate, (FrameRate{15, 1}));
  EXPECT_EQ(plain.traits.chroma, "420jpeg");
  EXPECT_EQ(plain.count, 1U);

  const ReadAll raw = readAll(pictureOf('a') + pictureOf('b'), Size{4, 2});
  EXPECT_EQ(raw.pictures, "ab");
  EXPECT_EQ(raw.count, 2U);
}

TEST(FrameSource, SaysWhatIsWrongWithAnInput) {
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
      {head + "FRAME\n" + pictureOf('a') + "FRA", {}, "a", "something else where frame 1"},
      {head + "FRAMES\n" + pictureOf('a'), {}, "", "something else where frame 0"},
      {head + std::string(5000, 'x'), {}, "", "something else where frame 0"},
      {"YUV4MPEG2 " + std::string(5000, 'x'), {}, "", "no end of its Y4M header"},
      {"YUV4MPEG2 W4\n", {}, "", "no picture size"},
      {"YUV4MPEG2 W4 H-2\n", {}, "", "bad header word \"H-2\""},
      {"YUV4MPEG2 W4 H99999999999\n", {}, "", "bad header word"},
      {"YUV4MPEG2 W8192 H8194\n", {}, "", "bad header word \"H8194\""},
      {"YUV4MPEG2 W H2\n", {}, "", "bad header word \"W\""},
      {"YUV4MPEG2 W4 H2 F30:0\n", {}, "", "bad header word \"F30:0\""},
      {"YUV4MPEG2 W4 H2 C422\n", {}, "", "yuv420p"},
      {"YUV4MPEG2 W5 H2 F30:1\n", {}, "", "5x2 is an odd size"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.content.substr(0, 60));
    const ReadAll read = readAll(each.content, each.size);
    EXPECT_EQ(read.pictures, each.pictures);
    EXPECT_NE(read.failure.find(each.complaint), std::string::npos) << read.failure;
    EXPECT_NE(read.failure.find("/in: "), std::string::npos) << read.failure;
    EXPECT_EQ(read.code, ExitCode::Input);
  }
}

TEST(ByteReader, ReadsAPipeThatComesInDrops) {
  const TemporaryDirectory directory;
  const std::string path = directory.file("pipe");
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  const std::string content = "YUV4MPEG2 W4 H2 F25:1\nFRAME\n" + pictureOf('a') + "FRAME\n" + pictureOf('b');
  const std::jthread writer([&] {
    const int pipe = open(path.c_str(), O_WRONLY);
    for (const char& byte : content) EXPECT_EQ(write(pipe, &byte, 1), 1);
    close(pipe);
  });
  auto source = openFrameSource({path, {}, {}}, {});
  ASSERT_TRUE(source.ok()) << source.failure().text;
  Picture picture;
  EXPECT_TRUE(source.value()->next(picture).value());
  EXPECT_TRUE(source.value()->next(picture).value());
  EXPECT_EQ(picture.bytes[0], 'b');
  EXPECT_FALSE(source.value()->next(picture).value());
  EXPECT_EQ(source.value()->frameCount(), std::nullopt);
}

TEST(ByteReader, StopsWaitingForAPipeWhenAStopIsRequested) {
  const TemporaryDirectory directory;
  const std::string path = directory.file("pipe");
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  const int keptOpen = open(path.c_str(), O_RDWR);
  std::stop_source stop;
  auto reader = ByteReader::open(path, stop.get_token());
  ASSERT_TRUE(reader.ok());
  const std::jthread stopper([&stop] { stop.request_stop(); });
  std::vector<uint8_t> bytes(4);
  const auto count = reader.value()->read(bytes);
  ASSERT_TRUE(count.ok());
  EXPECT_EQ(count.value(), 0U);
  EXPECT_TRUE(reader.value()->stopped());
  close(keptOpen);
}

}  // namespace
