// Every function between two frames against its plain statement, for every size, stride and way of centring.

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
using reference::Chroma;
using reference::RgbLayout;
using reference::Rows;
using reference::Turn;
using In = const std::uint8_t*;
using Out = std::uint8_t*;

enum class Shape { kTight, kStrided, kCentred };  // what `to` and `stride` may differ from `from` by

struct Function {
  std::string name;
  Shape shape;
  unsigned srcHalves, dstHalves;  // bytes per two pixels
  std::function<int(In src, Out dst, Size from, Size to, unsigned stride)> call{};
  std::function<void(const Bytes& src, Bytes& dst, Size from, Size to, unsigned stride)> reference{};
  std::function<std::size_t(Size to, unsigned stride)> result{};
  bool evenWhereStrided = false;  // odd widths come without a stride
  int zeroSize = -1;
};

// Results: bytes of the frame, of its pairs of rows, and those that are written.
std::size_t frame(Size s, unsigned) {
  return reference::i420Bytes(s);
}
std::size_t evenRows(Size s, unsigned) {
  return std::size_t{s.height / 2} * s.width * 3;
}
std::size_t evenColumns(Size s, unsigned) {
  return std::size_t{s.width / 2} * s.height * 3;
}
std::size_t written(Size s, unsigned) {
  return s.area() + std::size_t{s.width / 2} * (s.height / 2) * 2;
}

using TightCall = int (*)(In, Out, unsigned, unsigned);
using StridedCall = int (*)(In, Out, unsigned, unsigned, unsigned);
using CentredCall = int (*)(In, unsigned, unsigned, Out, unsigned, unsigned);

Function tight(const char* name, const std::function<int(In, Out, unsigned, unsigned)>& call,
               unsigned srcHalves, const std::function<void(const Bytes&, Bytes&, Size)>& reference,
               std::size_t (*result)(Size, unsigned) = frame) {
  Function function{name, Shape::kTight, srcHalves, 3};
  function.call = [=](In src, Out dst, Size s, Size, unsigned) { return call(src, dst, s.width, s.height); };
  function.reference = [=](const Bytes& src, Bytes& dst, Size s, Size, unsigned) { reference(src, dst, s); };
  function.result = result;
  return function;
}

Function strided(const char* name, StridedCall call, unsigned dstHalves,
                 const std::function<void(const Bytes&, Bytes&, Size, unsigned)>& reference) {
  Function function{name, Shape::kStrided, 3, dstHalves};
  function.call = [=](In src, Out dst, Size s, Size, unsigned n) {
    return call(src, dst, s.width, s.height, n);
  };
  function.reference = [=](const Bytes& src, Bytes& dst, Size s, Size, unsigned n) {
    reference(src, dst, s, n);
  };
  function.result = [=](Size s, unsigned n) { return std::size_t{n} * s.height * dstHalves / 2; };
  return function;
}

Function centred(const char* name, CentredCall call, unsigned srcHalves,
                 const std::function<void(const Bytes&, Size, Bytes&, Size)>& reference,
                 std::size_t (*result)(Size, unsigned) = frame) {
  Function function{name, Shape::kCentred, srcHalves, 3};
  function.call = [=](In src, Out dst, Size from, Size to, unsigned) {
    return call(src, from.width, from.height, dst, to.width, to.height);
  };
  function.reference = [=](const Bytes& src, Bytes& dst, Size from, Size to, unsigned) {
    reference(src, from, dst, to);
  };
  function.result = result;
  return function;
}

Function rgb(const char* name, StridedCall call, const RgbLayout& layout) {
  Function function =
      strided(name, call, layout.bytes * 2, [=](const Bytes& src, Bytes& dst, Size s, unsigned stride) {
        reference::toRgb(layout, src, dst, s, stride);
      });
  function.evenWhereStrided = true;
  return function;
}

Function rgb(const char* name, TightCall call, const RgbLayout& layout) {
  Function function = tight(name, call, 3, [=](const Bytes& src, Bytes& dst, Size s) {
    reference::toRgb(layout, src, dst, s, s.width);
  });
  function.dstHalves = layout.bytes * 2;
  function.result = [=](Size s, unsigned) { return s.area() * layout.bytes; };
  return function;
}

template <typename Call>
Function turned(const char* name, const Call& call, Turn turn, Chroma chroma) {
  const auto reference = [=](const Bytes& src, Bytes& dst, Size s) {
    reference::turn(turn, chroma, src, dst, s);
  };
  return tight(name, call, 3, reference, turn == Turn::kHalf ? written : frame);
}

// By the functions that take a type.
Function turned(const char* name, VideoType type, Turn turn, Chroma chroma) {
  const auto call = [=](In src, Out dst, unsigned width, unsigned height) {
    if (turn == Turn::kHalf) return ConvertToI420AndMirrorUpDown(src, dst, width, height, type);
    const auto rotate =
        turn == Turn::kClockwise ? ConvertToI420AndRotateClockwise : ConvertToI420AndRotateAntiClockwise;
    return rotate(src, width, height, dst, height, width, type);
  };
  return turned(name, call, turn, chroma);
}

template <int (*kCall)(unsigned, unsigned, In, Out)>
int sizeFirst(In src, Out dst, unsigned width, unsigned height) {
  return kCall(width, height, src, dst);
}
template <int (*kCall)(In, unsigned, unsigned, Out)>
int sizeBetween(In src, Out dst, unsigned width, unsigned height) {
  return kCall(src, width, height, dst);
}

std::vector<Function> functions() {
  using namespace std::placeholders;
  using namespace reference;
  using enum Turn;
  using enum Chroma;
  Function copy = strided("I420ToI420", ConvertI420ToI420, 3, i420ToI420);
  copy.result = [](Size s, unsigned stride) { return std::size_t{s.height / 2} * stride * 3; };
  copy.zeroSize = 0;
  Function rgbToArgb = strided("RGB24ToARGB", ConvertRGB24ToARGB, 8, rgb24ToArgb);
  rgbToArgb.srcHalves = 6;
  return {
      tight("YV12ToI420", sizeBetween<ConvertYV12ToI420>, 3, exchangeChroma),
      tight("I420ToNV12", ConvertI420ToNV12, 3, std::bind(pairs, true, false, _1, _2, _3)),
      tight("I420ToNV21", ConvertI420ToNV21, 3, std::bind(pairs, true, true, _1, _2, _3)),
      tight("NV12ToI420", ConvertNV12ToI420, 3, std::bind(pairs, false, false, _1, _2, _3)),
      tight("NV21ToI420", ConvertNV21ToI420, 3, std::bind(pairs, false, true, _1, _2, _3)),
      tight("YUY2ToI420", sizeFirst<ConvertYUY2ToI420>, 4, std::bind(unpack, kYuy2, true, _1, _2, _3),
            evenRows),
      tight("UYVYToI420", sizeFirst<ConvertUYVYToI420>, 4, std::bind(unpack, kUyvy, false, _1, _2, _3),
            evenRows),
      strided("I420ToYV12", ConvertI420ToYV12, 3, i420ToYv12),
      copy,
      rgbToArgb,
      strided("I420ToYUY2", ConvertI420ToYUY2, 4, std::bind(pack, kYuy2, _1, _2, _3, _4)),
      strided("I420ToUYVY", ConvertI420ToUYVY, 4, std::bind(pack, kUyvy, _1, _2, _3, _4)),
      centred("I420Centred", ConvertI420ToI420, 3, i420Centred, evenRows),
      centred("YUY2Centred", ConvertYUY2ToI420, 4, std::bind(unpackCentred, kYuy2, false, _1, _2, _3, _4)),
      centred("UYVYCentred", ConvertUYVYToI420, 4, std::bind(unpackCentred, kUyvy, false, _1, _2, _3, _4)),
      centred("YUY2Interlaced", ConvertYUY2ToI420interlaced, 4,
              std::bind(unpackCentred, kYuy2, true, _1, _2, _3, _4)),
      centred("UYVYInterlaced", ConvertUYVYToI420interlaced, 4,
              std::bind(unpackCentred, kUyvy, true, _1, _2, _3, _4)),
      centred("RGB24Centred", ConvertRGB24ToI420, 6, fromRgbCentred, evenColumns),
      tight("RGB24ToI420", sizeFirst<ConvertRGB24ToI420>, 6, std::bind(fromRgb, Rgb::k24, _1, _2, _3)),
      tight("ARGBMacToI420", sizeFirst<ConvertARGBMacToI420>, 8, std::bind(fromRgb, Rgb::kMac, _1, _2, _3)),
      tight("RGB565ToI420", sizeBetween<ConvertRGB565ToI420>, 4, std::bind(fromRgb, Rgb::k565, _1, _2, _3)),
      rgb("RGB24", ConvertI420ToRGB24, {pixelBgr, 3, Rows::kBottomUp}),
      rgb("RGB24_EX", ConvertI420ToRGB24_EX, {pixelBgr, 3, Rows::kTopDown}),
      rgb("ARGB", ConvertI420ToARGB, {pixelBgra, 4, Rows::kTopDown}),
      rgb("ARGBMac", ConvertI420ToARGBMac, {pixelBgra, 4, Rows::kTopDown, true, true}),
      rgb("RGBAMac", ConvertI420ToRGBAMac, {pixelArgb, 4, Rows::kTopDown, true, true}),
      rgb("RGBAIPhone", ConvertI420ToRGBAIPhone, {pixelRgba, 4, Rows::kBottomUp}),
      rgb("ARGB4444", ConvertI420ToARGB4444, {pixel4444, 2, Rows::kBottomUp}),
      rgb("ARGB4444_EX", ConvertI420ToARGB4444_EX, {pixel4444, 2, Rows::kHalfStride}),
      rgb("RGB565", ConvertI420ToRGB565, {pixel565, 2, Rows::kBottomUp}),
      rgb("RGB565_EX", ConvertI420ToRGB565_EX, {pixel565, 2, Rows::kTopDown}),
      rgb("RGB565Android", ConvertI420ToRGB565Android, {pixel565, 2, Rows::kTopDown}),
      rgb("ARGB1555", ConvertI420ToARGB1555, {pixel1555, 2, Rows::kBottomUp, false}),
      rgb("ARGB1555_EX", ConvertI420ToARGB1555_EX, {pixel1555, 2, Rows::kTopDown, false}),
      rgb("NV12ToRGB565", ConvertNV12ToRGB565, {pixel565, 2, Rows::kBottomUp, true, false, true}),
      turned("I420Clockwise", kI420, kClockwise, kUThenV),
      turned("I420AntiClockwise", kI420, kAntiClockwise, kUThenV),
      turned("I420Half", kI420, kHalf, kUThenV),
      turned("YV12Clockwise", kYV12, kClockwise, kVThenU),
      turned("YV12AntiClockwise", kYV12, kAntiClockwise, kVThenU),
      turned("YV12Half", kYV12, kHalf, kVThenU),
      turned("NV12Clockwise", ConvertNV12ToI420AndRotateClockwise, kClockwise, kUvPairs),
      turned("NV12AntiClockwise", ConvertNV12ToI420AndRotateAntiClockwise, kAntiClockwise, kUvPairs),
      turned("NV12Half", ConvertNV12ToI420AndRotate180, kHalf, kUvPairs),
      turned("NV21Clockwise", ConvertNV21ToI420AndRotateClockwise, kClockwise, kVuPairs),
      turned("NV21AntiClockwise", ConvertNV21ToI420AndRotateAntiClockwise, kAntiClockwise, kVuPairs),
      turned("NV21Half", ConvertNV21ToI420AndRotate180, kHalf, kVuPairs),
      turned("UpDown", MirrorI420UpDown, kUpDown, kUThenV),
      turned("LeftRight", MirrorI420LeftRight, kLeftRight, kUThenV),
  };
}

class Conversions : public testing::TestWithParam<Function> {
 protected:
  void expectReference(Size from, Size to, unsigned stride) {
    const Function& function = GetParam();
    SCOPED_TRACE(text(from) + " to " + text(to) + " stride " + std::to_string(stride));
    const Bytes src = _content.bytes(from.area() * function.srcHalves / 2);
    const Bytes dst = _content.bytes(std::size_t{stride} * to.height * function.dstHalves / 2);
    Bytes expected = dst;
    function.reference(src, expected, from, to, stride);
    const unsigned argument = stride == to.width && from.height % 2 == 0 ? 0 : stride;
    expectConversion([&](In in, Out out) { return function.call(in, out, from, to, argument); }, src, dst,
                     expected, static_cast<int>(function.result(to, stride)));
  }
  unsigned number(unsigned low, unsigned high) { return _content.number(low, high); }

 private:
  Content _content{11};
};
INSTANTIATE_TEST_SUITE_P(Functions, Conversions, testing::ValuesIn(functions()),
                         [](const auto& test) { return test.param.name; });

TEST_P(Conversions, EqualReferenceForEverySizeStrideAndMargin) {
  const Function& function = GetParam();
  forEachSize([&](Size s) {
    expectReference(s, s, s.width);
    const bool strides = s.width % 2 == 0 || !function.evenWhereStrided;
    if (function.shape == Shape::kStrided && strides) expectReference(s, s, s.width + number(1, 40));
    if (function.shape != Shape::kCentred) return;
    const Size to{number(1, s.width + 9), number(1, s.height + 9)};
    expectReference(s, to, to.width);
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
  const auto call = [&](Size from, Size to, unsigned stride) {
    return function.call(nullptr, nullptr, from, to, stride);
  };
  for (const Size zero : {Size{0, 2}, Size{2, 0}}) {
    EXPECT_EQ(call(zero, zero, 0), function.zeroSize);
    EXPECT_EQ(call(zero, zero, 9), function.zeroSize);
  }
  const unsigned huge = 0x80000000 / function.dstHalves * 2 + 1;
  EXPECT_EQ(call({huge, 2}, {huge, 2}, 0), -1);
  EXPECT_EQ(call({0xFFFFFFFE, 0xFFFFFFFE}, {0xFFFFFFFE, 0xFFFFFFFE}, 0), -1);
  if (function.shape == Shape::kStrided) {
    EXPECT_EQ(call({4, 2}, {4, 2}, 3), -1);
    EXPECT_EQ(call({4, 4}, {4, 4}, 0xFFFFFFFF), -1);
  }
  if (function.shape == Shape::kCentred) {
    for (const Size bad : {Size{0, 2}, Size{2, 0}}) {
      EXPECT_EQ(call(bad, {2, 2}, 0), -1);
      EXPECT_EQ(call({2, 2}, bad, 0), -1);
    }
    EXPECT_EQ(call({2, 2}, {0x10000, 0x10000}, 0), -1);
  }
}

// --- What is peculiar to single functions ---

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
