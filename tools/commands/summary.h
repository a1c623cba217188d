// What the commands' tables and JSON objects have in common. Lines come with their ends.
#pragma once

#include <stdint.h>

#include <nlohmann/json_fwd.hpp>
#include <string>

#include "tools/base/units.h"

namespace tool {

std::string row(const char* label, const std::string& value);
std::string row(const char* label, uint64_t count);
std::string videoRow(Size size, FrameRate rate);
// Bits per second.
std::string bitRateRow(double asked, double reached);
// Seconds of the processor and of the clock on the wall for so many pictures.
std::string timeRow(double cpuSeconds, double wallSeconds, uint64_t pictures);

// Bits per second; 0 for a video without length.
double bitRate(uint64_t bytes, double seconds);

// Null stands for a null pointer.
nlohmann::ordered_json orNull(const char* name);

}  // namespace tool
