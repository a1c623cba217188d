// How alike two planes look.
#pragma once

#include <stdint.h>

#include <span>

#include "tools/base/units.h"

namespace tool {

// Structural similarity of 8-bit samples, 1 for identical planes: the mean over windows of 8 x 8 samples, 4
// apart in both directions. Sides below 8 give 1 window of what there is.
double ssim(std::span<const uint8_t> one, std::span<const uint8_t> other, Size size);

}  // namespace tool
