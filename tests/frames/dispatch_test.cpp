#include <gtest/gtest.h>

#include <array>

#include "omxbridge/frames.h"
#include "tests/frames/harness.h"

namespace frames_test {
namespace {

using namespace webrtc;

VideoType type(unsigned value) {
  return static_cast<VideoType>(value);
}

TEST(CalcBufferSize, TruncatesAndWrapsAndUsesTwoTables) {
  EXPECT_EQ(CalcBufferSize(kI420, 3, 3), 13);
  // Sources from kI420 on; both neighbours of the table count as unknown.
  const unsigned bits[] = {32, 12, 12, 24, 32, 16, 16, 16, 16, 12, 16, 32, 12, 12, 32};
  for (unsigned i = 0; i < std::size(bits); ++i) {
    EXPECT_EQ(CalcBufferSize(type(i), 4, 4), static_cast<int>(bits[i] * 2)) << i;
    // As a target, NV12 and NV21 are unknown.
    const unsigned asTarget = i > kUYVY ? 32 : bits[i];
    EXPECT_EQ(CalcBufferSize(kI420, type(i), 120), static_cast<int>(asTarget * 10)) << i;
    EXPECT_EQ(CalcBufferSize(type(i), kI420, 7), static_cast<int>(7 * 12 / bits[i])) << i;
  }
  EXPECT_EQ(CalcBufferSize(type(0xFFFFFFFF), 2, 2), 16);
  EXPECT_EQ(CalcBufferSize(kARGB, 0x8000, 0x1000), 0);
  EXPECT_EQ(CalcBufferSize(kI420, 0xFFFFFFFF, 1), 0x1FFFFFFE);
  EXPECT_EQ(CalcBufferSize(kI420, kARGB, 1u << 27), 0);
}

constexpr unsigned w = 12, h = 6;
using In = const unsigned char*;
using Out = unsigned char*;
using Direct = int (*)(In src, Out dst);

int copy(In src, Out dst) {
  std::copy_n(src, w * h * 3 / 2, dst);
  return w * h * 3 / 2;
}

// What a dispatcher must call: for a rotation, or for interlaced frames where that makes a difference.
struct Route {
  VideoType type;
  int how;
  Direct call;
};

const Route kToI420[] = {
    {kI420, 0, copy},
    {kI420, 90, [](In s, Out d) { return ConvertToI420AndRotateClockwise(s, w, h, d, h, w, kI420); }},
    {kI420, -90, [](In s, Out d) { return ConvertToI420AndRotateAntiClockwise(s, w, h, d, h, w, kI420); }},
    {kI420, 180, [](In s, Out d) { return ConvertToI420AndMirrorUpDown(s, d, w, h, kI420); }},
    {kYV12, 0, [](In s, Out d) { return ConvertYV12ToI420(s, w, h, d); }},
    {kNV12, 0, [](In s, Out d) { return ConvertNV12ToI420(s, d, w, h); }},
    {kNV21, 0, [](In s, Out d) { return ConvertNV21ToI420(s, d, w, h); }},
    {kYUY2, 0, [](In s, Out d) { return ConvertYUY2ToI420(s, w, h, d, w, h); }},
    {kYUY2, 1, [](In s, Out d) { return ConvertYUY2ToI420interlaced(s, w, h, d, w, h); }},
    {kUYVY, 0, [](In s, Out d) { return ConvertUYVYToI420(w, h, s, d); }},
    {kUYVY, 1, [](In s, Out d) { return ConvertUYVYToI420interlaced(s, w, h, d, w, h); }},
    {kRGB24, 0, [](In s, Out d) { return ConvertRGB24ToI420(w, h, s, d); }},
    {kRGB565, 0, [](In s, Out d) { return ConvertRGB565ToI420(s, w, h, d); }},
};

const Route kFromI420[] = {
    {kI420, 0, copy},
    {kRGB24, 0, [](In s, Out d) { return ConvertI420ToRGB24(s, d, w, h); }},
    {kARGB, 0, [](In s, Out d) { return ConvertI420ToARGB(s, d, w, h, 0); }},
    {kARGB4444, 0, [](In s, Out d) { return ConvertI420ToARGB4444(s, d, w, h, 0); }},
    {kRGB565, 0, [](In s, Out d) { return ConvertI420ToRGB565(s, d, w, h); }},
    {kARGB1555, 0, [](In s, Out d) { return ConvertI420ToARGB1555(s, d, w, h, 0); }},
    {kYUY2, 0, [](In s, Out d) { return ConvertI420ToYUY2(s, d, w, h, 0); }},
    {kYV12, 0, [](In s, Out d) { return ConvertI420ToYV12(s, d, w, h, 0); }},
    {kUYVY, 0, [](In s, Out d) { return ConvertI420ToUYVY(s, d, w, h, 0); }},
};

TEST(Dispatch, CallsTheConversionOfEachTypeAndRotation) {
  Content content(61);
  const Bytes src = content.bytes(w * h * 4), dst = content.bytes(w * h * 4);
  const auto expectRoute = [&](const Route& route, auto dispatcher) {
    SCOPED_TRACE("type " + std::to_string(route.type) + " how " + std::to_string(route.how));
    Bytes expected = dst;
    const int result = route.call(src.data(), expected.data());
    const bool interlaced = route.how == 1;
    const auto mode = static_cast<VideoRotationMode>(interlaced ? 0 : route.how);
    expectConversion([&](In s, Out d) { return dispatcher(route.type, s, w, h, d, interlaced, mode); }, src,
                     dst, expected, result);
  };
  for (const Route& route : kToI420) expectRoute(route, ConvertToI420);
  for (const Route& route : kFromI420) expectRoute(route, ConvertFromI420);
  // Turning while converting is turning what was converted.
  for (const VideoType planar : {kYV12, kNV12, kNV21}) {
    for (const auto mode : {kRotateClockwise, kRotateAntiClockwise, kRotate180}) {
      Bytes upright(w * h * 3 / 2), expected = upright, turned = upright;
      ConvertToI420(planar, src.data(), w, h, upright.data(), false, kRotateNone);
      ConvertToI420(kI420, upright.data(), w, h, expected.data(), false, mode);
      EXPECT_EQ(ConvertToI420(planar, src.data(), w, h, turned.data(), false, mode), w * h * 3 / 2);
      EXPECT_EQ(turned, expected) << planar << " turned by " << mode;
    }
  }
}

TEST(Dispatch, RefusesSizesTypesAndRotations) {
  std::uint8_t src[24] = {}, dst[24];
  for (unsigned value = 0; value < 16; ++value) {
    for (const auto& [width, height] : {std::pair{0u, 10u}, {10u, 0u}}) {
      EXPECT_EQ(ConvertToI420(type(value), nullptr, width, height, nullptr, false, kRotateNone), -1);
      EXPECT_EQ(ConvertFromI420(type(value), nullptr, width, height, nullptr, false, kRotateNone), -1);
    }
  }
  EXPECT_EQ(ConvertToI420(kI420, nullptr, 0x10000, 0x10000, nullptr, false, kRotateNone), -1);
  EXPECT_EQ(ConvertFromI420(kI420, nullptr, 0x10000, 0x10000, nullptr, false, kRotateNone), -1);
  EXPECT_EQ(ConvertToI420(kI420, src, 4, 4, dst, false, static_cast<VideoRotationMode>(45)), 0);
  EXPECT_EQ(ConvertToI420(type(99), src, 4, 4, dst, false, kRotateNone), 0);
  EXPECT_EQ(ConvertFromI420(kNV12, src, 4, 4, dst, false, kRotateNone), 0);
}

}  // namespace
}  // namespace frames_test
