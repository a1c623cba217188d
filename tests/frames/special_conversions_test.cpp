// What is peculiar to single functions: every colour, overlapping rows, directions, rectangles.

#include <gtest/gtest.h>

#include <climits>

#include "omxbridge/frames/rgb.h"
#include "omxbridge/frames/rotate.h"
#include "omxbridge/frames/yuv.h"
#include "tests/frames/harness.h"
#include "tests/frames/reference_rgb.h"
#include "tests/frames/reference_yuv.h"

namespace frames_test {
namespace {

using namespace webrtc;

// All combinations of the three samples: each frame has one v, a row of blocks for each u, 256 lumas in them.
TEST(I420ToRgbColour, IsExactForEverySample) {
  const Size s{128, 512};
  Bytes src(reference::i420Bytes(s)), dst(s.area() * 4), expected(dst);
  for (std::size_t i = 0; i < s.area(); ++i) {
    // 64 blocks in a row: block b holds lumas 4b to 4b + 3.
    const std::size_t row = i / s.width, x = i % s.width;
    src[i] = static_cast<std::uint8_t>(x / 2 * 4 + row % 2 * 2 + x % 2);
  }
  for (std::size_t i = 0; i < s.area() / 4; ++i) src[s.area() + i] = static_cast<std::uint8_t>(i / 64);
  for (unsigned v = 0; v < 256 && !HasFailure(); ++v) {
    SCOPED_TRACE(v);
    for (std::size_t i = 0; i < s.area() / 4; ++i) src[s.area() * 5 / 4 + i] = static_cast<std::uint8_t>(v);
    reference::toRgb({reference::pixelBgra, 4, reference::Rows::kTopDown}, src, expected, s, s.width);
    expectConversion([&](auto* from, auto* to) { return ConvertI420ToARGB(from, to, s.width, s.height); },
                     src, dst, expected, static_cast<int>(dst.size()));
  }
}

TEST(Rgb24ToArgb, StepsRowsUpByTheSurplusOfTheStride) {
  Content content(2);
  forEachSize([&](Size s) {
    for (const unsigned surplus : {0u, content.number(1, s.width), s.width + 5}) {
      const unsigned stride = s.width + surplus;
      SCOPED_TRACE(text(s) + " stride " + std::to_string(stride));
      const Bytes src = content.bytes(s.area() * 3), dst = content.bytes(std::size_t{stride} * s.height * 4);
      Bytes expected = dst;
      reference::rgb24ToArgb(src, expected, s, stride);
      expectConversion(
          [&](auto* from, auto* to) { return ConvertRGB24ToARGB(from, to, s.width, s.height, stride); }, src,
          dst, expected, static_cast<int>(dst.size()));
    }
  });
  EXPECT_EQ(ConvertRGB24ToARGB(nullptr, nullptr, 4, 2, 3), -1);
  EXPECT_EQ(ConvertRGB24ToARGB(nullptr, nullptr, 0, 2), -1);
}

TEST(Rotate, TakesPlanarTypesAndTheTurnedSizeAndTurnsAsItSays) {
  const std::uint8_t src[] = {1, 2, 3, 4, 5, 6, 7, 8, /*u*/ 20, 21, /*v*/ 30, 31};
  const std::uint8_t clockwiseFrame[] = {5, 1, 6, 2, 7, 3, 8, 4, 20, 21, 30, 31};
  const std::uint8_t antiClockwiseFrame[] = {4, 8, 3, 7, 2, 6, 1, 5, 21, 20, 31, 30};
  std::uint8_t dst[12];
  ASSERT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 2, 4, kI420), 12);
  EXPECT_TRUE(std::equal(dst, dst + 12, clockwiseFrame));
  ASSERT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 4, kI420), 12);
  EXPECT_TRUE(std::equal(dst, dst + 12, antiClockwiseFrame));
  EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 4, 2, kI420), -1);
  EXPECT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 3, kI420), -1);
  for (const VideoType type : {kUnknown, kI420Alt, kRGB24, kNV12, kNV21, static_cast<VideoType>(99)}) {
    EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 2, 4, type), -1);
    EXPECT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 4, type), -1);
    EXPECT_EQ(ConvertToI420AndMirrorUpDown(src, dst, 4, 2, type), -1);
  }
}

TEST(Nv12Crop, CopiesTheRectangleAndRefusesOnesThatAreEmptyOrLeaveTheFrame) {
  Content content(14);
  const auto number = [&](int low, int high) {
    return static_cast<int>(content.number(static_cast<unsigned>(low), static_cast<unsigned>(high)));
  };
  for (unsigned k = 0; k < 300 && !HasFailure(); ++k) {
    const int width = number(1, 40), height = number(1, 12);
    const int left = number(0, width - 1), right = number(left, width - 1);
    const int top = number(0, height - 1), bottom = number(top, height - 1);
    const std::array<int, 4> ltrb{left, top, right, bottom};
    SCOPED_TRACE(testing::PrintToString(ltrb));
    const Size s{static_cast<unsigned>(width), static_cast<unsigned>(height)};
    const Bytes src = content.bytes(reference::i420Bytes(s));
    const int rows = bottom - top + 1 + bottom / 2 - top / 2 + 1;
    const Bytes dst = content.bytes(static_cast<std::size_t>(rows * (right - left + 1)));
    Bytes expected = dst;
    reference::cropNv12(src, s, ltrb, expected);
    expectConversion(
        [&](auto* from, auto* to) {
          return ConvertNV12ToNV12(from, width, height, left, top, right, bottom, to);
        },
        src, dst, expected, 0);
  }
  std::uint8_t src[24] = {}, dst[24] = {};
  const int refused[][6] = {{0, 4, 0, 0, 3, 3}, {4, -4, 0, 0, 3, 3},      {4, 4, -1, 0, 3, 3},
                            {4, 4, 3, 0, 2, 3}, {4, 4, 0, INT_MIN, 3, 3}, {4, 4, 0, 3, 3, 2},
                            {4, 4, 0, 0, 4, 3}, {4, 4, 0, 0, 3, 4},       {4, 4, 0, 0, INT_MAX, INT_MAX}};
  for (const auto& [stride, height, left, top, right, bottom] : refused) {
    EXPECT_EQ(ConvertNV12ToNV12(src, stride, height, left, top, right, bottom, dst), -1);
  }
  EXPECT_EQ(ConvertNV12ToNV12(nullptr, 4, 4, 0, 0, 3, 3, dst), -1);
}

}  // namespace
}  // namespace frames_test
