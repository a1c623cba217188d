#include "tools/video/ssim.h"

#include <algorithm>

namespace tool {

namespace {

constexpr int kWindow = 8;
constexpr int kStep = 4;
// (0.01 * 255)^2 and (0.03 * 255)^2, which keep flat windows from dividing by nothing.
constexpr double kC1 = 6.5025;
constexpr double kC2 = 58.5225;

double windowSsim(const uint8_t* one, const uint8_t* other, int stride, int width, int height) {
  int32_t sumOne = 0;
  int32_t sumOther = 0;
  int32_t squares = 0;
  int32_t products = 0;
  for (int y = 0; y < height; ++y, one += stride, other += stride) {
    for (int x = 0; x < width; ++x) {
      const int32_t a = one[x];
      const int32_t b = other[x];
      sumOne += a;
      sumOther += b;
      squares += a * a + b * b;
      products += a * b;
    }
  }
  const double count = width * height;
  const double meanOne = sumOne / count;
  const double meanOther = sumOther / count;
  const double means = meanOne * meanOne + meanOther * meanOther;
  const double variances = (squares / count - means) * count / (count - 1);
  const double covariance = (products / count - meanOne * meanOther) * count / (count - 1);
  return (2 * meanOne * meanOther + kC1) * (2 * covariance + kC2) / ((means + kC1) * (variances + kC2));
}

}  // namespace

double ssim(std::span<const uint8_t> one, std::span<const uint8_t> other, Size size) {
  const int width = std::min(kWindow, size.width);
  const int height = std::min(kWindow, size.height);
  double sum = 0;
  int windows = 0;
  for (int y = 0; y + height <= size.height; y += kStep) {
    for (int x = 0; x + width <= size.width; x += kStep, ++windows) {
      const ptrdiff_t at = static_cast<ptrdiff_t>(y) * size.width + x;
      sum += windowSsim(one.data() + at, other.data() + at, size.width, width, height);
    }
  }
  return sum / windows;
}

}  // namespace tool
