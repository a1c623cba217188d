/// @file
/// Pixel layouts and rotations of the frame functions, and the words that their contracts use.
///
/// Frame: the caller's whole buffer, tightly packed unless a function takes a stride. Sizes and strides are
/// in pixels, results in bytes; all divisions truncate.
/// I420: Y plane (width x height bytes), then U (Cb), then V (Cr), each (width / 2) x (height / 2) bytes; a
/// frame has width * height * 3 / 2 bytes. YV12 has V before U. NV12 and NV21 have one plane of interleaved
/// chroma pairs behind the Y plane, U V and V U respectively. YUY2 is Y0 U Y1 V, UYVY is U Y0 V Y1.
/// RGB layouts are given in memory order where they are used; 16-bit words are little-endian.
#pragma once

#include <cstdint>

/// Frame functions and settings records, where applications expect them.
namespace webrtc {

/// Any other value is an unknown layout: 32 bits per pixel to CalcBufferSize, refused by the conversions.
enum VideoType : std::uint32_t {
  kUnknown = 0,         ///< no layout
  kI420 = 1,            ///< planes Y, U, V
  kI420Alt = 2,         ///< known to the type check of interpolator only
  kRGB24 = 3,           ///< three bytes
  kARGB = 4,            ///< four bytes
  kARGB4444 = 5,        ///< words of 16 bits
  kRGB565 = 6,          ///< words of 16 bits
  kARGB1555 = 7,        ///< words of 16 bits
  kYUY2 = 8,            ///< Y0 U Y1 V
  kYV12 = 9,            ///< planes Y, V, U
  kUYVY = 10,           ///< U Y0 V Y1
  kUnsupported32 = 11,  ///< 32 bits a pixel, refused by the conversions
  kNV21 = 12,           ///< plane Y, pairs V U
  kNV12 = 13,           ///< plane Y, pairs U V
};

/// Degrees, clockwise.
enum VideoRotationMode : std::int32_t {
  kRotateNone = 0,             ///< not turned
  kRotateClockwise = 90,       ///< a quarter to the right
  kRotateAntiClockwise = -90,  ///< a quarter to the left
  kRotate180 = 180,            ///< upside down
};

}  // namespace webrtc
