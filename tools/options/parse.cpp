#include <stdlib.h>

#include <omxhost/device.h>

#include "tools/base/text.h"
#include "tools/files/output_file.h"
#include "tools/options/fields.h"
#include "tools/options/shell.h"

namespace tool {

namespace {

constexpr uint64_t kSceneFrames = 300;
constexpr int kDefaultKeyInterval = 150;

constexpr const char* kFooter =
    "Environment:\n"
    "  OMXBRIDGE_DEVICE  the device to pose as (--device goes first)\n"
    "  OMXBRIDGE_LOG     what of the library's log to show: verbose, debug, info, warn, error, silent\n\n";

using Command = Options::Command;

struct Entry {
  Command command;
  const char* name;
  const char* help;
  bool isCommon;  // has the common options
  bool hasDevice = true;
};

constexpr Entry kEntries[] = {
    {Command::Call, "call", "Encode video, decode it again, and report on it", true},
    {Command::Encode, "encode", "Encode video into an H.264 stream or an MP4 file", true},
    {Command::Decode, "decode", "Decode H.264 video", true},
    {Command::Convert, "convert", "Cut, scale, turn, pad pictures and change their layout", true, false},
    {Command::Compare, "compare", "Tell how much the pictures of two files differ", true, false},
    {Command::Devices, "devices", "List the devices that this host can pose as", true},
    {Command::Components, "components", "List the components of the device's media server", true},
    {Command::Completion, "completion", "Print a script that completes command lines", false},
    {Command::Manual, "manual", "Print the manual page, for man -l -", false},
};

std::string deviceNames(const char* between) {
  std::string names;
  for (const omxhost::Device& device : omxhost::devices()) {
    names.append(names.empty() ? "" : between).append(device.name);
  }
  return names;
}

void addCommon(CLI::App& app, Options& options, bool hasDevice) {
  if (hasDevice) {
    app.add_option("-d,--device", options.device, "Pose as this device (default msm8960)")
        ->check([](const std::string& name) {
          return omxhost::findDevice(name) != nullptr
                     ? std::string()
                     : "no device \"" + name + "\"; there are " + deviceNames(", ");
        })
        ->type_name(deviceNames("|"))
        ->take_last();
  }
  app.add_flag("--json", options.json, "Print one JSON object instead of a table");
  app.add_flag("-v,--verbose", options.verbose, "Show the library's log");
}

void addOwn(CLI::App& app, Command command, Options& options, CodingOptions& coding) {
  if (command == Command::Call) addCall(app, options, coding);
  if (command == Command::Encode) addEncode(app, options, coding);
  if (command == Command::Decode) addDecode(app, options);
  if (command == Command::Convert) addConvert(app, options);
  if (command == Command::Compare) addCompare(app, options);
  if (command == Command::Completion) {
    app.add_option("SHELL", options.shell, "The shell it is for")
        ->required()
        ->type_name("bash|zsh")
        ->check(CLI::IsMember({"bash", "zsh"}).description(""));
  }
}

// The files that a command writes, with the options that name them.
std::vector<std::pair<std::string, std::string>> outputs(const Options& options) {
  std::vector<std::pair<std::string, std::string>> files;
  const auto add = [&files](const char* option, const std::string& path) {
    if (!path.empty()) files.emplace_back(option, path);
  };
  if (options.command == Command::Call) {
    add("--output", options.call.picturesPath);
    add("--stream", options.call.streamPath);
    add("--report", options.call.reportPath);
    for (const SnapshotRequest& snapshot : options.call.snapshots) add("--snapshot", snapshot.path);
  }
  if (options.command == Command::Encode) add("--output", options.encode.path);
  if (options.command == Command::Decode) add("--output", options.decode.picturesPath);
  if (options.command == Command::Convert) add("--output", options.convert.path);
  return files;
}

// What the options say together.
std::string contradiction(const Options& options) {
  const auto files = outputs(options);
  for (size_t i = 0; i < files.size(); ++i) {
    if (options.json && isStandardOutput(files[i].second)) {
      return "--json needs standard output for itself: write the video to a file";
    }
    for (size_t k = 0; k < i; ++k) {
      if (files[i].second != files[k].second) continue;
      return files[k].first + " and " + files[i].first + " cannot both go to " + files[i].second;
    }
  }
  if (options.command == Command::Compare && options.source.path == "-" && options.secondSource.path == "-") {
    return "only one of the two can come from standard input";
  }
  const char* const named = getenv("OMXBRIDGE_DEVICE");
  if (options.device.empty() && named != nullptr && *named != '\0' && omxhost::findDevice(named) == nullptr) {
    return formatted("OMXBRIDGE_DEVICE: no device \"%s\"; there are %s", named, deviceNames(", ").c_str());
  }
  return {};
}

void complete(Options& options, const CodingOptions& coding) {
  for (SenderSettings* const sender : {&options.call.sender, &options.encode.sender}) {
    coding.apply(sender->encoder);
    if (options.source.path.empty() && sender->frameLimit == 0) sender->frameLimit = kSceneFrames;
  }
  if (options.source.path.empty() && options.convert.frameLimit == 0) {
    options.convert.frameLimit = kSceneFrames;
  }
  options.call.inputName = options.source.path;
  options.secondSource.size = options.source.size;
}

}  // namespace

std::optional<Options> parseCommandLine(int argc, char** argv, ExitCode& exitCode) {
  Options options;
  options.call.sender.encoder.keyInterval = kDefaultKeyInterval;
  options.encode.sender.encoder.keyInterval = kDefaultKeyInterval;
  CodingOptions coding;
  CLI::App app("Video calls through the device's H.264 encoder and decoder.", "omxbridge");
  app.require_subcommand(1);
  app.footer(std::string(kFooter) + kExitCodes);
  app.set_version_flag("--version", OMXBRIDGE_VERSION);
  for (const Entry& entry : kEntries) {
    CLI::App& command = *app.add_subcommand(entry.name, entry.help);
    addOwn(command, entry.command, options, coding);
    if (entry.isCommon) addCommon(command, options, entry.hasDevice);
  }

  try {
    app.parse(argc, argv);
    for (const Entry& entry : kEntries) {
      if (app.got_subcommand(entry.name)) options.command = entry.command;
    }
    const std::string wrong = contradiction(options);
    if (!wrong.empty()) throw CLI::ValidationError(wrong);
  } catch (const CLI::ParseError& error) {
    exitCode = app.exit(error) == 0 ? ExitCode::Done : ExitCode::Usage;
    return std::nullopt;
  }
  complete(options, coding);
  if (options.command == Command::Completion) options.text = completionScript(app, options.shell);
  if (options.command == Command::Manual) options.text = manualPage(app);
  return options;
}

}  // namespace tool
