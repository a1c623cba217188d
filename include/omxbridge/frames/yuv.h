/// @file
/// YUV and RGB layouts to I420, and I420 to planar, semi-planar and packed YUV layouts. Any thread.
///
/// stride: distance of destination luma rows in pixels, 0 for the width; a stride other than 0 below the
/// width is refused. Bytes between width and stride keep their value.
/// Where an odd last row or column "is left alone", its destination bytes keep their value.
/// Three offsets of the third plane are in use, which differ for sizes that are no multiples of 4:
/// "by area" width * height + width * height / 4, "by rows" width * (height + height / 4), "by samples"
/// width * height + (width / 2) * (height / 2). Each function says which one it uses; where it says nothing
/// it is the first.
/// Results: as given; -1 for a zero size, a refused stride, or a result above 2147483647.
#pragma once

#include "omxbridge/export.h"
#include "omxbridge/frames/types.h"

namespace webrtc {

/// @name Planar
/// @{

/// Copies the planes, exchanging the two chroma planes of width * height / 4 bytes each.
/// Result width * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertYV12ToI420(const unsigned char* src, unsigned int width, unsigned int height,
                                       unsigned char* dst);

/// Y rows stride bytes apart, V rows stride / 2 apart from stride * height on, U rows from
/// stride * height + height * (stride / 2) / 2 on. A height of 1 writes the luma row only.
/// Result stride * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertI420ToYV12(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height, unsigned int stride);

/// stride 0 or width: copies height / 2 * width * 3 bytes in one piece, which for an odd height is less than
/// the frame. Otherwise Y rows stride bytes apart and, unless the height is 1, U and then V rows stride / 2
/// apart directly behind them; for an odd height these are more bytes than the result says, so the
/// destination must have room for stride * height * 3 / 2.
/// Result height / 2 * stride * 3; a zero size is no error here: 0, nothing written, once the stride is fine.
OMXBRIDGE_EXPORT int ConvertI420ToI420(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height, unsigned int stride);

/// Centred copy into a frame of another size. Each axis on its own crops or pads half the difference at the
/// top or left and the rest at the bottom or right; chroma margins are half the luma margins. Padding is
/// luma 0 and chroma 127. Equal sizes: dstHeight / 2 * dstWidth * 3 bytes are copied in one piece.
/// Result dstHeight / 2 * dstWidth * 3; the destination must have room for dstWidth * dstHeight * 3 / 2.
OMXBRIDGE_EXPORT int ConvertI420ToI420(const unsigned char* src, unsigned int srcWidth,
                                       unsigned int srcHeight, unsigned char* dst, unsigned int dstWidth,
                                       unsigned int dstHeight);

/// @}

/// @name Semi-planar
/// @{

/// Copies Y and interleaves width * height / 4 chroma pairs, U first, counted over the plane and not per row.
/// Result width * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertI420ToNV12(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height);

/// As ConvertI420ToNV12(), V before U.
OMXBRIDGE_EXPORT int ConvertI420ToNV21(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height);

/// Copies Y and splits width * height / 4 chroma pairs. Result width * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertNV12ToI420(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height);

/// As ConvertNV12ToI420(), from pairs with V first.
OMXBRIDGE_EXPORT int ConvertNV21ToI420(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height);

/// Copies columns left to right and rows top to bottom (all included) of an NV12 frame, tightly packed, and
/// behind them chroma rows top / 2 to bottom / 2 of the same columns; with an odd left the pairs start with
/// a V byte. srcStride: distance of source rows in bytes; chroma starts srcStride * srcHeight bytes in. A
/// chroma row behind the frame (odd srcHeight) repeats the last one; without any, chroma is 128.
/// Results: 0; -1 for a null pointer, a stride or height below 1, or a rectangle that is empty or leaves the
/// frame.
OMXBRIDGE_EXPORT int ConvertNV12ToNV12(const unsigned char* src, int srcStride, int srcHeight, int left,
                                       int top, int right, int bottom, unsigned char* dst);

/// @}

/// @name Packed 4:2:2
/// @{

/// To Y0 U Y1 V. Destination rows stride * 2 bytes apart; both rows of a pair get the same chroma. Source V
/// plane by rows. An odd last row or column is left alone; a height of 1 writes nothing. Results stride *
/// height * 2.
OMXBRIDGE_EXPORT int ConvertI420ToYUY2(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height, unsigned int stride = 0);

/// As ConvertI420ToYUY2(), to U Y0 V Y1.
OMXBRIDGE_EXPORT int ConvertI420ToUYVY(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height, unsigned int stride = 0);

/// Source rows width * 2 bytes apart. Chroma is the rounded-up average of the sample in the first row of
/// a pair and the byte width bytes further on, half way along that row.
/// Destination V plane by rows: where it overlaps U (height % 4 above 1) the pair of rows further down wins,
/// within a pair V. An odd last row or column is left alone; a height of 1 writes nothing.
/// Results height / 2 * width * 3; the destination must have room for width * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertYUY2ToI420(unsigned int width, unsigned int height, const unsigned char* src,
                                       unsigned char* dst);

/// As the function before it, from U Y0 V Y1, but chroma is that of the first row of a pair.
OMXBRIDGE_EXPORT int ConvertUYVYToI420(unsigned int width, unsigned int height, const unsigned char* src,
                                       unsigned char* dst);

/// Centred crop or pad on the way; chroma of the first row of each pair. A smaller source is placed half the
/// difference from the top and left (chroma a quarter), with luma 0 and chroma 127 around it; of a larger one
/// half of the surplus rows are skipped, and srcWidth - dstWidth bytes of each row: half the surplus pixels,
/// but for differences that are no multiple of 4 bytes luma and chroma bytes are then taken for each other.
/// An odd last row or column of the picture is left alone, the single row of a picture of height 1 too.
/// Results dstWidth * dstHeight * 3 / 2.
OMXBRIDGE_EXPORT int ConvertYUY2ToI420(const unsigned char* src, unsigned int srcWidth,
                                       unsigned int srcHeight, unsigned char* dst, unsigned int dstWidth,
                                       unsigned int dstHeight);

/// As the function before it, from U Y0 V Y1.
OMXBRIDGE_EXPORT int ConvertUYVYToI420(const unsigned char* src, unsigned int srcWidth,
                                       unsigned int srcHeight, unsigned char* dst, unsigned int dstWidth,
                                       unsigned int dstHeight);

/// As ConvertYUY2ToI420() with two sizes, for interlaced frames: only the first row of each source pair is
/// read. It gives the first output row of the pair and the chroma; luma of the second is the average, rounded
/// down, with the next pair's first row, and in the last pair a copy. Destination V plane by rows,
/// overlapping as above.
OMXBRIDGE_EXPORT int ConvertYUY2ToI420interlaced(const unsigned char* src, unsigned int srcWidth,
                                                 unsigned int srcHeight, unsigned char* dst,
                                                 unsigned int dstWidth, unsigned int dstHeight);

/// As ConvertYUY2ToI420interlaced(), from U Y0 V Y1.
OMXBRIDGE_EXPORT int ConvertUYVYToI420interlaced(const unsigned char* src, unsigned int srcWidth,
                                                 unsigned int srcHeight, unsigned char* dst,
                                                 unsigned int dstWidth, unsigned int dstHeight);

/// @}

/// @name RGB
/// @{

/// RGB24 (B, G, R): BT.601 limited range in 8-bit fixed point, chroma of the top left pixel of each block of
/// 2 x 2. Top-down, source rows tightly packed. An odd last row or column is left alone; a height of 1 writes
/// nothing. Result width * height * 3 / 2.
OMXBRIDGE_EXPORT int ConvertRGB24ToI420(unsigned int width, unsigned int height, const unsigned char* src,
                                        unsigned char* dst);

/// As ConvertRGB24ToI420() with one size, from four bytes per pixel: ignored, R, G, B.
OMXBRIDGE_EXPORT int ConvertARGBMacToI420(unsigned int width, unsigned int height, const unsigned char* src,
                                          unsigned char* dst);

/// As ConvertRGB24ToI420() with one size, from RGB565 words; components are widened with zero bits, so white
/// is 248, 252, 248.
OMXBRIDGE_EXPORT int ConvertRGB565ToI420(const unsigned char* src, unsigned int width, unsigned int height,
                                         unsigned char* dst);

/// RGB24 (B, G, R) bottom-up, with centred crop or pad: of a larger source half of the surplus rows and
/// columns are skipped (the first ones in memory), a smaller one is placed half the difference from the top
/// and left (chroma a quarter) with luma 0 and chroma 127 around it. Chroma is that of the block's left pixel
/// in the second source row, the upper one of the picture. An odd last column or source row of the picture is
/// filled with luma 0.
/// Result dstWidth / 2 * dstHeight * 3; the destination must have room for dstWidth * dstHeight * 3 / 2.
OMXBRIDGE_EXPORT int ConvertRGB24ToI420(const unsigned char* src, unsigned int srcWidth,
                                        unsigned int srcHeight, unsigned char* dst, unsigned int dstWidth,
                                        unsigned int dstHeight);
/// @}

}  // namespace webrtc
