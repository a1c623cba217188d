#include "tools/base/text.h"

#include <stdarg.h>
#include <stdio.h>

#include <cmath>

namespace tool {

std::string formatted(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  va_list again;
  va_copy(again, arguments);
  const int length = vsnprintf(nullptr, 0, format, arguments);
  va_end(arguments);
  std::string text(length > 0 ? static_cast<size_t>(length) : 0, '\0');
  if (length > 0) vsnprintf(text.data(), text.size() + 1, format, again);
  va_end(again);
  return text;
}

double rounded(double value) {
  return std::round(value * 1000) / 1000;
}

}  // namespace tool
