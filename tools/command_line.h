// The command line: commands, options, help. Says nothing about what the commands do.
#pragma once

#include <optional>
#include <string>

#include "tools/base/failure.h"
#include "tools/commands/call.h"
#include "tools/commands/decode.h"
#include "tools/files/frame_source.h"

namespace tool {

struct Options {
  enum class Command { Call, Decode, Devices, Components };

  Command command = Command::Call;
  std::string device;  // empty: as the environment says, or the default
  bool json = false;
  bool verbose = false;

  SourceRequest source;     // of a call
  CallSettings call;        // of a call
  std::string decodeInput;  // of a decode
  DecodeSettings decode;    // of a decode
};

// Nothing: help or the complaint has been printed, and the process is to end with `exitCode`.
std::optional<Options> parseCommandLine(int argc, char** argv, ExitCode& exitCode);

}  // namespace tool
