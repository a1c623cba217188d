// The clock for everything that takes time: steady, of the finest kind.
#pragma once

#include <chrono>

namespace tool {

using Clock = std::chrono::steady_clock;

}  // namespace tool
