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

void walk(RowPairToRgb kernel, const std::uint8_t* src, Chroma chroma, unsigned width, unsigned height,
          std::uint8_t* dst, Rows rows) {
  const std::size_t pairs = width / 2;
  for (std::size_t p = 0; p < height / 2; ++p) {
    // Kept: a pair of rows takes the even part of the width and the width, so pictures of odd width lean by
    // a pixel per pair. Callers compare frames byte for byte.
    const std::uint8_t* y = src + p * (2 * pairs + width);
    const std::size_t sample = p * pairs * chroma.step;
    std::uint8_t* to = dst + rows.first + static_cast<std::ptrdiff_t>(p) * rows.pair;
    kernel(y, y + width, src + chroma.u + sample, src + chroma.v + sample, to, to + rows.second, pairs);
  }
}

struct Pixels {
  RowPairToRgb kernel;
  unsigned bytes;  // of each
};

enum class Order { kTopDown, kBottomUp };

using ChromaOf = Chroma (*)(unsigned width, unsigned height);

// The conversions whose rows are a stride apart.
int convert(Pixels pixels, Order order, ChromaOf chroma, const std::uint8_t* src, std::uint8_t* dst,
            unsigned width, unsigned height, unsigned stride) {
  const int result = checkedBytes(width, height, stride, pixels.bytes);
  if (result == kRefused) return kRefused;
  const std::size_t pitch = std::size_t{stride} * pixels.bytes;
  walk(pixels.kernel, src, chroma(width, height), width, height, dst,
       order == Order::kTopDown ? topDown(pitch) : bottomUp(pitch, height));
  return result;
}

// Kept: the stride of the two 1555 functions counts in checks and result, the rows are as wide as the
// picture.
int convertTo1555(Order order, const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height,
                  unsigned stride) {
  const int result = checkedBytes(width, height, stride, 2);
  if (result == kRefused) return kRefused;
  convert({yuvToRgbKernels().argb1555, 2}, order, planar, src, dst, width, height, kNoStride);
  return result;
}

}  // namespace

int ConvertI420ToRGB24(const unsigned char* src, unsigned char* dst, unsigned int width,
                       unsigned int height) {
  return convert({yuvToRgbKernels().bgr24, 3}, Order::kBottomUp, planar, src, dst, width, height, kNoStride);
}

int ConvertI420ToRGB24_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height) {
  return convert({yuvToRgbKernels().bgr24, 3}, Order::kTopDown, planar, src, dst, width, height, kNoStride);
}

int ConvertI420ToARGB(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height,
                      unsigned int stride) {
  return convert({yuvToRgbKernels().bgra, 4}, Order::kTopDown, planar, src, dst, width, height, stride);
}

int ConvertI420ToARGBMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                         unsigned int height, unsigned int stride) {
  return convert({yuvToRgbKernels().bgra, 4}, Order::kTopDown, exchanged, src, dst, width, height, stride);
}

int ConvertI420ToRGBAMac(const unsigned char* src, unsigned char* dst, unsigned int width,
                         unsigned int height, unsigned int stride) {
  return convert({yuvToRgbKernels().argb, 4}, Order::kTopDown, exchanged, src, dst, width, height, stride);
}

int ConvertI420ToRGBAIPhone(const unsigned char* src, unsigned char* dst, unsigned int width,
                            unsigned int height, unsigned int stride) {
  return convert({yuvToRgbKernels().rgba, 4}, Order::kBottomUp, planar, src, dst, width, height, stride);
}

int ConvertI420ToARGB4444(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height, unsigned int stride) {
  return convert({yuvToRgbKernels().argb4444, 2}, Order::kBottomUp, planar, src, dst, width, height, stride);
}

int ConvertI420ToARGB4444_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                             unsigned int height, unsigned int stride) {
  const int result = checkedBytes(width, height, stride, 2);
  if (result == kRefused) return kRefused;
  // Kept: only the second row of a pair is a stride away, the next pair a stride and a width.
  const std::size_t second = std::size_t{stride} * 2;
  walk(yuvToRgbKernels().argb4444, src, planar(width, height), width, height, dst,
       {0, offset(second), offset(second + std::size_t{width} * 2)});
  return result;
}

int ConvertI420ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                        unsigned int height) {
  return convert({yuvToRgbKernels().rgb565, 2}, Order::kBottomUp, planar, src, dst, width, height, kNoStride);
}

int ConvertI420ToRGB565_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                           unsigned int height) {
  return convert({yuvToRgbKernels().rgb565, 2}, Order::kTopDown, planar, src, dst, width, height, kNoStride);
}

int ConvertI420ToRGB565Android(const unsigned char* src, unsigned char* dst, unsigned int width,
                               unsigned int height) {
  return ConvertI420ToRGB565_EX(src, dst, width, height);
}

int ConvertI420ToARGB1555(const unsigned char* src, unsigned char* dst, unsigned int width,
                          unsigned int height, unsigned int stride) {
  return convertTo1555(Order::kBottomUp, src, dst, width, height, stride);
}

int ConvertI420ToARGB1555_EX(const unsigned char* src, unsigned char* dst, unsigned int width,
                             unsigned int height, unsigned int stride) {
  return convertTo1555(Order::kTopDown, src, dst, width, height, stride);
}

int ConvertNV12ToRGB565(const unsigned char* src, unsigned char* dst, unsigned int width,
                        unsigned int height) {
  return convert({yuvToRgbKernels().semiPlanarRgb565, 2}, Order::kBottomUp, semiPlanar, src, dst, width,
                 height, kNoStride);
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
