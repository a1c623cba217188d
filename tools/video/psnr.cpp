#include "tools/video/psnr.h"

#include <algorithm>
#include <cmath>

namespace tool {

namespace {

// A block's sum of squares fits 32 bits, which lets the compiler use short vectors.
constexpr size_t kBlock = 65536 / 2;
static_assert(kBlock * 255 * 255 <= UINT32_MAX);

uint32_t squaredError(const uint8_t* one, const uint8_t* other, size_t count) {
  uint32_t sum = 0;
  for (size_t i = 0; i < count; ++i) {
    const int difference = one[i] - other[i];
    sum += static_cast<uint32_t>(difference * difference);
  }
  return sum;
}

}  // namespace

double psnr(std::span<const uint8_t> one, std::span<const uint8_t> other) {
  const size_t count = std::min(one.size(), other.size());
  uint64_t sum = 0;
  for (size_t at = 0; at < count; at += kBlock) {
    sum += squaredError(one.data() + at, other.data() + at, std::min(kBlock, count - at));
  }
  if (sum == 0) return kBestPsnr;
  const double meanError = static_cast<double>(sum) / static_cast<double>(count);
  return std::min(kBestPsnr, 10 * std::log10(255.0 * 255.0 / meanError));
}

}  // namespace tool
