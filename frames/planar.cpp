#include <algorithm>

#include "frames/borders.h"
#include "frames/copy.h"
#include "frames/geometry.h"
#include "omxbridge/frames/yuv.h"

namespace webrtc {

using namespace detail;

int ConvertYV12ToI420(const unsigned char* src, unsigned int width, unsigned int height, unsigned char* dst) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  const std::size_t area = planeArea(width, height);
  const std::size_t third = thirdPlaneByArea(width, height);
  std::memcpy(dst, src, area);
  std::memcpy(dst + area, src + third, area / 4);
  std::memcpy(dst + third, src + area, area / 4);
  return result;
}

int ConvertI420ToYV12(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  if (width == 0 || height == 0 || !resolveStride(width, stride)) return kRefused;
  const int result = frameBytes(stride, height, 3, 2);
  if (result == kRefused) return kRefused;
  copyRows(src, width, dst, stride, width, height);
  if (height < 2) return result;
  const std::size_t pitch = stride / 2;
  std::uint8_t* v = dst + planeArea(stride, height);
  std::uint8_t* u = v + height * pitch / 2;  // for an odd height not directly behind the V rows
  copyRows(src + planeArea(width, height), width / 2, u, pitch, width / 2, height / 2);
  copyRows(src + thirdPlaneByArea(width, height), width / 2, v, pitch, width / 2, height / 2);
  return result;
}

int ConvertI420ToI420(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  if (!resolveStride(width, stride)) return kRefused;
  if (width == 0 || height == 0) return 0;
  const int result = frameBytes(stride, height / 2, 3);
  if (result == kRefused) return kRefused;
  if (stride == width) {
    // Kept: for an odd height this piece ends within the frame. Callers size their buffers by the result.
    std::memcpy(dst, src, static_cast<std::size_t>(result));
    return result;
  }
  copyRows(src, width, dst, stride, width, height);
  const std::size_t pitch = stride / 2;
  std::uint8_t* u = dst + planeArea(stride, height);
  copyRows(src + planeArea(width, height), width / 2, u, pitch, width / 2, height / 2);
  copyRows(src + thirdPlaneByArea(width, height), width / 2, u + height / 2 * pitch, pitch, width / 2,
           height / 2);
  return result;
}

int ConvertI420ToI420(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                      unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight) {
  if (srcWidth == 0 || srcHeight == 0 || dstWidth == 0 || dstHeight == 0) return kRefused;
  const int result = frameBytes(dstWidth, dstHeight / 2, 3);
  if (result == kRefused || !addressable(srcWidth, srcHeight) || !addressable(dstWidth, dstHeight))
    return kRefused;
  if (srcWidth == dstWidth && srcHeight == dstHeight) {
    std::memcpy(dst, src, static_cast<std::size_t>(result));
    return result;
  }
  const CentredAxis x = centre(srcWidth, dstWidth), y = centre(srcHeight, dstHeight);
  const BorderedPlane luma{dst, dstWidth, dstHeight, x.margin, y.margin, x.count, y.count, kFillLuma};
  luma.place(src + planeArea(srcWidth, y.skip) + x.skip, srcWidth);

  const CentredAxis cx = x.chroma(srcWidth, dstWidth), cy = y.chroma(srcHeight, dstHeight);
  BorderedPlane chroma{dst + planeArea(dstWidth, dstHeight),
                       dstWidth / 2,
                       dstHeight / 2,
                       cx.margin,
                       cy.margin,
                       cx.count,
                       cy.count,
                       kFillChroma};
  const std::size_t from = planeArea(srcWidth / 2, cy.skip) + cx.skip;
  chroma.place(src + planeArea(srcWidth, srcHeight) + from, srcWidth / 2);
  chroma.data = dst + thirdPlaneByArea(dstWidth, dstHeight);
  chroma.place(src + thirdPlaneByArea(srcWidth, srcHeight) + from, srcWidth / 2);
  return result;
}

}  // namespace webrtc
