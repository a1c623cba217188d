#include "omxbridge/frames/rgb.h"

#include <gtest/gtest.h>

#include "omxbridge/frames/yuv.h"
#include "tests/frames/harness.h"

namespace frames_test {
namespace {

using namespace webrtc;
using reference::RgbLayout;
using reference::Rows;

using WithStride = int (*)(const unsigned char*, unsigned char*, unsigned, unsigned, unsigned);
using Tight = int (*)(const unsigned char*, unsigned char*, unsigned, unsigned);

struct ToRgb {
  const char* name;
  WithStride strided;  // one of these two
  Tight tight;
  RgbLayout layout;

  int operator()(const unsigned char* src, unsigned char* dst, Size s, unsigned stride) const {
    return strided != nullptr ? strided(src, dst, s.width, s.height, stride)
                              : tight(src, dst, s.width, s.height);
  }
};

const ToRgb kToRgb[] = {
    {"RGB24", nullptr, ConvertI420ToRGB24, {reference::pixelBgr, 3, Rows::kBottomUp}},
    {"RGB24_EX", nullptr, ConvertI420ToRGB24_EX, {reference::pixelBgr, 3, Rows::kTopDown}},
    {"ARGB", ConvertI420ToARGB, nullptr, {reference::pixelBgra, 4, Rows::kTopDown}},
    {"ARGBMac", ConvertI420ToARGBMac, nullptr, {reference::pixelBgra, 4, Rows::kTopDown, true, true}},
    {"RGBAMac", ConvertI420ToRGBAMac, nullptr, {reference::pixelArgb, 4, Rows::kTopDown, true, true}},
    {"RGBAIPhone", ConvertI420ToRGBAIPhone, nullptr, {reference::pixelRgba, 4, Rows::kBottomUp}},
    {"ARGB4444", ConvertI420ToARGB4444, nullptr, {reference::pixel4444, 2, Rows::kBottomUp}},
    {"ARGB4444_EX", ConvertI420ToARGB4444_EX, nullptr, {reference::pixel4444, 2, Rows::kHalfStride}},
    {"RGB565", nullptr, ConvertI420ToRGB565, {reference::pixel565, 2, Rows::kBottomUp}},
    {"RGB565_EX", nullptr, ConvertI420ToRGB565_EX, {reference::pixel565, 2, Rows::kTopDown}},
    {"RGB565Android", nullptr, ConvertI420ToRGB565Android, {reference::pixel565, 2, Rows::kTopDown}},
    {"ARGB1555", ConvertI420ToARGB1555, nullptr, {reference::pixel1555, 2, Rows::kBottomUp, false}},
    {"ARGB1555_EX", ConvertI420ToARGB1555_EX, nullptr, {reference::pixel1555, 2, Rows::kTopDown, false}},
    {"NV12ToRGB565",
     nullptr,
     ConvertNV12ToRGB565,
     {reference::pixel565, 2, Rows::kBottomUp, true, false, true}},
};

class I420ToRgb : public testing::TestWithParam<ToRgb> {};
INSTANTIATE_TEST_SUITE_P(Layouts, I420ToRgb, testing::ValuesIn(kToRgb),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(I420ToRgb, EqualsReferenceForEverySizeAndStride) {
  const ToRgb& function = GetParam();
  Content content(1);
  forEachSize([&](Size s) {
    SCOPED_TRACE(text(s));
    const unsigned surplus = function.strided != nullptr && s.width % 2 == 0 ? content.number(0, 37) : 0;
    const unsigned stride = s.width + surplus;
    const Bytes src = content.bytes(reference::i420Bytes(s));
    const Bytes dst = content.bytes(std::size_t{stride} * s.height * function.layout.bytes);
    Bytes expected = dst;
    reference::toRgb(function.layout, src, expected, s, stride);
    const unsigned argument = surplus == 0 && s.height % 2 == 0 ? 0 : stride;
    expectConversion([&](auto* from, auto* to) { return function(from, to, s, argument); }, src, dst,
                     expected, static_cast<int>(dst.size()));
  });
}

TEST_P(I420ToRgb, RefusesBadArguments) {
  const ToRgb& function = GetParam();
  EXPECT_EQ(function(nullptr, nullptr, {0, 4}, 0), -1);
  EXPECT_EQ(function(nullptr, nullptr, {4, 0}, 9), -1);
  EXPECT_EQ(function(nullptr, nullptr, {0xFFFFFFFE, 0xFFFFFFFE}, 0), -1);
  EXPECT_EQ(function(nullptr, nullptr, {0x80000000 / function.layout.bytes + 1, 1}, 0), -1);
  if (function.strided == nullptr) return;
  EXPECT_EQ(function(nullptr, nullptr, {4, 2}, 3), -1);
  EXPECT_EQ(function(nullptr, nullptr, {4, 0xFFFFFFFF}, 0xFFFFFFFF), -1);
}

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
    reference::toRgb({reference::pixelBgra, 4, Rows::kTopDown}, src, expected, s, s.width);
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

struct FromRgb {
  const char* name;
  int (*call)(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height);
  reference::Rgb layout;
};

const FromRgb kFromRgb[] = {
    {"RGB24", [](auto* src, auto* dst, unsigned w, unsigned h) { return ConvertRGB24ToI420(w, h, src, dst); },
     reference::Rgb::k24},
    {"ARGBMac",
     [](auto* src, auto* dst, unsigned w, unsigned h) { return ConvertARGBMacToI420(w, h, src, dst); },
     reference::Rgb::kMac},
    {"RGB565",
     [](auto* src, auto* dst, unsigned w, unsigned h) { return ConvertRGB565ToI420(src, w, h, dst); },
     reference::Rgb::k565},
};

class RgbToI420 : public testing::TestWithParam<FromRgb> {};
INSTANTIATE_TEST_SUITE_P(Layouts, RgbToI420, testing::ValuesIn(kFromRgb),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(RgbToI420, EqualsReferenceForEverySize) {
  const FromRgb& function = GetParam();
  Content content(3);
  forEachSize([&](Size s) {
    SCOPED_TRACE(text(s));
    const Bytes src = content.bytes(s.area() * reference::bytesOf(function.layout));
    const Bytes dst = content.bytes(reference::i420Bytes(s));
    Bytes expected = dst;
    reference::fromRgb(function.layout, src, expected, s);
    expectConversion([&](auto* from, auto* to) { return function.call(from, to, s.width, s.height); }, src,
                     dst, expected, static_cast<int>(dst.size()));
  });
  EXPECT_EQ(function.call(nullptr, nullptr, 0, 2), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 2, 0), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 0x10000, 0x10000), -1);
}

TEST(Rgb24ToI420Centred, EqualsReferenceWhereverItCropsAndPads) {
  Content content(4);
  forEachSize([&](Size from) {
    const Size to{content.number(1, from.width + 9), content.number(1, from.height + 9)};
    SCOPED_TRACE(text(from) + " to " + text(to));
    const Bytes src = content.bytes(from.area() * 3), dst = content.bytes(reference::i420Bytes(to));
    Bytes expected = dst;
    reference::fromRgbCentred(src, from, expected, to);
    expectConversion(
        [&](auto* in, auto* out) {
          return ConvertRGB24ToI420(in, from.width, from.height, out, to.width, to.height);
        },
        src, dst, expected, static_cast<int>(to.width / 2 * to.height * 3));
  });
  EXPECT_EQ(ConvertRGB24ToI420(nullptr, 2, 2, nullptr, 2, 0), -1);
  EXPECT_EQ(ConvertRGB24ToI420(nullptr, 0, 2, nullptr, 2, 2), -1);
}

}  // namespace
}  // namespace frames_test
