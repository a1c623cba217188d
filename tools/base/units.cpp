#include "tools/base/units.h"

#include <charconv>
#include <cmath>
#include <numeric>

namespace tool {

namespace {

template <typename Number>
std::optional<Number> parseWhole(std::string_view text) {
  Number number{};
  const char* const end = text.data() + text.size();
  const auto [last, error] = std::from_chars(text.data(), end, number);
  if (error != std::errc() || last != end) return std::nullopt;
  return number;
}

// Digits with at most one point, no sign and no exponent.
std::optional<double> parseDecimal(std::string_view text) {
  if (text.find_first_not_of("0123456789.") != std::string_view::npos) return std::nullopt;
  return parseWhole<double>(text);
}

constexpr double kMaxRate = 255;  // what encoders can be told
constexpr uint32_t kMaxRateTerm = 1'000'000;

}  // namespace

int64_t FrameRate::microseconds(uint64_t frame) const {
  constexpr uint64_t kMicro = 1'000'000;
  // In two steps, which keeps hours of frames clear of overflow.
  const uint64_t whole = frame / numerator * denominator * kMicro;
  return static_cast<int64_t>(whole + frame % numerator * denominator * kMicro / numerator);
}

std::optional<FrameRate> makeFrameRate(uint32_t numerator, uint32_t denominator) {
  if (numerator == 0 || denominator == 0) return std::nullopt;
  const uint32_t divisor = std::gcd(numerator, denominator);
  const FrameRate rate{numerator / divisor, denominator / divisor};
  if (rate.perSecond() > kMaxRate) return std::nullopt;
  if (rate.numerator <= kMaxRateTerm && rate.denominator <= kMaxRateTerm) return rate;
  const auto thousandths = static_cast<uint32_t>(std::lround(rate.perSecond() * 1000));
  return thousandths > 0 ? makeFrameRate(thousandths, 1000) : std::nullopt;
}

std::optional<Size> parseSize(std::string_view text) {
  const size_t cross = text.find('x');
  if (cross == std::string_view::npos) return std::nullopt;
  const auto width = parseWhole<int>(text.substr(0, cross));
  const auto height = parseWhole<int>(text.substr(cross + 1));
  const auto isSide = [](std::optional<int> side) { return side && *side >= 2 && *side <= kMaxSide; };
  if (!isSide(width) || !isSide(height)) return std::nullopt;
  return Size{*width, *height};
}

std::optional<FrameRate> parseFrameRate(std::string_view text) {
  const size_t bar = text.find_first_of("/:");
  if (bar != std::string_view::npos) {
    const auto numerator = parseWhole<uint32_t>(text.substr(0, bar));
    const auto denominator = parseWhole<uint32_t>(text.substr(bar + 1));
    return numerator && denominator ? makeFrameRate(*numerator, *denominator) : std::nullopt;
  }
  const auto decimal = parseDecimal(text);
  if (!decimal || *decimal > kMaxRate) return std::nullopt;
  // 23.976, 29.97 and 59.94 stand for the rates of 1001 seconds a whole number of thousand frames.
  const double whole = std::round(*decimal);
  if (whole != *decimal && std::abs(whole * 1000 / 1001 - *decimal) < 0.005) {
    return makeFrameRate(static_cast<uint32_t>(whole) * 1000, 1001);
  }
  return makeFrameRate(static_cast<uint32_t>(std::lround(*decimal * 1000)), 1000);
}

std::optional<uint32_t> parseBitRate(std::string_view text) {
  double unit = 1;
  if (text.ends_with('k') || text.ends_with('K')) unit = 1e3;
  if (text.ends_with('M') || text.ends_with('m')) unit = 1e6;
  if (unit > 1) text.remove_suffix(1);
  const auto number = parseDecimal(text);
  if (!number) return std::nullopt;
  const double bits = std::round(*number * unit);
  if (!(bits >= 1e3 && bits <= 1e9)) return std::nullopt;
  return static_cast<uint32_t>(bits);
}

std::optional<uint64_t> parseCount(std::string_view text) {
  return parseWhole<uint64_t>(text);
}

std::optional<int64_t> parseTime(std::string_view text) {
  constexpr double kSecond = 1e6;
  constexpr double kDay = 86'400 * kSecond;
  double unit = kSecond;
  if (text.ends_with("ms")) {
    unit = 1e3;
    text.remove_suffix(2);
  } else if (text.ends_with('s')) {
    text.remove_suffix(1);
  } else if (text.ends_with('m')) {
    unit = 60 * kSecond;
    text.remove_suffix(1);
  }
  const auto number = parseDecimal(text);
  if (!number || !(*number * unit <= kDay)) return std::nullopt;
  return std::llround(*number * unit);
}

std::optional<double> parseShare(std::string_view text) {
  if (text.ends_with('%')) text.remove_suffix(1);
  const auto percent = parseDecimal(text);
  return percent && *percent <= 100 ? std::optional(*percent / 100) : std::nullopt;
}

}  // namespace tool
