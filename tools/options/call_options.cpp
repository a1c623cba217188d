#include <algorithm>

#include "tools/options/fields.h"

namespace tool {

namespace {

constexpr const char* kFooter =
    "INPUT is any video file, Y4M, raw I420 (with --size), or - for standard input; without it a built-in\n"
    "scene is used. Files appear under their names when they are complete. Times and losses are in the time "
    "of\n"
    "the video, whether it runs in real time or not.\n\n"
    "Examples:\n"
    "  omxbridge call\n"
    "  omxbridge call clip.mp4 -b 800k -o decoded.y4m --stream coded.264\n"
    "  omxbridge call clip.yuv --size 1280x720 --fps 25 --profile high --device omap4\n"
    "  omxbridge call --at 3s bitrate=300k --at 5s keyframe --at 6s rotate=90 --report call.html\n"
    "  omxbridge call --loss 1% --reorder 2% --delay 80ms --seed 7 --report lossy.html\n"
    "  ffmpeg -i clip.mp4 -pix_fmt yuv420p -f yuv4mpegpipe - | omxbridge call - -o - | mpv -\n"
    "  omxbridge call --realtime --json > figures.json\n\n";

constexpr const char* kChanges = "bitrate=300k, keyframe, rotate=90 (0, 90, 180, 270), fps=15 or intra=30";

int64_t readTime(const char* option, const std::string& text) {
  const auto time = parseTime(text);
  if (!time) throw CLI::ValidationError(option, "\"" + text + "\" is not a time as 3s or 500ms");
  return *time;
}

using Pairs = std::vector<std::pair<std::string, std::string>>;

// An option with two arguments, which may be given several times.
void addPairs(CLI::App& app, const std::string& name, const std::string& form,
              const std::function<void(const Pairs&)>& take, const std::string& help) {
  app.add_option_function<Pairs>(name, take, help)->type_name(form)->allow_extra_args(false);
}

void addChanges(CLI::App& app, std::vector<Change>& changes) {
  const auto take = [&changes](const Pairs& pairs) {
    for (const auto& [when, what] : pairs) {
      auto change = parseChange(what);
      if (!change) throw CLI::ValidationError("--at", "\"" + what + "\" is not a change as " + kChanges);
      change->at = readTime("--at", when);
      changes.push_back(std::move(*change));
    }
    std::stable_sort(changes.begin(), changes.end(),
                     [](const Change& one, const Change& other) { return one.at < other.at; });
  };
  addPairs(
      app, "--at", "TIME CHANGE", take,
      std::string("Change something at this time of the video: ") + kChanges + "; again for more changes");
}

void addSnapshots(CLI::App& app, std::vector<SnapshotRequest>& snapshots) {
  const auto take = [&snapshots](const Pairs& pairs) {
    for (const auto& [when, path] : pairs) snapshots.push_back({readTime("--snapshot", when), path});
  };
  addPairs(app, "--snapshot", "TIME FILE", take,
           "Write the picture of this time, before and after side by side, as PNG; again for more pictures");
}

std::optional<int64_t> parseDelay(std::string_view text) {
  constexpr int64_t kLongest = 10'000'000;
  const auto time = parseTime(text);
  return time && *time <= kLongest ? time : std::nullopt;
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

}  // namespace

void addCall(CLI::App& app, Options& options, CodingOptions& coding) {
  app.footer(std::string(kFooter) + kExitCodes);
  addSource(app, options.source, "Video file, raw I420, or -");
  addSender(app, options.call.sender, coding);
  app.add_flag(
      "-r,--realtime", options.call.sender.realTime,
      "Pace the frames by their rate and drop those that find no free buffer; else as fast as it goes");
  addChanges(app, options.call.sender.changes);
  addImpairments(app, options.call.impairments);
  addText(app, "--stream", options.call.streamPath, "FILE",
          "Write the coded stream (H.264 Annex B) here; - for standard output");
  addPictureOutput(app, options.call.picturesPath, options.call.picturesFormat);
  addSnapshots(app, options.call.snapshots);
  addText(app, "--report", options.call.reportPath, "FILE", "Write a report (one HTML file) here");
}

}  // namespace tool
