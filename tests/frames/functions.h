// The functions between two frames, each with its plain statement. Those that a dispatcher finds by type can
// be called through it as well.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <tuple>

#include "omxbridge/frames.h"
#include "tests/frames/reference_rgb.h"
#include "tests/frames/reference_scale.h"
#include "tests/frames/reference_yuv.h"

namespace frames_test {

using namespace webrtc;
using reference::Bytes;
using reference::Conversion;
using reference::Size;
using In = const std::uint8_t*;
using Out = std::uint8_t*;

// How sizes and stride may differ: not at all, rows a stride apart, any other size, a larger one.
enum class Shape { kTight, kStrided, kCentred, kPadded };

struct Call {
  Shape shape;
  std::function<int(In src, Out dst, Size from, Size to, unsigned stride)> run;
};

struct Function {
  std::string name;
  Call call;
  unsigned srcHalves, dstHalves;  // bytes per two pixels
  Conversion reference;
  std::optional<Call> dispatched{};  // without a stride
};

inline Call tight(int (*f)(In, Out, unsigned, unsigned)) {
  return {Shape::kTight, [=](In s, Out d, Size a, Size, unsigned) { return f(s, d, a.width, a.height); }};
}
inline Call sizeFirst(int (*f)(unsigned, unsigned, In, Out)) {
  return {Shape::kTight, [=](In s, Out d, Size a, Size, unsigned) { return f(a.width, a.height, s, d); }};
}
inline Call sizeBetween(int (*f)(In, unsigned, unsigned, Out)) {
  return {Shape::kTight, [=](In s, Out d, Size a, Size, unsigned) { return f(s, a.width, a.height, d); }};
}
inline Call inPlace(int (*f)(unsigned, unsigned, Out)) {
  return {Shape::kTight, [=](In, Out d, Size a, Size, unsigned) { return f(a.width, a.height, d); }};
}
inline Call strided(int (*f)(In, Out, unsigned, unsigned, unsigned)) {
  return {Shape::kStrided,
          [=](In s, Out d, Size a, Size, unsigned n) { return f(s, d, a.width, a.height, n); }};
}
inline Call centred(int (*f)(In, unsigned, unsigned, Out, unsigned, unsigned)) {
  return {Shape::kCentred, [=](In s, Out d, Size a, Size b, unsigned) {
            return f(s, a.width, a.height, d, b.width, b.height);
          }};
}
inline Call padded(int (*f)(In, Out, unsigned, unsigned, unsigned, unsigned)) {
  return {Shape::kPadded, [=](In s, Out d, Size a, Size b, unsigned) {
            return f(s, d, a.width, a.height, b.width, b.height);
          }};
}
inline Call dispatched(decltype(&ConvertToI420) f, VideoType type, VideoRotationMode turn, bool interlaced) {
  return {Shape::kTight, [=](In s, Out d, Size a, Size, unsigned) {
            return f(type, s, a.width, a.height, d, interlaced, turn);
          }};
}
inline Call from(VideoType type, VideoRotationMode turn = kRotateNone, bool interlaced = false) {
  return dispatched(ConvertToI420, type, turn, interlaced);
}
inline Call to(VideoType type) {
  return dispatched(ConvertFromI420, type, kRotateNone, false);
}

inline std::vector<Function> functions() {
  using namespace reference;
  using enum Turn;
  using enum Chroma;
  using enum Rows;
  std::vector<Function> all{
      {"I420FromI420", from(kI420), 3, 3, sameFrame},
      {"I420IntoI420", to(kI420), 3, 3, sameFrame},
      {"YV12ToI420", sizeBetween(ConvertYV12ToI420), 3, 3, exchangeChroma, from(kYV12)},
      {"I420ToNV12", tight(ConvertI420ToNV12), 3, 3, pairs<true, false>},
      {"I420ToNV21", tight(ConvertI420ToNV21), 3, 3, pairs<true, true>},
      {"NV12ToI420", tight(ConvertNV12ToI420), 3, 3, pairs<false, false>, from(kNV12)},
      {"NV21ToI420", tight(ConvertNV21ToI420), 3, 3, pairs<false, true>, from(kNV21)},
      {"YUY2ToI420", sizeFirst(ConvertYUY2ToI420), 4, 3, unpack<kYuy2, true>},
      {"UYVYToI420", sizeFirst(ConvertUYVYToI420), 4, 3, unpack<kUyvy, false>, from(kUYVY)},
      {"I420ToYV12", strided(ConvertI420ToYV12), 3, 3, i420ToYv12, to(kYV12)},
      {"I420ToI420", strided(ConvertI420ToI420), 3, 3, i420ToI420},
      {"RGB24ToARGB", strided(ConvertRGB24ToARGB), 6, 8, rgb24ToArgb},
      {"I420ToYUY2", strided(ConvertI420ToYUY2), 3, 4, pack<kYuy2>, to(kYUY2)},
      {"I420ToUYVY", strided(ConvertI420ToUYVY), 3, 4, pack<kUyvy>, to(kUYVY)},
      {"I420Centred", centred(ConvertI420ToI420), 3, 3, i420Centred},
      {"YUY2Centred", centred(ConvertYUY2ToI420), 4, 3, unpackCentred<kYuy2, false>, from(kYUY2)},
      {"UYVYCentred", centred(ConvertUYVYToI420), 4, 3, unpackCentred<kUyvy, false>},
      {"YUY2Interlaced", centred(ConvertYUY2ToI420interlaced), 4, 3, unpackCentred<kYuy2, true>,
       from(kYUY2, kRotateNone, true)},
      {"UYVYInterlaced", centred(ConvertUYVYToI420interlaced), 4, 3, unpackCentred<kUyvy, true>,
       from(kUYVY, kRotateNone, true)},
      {"RGB24Centred", centred(ConvertRGB24ToI420), 6, 3, rgb24Centred},
      {"RGB24ToI420", sizeFirst(ConvertRGB24ToI420), 6, 3, fromRgb<Rgb::k24>, from(kRGB24)},
      {"ARGBMacToI420", sizeFirst(ConvertARGBMacToI420), 8, 3, fromRgb<Rgb::kMac>},
      {"RGB565ToI420", sizeBetween(ConvertRGB565ToI420), 4, 3, fromRgb<Rgb::k565>, from(kRGB565)},
      {"RGB24", tight(ConvertI420ToRGB24), 3, 6, toRgb<bgra, 3, kBottomUp>, to(kRGB24)},
      {"RGB24_EX", tight(ConvertI420ToRGB24_EX), 3, 6, toRgb<bgra, 3, kTopDown>},
      {"ARGB", strided(ConvertI420ToARGB), 3, 8, toRgb<bgra, 4, kTopDown>, to(kARGB)},
      {"ARGBMac", strided(ConvertI420ToARGBMac), 3, 8, toRgb<bgra, 4, kTopDown, kVThenU>},
      {"RGBAMac", strided(ConvertI420ToRGBAMac), 3, 8, toRgb<argb, 4, kTopDown, kVThenU>},
      {"RGBAIPhone", strided(ConvertI420ToRGBAIPhone), 3, 8, toRgb<rgba, 4, kBottomUp>},
      {"ARGB4444", strided(ConvertI420ToARGB4444), 3, 4, toRgb<word4444, 2, kBottomUp>, to(kARGB4444)},
      {"ARGB4444_EX", strided(ConvertI420ToARGB4444_EX), 3, 4, toRgb<word4444, 2, kHalfStride>},
      {"RGB565", tight(ConvertI420ToRGB565), 3, 4, toRgb<word565, 2, kBottomUp>, to(kRGB565)},
      {"RGB565_EX", tight(ConvertI420ToRGB565_EX), 3, 4, toRgb<word565, 2, kTopDown>},
      {"RGB565Android", tight(ConvertI420ToRGB565Android), 3, 4, toRgb<word565, 2, kTopDown>},
      {"ARGB1555", strided(ConvertI420ToARGB1555), 3, 4, toRgb<word1555, 2, kBottomUp, kUThenV, false>,
       to(kARGB1555)},
      {"ARGB1555_EX", strided(ConvertI420ToARGB1555_EX), 3, 4, toRgb<word1555, 2, kTopDown, kUThenV, false>},
      {"NV12ToRGB565", tight(ConvertNV12ToRGB565), 3, 4, toRgb<word565, 2, kBottomUp, kUvPairs>},
      {"UpHalf", inPlace(ScaleI420UpHalfFrame), 0, 3, upHalf},
      {"DownHalf", inPlace(ScaleI420DownHalfFrame), 0, 3, downHalf},
      {"Quarter", inPlace(ScaleI420FrameQuarter), 0, 3, quarter},
      {"Pad", padded(PadI420Frame), 3, 3, pad},
      {"UpDown", tight(MirrorI420UpDown), 3, 3, turn(kUpDown, kUThenV)},
      {"LeftRight", tight(MirrorI420LeftRight), 3, 3, turn(kLeftRight, kUThenV)},
  };
  const std::tuple<std::string, VideoType, Chroma> layouts[] = {{"I420", kI420, kUThenV},
                                                                {"YV12", kYV12, kVThenU},
                                                                {"NV12", kNV12, kUvPairs},
                                                                {"NV21", kNV21, kVuPairs}};
  for (const auto& [layout, type, chroma] : layouts) {
    all.push_back({layout + "Clockwise", from(type, kRotateClockwise), 3, 3, turn(kClockwise, chroma)});
    all.push_back(
        {layout + "AntiClockwise", from(type, kRotateAntiClockwise), 3, 3, turn(kAntiClockwise, chroma)});
    all.push_back({layout + "Half", from(type, kRotate180), 3, 3, turn(kHalf, chroma)});
  }
  return all;
}

}  // namespace frames_test
