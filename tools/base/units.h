// Quantities as users write them on the command line and as files carry them.
#pragma once

#include <stdint.h>

#include <optional>
#include <string_view>

namespace tool {

struct Size {
  int width = 0;   // pixels
  int height = 0;  // pixels
  bool operator==(const Size&) const = default;
};

// The largest side of a picture that the tool handles.
inline constexpr int kMaxSide = 8192;

struct FrameRate {
  uint32_t numerator = 30;
  uint32_t denominator = 1;

  double perSecond() const { return static_cast<double>(numerator) / denominator; }
  // Of the frame with this number, counted from 0.
  int64_t microseconds(uint64_t frame) const;
  bool operator==(const FrameRate&) const = default;
};

// The rate in small numbers: reduced, and rounded to thousandths where that leaves large ones. Nothing for
// 0 or more than 255 frames a second.
std::optional<FrameRate> makeFrameRate(uint32_t numerator, uint32_t denominator);

// Nothing where the text is not of the form, or the quantity is out of range.

// "640x480"; each side 2 to kMaxSide.
std::optional<Size> parseSize(std::string_view text);
// "30", "29.97", "30000/1001" or "30000:1001"; more than 0, at most 255 a second.
std::optional<FrameRate> parseFrameRate(std::string_view text);
// "800k", "1.5M" or "1000000"; bits per second, 1000 to 1000 M.
std::optional<uint32_t> parseBitRate(std::string_view text);
// Digits alone.
std::optional<uint64_t> parseCount(std::string_view text);
// "3s", "80ms", "1.5" (seconds) or "2m"; microseconds, up to a day.
std::optional<int64_t> parseTime(std::string_view text);
// "2%" or "0.5%" or the number alone, 0 to 100; a share from 0 to 1.
std::optional<double> parseShare(std::string_view text);

}  // namespace tool
