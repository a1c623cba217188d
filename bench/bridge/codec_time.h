// Counts the time that the process spends inside libavcodec, whoever calls it.
#pragma once

#include <chrono>

namespace bench {

// Of the calls that encode and decode, since the last call of this function. They must not overlap.
std::chrono::nanoseconds takeCodecTime();

}  // namespace bench
