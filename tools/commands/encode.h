// Encodes pictures with the device's encoder, into a byte stream or a file.
#pragma once

#include <stdint.h>

#include <stop_token>
#include <string>

#include "tools/commands/sender.h"

namespace tool {

struct EncodeSettings {
  SenderSettings sender;
  std::string path;    // empty: the stream is not kept
  std::string format;  // see createStreamWriter()
};

struct EncodeReport {
  CallFigures figures;  // without what concerns decoding
  EncoderSettings encoder;
  std::optional<SequenceInfo> sequence;
  uint64_t keyFrames = 0;
  double seconds = 0;      // of video
  double meanBitRate = 0;  // asked for, bits per second
  double wallSeconds = 0;
  double cpuSeconds = 0;  // of the whole process, all threads, components included
  Outcome inputFailure;   // the input broke off; what there was is encoded
};

// `enough` ends it early, as in runCall().
Result<EncodeReport> runEncode(const EncodeSettings& settings, FrameSource& source, std::stop_source& enough);

std::string encodeSummary(const EncodeReport& report, const std::string& path);
std::string encodeJson(const EncodeReport& report, bool interrupted);

}  // namespace tool
