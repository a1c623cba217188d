#include <cstring>

#include "frames/geometry.h"
#include "omxbridge/frames/convert.h"
#include "omxbridge/frames/rgb.h"
#include "omxbridge/frames/rotate.h"
#include "omxbridge/frames/yuv.h"

namespace webrtc {
namespace {

using namespace detail;

constexpr unsigned kBitsUnknown = 32;

// Bits per pixel from kI420 on.
constexpr unsigned kSourceBits[] = {12, 12, 24, 32, 16, 16, 16, 16, 12, 16, 32, 12, 12};
// Kept: targets end at kUYVY, so that NV12 and NV21 count as 32 bits. Callers size their buffers by it.
constexpr unsigned kTargetBits[] = {12, 12, 24, 32, 16, 16, 16, 16, 12, 16};

template <std::size_t kTypes>
unsigned bitsOf(const unsigned (&table)[kTypes], VideoType type) {
  return type >= kI420 && type <= kTypes ? table[type - kI420] : kBitsUnknown;
}

int copyI420(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  if (i420Bytes(width, height) == kRefused) return kRefused;
  // Kept: this count wraps for frames of 512 MiB and more, and the copy is then short of the frame.
  const int bytes = CalcBufferSize(kI420, width, height);
  std::memcpy(dst, src, static_cast<std::size_t>(bytes));
  return bytes;
}

int copyYv12(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  return ConvertYV12ToI420(src, width, height, dst);
}

template <VideoType kType>
int turnClockwise(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  return ConvertToI420AndRotateClockwise(src, width, height, dst, height, width, kType);
}

template <VideoType kType>
int turnAntiClockwise(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  return ConvertToI420AndRotateAntiClockwise(src, width, height, dst, height, width, kType);
}

template <VideoType kType>
int turnHalf(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  return ConvertToI420AndMirrorUpDown(src, dst, width, height, kType);
}

// The conversions of a layout that can be turned on the way.
struct Turns {
  using Conversion = int (*)(const std::uint8_t*, std::uint8_t*, unsigned, unsigned);
  Conversion none, clockwise, antiClockwise, half;
};

constexpr Turns kI420Turns = {copyI420, turnClockwise<kI420>, turnAntiClockwise<kI420>, turnHalf<kI420>};
constexpr Turns kYv12Turns = {copyYv12, turnClockwise<kYV12>, turnAntiClockwise<kYV12>, turnHalf<kYV12>};
constexpr Turns kNv12Turns = {ConvertNV12ToI420, ConvertNV12ToI420AndRotateClockwise,
                              ConvertNV12ToI420AndRotateAntiClockwise, ConvertNV12ToI420AndRotate180};
constexpr Turns kNv21Turns = {ConvertNV21ToI420, ConvertNV21ToI420AndRotateClockwise,
                              ConvertNV21ToI420AndRotateAntiClockwise, ConvertNV21ToI420AndRotate180};

int turned(const Turns& turns, VideoRotationMode rotate, const std::uint8_t* src, std::uint8_t* dst,
           unsigned width, unsigned height) {
  switch (rotate) {
    case kRotateNone:
      return turns.none(src, dst, width, height);
    case kRotateClockwise:
      return turns.clockwise(src, dst, width, height);
    case kRotateAntiClockwise:
      return turns.antiClockwise(src, dst, width, height);
    case kRotate180:
      return turns.half(src, dst, width, height);
  }
  return 0;
}

}  // namespace

int CalcBufferSize(VideoType type, unsigned int width, unsigned int height) {
  return static_cast<int>((bitsOf(kSourceBits, type) * (width * height)) >> 3);
}

int CalcBufferSize(VideoType srcType, VideoType dstType, unsigned int srcSize) {
  return static_cast<int>(srcSize * bitsOf(kTargetBits, dstType) / bitsOf(kSourceBits, srcType));
}

int ConvertToI420(VideoType srcType, const unsigned char* src, unsigned int width, unsigned int height,
                  unsigned char* dst, bool interlaced, VideoRotationMode rotate) {
  if (width == 0 || height == 0) return kRefused;
  switch (srcType) {
    case kI420:
      return turned(kI420Turns, rotate, src, dst, width, height);
    case kYV12:
      return turned(kYv12Turns, rotate, src, dst, width, height);
    case kNV12:
      return turned(kNv12Turns, rotate, src, dst, width, height);
    case kNV21:
      return turned(kNv21Turns, rotate, src, dst, width, height);
    // Kept: the two packed layouts take different functions, whose chroma differs for many heights.
    case kYUY2:
      return interlaced ? ConvertYUY2ToI420interlaced(src, width, height, dst, width, height)
                        : ConvertYUY2ToI420(src, width, height, dst, width, height);
    case kUYVY:
      return interlaced ? ConvertUYVYToI420interlaced(src, width, height, dst, width, height)
                        : ConvertUYVYToI420(width, height, src, dst);
    case kRGB24:
      return ConvertRGB24ToI420(width, height, src, dst);
    case kRGB565:
      return ConvertRGB565ToI420(src, width, height, dst);
    default:
      return 0;
  }
}

int ConvertFromI420(VideoType dstType, const unsigned char* src, unsigned int width, unsigned int height,
                    unsigned char* dst, bool /*interlaced*/, VideoRotationMode /*rotate*/) {
  if (width == 0 || height == 0) return kRefused;
  switch (dstType) {
    case kI420:
      return copyI420(src, dst, width, height);
    case kRGB24:
      return ConvertI420ToRGB24(src, dst, width, height);
    case kARGB:
      return ConvertI420ToARGB(src, dst, width, height, 0);
    case kARGB4444:
      return ConvertI420ToARGB4444(src, dst, width, height, 0);
    case kRGB565:
      return ConvertI420ToRGB565(src, dst, width, height);
    case kARGB1555:
      return ConvertI420ToARGB1555(src, dst, width, height, 0);
    case kYUY2:
      return ConvertI420ToYUY2(src, dst, width, height, 0);
    case kYV12:
      return ConvertI420ToYV12(src, dst, width, height, 0);
    case kUYVY:
      return ConvertI420ToUYVY(src, dst, width, height, 0);
    default:
      return 0;
  }
}

}  // namespace webrtc
