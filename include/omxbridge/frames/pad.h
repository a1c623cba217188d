/// @file
/// Padding of I420 frames with black borders, and cutting, without scaling. Any thread; nothing is allocated.
/// Fill is luma 0 and chroma 127. Every refusal is -1 and comes before anything is written.
#pragma once

#include "omxbridge/export.h"

namespace webrtc {

/// Two fixed sizes, told by the source frame's size in bytes; block must be true.
/// 115200: 320 x 240 into 352 x 288, 16 rows above and 32 below, 16 columns left and right; the last 4 bytes
/// of the left margin of the first V row keep their value. Result 152064.
/// 28800: rows 4 to 115 of 160 x 120 into 176 x 144, 16 rows above and below, 16 columns right. Result 38016.
/// -1 for any other size or block false.
OMXBRIDGE_EXPORT int PadI420Frame(unsigned int size, const unsigned char* src, unsigned char* dst,
                                  bool block);

/// Places a frame in a larger one. Margins at the top and left are half the difference; where the difference
/// is a multiple of 16 they are rounded down to one, too. Chroma: half of every quantity, planes directly one
/// after the other, so for odd sizes they may be smaller than the frame's and bytes behind them keep their
/// value. Equal sizes: the frame's size dstWidth * dstHeight * 3 / 2 is returned, nothing is copied.
/// Results: bytes written; -1 for a zero size, then (sizes differ) a null pointer or a destination smaller in
/// either direction, or a result above 2147483647.
OMXBRIDGE_EXPORT int PadI420Frame(const unsigned char* src, unsigned char* dst, unsigned int srcWidth,
                                  unsigned int srcHeight, unsigned int dstWidth, unsigned int dstHeight);

/// Adds nrRows rows below the picture, in place; size is the capacity of buffer. On success outSize becomes
/// (height + nrRows) * (width / 2 * 3) and 0 is returned; -1, with outSize as it was, if that or the bytes
/// that have to be written (more than that for an odd width) exceed size, or nrRows is negative.
OMXBRIDGE_EXPORT int PadI420BottomRows(unsigned char* buffer, unsigned int size, unsigned int width,
                                       unsigned int height, int nrRows, unsigned int& outSize);

/// Cuts the centred rectangle out, in place; bytes behind the smaller frame keep what they had. Chroma is
/// taken from ((fromWidth / 2) * ((fromHeight - toHeight) / 2)) / 2 + (fromWidth - toWidth) / 4 bytes into
/// its plane, in the middle of a row when the row count skipped is odd. Results: toWidth / 2 * toHeight * 3,
/// for equal sizes toWidth * toHeight * 3 / 2 with nothing done; -1 for a zero size, a rectangle larger than
/// the frame, or a result above 2147483647.
OMXBRIDGE_EXPORT int CutI420Frame(unsigned char* frame, unsigned int fromWidth, unsigned int fromHeight,
                                  unsigned int toWidth, unsigned int toHeight);

}  // namespace webrtc
