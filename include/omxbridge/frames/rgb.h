/// @file
/// I420 (and NV12) to RGB layouts, BT.601 limited range in 8-bit fixed point. Any thread.
///
/// Common to all but ConvertRGB24ToARGB:
/// Source: the Y plane, the second plane width * height bytes in, the third width * height / 4 behind that.
/// The picture is worked off in blocks of 2 x 2 pixels, each with one chroma pair; an odd last column and an
/// odd last source row are not written. With an odd width the luma rows of each further pair of rows start
/// one byte earlier than the picture has them, so the picture leans: applications have always seen that.
/// Bottom-up: source row k goes to destination row height - 1 - k; top-down: to row k.
/// stride: distance of destination rows in pixels, 0 for the width; pixels between width and stride keep
/// their value.
/// Results: the bytes that the destination frame occupies; -1 for a zero size, a stride other than 0 below
/// the width, or a result above 2147483647. A height of 1 returns the size and writes nothing.
#pragma once

#include "omxbridge/export.h"
#include "omxbridge/frames/types.h"

namespace webrtc {

/// B, G, R; bottom-up. Result width * height * 3.
OMXBRIDGE_EXPORT int ConvertI420ToRGB24(const unsigned char* src, unsigned char* dst, unsigned int width,
                                        unsigned int height);

/// B, G, R; top-down. Result width * height * 3.
OMXBRIDGE_EXPORT int ConvertI420ToRGB24_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                                           unsigned int height);

/// B, G, R, 255; top-down. Result stride * height * 4.
OMXBRIDGE_EXPORT int ConvertI420ToARGB(const unsigned char* src, unsigned char* dst, unsigned int width,
                                       unsigned int height, unsigned int stride = 0);

/// B, G, R, 255; top-down; the plane behind luma is taken as Cr and the last one as Cb, so a Y, U, V frame
/// comes out with red and blue exchanged. Result stride * height * 4.
OMXBRIDGE_EXPORT int ConvertI420ToARGBMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                                          unsigned int height, unsigned int stride = 0);

/// 255, R, G, B; top-down; chroma planes exchanged as in ConvertI420ToARGBMac. Result stride * height * 4.
OMXBRIDGE_EXPORT int ConvertI420ToRGBAMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                                          unsigned int height, unsigned int stride = 0);

/// R, G, B, 255; bottom-up. Result stride * height * 4.
OMXBRIDGE_EXPORT int ConvertI420ToRGBAIPhone(const unsigned char* src, unsigned char* dst, unsigned int width,
                                             unsigned int height, unsigned int stride = 0);

/// Word 0xF000 | red << 8 | green << 4 | blue, the upper four bits of each; bottom-up.
/// Result stride * height * 2.
OMXBRIDGE_EXPORT int ConvertI420ToARGB4444(const unsigned char* src, unsigned char* dst, unsigned int width,
                                           unsigned int height, unsigned int stride = 0);

/// As ConvertI420ToARGB4444 but top-down, and with a stride only half honoured: the pair of rows p starts
/// p * (width + stride) * 2 bytes in, its second row stride * 2 bytes behind. Result stride * height * 2.
OMXBRIDGE_EXPORT int ConvertI420ToARGB4444_EX(const unsigned char* src, unsigned char* dst,
                                              unsigned int width, unsigned int height,
                                              unsigned int stride = 0);

/// Word red >> 3 << 11 | green >> 2 << 5 | blue >> 3; bottom-up. Result width * height * 2.
OMXBRIDGE_EXPORT int ConvertI420ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                                         unsigned int height);

/// As ConvertI420ToRGB565, top-down.
OMXBRIDGE_EXPORT int ConvertI420ToRGB565_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                                            unsigned int height);

/// The same as ConvertI420ToRGB565_EX.
OMXBRIDGE_EXPORT int ConvertI420ToRGB565Android(const unsigned char* src, unsigned char* dst,
                                                unsigned int width, unsigned int height);

/// Bottom-up. Not the usual 1555 word: bits 0 to 4 are the upper five of blue, bit 5 is 0, bits 6 to 10 the
/// upper five of green, bits 13 to 15 are bits 3 to 5 of red with the top one inverted. Rows are width * 2
/// bytes apart whatever the stride, which only counts in the result: stride * height * 2, and the bytes from
/// width * height * 2 on keep their value.
OMXBRIDGE_EXPORT int ConvertI420ToARGB1555(const unsigned char* src, unsigned char* dst, unsigned int width,
                                           unsigned int height, unsigned int stride = 0);

/// As ConvertI420ToARGB1555, top-down.
OMXBRIDGE_EXPORT int ConvertI420ToARGB1555_EX(const unsigned char* src, unsigned char* dst,
                                              unsigned int width, unsigned int height,
                                              unsigned int stride = 0);

/// NV12 to the words of ConvertI420ToRGB565; bottom-up. Chroma pairs start width * height bytes in, their
/// rows width / 2 pairs apart. Result width * height * 2.
OMXBRIDGE_EXPORT int ConvertNV12ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                                         unsigned int height);

/// Copies the three bytes of each RGB24 pixel and appends 255. Source row i goes to byte
/// ((height - 1) * stride - i * (stride - width)) * 4, rows in this order: with stride equal to the width
/// each row lands on the last one. All other bytes keep their value. A height of 1 is written too.
/// Result stride * height * 4, or -1 as above.
OMXBRIDGE_EXPORT int ConvertRGB24ToARGB(const unsigned char* src, unsigned char* dst, unsigned int width,
                                        unsigned int height, unsigned int stride = 0);

}  // namespace webrtc
