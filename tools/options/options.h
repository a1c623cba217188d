// The command line: commands, options, help. Says nothing about what the commands do.
#pragma once

#include <optional>
#include <string>

#include "tools/base/failure.h"
#include "tools/commands/call.h"
#include "tools/commands/convert.h"
#include "tools/commands/decode.h"
#include "tools/commands/encode.h"
#include "tools/files/frame_source.h"

namespace tool {

struct Options {
  enum class Command { Call, Encode, Decode, Convert, Compare, Devices, Components, Completion, Manual };

  Command command = Command::Call;
  std::string device;  // empty: as the environment says, or the default
  bool json = false;
  bool verbose = false;

  SourceRequest source;        // what call, encode, convert and compare read
  CallSettings call;           // of a call
  EncodeSettings encode;       // of an encode
  std::string decodeInput;     // of a decode
  DecodeSettings decode;       // of a decode
  ConvertSettings convert;     // of a convert
  SourceRequest secondSource;  // of a compare
  bool perPicture = false;     // of a compare
  std::string shell;           // of a completion
  std::string text;            // what a completion or a manual prints
};

// Nothing: help or the complaint has been printed, and the process is to end with `exitCode`.
std::optional<Options> parseCommandLine(int argc, char** argv, ExitCode& exitCode);

}  // namespace tool
