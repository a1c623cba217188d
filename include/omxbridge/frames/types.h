// Pixel layouts and rotations of the frame functions, and the words that their contracts use.
//
// Frame: the caller's whole buffer, tightly packed unless a function takes a stride. Sizes and strides are
// in pixels, results in bytes; all divisions truncate.
// I420: Y plane (width x height bytes), then U (Cb), then V (Cr), each (width / 2) x (height / 2) bytes; a
// frame has width * height * 3 / 2 bytes. YV12 has V before U. NV12 and NV21 have one plane of interleaved
// chroma pairs behind the Y plane, U V and V U respectively. YUY2 is Y0 U Y1 V, UYVY is U Y0 V Y1.
// RGB layouts are given in memory order where they are used; 16-bit words are little-endian.
#pragma once

#include <cstdint>

namespace webrtc {

// Any other value is an unknown layout: 32 bits per pixel to CalcBufferSize, refused by the conversions.
enum VideoType : std::uint32_t {
  kUnknown = 0,
  kI420 = 1,
  kI420Alt = 2,  // known to the type check of interpolator only
  kRGB24 = 3,
  kARGB = 4,
  kARGB4444 = 5,
  kRGB565 = 6,
  kARGB1555 = 7,
  kYUY2 = 8,
  kYV12 = 9,
  kUYVY = 10,
  kUnsupported32 = 11,
  kNV21 = 12,
  kNV12 = 13,
};

// Degrees, clockwise.
enum VideoRotationMode : std::int32_t {
  kRotateNone = 0,
  kRotateClockwise = 90,
  kRotateAntiClockwise = -90,
  kRotate180 = 180,
};

}  // namespace webrtc
