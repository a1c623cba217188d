// Where coded pictures go: an H.264 byte stream (Annex B) or an MP4 file. One thread at a time.
#pragma once

#include <stdint.h>

#include <memory>
#include <span>
#include <string>
#include <vector>

#include "tools/base/failure.h"
#include "tools/base/units.h"

namespace tool {

class StreamWriter {
 public:
  virtual ~StreamWriter() = default;
  // `time` in microseconds; a key picture comes first and with its parameter sets.
  virtual Outcome write(std::span<const uint8_t> picture, int64_t time, bool isKey) = 0;
  // Once, behind the last picture: the file gets its name. Without a picture there is no file.
  virtual Outcome finish() = 0;
};

std::vector<std::string> streamFormats();

// `format` is one of the names; empty: as the path ends, and a byte stream where that tells nothing. An
// empty path gives a writer that drops the pictures. MP4 on a pipe is written in fragments.
Result<std::unique_ptr<StreamWriter>> createStreamWriter(const std::string& path, const std::string& format,
                                                         Size size, FrameRate rate);

}  // namespace tool
