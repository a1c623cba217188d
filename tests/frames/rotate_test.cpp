#include "omxbridge/frames/rotate.h"

#include <gtest/gtest.h>

#include "tests/frames/harness.h"

namespace frames_test {
namespace {

using namespace webrtc;
using reference::Chroma;
using reference::Turn;

using Call = int (*)(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height);

template <VideoType kType>
int clockwise(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return ConvertToI420AndRotateClockwise(src, width, height, dst, height, width, kType);
}

template <VideoType kType>
int antiClockwise(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return ConvertToI420AndRotateAntiClockwise(src, width, height, dst, height, width, kType);
}

template <VideoType kType>
int half(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return ConvertToI420AndMirrorUpDown(src, dst, width, height, kType);
}

struct Rotation {
  const char* name;
  Call call;
  Turn turn;
  Chroma chroma;
  bool bytesWritten = false;  // the result; otherwise the frame
};

const Rotation kRotations[] = {
    {"I420Clockwise", clockwise<kI420>, Turn::kClockwise, Chroma::kUThenV},
    {"I420AntiClockwise", antiClockwise<kI420>, Turn::kAntiClockwise, Chroma::kUThenV},
    {"I420Half", half<kI420>, Turn::kHalf, Chroma::kUThenV, true},
    {"YV12Clockwise", clockwise<kYV12>, Turn::kClockwise, Chroma::kVThenU},
    {"YV12AntiClockwise", antiClockwise<kYV12>, Turn::kAntiClockwise, Chroma::kVThenU},
    {"YV12Half", half<kYV12>, Turn::kHalf, Chroma::kVThenU, true},
    {"NV12Clockwise", ConvertNV12ToI420AndRotateClockwise, Turn::kClockwise, Chroma::kUvPairs},
    {"NV12AntiClockwise", ConvertNV12ToI420AndRotateAntiClockwise, Turn::kAntiClockwise, Chroma::kUvPairs},
    {"NV12Half", ConvertNV12ToI420AndRotate180, Turn::kHalf, Chroma::kUvPairs, true},
    {"NV21Clockwise", ConvertNV21ToI420AndRotateClockwise, Turn::kClockwise, Chroma::kVuPairs},
    {"NV21AntiClockwise", ConvertNV21ToI420AndRotateAntiClockwise, Turn::kAntiClockwise, Chroma::kVuPairs},
    {"NV21Half", ConvertNV21ToI420AndRotate180, Turn::kHalf, Chroma::kVuPairs, true},
    {"UpDown", MirrorI420UpDown, Turn::kUpDown, Chroma::kUThenV},
    {"LeftRight", MirrorI420LeftRight, Turn::kLeftRight, Chroma::kUThenV},
};

class Rotate : public testing::TestWithParam<Rotation> {
 protected:
  void expectReference(Content& content, Size s) {
    SCOPED_TRACE(text(s));
    const Rotation& function = GetParam();
    const Bytes src = content.bytes(reference::i420Bytes(s)), dst = content.bytes(src.size());
    Bytes expected = dst;
    reference::turn(function.turn, function.chroma, src, expected, s);
    const std::size_t written = s.area() + std::size_t{s.width / 2} * (s.height / 2) * 2;
    expectConversion([&](auto* from, auto* to) { return function.call(from, to, s.width, s.height); }, src,
                     dst, expected, static_cast<int>(function.bytesWritten ? written : src.size()));
  }
};
INSTANTIATE_TEST_SUITE_P(Functions, Rotate, testing::ValuesIn(kRotations),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(Rotate, EqualsReferenceForEverySize) {
  Content content(21);
  forEachSize([&](Size s) { expectReference(content, s); });
  // Around the sizes of tiles, in luma and in chroma.
  for (const unsigned width : {15u, 16u, 33u, 63u, 64u, 65u, 128u, 131u}) {
    for (const unsigned height : {16u, 31u, 32u, 63u, 64u, 65u, 129u, 140u}) {
      if (!HasFailure()) expectReference(content, {width, height});
    }
  }
}

TEST_P(Rotate, RefusesBadSizes) {
  EXPECT_EQ(GetParam().call(nullptr, nullptr, 0, 2), -1);
  EXPECT_EQ(GetParam().call(nullptr, nullptr, 2, 0), -1);
  EXPECT_EQ(GetParam().call(nullptr, nullptr, 0xFFFFFFFF, 0xFFFFFFFF), -1);
}

TEST(RotateArguments, OnlyPlanarTypesAndTheTurnedSize) {
  std::uint8_t src[12] = {}, dst[12] = {};
  EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 2, 4, kI420), 12);
  EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 4, 2, kI420), -1);
  EXPECT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 3, kI420), -1);
  for (const VideoType type : {kUnknown, kI420Alt, kRGB24, kNV12, kNV21, static_cast<VideoType>(99)}) {
    EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 2, 4, type), -1);
    EXPECT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 4, type), -1);
    EXPECT_EQ(ConvertToI420AndMirrorUpDown(src, dst, 4, 2, type), -1);
  }
}

TEST(RotateMeaning, ClockwiseBringsTheBottomLeftToTheTopLeft) {
  const std::uint8_t src[] = {1, 2, 3, 4, 5, 6, 7, 8, /*u*/ 20, 21, /*v*/ 30, 31};
  const std::uint8_t clockwiseFrame[] = {5, 1, 6, 2, 7, 3, 8, 4, 20, 21, 30, 31};
  const std::uint8_t antiClockwiseFrame[] = {4, 8, 3, 7, 2, 6, 1, 5, 21, 20, 31, 30};
  std::uint8_t dst[12];
  ASSERT_EQ(clockwise<kI420>(src, dst, 4, 2), 12);
  EXPECT_TRUE(std::equal(dst, dst + 12, clockwiseFrame));
  ASSERT_EQ(antiClockwise<kI420>(src, dst, 4, 2), 12);
  EXPECT_TRUE(std::equal(dst, dst + 12, antiClockwiseFrame));
}

}  // namespace
}  // namespace frames_test
