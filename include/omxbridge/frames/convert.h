/// @file
/// Buffer sizes, and the two dispatchers that route any supported layout to and from I420.
/// Any thread; nothing is allocated, the caller sizes the destination (with CalcBufferSize, say).
#pragma once

#include "omxbridge/export.h"
#include "omxbridge/frames/types.h"

namespace webrtc {

/// Bytes of one frame: width * height * bits / 8, in 32-bit arithmetic that wraps. A layout without an
/// entry counts as 32 bits per pixel.
OMXBRIDGE_EXPORT int CalcBufferSize(VideoType type, unsigned int width, unsigned int height);

/// Bytes that a frame of srcSize bytes takes in another layout: srcSize * target bits / source bits, in
/// 32-bit arithmetic that wraps. Targets above kUYVY, kNV12 and kNV21 among them, count as 32 bits.
OMXBRIDGE_EXPORT int CalcBufferSize(VideoType srcType, VideoType dstType, unsigned int srcSize);

/// Converts a width x height frame to I420, rotated where asked (then height x width for the quarter turns).
/// interlaced matters to kYUY2 and kUYVY only; rotate to kI420, kYV12, kNV12 and kNV21 only, every other
/// type ignores it. kRGB24 is read top-down, which is not how ConvertFromI420 writes it. A plain kI420 copy
/// is CalcBufferSize bytes long, which for frames of 512 MiB and more is short of the frame.
/// Results: what the conversion returns (bytes written); -1 for a zero width or height, before the type is
/// looked at, or a frame above 2147483647 bytes; 0 for an unsupported type or rotation.
OMXBRIDGE_EXPORT int ConvertToI420(VideoType srcType, const unsigned char* src, unsigned int width,
                                   unsigned int height, unsigned char* dst, bool interlaced,
                                   VideoRotationMode rotate);

/// Converts an I420 frame to kI420, kRGB24 (bottom-up), kARGB (top-down), kARGB4444, kRGB565, kARGB1555 (all
/// bottom-up), kYUY2, kYV12 or kUYVY. interlaced and rotate are ignored.
/// Results as for ConvertToI420.
OMXBRIDGE_EXPORT int ConvertFromI420(VideoType dstType, const unsigned char* src, unsigned int width,
                                     unsigned int height, unsigned char* dst, bool interlaced,
                                     VideoRotationMode rotate);

}  // namespace webrtc
