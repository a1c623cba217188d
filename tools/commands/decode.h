// Decodes an H.264 stream with the device's decoder: the main thread takes its access units and feeds them;
// the decoder's output thread writes the pictures.
#pragma once

#include <stdint.h>

#include <memory>
#include <optional>
#include <stop_token>
#include <string>

#include "tools/base/failure.h"
#include "tools/h264/access_units.h"
#include "tools/video/picture.h"

namespace tool {

struct DecodeSettings {
  std::string picturesPath;       // empty: the pictures are not kept
  std::string picturesFormat;     // see createPictureWriter()
  std::optional<FrameRate> rate;  // for the file; else the stream's own
};

struct DecodeReport {
  uint64_t unitsIn = 0;
  uint64_t picturesOut = 0;
  Size size;  // of the last picture
  FrameRate rate;
  int sizeChanges = 0;
  double wallSeconds = 0;
  double cpuSeconds = 0;  // of the whole process, all threads, components included
  Outcome inputFailure;   // the input broke off; what there was is decoded
};

// `enough` ends it early, as in runCall().
Result<DecodeReport> runDecode(const DecodeSettings& settings, AccessUnitSource& stream,
                               std::stop_source& enough);

std::string decodeSummary(const DecodeReport& report, const std::string& picturesPath);
std::string decodeJson(const DecodeReport& report, bool interrupted);

}  // namespace tool
