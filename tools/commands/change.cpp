#include "tools/commands/change.h"

#include "tools/base/units.h"

namespace tool {

namespace {

constexpr uint64_t kMostFramesPerSecond = 255;
constexpr uint64_t kLongestIntraPeriod = 100'000;

std::optional<uint32_t> valueOf(CONFIGTYPE item, std::string_view text) {
  if (item == CONFIG_BITRATE) return parseBitRate(text);
  const auto number = parseCount(text);
  if (!number) return std::nullopt;
  const bool isGood = item == CONFIG_FRAMERATE  ? *number >= 1 && *number <= kMostFramesPerSecond
                      : item == CONFIG_ROTATION ? *number % 90 == 0 && *number < 360
                                                : *number >= 1 && *number <= kLongestIntraPeriod;
  return isGood ? std::optional(static_cast<uint32_t>(*number)) : std::nullopt;
}

}  // namespace

std::optional<Change> parseChange(std::string_view text) {
  if (text == "keyframe") return Change{0, CONFIG_REQUEST_IFRAME, 1, "keyframe"};
  constexpr struct {
    std::string_view prefix;
    CONFIGTYPE item;
  } kItems[] = {{"bitrate=", CONFIG_BITRATE},
                {"fps=", CONFIG_FRAMERATE},
                {"rotate=", CONFIG_ROTATION},
                {"intra=", CONFIG_INTRA_PERIOD}};
  for (const auto& [prefix, item] : kItems) {
    if (!text.starts_with(prefix)) continue;
    const auto value = valueOf(item, text.substr(prefix.size()));
    return value ? std::optional(Change{0, item, *value, std::string(text)}) : std::nullopt;
  }
  return std::nullopt;
}

}  // namespace tool
