/// @file
/// Rotation and mirroring of I420, YV12, NV12 and NV21 frames into I420 frames. Any thread.
///
/// Chroma planes have (width / 2) x (height / 2) samples and the third plane starts
/// width * height + (width / 2) * (height / 2) bytes in, in source and result; bytes behind it (odd sizes
/// only) keep their value. Luma is complete for odd sizes too.
/// Results: width * height * 3 / 2, unless a function says otherwise; -1 for an unsupported type, a zero
/// size, a destination size that does not fit, or a result above 2147483647.
#pragma once

#include "omxbridge/export.h"
#include "omxbridge/frames/types.h"

namespace webrtc {

/// Turns by 90 degrees: result pixel (row i, column j) is source pixel (srcHeight - 1 - j, i). type is kI420
/// or kYV12 (whose chroma planes change places on the way); dstWidth must be srcHeight, dstHeight srcWidth.
OMXBRIDGE_EXPORT int ConvertToI420AndRotateClockwise(const unsigned char* src, unsigned int srcWidth,
                                                     unsigned int srcHeight, unsigned char* dst,
                                                     unsigned int dstWidth, unsigned int dstHeight,
                                                     VideoType type);

/// The opposite turn: result pixel (row i, column j) is source pixel (j, srcWidth - 1 - i).
OMXBRIDGE_EXPORT int ConvertToI420AndRotateAntiClockwise(const unsigned char* src, unsigned int srcWidth,
                                                         unsigned int srcHeight, unsigned char* dst,
                                                         unsigned int dstWidth, unsigned int dstHeight,
                                                         VideoType type);

/// Turns by 180 degrees: each plane with its bytes in reverse order; type as above. Result: the bytes
/// written, width * height + 2 * (width / 2) * (height / 2).
OMXBRIDGE_EXPORT int ConvertToI420AndMirrorUpDown(const unsigned char* src, unsigned char* dst,
                                                  unsigned int width, unsigned int height, VideoType type);

/// Semi-planar to I420 with the turn of the same name. width and height are the source's; its chroma rows
/// are (width / 2) pairs apart. Results: as the functions above.
OMXBRIDGE_EXPORT int ConvertNV12ToI420AndRotateClockwise(const unsigned char* src, unsigned char* dst,
                                                         unsigned int width, unsigned int height);

/// As ConvertNV12ToI420AndRotateClockwise(), the other way round.
OMXBRIDGE_EXPORT int ConvertNV12ToI420AndRotateAntiClockwise(const unsigned char* src, unsigned char* dst,
                                                             unsigned int width, unsigned int height);

/// As ConvertNV12ToI420AndRotateClockwise(), by 180 degrees.
OMXBRIDGE_EXPORT int ConvertNV12ToI420AndRotate180(const unsigned char* src, unsigned char* dst,
                                                   unsigned int width, unsigned int height);

/// As ConvertNV12ToI420AndRotateClockwise(), from pairs with V first.
OMXBRIDGE_EXPORT int ConvertNV21ToI420AndRotateClockwise(const unsigned char* src, unsigned char* dst,
                                                         unsigned int width, unsigned int height);

/// As ConvertNV21ToI420AndRotateClockwise(), the other way round.
OMXBRIDGE_EXPORT int ConvertNV21ToI420AndRotateAntiClockwise(const unsigned char* src, unsigned char* dst,
                                                             unsigned int width, unsigned int height);

/// As ConvertNV21ToI420AndRotateClockwise(), by 180 degrees.
OMXBRIDGE_EXPORT int ConvertNV21ToI420AndRotate180(const unsigned char* src, unsigned char* dst,
                                                   unsigned int width, unsigned int height);

/// Rows in reverse order: the picture stands on its head, left stays left.
OMXBRIDGE_EXPORT int MirrorI420UpDown(const unsigned char* src, unsigned char* dst, unsigned int width,
                                      unsigned int height);

/// Bytes of each row in reverse order: left and right change places.
OMXBRIDGE_EXPORT int MirrorI420LeftRight(const unsigned char* src, unsigned char* dst, unsigned int width,
                                         unsigned int height);

}  // namespace webrtc
