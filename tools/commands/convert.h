// Pictures from one file to another through the library's frame functions: cut, scaled, turned and padded, in
// this order, and in another layout.
#pragma once

#include <stdint.h>

#include <optional>
#include <stop_token>
#include <string>

#include "tools/files/frame_source.h"

namespace tool {

struct ConvertSettings {
  std::string path;
  std::string format;  // see createPictureWriter()
  std::string layout;  // of raw output
  std::optional<Size> cut;
  std::optional<Size> scale;
  int rotation = 0;  // degrees
  std::optional<Size> pad;
  uint64_t frameLimit = 0;  // 0: all
};

struct ConvertReport {
  uint64_t pictures = 0;
  Size from;
  Size to;
  double wallSeconds = 0;
  Outcome inputFailure;  // the input broke off; what there was is converted
};

// `enough` ends it early, as in runCall().
Result<ConvertReport> runConvert(const ConvertSettings& settings, FrameSource& source,
                                 std::stop_source& enough);

std::string convertSummary(const ConvertReport& report, const std::string& path);
std::string convertJson(const ConvertReport& report, bool interrupted);

}  // namespace tool
