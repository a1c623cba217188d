/// @file
/// Scaling of I420 frames: fixed ratios in the caller's buffer, and any ratio bilinearly. Any thread; an
/// interpolator is used by one thread at a time.
///
/// Functions that take the buffer as a reference may replace it: the buffer comes from new unsigned char[]
/// and is released with delete[] when a larger one, from new unsigned char[] again, takes its place. The
/// caller releases what the reference holds in the end. If memory is short std::bad_alloc leaves the function
/// with the buffer as it was.
#pragma once

#include <cstdint>

#include "omxbridge/export.h"
#include "omxbridge/frames/types.h"

namespace webrtc {

/// @name In place
///
/// Averages are truncated. Results -1 for a zero size or a result above 2147483647. Bytes that are not
/// reached keep their old value.
/// @{

/// Doubles the width of a (width / 2) x height frame: n = width * height / 4 * 3 bytes become 2 * n. Output
/// byte 2i + 1 is input byte i, output byte 2i the average with the byte before it; rows and planes run into
/// each other, as they always have. Result width * height * 3 / 2, of which nothing beyond 2 * n is touched.
OMXBRIDGE_EXPORT int ScaleI420UpHalfFrame(unsigned int width, unsigned int height, unsigned char* buffer);

/// Halves the width by averaging pairs; chroma output directly behind the luma output. Luma input advances by
/// width rounded down to even per row, chroma input by width / 4 * 2. The result is (width / 2) * height * 3,
/// twice the size of the frame made.
OMXBRIDGE_EXPORT int ScaleI420DownHalfFrame(unsigned int width, unsigned int height, unsigned char* buffer);

/// Halves both directions by averaging blocks of 2 x 2; U and V count as one plane of height rows, so for
/// height % 4 above 1 one row mixes them. A height of 1 leaves the buffer alone. The result is
/// (width / 2) * height * 3, four times the size of the frame made.
OMXBRIDGE_EXPORT int ScaleI420FrameQuarter(unsigned int width, unsigned int height, unsigned char* buffer);

/// @}

/// @name In the caller's buffer, which may grow
///
/// bufferSize: capacity of buffer in bytes, at least the source frame. outWidth and outHeight tell the new
/// size, and with it the new capacity, where outWidth * outHeight * 3 / 2 is above bufferSize.
/// Results: outHeight * 3 * (outWidth / 2); -1, with buffer, outWidth and outHeight as they were, for a null
/// buffer, sizes that do not suit, a bufferSize below width * height * 3 / 2, or a result above 2147483647.
/// @{

/// A third of each direction: of each 3 x 3 block the average of the upper left 2 x 2. Sizes: above 5, even,
/// height / 3 even. An odd outWidth is raised by one: the extra pixel averages the last column's two samples.
OMXBRIDGE_EXPORT int ScaleI420Down1_3(unsigned int width, unsigned int height, unsigned char*& buffer,
                                      unsigned int bufferSize, unsigned int& outWidth,
                                      unsigned int& outHeight);

/// Three halves of each direction: behind every second sample the average with the next one is inserted, at a
/// new row and column the average of four; the last sample counts twice. Sizes: multiples of 4.
OMXBRIDGE_EXPORT int ScaleI420Up3_2(unsigned int width, unsigned int height, unsigned char*& buffer,
                                    unsigned int bufferSize, unsigned int& outWidth, unsigned int& outHeight);

/// Twice each direction: as ScaleI420Up3_2 with an average behind every sample. Sizes: even.
OMXBRIDGE_EXPORT int ScaleI420Up2(unsigned int width, unsigned int height, unsigned char*& buffer,
                                  unsigned int bufferSize, unsigned int& outWidth, unsigned int& outHeight);

/// @}

/// @name Bilinear
/// @{

/// Scales each plane, first vertically with 8 bits of fraction, then horizontally with 16. The arithmetic is
/// fixed to the byte and has its ways: whole positions take the row after, a flat value n above 0 becomes
/// n - 1 when the width changes, and where width stays the last column repeats the one before it. Chroma of
/// an odd srcWidth is read as rows of (srcWidth + 1) / 2 bytes. Samples behind the source frame count as the
/// last row or byte in it; a source of height 1 has no chroma, 128 is taken.
/// destination: reused if not null and destinationSize is at least dstWidth * dstHeight * 3 / 2, bytes behind
/// the frame then keep their value; otherwise replaced (and released last), and destinationSize becomes that
/// number. It may be the source's memory. For odd sizes, planes of (dstWidth / 2) x (dstHeight / 2) directly
/// follow each other and the rest of the frame is left alone (0 in a new array).
/// Results: dstHeight; -1, nothing touched, for a null source, a zero size, one above 65535, or an output
/// above 2147483647.
OMXBRIDGE_EXPORT int ScaleBilinear(const unsigned char* source, unsigned char*& destination,
                                   unsigned int srcWidth, unsigned int srcHeight, unsigned int dstWidth,
                                   unsigned int dstHeight, unsigned int& destinationSize);
/// @}

/// Methods of scaling.
enum interpolatorType : std::int32_t { kBilinear = 0 };

/// A remembered configuration in front of ScaleBilinear.
class OMXBRIDGE_EXPORT interpolator {
 public:
  interpolator();
  ~interpolator();

  /// 1 and stored for kBilinear; 0, nothing stored, for anything else.
  int Method(interpolatorType type);

  /// 0 when both types are the same and kI420, kI420Alt or kYV12; else -1.
  int SupportedVideoType(VideoType srcType, VideoType dstType);

  /// 0; -1 for a zero size, an unknown method, or a pair of types that SupportedVideoType accepts: only the
  /// others are taken. A refusal also ends an earlier configuration.
  int Set(unsigned int srcWidth, unsigned int srcHeight, unsigned int dstWidth, unsigned int dstHeight,
          VideoType srcType, VideoType dstType, interpolatorType type);

  /// As ScaleBilinear with the sizes set, whatever the types were; -1 for a null source, -2 if not set.
  int Interpolate(const unsigned char* source, unsigned char*& destination, unsigned int& destinationSize);

 private:
  /// In this order, and with these sizes: applications embed the object.
  interpolatorType method;
  std::uint32_t srcWidth;
  std::uint32_t srcHeight;
  std::uint32_t dstWidth;
  std::uint32_t dstHeight;
  bool set;
};

}  // namespace webrtc
