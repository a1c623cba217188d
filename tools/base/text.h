// Texts and figures for people and scripts.
#pragma once

#include <string>

namespace tool {

// printf into a string.
__attribute__((format(printf, 1, 2))) std::string formatted(const char* format, ...);

// To thousandths: without the digits that mean nothing.
double rounded(double value);

}  // namespace tool
