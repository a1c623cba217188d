// How much two pictures differ.
#pragma once

#include <stdint.h>

#include <span>

namespace tool {

// Identical samples count as this; others come near it at most.
inline constexpr double kBestPsnr = 100;

// Peak signal to noise ratio of 8-bit samples in dB. Both have the same number of them.
double psnr(std::span<const uint8_t> one, std::span<const uint8_t> other);

}  // namespace tool
