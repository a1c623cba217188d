#include "frames/kernels/packed_422.h"

#include "frames/borders.h"
#include "frames/geometry.h"
#include "omxbridge/frames/yuv.h"

namespace webrtc {
namespace {

using namespace detail;

int pack(const Packed422Rows& rows, const std::uint8_t* src, std::uint8_t* dst, unsigned width,
         unsigned height, unsigned stride) {
  if (width == 0 || height == 0 || !resolveStride(width, stride)) return kRefused;
  const int result = frameBytes(stride, height, 2);
  if (result == kRefused) return kRefused;
  const std::size_t pairs = width / 2, pitch = std::size_t{stride} * 2;
  const std::uint8_t *u = src + planeArea(width, height), *v = src + thirdPlaneByRows(width, height);
  for (std::size_t p = 0; p < height / 2; ++p) {
    const std::uint8_t* y = src + 2 * p * width;
    std::uint8_t* to = dst + 2 * p * pitch;
    rows.pack(y, u + p * pairs, v + p * pairs, to, pairs);
    rows.pack(y + width, u + p * pairs, v + p * pairs, to + pitch, pairs);
  }
  return result;
}

// chromaOfTwo: with the sample half a row further on.
int unpack(const Packed422Rows& rows, bool chromaOfTwo, unsigned width, unsigned height,
           const std::uint8_t* src, std::uint8_t* dst) {
  const int result = frameBytes(width, height / 2, 3);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  const std::size_t pairs = width / 2, pitch = std::size_t{width} * 2;
  // Kept: with height % 4 above 1 the V plane starts on U's last row. In pairs of rows from the top, U before
  // V, the bytes there are what callers have always got.
  std::uint8_t *u = dst + planeArea(width, height), *v = dst + thirdPlaneByRows(width, height);
  for (std::size_t p = 0; p < height / 2; ++p) {
    const std::uint8_t* from = src + 2 * p * pitch;
    std::uint8_t* y = dst + 2 * p * width;
    if (chromaOfTwo) {
      // Kept: the partner is width bytes further on, in the middle of the same row and not below.
      rows.lumaAndChromaOfTwo(from, from + width, y, u + p * pairs, v + p * pairs, pairs);
    } else {
      rows.lumaAndChroma(from, y, u + p * pairs, v + p * pairs, pairs);
    }
    rows.luma(from + pitch, y + width, pairs);
  }
  return result;
}

// A frame on its way into one of another size. Chroma planes and picture rows as BorderedPlane has them.
struct Centred {
  const std::uint8_t* src;  // first byte of the picture
  std::size_t pitch;        // of source rows
  std::size_t pairs;        // of pixels in a row
  BorderedPlane y, u, v;
};

Centred centred(const std::uint8_t* src, unsigned srcWidth, unsigned srcHeight, std::uint8_t* dst,
                unsigned dstWidth, unsigned dstHeight, std::size_t vOffset) {
  const CentredAxis x = centre(srcWidth, dstWidth), y = centre(srcHeight, dstHeight);
  const CentredAxis cx = x.chroma(srcWidth, dstWidth), cy = y.chroma(srcHeight, dstHeight);
  const std::size_t pitch = std::size_t{srcWidth} * 2;
  // Kept: the surplus is skipped in bytes. Where it is no multiple of 4 the groups are entered in the middle.
  const std::size_t skip = srcWidth > dstWidth ? srcWidth - dstWidth : 0;
  BorderedPlane luma{dst, dstWidth, dstHeight, x.margin, y.margin, x.count, y.count, kFillLuma};
  BorderedPlane u{dst + planeArea(dstWidth, dstHeight),
                  dstWidth / 2,
                  dstHeight / 2,
                  cx.margin,
                  cy.margin,
                  cx.count,
                  cy.count,
                  kFillChroma};
  BorderedPlane v = u;
  v.data = dst + vOffset;
  return {src + y.skip * pitch + skip, pitch, x.count / 2, luma, u, v};
}

void fillBeside(const Centred& c, std::size_t pair) {
  c.y.fillBeside(2 * pair);
  c.y.fillBeside(2 * pair + 1);
  c.u.fillBeside(pair);
  c.v.fillBeside(pair);
}

int unpackCentred(const Packed422Rows& rows, bool interlaced, const std::uint8_t* src, unsigned srcWidth,
                  unsigned srcHeight, std::uint8_t* dst, unsigned dstWidth, unsigned dstHeight) {
  if (srcWidth == 0 || srcHeight == 0 || dstWidth == 0 || dstHeight == 0) return kRefused;
  const int result = i420Bytes(dstWidth, dstHeight);
  if (result == kRefused || !addressable(srcWidth, srcHeight)) return kRefused;
  const std::size_t vOffset =
      interlaced ? thirdPlaneByRows(dstWidth, dstHeight) : thirdPlaneByArea(dstWidth, dstHeight);
  const Centred c = centred(src, srcWidth, srcHeight, dst, dstWidth, dstHeight, vOffset);
  c.y.fillAboveAndBelow();
  c.u.fillAboveAndBelow();
  c.v.fillAboveAndBelow();
  const std::size_t pairs = c.y.rows / 2;
  for (std::size_t p = 0; p < pairs; ++p) {
    const std::uint8_t* from = c.src + 2 * p * c.pitch;
    fillBeside(c, p);
    rows.lumaAndChroma(from, c.y.row(2 * p), c.u.row(p), c.v.row(p), c.pairs);
    if (!interlaced) {
      rows.luma(from + c.pitch, c.y.row(2 * p + 1), c.pairs);
    } else if (p + 1 < pairs) {
      rows.lumaOfTwo(from, from + 2 * c.pitch, c.y.row(2 * p + 1), c.pairs);
    } else {
      rows.luma(from, c.y.row(2 * p + 1), c.pairs);
    }
  }
  if (pairs != 0 && c.y.rows % 2 != 0) c.y.fillBeside(c.y.rows - 1);
  return result;
}

}  // namespace

int ConvertI420ToYUY2(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  return pack(packed422Kernels().yuy2, src, dst, width, height, stride);
}

int ConvertI420ToUYVY(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  return pack(packed422Kernels().uyvy, src, dst, width, height, stride);
}

// Kept: YUY2 averages its chroma, UYVY does not.
int ConvertYUY2ToI420(unsigned int width, unsigned int height, const unsigned char* src, unsigned char* dst) {
  return unpack(packed422Kernels().yuy2, true, width, height, src, dst);
}

int ConvertUYVYToI420(unsigned int width, unsigned int height, const unsigned char* src, unsigned char* dst) {
  return unpack(packed422Kernels().uyvy, false, width, height, src, dst);
}

int ConvertYUY2ToI420(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                      unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  return unpackCentred(packed422Kernels().yuy2, false, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

int ConvertUYVYToI420(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                      unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  return unpackCentred(packed422Kernels().uyvy, false, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

int ConvertYUY2ToI420interlaced(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                                unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  return unpackCentred(packed422Kernels().yuy2, true, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

int ConvertUYVYToI420interlaced(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                                unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  return unpackCentred(packed422Kernels().uyvy, true, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

}  // namespace webrtc
