#include "frames/borders.h"
#include "frames/geometry.h"
#include "frames/kernels/rgb_to_yuv.h"
#include "omxbridge/frames/yuv.h"

namespace webrtc {
namespace {

using namespace detail;

int convert(const RgbToYuvRows& rows, const std::uint8_t* src, unsigned width, unsigned height,
            std::uint8_t* dst) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  const std::size_t pairs = width / 2, pitch = rows.bytesPerPixel * width;
  std::uint8_t *u = dst + planeArea(width, height), *v = dst + thirdPlaneByArea(width, height);
  for (std::size_t p = 0; p < height / 2; ++p) {
    const std::uint8_t* from = src + 2 * p * pitch;
    std::uint8_t* y = dst + 2 * p * width;
    rows.lumaAndChroma(from, y, u + p * pairs, v + p * pairs, pairs);
    rows.luma(from + pitch, y + width, pairs);
  }
  return result;
}

}  // namespace

int ConvertRGB24ToI420(unsigned int width, unsigned int height, const unsigned char* src,
                       unsigned char* dst) {
  return convert(rgbToYuvKernels().bgr24, src, width, height, dst);
}

int ConvertARGBMacToI420(unsigned int width, unsigned int height, const unsigned char* src,
                         unsigned char* dst) {
  return convert(rgbToYuvKernels().argb, src, width, height, dst);
}

int ConvertRGB565ToI420(const unsigned char* src, unsigned int width, unsigned int height,
                        unsigned char* dst) {
  return convert(rgbToYuvKernels().rgb565, src, width, height, dst);
}

int ConvertRGB24ToI420(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                       unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  if (srcWidth == 0 || srcHeight == 0 || dstWidth == 0 || dstHeight == 0) return kRefused;
  const int result = frameBytes(dstWidth / 2, dstHeight, 3);
  if (result == kRefused || !addressable(srcWidth, srcHeight) || !addressable(dstWidth, dstHeight))
    return kRefused;

  // The picture is what consists of whole blocks; what is left of an odd one at the top and right is border.
  const RgbToYuvRows& rows = rgbToYuvKernels().bgr24;
  const CentredAxis x = centre(srcWidth, dstWidth), y = centre(srcHeight, dstHeight);
  const CentredAxis cx = x.chroma(srcWidth, dstWidth), cy = y.chroma(srcHeight, dstHeight);
  const std::size_t pairs = x.count / 2, rowPairs = y.count / 2;
  const BorderedPlane luma{dst,       dstWidth,     dstHeight, x.margin, std::size_t{y.margin} + y.count % 2,
                           2 * pairs, 2 * rowPairs, kFillLuma};
  const BorderedPlane u{dst + planeArea(dstWidth, dstHeight),
                        dstWidth / 2,
                        dstHeight / 2,
                        cx.margin,
                        cy.margin,
                        pairs,
                        rowPairs,
                        kFillChroma};
  BorderedPlane v = u;
  v.data = dst + thirdPlaneByArea(dstWidth, dstHeight);
  for (const BorderedPlane& plane : {luma, u, v}) {
    plane.fillAboveAndBelow();
    for (std::size_t row = 0; row < plane.rows; ++row) plane.fillBeside(row);
  }

  const std::size_t pitch = std::size_t{srcWidth} * 3;
  const std::uint8_t* from = src + y.skip * pitch + std::size_t{x.skip} * 3;
  for (std::size_t p = rowPairs; p-- > 0; from += 2 * pitch) {
    rows.luma(from, luma.row(2 * p + 1), pairs);
    rows.lumaAndChroma(from + pitch, luma.row(2 * p), u.row(p), v.row(p), pairs);
  }
  return result;
}

}  // namespace webrtc
