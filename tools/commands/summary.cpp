#include "tools/commands/summary.h"

#include <inttypes.h>

#include <nlohmann/json.hpp>

#include "tools/base/text.h"

namespace tool {

std::string row(const char* label, const std::string& value) {
  return formatted("%-14s %s\n", label, value.c_str());
}

std::string row(const char* label, uint64_t count) {
  return row(label, formatted("%" PRIu64, count));
}

std::string videoRow(Size size, FrameRate rate) {
  return row("Video", formatted("%dx%d, %.4g frames/s", size.width, size.height, rate.perSecond()));
}

std::string bitRateRow(double asked, double reached) {
  return row("Bit rate", formatted("%.1f kbit/s asked, %.1f kbit/s reached", asked / 1e3, reached / 1e3));
}

std::string timeRow(double cpuSeconds, double wallSeconds, uint64_t pictures) {
  return row("CPU time", formatted("%.2f s in %.2f s, %.1f frames/s", cpuSeconds, wallSeconds,
                                   static_cast<double>(pictures) / wallSeconds));
}

double bitRate(uint64_t bytes, double seconds) {
  return seconds > 0 ? static_cast<double>(bytes) * 8 / seconds : 0;
}

nlohmann::ordered_json orNull(const char* name) {
  return name != nullptr ? nlohmann::ordered_json(name) : nlohmann::ordered_json();
}

}  // namespace tool
