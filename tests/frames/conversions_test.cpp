// Every function between two frames against its plain statement, for every size, stride and way of centring;
// those that a dispatcher finds by type also through it.

#include <gtest/gtest.h>

#include <climits>

#include "tests/frames/functions.h"
#include "tests/frames/harness.h"

namespace frames_test {
namespace {

class Conversions : public testing::TestWithParam<Function> {
 protected:
  void expectReference(Size from, Size to, unsigned stride) {
    const Function& function = GetParam();
    SCOPED_TRACE(text(from) + " to " + text(to) + " stride " + std::to_string(stride));
    const Bytes src = content.bytes(from.area() * function.srcHalves / 2);
    const Bytes dst = content.bytes(std::size_t{stride} * to.height * function.dstHalves / 2);
    Bytes expected = dst;
    const std::size_t result = function.reference(src, expected, from, to, stride);
    const bool plain = from == to && stride == to.width;
    const bool dispatch = plain && function.dispatched && content.number(0, 1) == 0;
    const Call& call = dispatch ? *function.dispatched : function.call;
    const unsigned argument = plain && from.height % 2 == 0 ? 0 : stride;
    expectConversion([&](In in, Out out) { return call.run(in, out, from, to, argument); }, src, dst,
                     expected, static_cast<int>(result));
  }

  Content content{11};
};
INSTANTIATE_TEST_SUITE_P(Functions, Conversions, testing::ValuesIn(functions()),
                         [](const auto& test) { return test.param.name; });

TEST_P(Conversions, EqualReferenceForEverySizeStrideAndMargin) {
  const Shape shape = GetParam().call.shape;
  forEachSize([&](Size s) {
    expectReference(s, s, s.width);
    if (shape == Shape::kStrided) expectReference(s, s, s.width + content.number(1, 40));
    Size to{content.number(1, s.width + 9), content.number(1, s.height + 9)};
    if (shape == Shape::kCentred) expectReference(s, to, to.width);
    // Margins that are multiples of 16 are rounded in another way.
    const unsigned unit = content.number(0, 1) == 0 ? 16 : 1;
    to = {s.width + unit * content.number(0, 64 / unit), s.height + unit * content.number(0, 64 / unit)};
    if (shape == Shape::kPadded) expectReference(s, to, to.width);
  });
  // Around the sizes of tiles, in luma and in chroma.
  for (const unsigned width : {15u, 16u, 33u, 63u, 64u, 65u, 128u, 131u}) {
    for (const unsigned height : {16u, 31u, 32u, 63u, 64u, 65u, 129u, 140u}) {
      if (!HasFailure()) expectReference({width, height}, {width, height}, width);
    }
  }
}

TEST_P(Conversions, RefuseBadArguments) {
  const Function& function = GetParam();
  const auto call = [&](Size from, Size to, unsigned stride = 0) {
    return function.call.run(nullptr, nullptr, from, to, stride);
  };
  for (const Size zero : {Size{0, 2}, Size{2, 0}}) {
    EXPECT_EQ(call(zero, zero), function.name == "I420ToI420" ? 0 : -1);
    if (function.call.shape != Shape::kCentred) continue;
    EXPECT_EQ(call(zero, {2, 2}), -1);
    EXPECT_EQ(call({2, 2}, zero), -1);
  }
  const unsigned wide = 0x80000000 / function.dstHalves * 2 + 1;
  for (const Size huge : {Size{wide, 2}, {0x10000, 0x10000}, {0xFFFFFFFE, 0xFFFFFFFE}}) {
    EXPECT_EQ(call(huge, huge), -1);
  }
  const bool isCentred = function.call.shape == Shape::kCentred;
  EXPECT_EQ(isCentred ? call({2, 2}, {0x10000, 0x10000}) : -1, -1);
  const bool isStrided = function.call.shape == Shape::kStrided;
  for (const unsigned stride : {3U, 0xFFFFFFFF}) EXPECT_EQ(isStrided ? call({4, 4}, {4, 4}, stride) : -1, -1);
}

// --- What is peculiar to single functions ---

TEST(Rotate, TakesPlanarTypesAndTheTurnedSize) {
  std::uint8_t src[12] = {}, dst[12];
  EXPECT_EQ(ConvertToI420AndRotateClockwise(src, 4, 2, dst, 4, 2, kI420), -1);
  EXPECT_EQ(ConvertToI420AndRotateAntiClockwise(src, 4, 2, dst, 2, 3, kI420), -1);
  for (const VideoType type : {kUnknown, kNV12, static_cast<VideoType>(99)}) {
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
    const Bytes src = content.bytes(s.i420());
    const int rows = bottom - top + 1 + bottom / 2 - top / 2 + 1;
    const Bytes dst = content.bytes(static_cast<std::size_t>(rows * (right - left + 1)));
    Bytes expected = dst;
    reference::cropNv12(src, s, ltrb, expected);
    const auto crop = [&](In in, Out out) {
      return ConvertNV12ToNV12(in, width, height, left, top, right, bottom, out);
    };
    expectConversion(crop, src, dst, expected, 0);
  }
  std::uint8_t src[24] = {}, dst[24] = {};
  const int refused[][6] = {{0, 4, 0, 0, 3, 3}, {4, -4, 0, 0, 3, 3},      {4, 4, -1, 0, 3, 3},
                            {4, 4, 3, 0, 2, 3}, {4, 4, 0, INT_MIN, 3, 3}, {4, 4, 0, 3, 3, 2},
                            {4, 4, 0, 0, 4, 3}, {4, 4, 0, 0, 3, 4},       {4, 4, 0, 0, INT_MAX, INT_MAX}};
  for (const auto& [stride, height, left, top, right, bottom] : refused) {
    EXPECT_EQ(ConvertNV12ToNV12(src, stride, height, left, top, right, bottom, dst), -1);
  }
}

TEST(Dispatch, RefusesSizesAndLeavesUnknownTypesAndRotationsAlone) {
  std::uint8_t src[24] = {}, dst[24];
  for (const auto dispatcher : {ConvertToI420, ConvertFromI420}) {
    EXPECT_EQ(dispatcher(kUnknown, nullptr, 0, 10, nullptr, false, kRotateNone), -1);
    EXPECT_EQ(dispatcher(static_cast<VideoType>(99), src, 4, 4, dst, false, kRotateNone), 0);
  }
  EXPECT_EQ(ConvertToI420(kI420, src, 4, 4, dst, false, static_cast<VideoRotationMode>(45)), 0);
  EXPECT_EQ(ConvertFromI420(kNV12, src, 4, 4, dst, false, kRotateNone), 0);
}

TEST(CalcBufferSize, TruncatesAndWrapsAndTakesNv12AndNv21ForUnknownTargets) {
  const unsigned bits[] = {32, 12, 12, 24, 32, 16, 16, 16, 16, 12, 16, 32, 12, 12, 32};
  for (unsigned i = 0; i < std::size(bits); ++i) {
    const auto type = static_cast<VideoType>(i);
    EXPECT_EQ(CalcBufferSize(type, 3, 3), static_cast<int>(bits[i] * 9 / 8)) << i;
    EXPECT_EQ(CalcBufferSize(kI420, type, 120), static_cast<int>((i > kUYVY ? 32 : bits[i]) * 10)) << i;
    EXPECT_EQ(CalcBufferSize(type, kI420, 7), static_cast<int>(7 * 12 / bits[i])) << i;
  }
  EXPECT_EQ(CalcBufferSize(static_cast<VideoType>(0xFFFFFFFF), 2, 2), 16);
  EXPECT_EQ(CalcBufferSize(kARGB, 0x8000, 0x1000), 0);
  EXPECT_EQ(CalcBufferSize(kI420, 0xFFFFFFFF, 1), 0x1FFFFFFE);
}

}  // namespace
}  // namespace frames_test
