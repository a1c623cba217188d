#include <cstring>

#include "frames/copy.h"
#include "frames/geometry.h"
#include "frames/kernels/planes.h"
#include "omxbridge/frames/yuv.h"

namespace webrtc {
namespace {

using namespace detail;

// What a pair's bytes are.
enum class Pairs { kUv, kVu };

struct ChromaPlanes {
  std::size_t first, second;  // of a pair, in the planar frame
};

ChromaPlanes planesOf(Pairs pairs, unsigned width, unsigned height) {
  const std::size_t u = planeArea(width, height), v = thirdPlaneByArea(width, height);
  return pairs == Pairs::kUv ? ChromaPlanes{u, v} : ChromaPlanes{v, u};
}

int interleave(Pairs pairs, const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  const std::size_t area = planeArea(width, height);
  const ChromaPlanes planes = planesOf(pairs, width, height);
  std::memcpy(dst, src, area);
  planeKernels().interleave(src + planes.first, src + planes.second, dst + area, area / 4);
  return result;
}

int split(Pairs pairs, const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  const std::size_t area = planeArea(width, height);
  const ChromaPlanes planes = planesOf(pairs, width, height);
  std::memcpy(dst, src, area);
  planeKernels().split(src + area, dst + planes.first, dst + planes.second, area / 4);
  return result;
}

}  // namespace

int ConvertI420ToNV12(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height) {
  return interleave(Pairs::kUv, src, dst, width, height);
}

int ConvertI420ToNV21(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height) {
  return interleave(Pairs::kVu, src, dst, width, height);
}

int ConvertNV12ToI420(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height) {
  return split(Pairs::kUv, src, dst, width, height);
}

int ConvertNV21ToI420(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height) {
  return split(Pairs::kVu, src, dst, width, height);
}

int ConvertNV12ToNV12(const unsigned char* src, int srcStride, int srcHeight, int left, int top, int right,
                      int bottom, unsigned char* dst) {
  if (src == nullptr || dst == nullptr || srcStride <= 0 || srcHeight <= 0) return kRefused;
  if (left < 0 || right < left || right >= srcStride) return kRefused;
  if (top < 0 || bottom < top || bottom >= srcHeight) return kRefused;

  const auto pitch = static_cast<std::size_t>(srcStride);
  const auto columns = static_cast<std::size_t>(right - left) + 1;
  const auto first = static_cast<std::size_t>(top), last = static_cast<std::size_t>(bottom);
  const std::uint8_t* from = src + left;
  copyRows(from + first * pitch, pitch, dst, columns, columns, last - first + 1);
  dst += columns * (last - first + 1);

  const auto height = static_cast<std::size_t>(srcHeight);
  const std::uint8_t* chroma = from + pitch * height;
  const std::size_t complete = height / 2;
  if (complete == 0) {
    std::memset(dst, 128, columns);
    return 0;
  }
  for (std::size_t row = first / 2; row <= last / 2; ++row, dst += columns) {
    std::memcpy(dst, chroma + (row < complete ? row : complete - 1) * pitch, columns);
  }
  return 0;
}

}  // namespace webrtc
