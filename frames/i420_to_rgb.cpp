#include "frames/geometry.h"
#include "frames/kernels/yuv_to_rgb.h"
#include "omxbridge/frames/rgb.h"

namespace webrtc {
namespace {

using namespace detail;

constexpr unsigned kNoStride = 0;

// The result of a conversion, or kRefused; stride is resolved.
int checkedBytes(unsigned width, unsigned height, unsigned& stride, unsigned bytesPerPixel) {
  if (width == 0 || height == 0 || !resolveStride(width, stride)) return kRefused;
  return frameBytes(stride, height, bytesPerPixel);
}

// Where the destination's rows are, in bytes: the first one, the second of a pair seen from the first, and
// the first of the next pair.
struct Rows {
  std::ptrdiff_t first, second, pair;
};

// Unsigned until here: these are also formed for sizes that turn out to be refused.
std::ptrdiff_t offset(std::size_t bytes) {
  return static_cast<std::ptrdiff_t>(bytes);
}

Rows topDown(std::size_t pitch) {
  return {0, offset(pitch), offset(2 * pitch)};
}

Rows bottomUp(std::size_t pitch, unsigned height) {
  return {offset((std::size_t{height} - 1) * pitch), offset(0 - pitch), offset(0 - 2 * pitch)};
}

// Where a frame's chroma starts, and the distance of two samples.
struct Chroma {
  std::size_t u, v, step;
};

Chroma planar(unsigned width, unsigned height) {
  return {planeArea(width, height), thirdPlaneByArea(width, height), 1};
}

// Kept: the two Mac layouts take the second plane as Cr. Their callers hand over YV12.
Chroma exchanged(unsigned width, unsigned height) {
  return {thirdPlaneByArea(width, height), planeArea(width, height), 1};
}

Chroma semiPlanar(unsigned width, unsigned height) {
  return {planeArea(width, height), planeArea(width, height) + 1, 2};
}

// result: of checkedBytes; a refusal is passed on.
int convert(int result, RowPairToRgb kernel, const std::uint8_t* src, Chroma chroma, unsigned width,
            unsigned height, std::uint8_t* dst, Rows rows) {
  if (result == kRefused) return kRefused;
  const std::size_t pairs = width / 2;
  for (std::size_t p = 0; p < height / 2; ++p) {
    // Kept: a pair of rows takes the even part of the width and the width, so pictures of odd width lean by
    // a pixel per pair. Callers compare frames byte for byte.
    const std::uint8_t* y = src + p * (2 * pairs + width);
    const std::size_t sample = p * pairs * chroma.step;
    std::uint8_t* to = dst + rows.first + static_cast<std::ptrdiff_t>(p) * rows.pair;
    kernel(y, y + width, src + chroma.u + sample, src + chroma.v + sample, to, to + rows.second, pairs);
  }
  return result;
}

}  // namespace

int ConvertI420ToRGB24(const unsigned char* src, unsigned char* dst, unsigned int width,
                       unsigned int height) {
  unsigned stride = kNoStride;
  const int result = checkedBytes(width, height, stride, 3);
  return convert(result, yuvToRgbKernels().bgr24, src, planar(width, height), width, height, dst,
                 bottomUp(std::size_t{stride} * 3, height));
}

int ConvertI420ToRGB24_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height) {
  unsigned stride = kNoStride;
  const int result = checkedBytes(width, height, stride, 3);
  return convert(result, yuvToRgbKernels().bgr24, src, planar(width, height), width, height, dst,
                 topDown(std::size_t{stride} * 3));
}

int ConvertI420ToARGB(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 4);
  return convert(result, yuvToRgbKernels().bgra, src, planar(width, height), width, height, dst,
                 topDown(std::size_t{stride} * 4));
}

int ConvertI420ToARGBMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                         unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 4);
  return convert(result, yuvToRgbKernels().bgra, src, exchanged(width, height), width, height, dst,
                 topDown(std::size_t{stride} * 4));
}

int ConvertI420ToRGBAMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                         unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 4);
  return convert(result, yuvToRgbKernels().argb, src, exchanged(width, height), width, height, dst,
                 topDown(std::size_t{stride} * 4));
}

int ConvertI420ToRGBAIPhone(const unsigned char* src, unsigned char* dst, unsigned int width,
                            unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 4);
  return convert(result, yuvToRgbKernels().rgba, src, planar(width, height), width, height, dst,
                 bottomUp(std::size_t{stride} * 4, height));
}

int ConvertI420ToARGB4444(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().argb4444, src, planar(width, height), width, height, dst,
                 bottomUp(std::size_t{stride} * 2, height));
}

int ConvertI420ToARGB4444_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                             unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 2);
  // Kept: only the second row of a pair is a stride away, the next pair a stride and a width.
  const std::size_t second = std::size_t{stride} * 2;
  return convert(result, yuvToRgbKernels().argb4444, src, planar(width, height), width, height, dst,
                 {0, offset(second), offset(second + std::size_t{width} * 2)});
}

int ConvertI420ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                        unsigned int height) {
  unsigned stride = kNoStride;
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().rgb565, src, planar(width, height), width, height, dst,
                 bottomUp(std::size_t{stride} * 2, height));
}

int ConvertI420ToRGB565_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                           unsigned int height) {
  unsigned stride = kNoStride;
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().rgb565, src, planar(width, height), width, height, dst,
                 topDown(std::size_t{stride} * 2));
}

int ConvertI420ToRGB565Android(const unsigned char* src, unsigned char* dst, unsigned int width,
                               unsigned int height) {
  return ConvertI420ToRGB565_EX(src, dst, width, height);
}

// Kept: the stride of the two 1555 functions counts in checks and result, the rows are as wide as the
// picture.
int ConvertI420ToARGB1555(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().argb1555, src, planar(width, height), width, height, dst,
                 bottomUp(std::size_t{width} * 2, height));
}

int ConvertI420ToARGB1555_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                             unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().argb1555, src, planar(width, height), width, height, dst,
                 topDown(std::size_t{width} * 2));
}

int ConvertNV12ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                        unsigned int height) {
  unsigned stride = kNoStride;
  const int result = checkedBytes(width, height, stride, 2);
  return convert(result, yuvToRgbKernels().semiPlanarRgb565, src, semiPlanar(width, height), width, height,
                 dst, bottomUp(std::size_t{stride} * 2, height));
}

int ConvertRGB24ToARGB(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                       unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 4);
  if (result == kRefused) return kRefused;
  // Kept: rows go up by the stride less the width, so without a stride all of them land on the last row and
  // the picture's last one stays. They may overlap: first to last.
  std::size_t to = (std::size_t{height} - 1) * stride;
  for (std::size_t row = 0; row < height; ++row) {
    yuvToRgbKernels().bgr24ToBgra(src + row * width * 3, dst + to * 4, width);
    to -= stride - width;
  }
  return result;
}

}  // namespace webrtc
