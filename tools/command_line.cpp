#include "tools/command_line.h"

#include <stdlib.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <functional>

#include <omxhost/device.h>

#include "tools/base/text.h"
#include "tools/base/units.h"
#include "tools/files/output_file.h"
#include "tools/files/picture_writer.h"

namespace tool {

namespace {

constexpr uint64_t kSceneFrames = 300;
constexpr int kBaseline = 66;
constexpr int kMain = 77;
constexpr int kHigh = 100;

constexpr const char* kSizes = "a size as 640x480, sides from 2 to 8192";
constexpr const char* kFrameRates = "a rate up to 255, as 30, 29.97 or 30000/1001";

constexpr const char* kExitCodes =
    "Exit codes:\n"
    "  0    done\n"
    "  1    a session failed while it ran\n"
    "  2    wrong command line\n"
    "  3    the input cannot be read, is not what it should be, or breaks off\n"
    "  4    an output cannot be written\n"
    "  5    the device has no such component, or it refuses the settings\n"
    "  130  interrupted; what was done until then has been written\n";

constexpr const char* kMainFooter =
    "Environment:\n"
    "  OMXBRIDGE_DEVICE  the device to pose as (--device goes first)\n"
    "  OMXBRIDGE_LOG     what of the library's log to show: verbose, debug, info, warn, error, silent\n\n";

constexpr const char* kCallFooter =
    "INPUT is any video file, Y4M, raw I420 (with --size), or - for standard input; without it a built-in\n"
    "scene is used. Files appear under their names when they are complete.\n\n"
    "Examples:\n"
    "  omxbridge call\n"
    "  omxbridge call clip.mp4 -b 800k -o decoded.y4m --stream coded.264\n"
    "  omxbridge call clip.yuv --size 1280x720 --fps 25 --profile high --device omap4\n"
    "  ffmpeg -i clip.mp4 -pix_fmt yuv420p -f yuv4mpegpipe - | omxbridge call - -o - | mpv -\n"
    "  omxbridge call --realtime --json > figures.json\n\n";

constexpr const char* kDecodeFooter =
    "Examples:\n"
    "  omxbridge decode coded.264 -o decoded.y4m\n"
    "  ffmpeg -i clip.mp4 -c copy -bsf:v h264_mp4toannexb -f h264 - | omxbridge decode - -o - | mpv -\n\n";

std::string deviceNames() {
  std::string names;
  for (const omxhost::Device& device : omxhost::devices()) {
    names.append(names.empty() ? "" : ", ").append(device.name);
  }
  return names;
}

// An option whose text one of the parse functions turns into a value. `form` stands in the help, `accepted`
// in the complaint.
template <typename Value>
void addParsed(CLI::App& app, const std::string& names, const std::string& form, const std::string& accepted,
               std::optional<Value> (*parse)(std::string_view), std::function<void(Value)> store,
               const std::string& help) {
  const auto take = [names, accepted, parse, store](const std::string& text) {
    const auto value = parse(text);
    if (!value) throw CLI::ValidationError(names, "\"" + text + "\" is not " + accepted);
    store(*value);
  };
  app.add_option_function<std::string>(names, take, help)->type_name(form);
}

void addChoice(CLI::App& app, const std::string& name, std::string& chosen,
               const std::vector<std::string>& choices, const std::string& help) {
  std::string list;
  for (const std::string& choice : choices) list.append(list.empty() ? "" : "|").append(choice);
  app.add_option(name, chosen, help)->check(CLI::IsMember(choices).description(""))->type_name(list);
}

std::optional<int> parseProfile(std::string_view name) {
  if (name == "baseline") return kBaseline;
  if (name == "main") return kMain;
  if (name == "high") return kHigh;
  return std::nullopt;
}

template <uint64_t low, uint64_t high>
std::optional<uint64_t> parseCountWithin(std::string_view text) {
  const auto count = parseCount(text);
  return count && *count >= low && *count <= high ? count : std::nullopt;
}

std::optional<int64_t> parseDelay(std::string_view text) {
  constexpr int64_t kLongest = 10'000'000;
  const auto time = parseTime(text);
  return time && *time <= kLongest ? time : std::nullopt;
}

void addPictureOutput(CLI::App& app, std::string& path, std::string& format) {
  app.add_option("-o,--output", path, "Write the decoded pictures here; - for standard output")
      ->type_name("FILE");
  addChoice(app, "--format", format, pictureFormats(),
            "Format of the pictures; else by the file's name, or y4m");
}

// Entropy coding and transform follow the profile unless they are asked for.
struct CodingOptions {
  std::string entropy;

  void apply(EncoderSettings& encoder) const {
    encoder.arithmeticCoding = entropy.empty() ? encoder.profile != kBaseline : entropy == "cabac";
    encoder.largeTransform = encoder.profile == kHigh;
  }
};

void addChanges(CLI::App& app, std::vector<Change>& changes) {
  const auto take = [&changes](const std::vector<std::pair<std::string, std::string>>& pairs) {
    for (const auto& [when, what] : pairs) {
      const auto time = parseTime(when);
      if (!time) throw CLI::ValidationError("--at", "\"" + when + "\" is not a time as 3s or 500ms");
      auto change = parseChange(what);
      if (!change) {
        throw CLI::ValidationError("--at",
                                   "\"" + what +
                                       "\" is not a change as bitrate=300k, keyframe, rotate=90 (0, 90, "
                                       "180, 270), fps=15 or intra=30");
      }
      change->at = *time;
      changes.push_back(std::move(*change));
    }
    std::stable_sort(changes.begin(), changes.end(),
                     [](const Change& one, const Change& other) { return one.at < other.at; });
  };
  app.add_option_function<std::vector<std::pair<std::string, std::string>>>(
         "--at", take,
         "Change something at this time of the video: bitrate=300k, keyframe, rotate=90, fps=15 or intra=30; "
         "may be given several times")
      ->type_name("TIME CHANGE")
      ->allow_extra_args(false);
}

void addImpairments(CLI::App& app, Impairments& impairments) {
  addParsed<double>(
      app, "--loss", "PERCENT", "a share of packets as 2%", parseShare,
      [&impairments](double share) { impairments.loss = share; },
      "Lose this share of the packets between the ends, as 2%");
  addParsed<double>(
      app, "--reorder", "PERCENT", "a share of packets as 1%", parseShare,
      [&impairments](double share) { impairments.reorder = share; },
      "Have this share of the packets overtaken by others, as 1%");
  addParsed<int64_t>(
      app, "--delay", "TIME", "a time up to 10s, as 80ms", parseDelay,
      [&impairments](int64_t delay) { impairments.delay = delay; },
      "Time that packets and key-frame requests are under way, as 80ms");
  addParsed<uint64_t>(
      app, "--seed", "NUMBER", "a number", parseCount,
      [&impairments](uint64_t seed) { impairments.seed = seed; },
      "What decides which packets are hit (default 1)");
}

void addCall(CLI::App& app, Options& options, CodingOptions& coding) {
  EncoderSettings& encoder = options.call.sender.encoder;
  app.footer(std::string(kCallFooter) + kExitCodes);
  app.add_option("INPUT", options.source.path, "Video file, raw I420, or -")->type_name("");
  addParsed<Size>(
      app, "-s,--size", "WxH", kSizes, parseSize, [&options](Size size) { options.source.size = size; },
      "Picture size of raw input and of the scene (default of the scene 640x480)");
  addParsed<FrameRate>(
      app, "--fps", "RATE", kFrameRates, parseFrameRate,
      [&options](FrameRate rate) { options.source.rate = rate; },
      "Frames a second, as 30, 29.97 or 30000/1001 (default: the input's own, or 30)");
  addParsed<uint64_t>(
      app, "-n,--frames", "COUNT", "a number from 1 on", parseCountWithin<1, uint64_t{1} << 40>,
      [&options](uint64_t count) { options.call.sender.frameLimit = count; },
      "End after this many frames (default: all; 300 of the scene)");
  addParsed<uint32_t>(
      app, "-b,--bitrate", "RATE", "a rate from 1k to 1000M, as 800k or 1.5M", parseBitRate,
      [&encoder](uint32_t rate) { encoder.bitRate = rate; }, "Bits a second, as 800k or 1.5M (default 1M)");
  addParsed<int>(
      app, "-p,--profile", "NAME", "baseline, main or high", parseProfile,
      [&encoder](int profile) { encoder.profile = profile; },
      "H.264 profile: baseline (default), main or high");
  addParsed<uint64_t>(
      app, "-k,--key-interval", "COUNT", "a number from 0 to 100000", parseCountWithin<0, 100000>,
      [&encoder](uint64_t count) { encoder.keyInterval = static_cast<int>(count); },
      "Frames from one key frame to the next; 0: only the first is one (default 150)");
  addParsed<uint64_t>(
      app, "--refs", "COUNT", "a number from 1 to 16", parseCountWithin<1, 16>,
      [&encoder](uint64_t count) { encoder.references = static_cast<uint32_t>(count); },
      "Reference frames, up to 16 (default 1)");
  addChoice(app, "--entropy", coding.entropy, {"cavlc", "cabac"},
            "Entropy coding (default cavlc for baseline, cabac for the others)");
  app.add_flag(
      "-r,--realtime", options.call.sender.realTime,
      "Pace the frames by their rate and drop those that find no free buffer; else as fast as it goes");
  addChanges(app, options.call.sender.changes);
  addImpairments(app, options.call.impairments);
  app.add_option("--stream", options.call.streamPath,
                 "Write the coded stream (H.264 Annex B) here; - for standard output")
      ->type_name("FILE");
  addPictureOutput(app, options.call.picturesPath, options.call.picturesFormat);
}

void addDecode(CLI::App& app, Options& options) {
  app.footer(std::string(kDecodeFooter) + kExitCodes);
  app.add_option("INPUT", options.decodeInput, "H.264 byte stream (Annex B), or - for standard input")
      ->required()
      ->type_name("");
  addPictureOutput(app, options.decode.picturesPath, options.decode.picturesFormat);
  addParsed<FrameRate>(
      app, "--fps", "RATE", kFrameRates, parseFrameRate,
      [&options](FrameRate rate) { options.decode.rate = rate; },
      "Frames a second to write into the file (default: what the stream says, or 30)");
}

void addCommon(CLI::App& app, Options& options) {
  app.add_option("-d,--device", options.device, "Pose as this device: " + deviceNames())
      ->check([](const std::string& name) {
        return omxhost::findDevice(name) != nullptr
                   ? std::string()
                   : "no device \"" + name + "\"; there are " + deviceNames();
      })
      ->type_name("NAME");
  app.add_flag("--json", options.json, "Print one JSON object instead of a table");
  app.add_flag("-v,--verbose", options.verbose, "Show the library's log");
}

// What the options say together.
std::string contradiction(const Options& options) {
  const bool isCall = options.command == Options::Command::Call;
  const bool pictures = isStandardOutput(isCall ? options.call.picturesPath : options.decode.picturesPath);
  const bool stream = isCall && isStandardOutput(options.call.streamPath);
  if (isCall && !options.call.streamPath.empty() && options.call.streamPath == options.call.picturesPath) {
    return "--output and --stream cannot both go to " + options.call.streamPath;
  }
  if (options.json && (pictures || stream)) {
    return "--json needs standard output for itself: write the video to a file";
  }
  const char* const named = getenv("OMXBRIDGE_DEVICE");
  if (options.device.empty() && named != nullptr && *named != '\0' && omxhost::findDevice(named) == nullptr) {
    return formatted("OMXBRIDGE_DEVICE: no device \"%s\"; there are %s", named, deviceNames().c_str());
  }
  return {};
}

}  // namespace

std::optional<Options> parseCommandLine(int argc, char** argv, ExitCode& exitCode) {
  Options options;
  options.call.sender.encoder.keyInterval = 150;
  CodingOptions coding;
  CLI::App app("Video calls through the device's H.264 encoder and decoder.", "omxbridge");
  app.require_subcommand(1);
  app.footer(std::string(kMainFooter) + kExitCodes);
  app.set_version_flag("--version", OMXBRIDGE_VERSION);

  struct Entry {
    CLI::App* app;
    Options::Command command;
  };
  const Entry entries[] = {
      {app.add_subcommand("call", "Encode video, decode it again, and report on it"), Options::Command::Call},
      {app.add_subcommand("decode", "Decode an H.264 byte stream"), Options::Command::Decode},
      {app.add_subcommand("devices", "List the devices that this host can pose as"),
       Options::Command::Devices},
      {app.add_subcommand("components", "List the components of the device's media server"),
       Options::Command::Components},
  };
  addCall(*entries[0].app, options, coding);
  addDecode(*entries[1].app, options);
  for (const Entry& entry : entries) addCommon(*entry.app, options);

  try {
    app.parse(argc, argv);
    for (const Entry& entry : entries) {
      if (entry.app->parsed()) options.command = entry.command;
    }
    const std::string wrong = contradiction(options);
    if (!wrong.empty()) throw CLI::ValidationError(wrong);
  } catch (const CLI::ParseError& error) {
    exitCode = app.exit(error) == 0 ? ExitCode::Done : ExitCode::Usage;
    return std::nullopt;
  }
  coding.apply(options.call.sender.encoder);
  if (options.source.path.empty() && options.call.sender.frameLimit == 0)
    options.call.sender.frameLimit = kSceneFrames;
  return options;
}

}  // namespace tool
