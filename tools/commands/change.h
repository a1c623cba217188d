// What a user wants changed while an encoder runs, and when.
#pragma once

#include <stdint.h>

#include <optional>
#include <string>
#include <string_view>

#include "omxbridge/codec_settings.h"

namespace tool {

struct Change {
  int64_t at = 0;  // microseconds of the video; it holds from the first picture not before on
  CONFIGTYPE item = CONFIG_BITRATE;
  uint32_t value = 0;  // in the item's unit, a bit rate in bits per second
  std::string text;    // as the user wrote it
};

// "bitrate=300k", "keyframe", "rotate=90", "fps=15" or "intra=30". Nothing for anything else.
std::optional<Change> parseChange(std::string_view text);

}  // namespace tool
