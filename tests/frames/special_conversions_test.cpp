// What is peculiar to single functions: types and sizes of rotations, rectangles.

#include <gtest/gtest.h>

#include <climits>

#include "omxbridge/frames/rotate.h"
#include "omxbridge/frames/yuv.h"
#include "tests/frames/harness.h"
#include "tests/frames/reference_yuv.h"

namespace frames_test {
namespace {

using namespace webrtc;

TEST(Rotate, TakesPlanarTypesAndTheTurnedSize) {
  std::uint8_t src[12] = {}, dst[12];
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
