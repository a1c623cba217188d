// Allocation functions of the executable's own, all on malloc, of which one call can be made to fail.
#pragma once

#include <stddef.h>

#include <atomic>

namespace omxtest {

// The next allocation of exactly so many bytes fails, on any thread, and sets this back to 0.
extern std::atomic<size_t> failingSize;

}  // namespace omxtest
