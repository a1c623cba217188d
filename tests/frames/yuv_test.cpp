#include "omxbridge/frames/yuv.h"

#include <gtest/gtest.h>

#include <climits>

#include "tests/frames/harness.h"

namespace frames_test {
namespace {

using namespace webrtc;

// Functions between two tightly packed frames of the same size.
struct Plain {
  const char* name;
  int (*call)(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height);
  void (*reference)(const Bytes& src, Bytes& dst, Size s);
  unsigned srcHalves, dstHalves;  // bytes per two pixels
  unsigned resultRows = 1,
           resultHalves = 3;  // result: height rounded down to resultRows * width * halves / 2
};

template <int (*kCall)(unsigned, unsigned, const unsigned char*, unsigned char*)>
int sizeFirst(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kCall(width, height, src, dst);
}

const Plain kPlain[] = {
    {"YV12ToI420",
     [](const unsigned char* src, unsigned char* dst, unsigned w, unsigned h) {
       return ConvertYV12ToI420(src, w, h, dst);
     },
     [](const Bytes& src, Bytes& dst, Size s) {
       const std::size_t area = s.area(), quarter = area / 4;
       for (std::size_t i = 0; i < area; ++i) dst[i] = src[i];
       for (std::size_t i = 0; i < quarter; ++i) {
         dst[area + i] = src[area + quarter + i];
         dst[area + quarter + i] = src[area + i];
       }
     },
     3, 3},
    {"I420ToNV12", ConvertI420ToNV12,
     [](const Bytes& src, Bytes& dst, Size s) { reference::interleave(false, src, dst, s); }, 3, 3},
    {"I420ToNV21", ConvertI420ToNV21,
     [](const Bytes& src, Bytes& dst, Size s) { reference::interleave(true, src, dst, s); }, 3, 3},
    {"NV12ToI420", ConvertNV12ToI420,
     [](const Bytes& src, Bytes& dst, Size s) { reference::split(false, src, dst, s); }, 3, 3},
    {"NV21ToI420", ConvertNV21ToI420,
     [](const Bytes& src, Bytes& dst, Size s) { reference::split(true, src, dst, s); }, 3, 3},
    {"YUY2ToI420", sizeFirst<ConvertYUY2ToI420>,
     [](const Bytes& src, Bytes& dst, Size s) { reference::unpack(reference::kYuy2, true, src, dst, s); }, 4,
     3, 2},
    {"UYVYToI420", sizeFirst<ConvertUYVYToI420>,
     [](const Bytes& src, Bytes& dst, Size s) { reference::unpack(reference::kUyvy, false, src, dst, s); }, 4,
     3, 2},
};

class PlainConversion : public testing::TestWithParam<Plain> {};
INSTANTIATE_TEST_SUITE_P(Layouts, PlainConversion, testing::ValuesIn(kPlain),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(PlainConversion, EqualsReferenceForEverySize) {
  const Plain& function = GetParam();
  Content content(11);
  forEachSize([&](Size s) {
    SCOPED_TRACE(text(s));
    const Bytes src = content.bytes(s.area() * function.srcHalves / 2);
    const Bytes dst = content.bytes(s.area() * function.dstHalves / 2);
    Bytes expected = dst;
    function.reference(src, expected, s);
    const unsigned rows = s.height / function.resultRows * function.resultRows;
    expectConversion([&](auto* from, auto* to) { return function.call(from, to, s.width, s.height); }, src,
                     dst, expected, static_cast<int>(rows * s.width * function.resultHalves / 2));
  });
  EXPECT_EQ(function.call(nullptr, nullptr, 0, 2), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 2, 0), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 0xFFFFFFFF, 0xFFFFFFFF), -1);
}

// Functions with a stride in the destination.
struct Strided {
  const char* name;
  int (*call)(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height, unsigned stride);
  void (*reference)(const Bytes& src, Bytes& dst, Size s, unsigned stride);
  unsigned dstHalves;
  int zeroSize = -1;
  bool wholePairs = false;  // the result counts even rows only
};

const Strided kStrided[] = {
    {"I420ToYV12", ConvertI420ToYV12, reference::i420ToYv12, 3},
    {"I420ToI420", ConvertI420ToI420, reference::i420ToI420, 3, 0, true},
    {"I420ToYUY2", ConvertI420ToYUY2,
     [](const Bytes& src, Bytes& dst, Size s, unsigned stride) {
       reference::pack(reference::kYuy2, src, dst, s, stride);
     },
     4},
    {"I420ToUYVY", ConvertI420ToUYVY,
     [](const Bytes& src, Bytes& dst, Size s, unsigned stride) {
       reference::pack(reference::kUyvy, src, dst, s, stride);
     },
     4},
};

class StridedConversion : public testing::TestWithParam<Strided> {};
INSTANTIATE_TEST_SUITE_P(Layouts, StridedConversion, testing::ValuesIn(kStrided),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(StridedConversion, EqualsReferenceForEverySizeAndStride) {
  const Strided& function = GetParam();
  Content content(12);
  forEachSize([&](Size s) {
    for (const unsigned surplus : {0u, content.number(1, 40)}) {
      const unsigned stride = s.width + surplus;
      SCOPED_TRACE(text(s) + " stride " + std::to_string(stride));
      const Bytes src = content.bytes(reference::i420Bytes(s));
      const Bytes dst = content.bytes(std::size_t{stride} * s.height * function.dstHalves / 2);
      Bytes expected = dst;
      function.reference(src, expected, s, stride);
      const unsigned rows = function.wholePairs ? s.height / 2 * 2 : s.height;
      expectConversion(
          [&](auto* from, auto* to) {
            return function.call(from, to, s.width, s.height, surplus == 0 && s.width % 2 == 0 ? 0 : stride);
          },
          src, dst, expected, static_cast<int>(stride * rows * function.dstHalves / 2));
    }
  });
}

TEST_P(StridedConversion, RefusesBadArguments) {
  const Strided& function = GetParam();
  EXPECT_EQ(function.call(nullptr, nullptr, 0, 2, 0), function.zeroSize);
  EXPECT_EQ(function.call(nullptr, nullptr, 2, 0, 8), function.zeroSize);
  EXPECT_EQ(function.call(nullptr, nullptr, 0, 2, 8), function.zeroSize);
  EXPECT_EQ(function.call(nullptr, nullptr, 640, 480, 320), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 2, 0, 1), -1);
  EXPECT_EQ(function.call(nullptr, nullptr, 2, 4, 0xFFFFFFFF), -1);
}

// Functions that centre the picture in a frame of another size.
struct Centred {
  const char* name;
  int (*call)(const unsigned char*, unsigned, unsigned, unsigned char*, unsigned, unsigned);
  void (*reference)(const Bytes& src, Size from, Bytes& dst, Size to);
  unsigned srcHalves;
  bool wholePairs = false;
};

template <bool kUyvy, bool kInterlaced>
void unpackCentred(const Bytes& src, Size from, Bytes& dst, Size to) {
  reference::unpackCentred(kUyvy ? reference::kUyvy : reference::kYuy2, kInterlaced, src, from, dst, to);
}

const Centred kCentred[] = {
    {"I420", ConvertI420ToI420, reference::i420Centred, 3, true},
    {"YUY2", ConvertYUY2ToI420, unpackCentred<false, false>, 4},
    {"UYVY", ConvertUYVYToI420, unpackCentred<true, false>, 4},
    {"YUY2Interlaced", ConvertYUY2ToI420interlaced, unpackCentred<false, true>, 4},
    {"UYVYInterlaced", ConvertUYVYToI420interlaced, unpackCentred<true, true>, 4},
};

class CentredConversion : public testing::TestWithParam<Centred> {
 protected:
  void expectReference(Content& content, Size from, Size to) {
    SCOPED_TRACE(text(from) + " to " + text(to));
    const Centred& function = GetParam();
    const Bytes src = content.bytes(from.area() * function.srcHalves / 2);
    const Bytes dst = content.bytes(reference::i420Bytes(to));
    Bytes expected = dst;
    function.reference(src, from, expected, to);
    const unsigned rows = function.wholePairs ? to.height / 2 * 2 : to.height;
    expectConversion(
        [&](auto* in, auto* out) {
          return function.call(in, from.width, from.height, out, to.width, to.height);
        },
        src, dst, expected, static_cast<int>(to.width * rows * 3 / 2));
  }
};
INSTANTIATE_TEST_SUITE_P(Layouts, CentredConversion, testing::ValuesIn(kCentred),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(CentredConversion, EqualsReferenceWhereverItCropsAndPads) {
  Content content(13);
  forEachSize([&](Size from) {
    expectReference(content, from, from);
    expectReference(content, from, {content.number(1, from.width + 9), content.number(1, from.height + 9)});
  });
  // All small differences in both directions, so that each rounding of a margin comes up.
  for (unsigned k = 0; k < 400 && !HasFailure(); ++k) {
    expectReference(content, {k % 20 + 1, k / 20 + 1}, {10, 10});
    expectReference(content, {10, 10}, {k % 20 + 1, k / 20 + 1});
    expectReference(content, {9, 7}, {k % 20 + 1, k / 20 + 1});
  }
}

TEST_P(CentredConversion, RefusesBadSizes) {
  const auto call = GetParam().call;
  EXPECT_EQ(call(nullptr, 0, 2, nullptr, 2, 2), -1);
  EXPECT_EQ(call(nullptr, 2, 0, nullptr, 2, 2), -1);
  EXPECT_EQ(call(nullptr, 2, 2, nullptr, 0, 2), -1);
  EXPECT_EQ(call(nullptr, 2, 2, nullptr, 2, 0), -1);
  EXPECT_EQ(call(nullptr, 2, 2, nullptr, 0x10000, 0x10000), -1);
}

TEST(Nv12Crop, CopiesTheRectangle) {
  Content content(14);
  for (unsigned k = 0; k < 300 && !HasFailure(); ++k) {
    const Size s{content.number(1, 40), content.number(1, 12)};
    const unsigned left = content.number(0, s.width - 1), right = content.number(left, s.width - 1);
    const unsigned top = content.number(0, s.height - 1), bottom = content.number(top, s.height - 1);
    SCOPED_TRACE(testing::Message() << text(s) << ": " << left << ' ' << top << ' ' << right << ' '
                                    << bottom);
    const Bytes src = content.bytes(reference::i420Bytes(s));
    const std::size_t rows = bottom - top + 1 + bottom / 2 - top / 2 + 1;
    const Bytes dst = content.bytes(rows * (right - left + 1));
    Bytes expected = dst;
    reference::cropNv12(src, s.width, s.height, {left, top, right, bottom}, expected);
    const auto number = [](unsigned n) { return static_cast<int>(n); };
    expectConversion(
        [&](auto* from, auto* to) {
          return ConvertNV12ToNV12(from, number(s.width), number(s.height), number(left), number(top),
                                   number(right), number(bottom), to);
        },
        src, dst, expected, 0);
  }
}

TEST(Nv12Crop, RefusesRectanglesThatAreEmptyOrLeaveTheFrame) {
  std::uint8_t src[24] = {}, dst[24] = {};
  const auto crop = [&](int stride, int height, int left, int top, int right, int bottom) {
    return ConvertNV12ToNV12(src, stride, height, left, top, right, bottom, dst);
  };
  EXPECT_EQ(crop(4, 4, 0, 0, 3, 3), 0);
  EXPECT_EQ(crop(0, 4, 0, 0, 3, 3), -1);
  EXPECT_EQ(crop(4, -4, 0, 0, 3, 3), -1);
  EXPECT_EQ(crop(4, 4, -1, 0, 3, 3), -1);
  EXPECT_EQ(crop(4, 4, 0, INT_MIN, 3, 3), -1);
  EXPECT_EQ(crop(4, 4, 3, 0, 2, 3), -1);
  EXPECT_EQ(crop(4, 4, 0, 3, 3, 2), -1);
  EXPECT_EQ(crop(4, 4, 0, 0, 4, 3), -1);
  EXPECT_EQ(crop(4, 4, 0, 0, INT_MAX, INT_MAX), -1);
  EXPECT_EQ(crop(4, 4, 0, 0, 3, 4), -1);
  EXPECT_EQ(ConvertNV12ToNV12(nullptr, 4, 4, 0, 0, 3, 3, dst), -1);
}

}  // namespace
}  // namespace frames_test
