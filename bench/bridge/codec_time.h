// Counts the time that the process spends inside libavcodec, whoever calls it, and with copying inputs.
#pragma once

#include <stdint.h>

#include <chrono>
#include <span>

namespace bench {

// Of the calls that encode and decode, since the last call of this function. They must not overlap.
std::chrono::nanoseconds takeCodecTime();

// What a client does with each input: puts it where the codec reads it.
void copyInput(std::span<const uint8_t> input, uint8_t* to);
// Of all copies since the last call of this function.
std::chrono::nanoseconds takeCopyTime();

}  // namespace bench
