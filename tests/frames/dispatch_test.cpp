#include <gtest/gtest.h>

#include <functional>

#include "omxbridge/frames.h"
#include "tests/frames/harness.h"

namespace frames_test {
namespace {

using namespace webrtc;

VideoType type(unsigned value) {
  return static_cast<VideoType>(value);
}

TEST(CalcBufferSizeOfFrame, MultipliesTruncatesAndWraps) {
  EXPECT_EQ(CalcBufferSize(kI420, 640, 480), 460800);
  EXPECT_EQ(CalcBufferSize(kRGB24, 640, 480), 921600);
  EXPECT_EQ(CalcBufferSize(kI420, 3, 3), 13);
  EXPECT_EQ(CalcBufferSize(kNV12, 4, 4), 24);
  for (const unsigned unknown : {0u, 11u, 14u, 0xFFFFFFFFu})
    EXPECT_EQ(CalcBufferSize(type(unknown), 2, 2), 16);
  EXPECT_EQ(CalcBufferSize(kARGB, 0x8000, 0x1000), 0);
  EXPECT_EQ(CalcBufferSize(kI420, 0xFFFFFFFF, 1), 0x1FFFFFFE);
}

TEST(CalcBufferSizeOfFrame, RatioUsesTwoTables) {
  EXPECT_EQ(CalcBufferSize(kI420, kRGB24, 460800), 921600);
  EXPECT_EQ(CalcBufferSize(kI420, kNV12, 120), 320);
  EXPECT_EQ(CalcBufferSize(kNV12, kI420, 120), 120);
  EXPECT_EQ(CalcBufferSize(kUYVY, kYUY2, 100), 100);
  EXPECT_EQ(CalcBufferSize(kI420, kI420, 7), 7);
  EXPECT_EQ(CalcBufferSize(kRGB24, kI420, 7), 3);
  EXPECT_EQ(CalcBufferSize(kUnknown, type(99), 50), 50);
  EXPECT_EQ(CalcBufferSize(kI420, kARGB, 1u << 27), 0);
}

constexpr Size kFrame{12, 6};

// What a dispatcher must have called; null: nothing.
using Direct = std::function<int(const unsigned char* src, unsigned char* dst)>;

void expectSame(const Direct& dispatched, const Direct& direct, const std::string& what) {
  SCOPED_TRACE(what);
  Content content(61);
  const Bytes src = content.bytes(kFrame.area() * 4), dst = content.bytes(kFrame.area() * 4);
  Bytes expected = dst;
  const int result = direct ? direct(src.data(), expected.data()) : 0;
  expectConversion(dispatched, src, dst, expected, result);
}

TEST(Dispatch, ToI420CallsTheConversionOfEachTypeAndRotation) {
  constexpr unsigned w = kFrame.width, h = kFrame.height;
  using In = const unsigned char*;
  using Out = unsigned char*;
  const auto planar = [](VideoType t, int rotation) -> Direct {
    switch (rotation) {
      case 90:
        return [t](In s, Out d) { return ConvertToI420AndRotateClockwise(s, w, h, d, h, w, t); };
      case -90:
        return [t](In s, Out d) { return ConvertToI420AndRotateAntiClockwise(s, w, h, d, h, w, t); };
      case 180:
        return [t](In s, Out d) { return ConvertToI420AndMirrorUpDown(s, d, w, h, t); };
      default:
        return t == kYV12 ? Direct([](In s, Out d) { return ConvertYV12ToI420(s, w, h, d); })
                          : Direct([](In s, Out d) { return std::copy_n(s, 108, d) != nullptr ? 108 : 0; });
    }
  };
  const auto semiPlanar = [](bool nv12, int rotation) -> Direct {
    const auto choose = [=](auto nv12Call, auto nv21Call) {
      return Direct([=](In s, Out d) { return (nv12 ? nv12Call : nv21Call)(s, d, w, h); });
    };
    switch (rotation) {
      case 90:
        return choose(ConvertNV12ToI420AndRotateClockwise, ConvertNV21ToI420AndRotateClockwise);
      case -90:
        return choose(ConvertNV12ToI420AndRotateAntiClockwise, ConvertNV21ToI420AndRotateAntiClockwise);
      case 180:
        return choose(ConvertNV12ToI420AndRotate180, ConvertNV21ToI420AndRotate180);
      default:
        return choose(ConvertNV12ToI420, ConvertNV21ToI420);
    }
  };
  for (const bool interlaced : {false, true}) {
    for (const int rotation : {0, 90, -90, 180, 45, 270}) {
      const bool turns = rotation != 45 && rotation != 270;
      const auto direct = [&](unsigned value) -> Direct {
        switch (value) {
          case kI420:
          case kYV12:
            return turns ? planar(type(value), rotation) : nullptr;
          case kNV12:
          case kNV21:
            return turns ? semiPlanar(value == kNV12, rotation) : nullptr;
          case kYUY2:
            return interlaced ? [](In s, Out d) { return ConvertYUY2ToI420interlaced(s, w, h, d, w, h); }
                              : [](In s, Out d) { return ConvertYUY2ToI420(s, w, h, d, w, h); };
          case kUYVY:
            return interlaced ? [](In s, Out d) { return ConvertUYVYToI420interlaced(s, w, h, d, w, h); }
                              : [](In s, Out d) { return ConvertUYVYToI420(w, h, s, d); };
          case kRGB24:
            return [](In s, Out d) { return ConvertRGB24ToI420(w, h, s, d); };
          case kRGB565:
            return [](In s, Out d) { return ConvertRGB565ToI420(s, w, h, d); };
          default:
            return nullptr;
        }
      };
      for (unsigned value = 0; value < 16; ++value) {
        const auto mode = static_cast<VideoRotationMode>(rotation);
        expectSame([&](In s, Out d) { return ConvertToI420(type(value), s, w, h, d, interlaced, mode); },
                   direct(value), "type " + std::to_string(value) + " turned by " + std::to_string(rotation));
      }
    }
  }
}

TEST(Dispatch, FromI420CallsTheConversionOfEachType) {
  constexpr unsigned w = kFrame.width, h = kFrame.height;
  using In = const unsigned char*;
  using Out = unsigned char*;
  const auto direct = [](unsigned value) -> Direct {
    switch (value) {
      case kI420:
        return [](In s, Out d) { return std::copy_n(s, 108, d) != nullptr ? 108 : 0; };
      case kRGB24:
        return [](In s, Out d) { return ConvertI420ToRGB24(s, d, w, h); };
      case kARGB:
        return [](In s, Out d) { return ConvertI420ToARGB(s, d, w, h, 0); };
      case kARGB4444:
        return [](In s, Out d) { return ConvertI420ToARGB4444(s, d, w, h, 0); };
      case kRGB565:
        return [](In s, Out d) { return ConvertI420ToRGB565(s, d, w, h); };
      case kARGB1555:
        return [](In s, Out d) { return ConvertI420ToARGB1555(s, d, w, h, 0); };
      case kYUY2:
        return [](In s, Out d) { return ConvertI420ToYUY2(s, d, w, h, 0); };
      case kYV12:
        return [](In s, Out d) { return ConvertI420ToYV12(s, d, w, h, 0); };
      case kUYVY:
        return [](In s, Out d) { return ConvertI420ToUYVY(s, d, w, h, 0); };
      default:
        return nullptr;
    }
  };
  for (unsigned value = 0; value < 16; ++value) {
    expectSame([&](In s, Out d) { return ConvertFromI420(type(value), s, w, h, d, true, kRotate180); },
               direct(value), "type " + std::to_string(value));
  }
}

TEST(Dispatch, RefusesZeroSizesBeforeTheType) {
  for (unsigned value = 0; value < 16; ++value) {
    EXPECT_EQ(ConvertToI420(type(value), nullptr, 0, 10, nullptr, false, kRotateNone), -1);
    EXPECT_EQ(ConvertToI420(type(value), nullptr, 10, 0, nullptr, false, kRotateClockwise), -1);
    EXPECT_EQ(ConvertFromI420(type(value), nullptr, 0, 10, nullptr, false, kRotateNone), -1);
    EXPECT_EQ(ConvertFromI420(type(value), nullptr, 10, 0, nullptr, false, kRotateNone), -1);
  }
  EXPECT_EQ(ConvertToI420(kI420, nullptr, 0x10000, 0x10000, nullptr, false, kRotateNone), -1);
  EXPECT_EQ(ConvertFromI420(kI420, nullptr, 0x10000, 0x10000, nullptr, false, kRotateNone), -1);
}

}  // namespace
}  // namespace frames_test
