// omxbridge: the command line tool.
#include <stdio.h>
#include <stdlib.h>

#include <algorithm>
#include <functional>
#include <stop_token>

#include <android/log.h>
#include <omxhost/device.h>
#include <omxhost/log.h>

#include "tools/base/interrupt.h"
#include "tools/commands/call_report.h"
#include "tools/commands/compare.h"
#include "tools/commands/devices.h"
#include "tools/files/output_file.h"
#include "tools/media/h264_track.h"
#include "tools/options/options.h"

namespace tool {

namespace {

// Keeps the library's log from the terminal, and shows its last errors where a session has failed.
class QuietLog {
 public:
  void explain(const Failure& failure) const {
    if (failure.code != ExitCode::Failed && failure.code != ExitCode::Device) return;
    constexpr size_t kShown = 6;
    auto lines = _capture.lines();
    std::erase_if(lines, [](const omxhost::LogLine& line) { return line.priority < ANDROID_LOG_ERROR; });
    for (size_t i = lines.size() - std::min(lines.size(), kShown); i < lines.size(); ++i) {
      std::string& text = lines[i].text;
      while (text.ends_with('\n')) text.pop_back();
      fprintf(stderr, "  log: %s\n", text.c_str());
    }
  }

 private:
  const omxhost::LogCapture _capture;
};

Outcome print(FILE* file, const std::string& text) {
  if (fputs(text.c_str(), file) >= 0 && fflush(file) == 0) return {};
  return Failure{ExitCode::Output, "the summary cannot be written"};
}

// A summary makes way for video on standard output.
FILE* summaryFile(bool videoOnStandardOutput) {
  return videoOnStandardOutput ? stderr : stdout;
}

// Prints what came of a command to `out`, and passes on that the input broke off.
template <typename Report, typename Json, typename Summary>
Outcome conclude(const Result<Report>& report, FILE* out, const Options& options, const Interrupt& interrupt,
                 Json json, Summary summary) {
  if (!report.ok()) return report.failure();
  const std::string text =
      options.json ? json(report.value(), interrupt.requested()) : summary(report.value());
  if (auto failure = print(out, text)) return failure;
  return report.value().inputFailure;
}

Outcome call(const Options& options, const Interrupt& interrupt, std::stop_source& enough) {
  const CallSettings& settings = options.call;
  FILE* const out =
      summaryFile(isStandardOutput(settings.picturesPath) || isStandardOutput(settings.streamPath) ||
                  isStandardOutput(settings.reportPath));
  auto source = openFrameSource(options.source, enough.get_token());
  if (!source.ok()) return source.failure();
  if (!options.json) {
    if (auto failure =
            print(out, "Device         " + deviceLine() + "\nComponents     " + componentsLine() + "\n")) {
      return failure;
    }
  }
  WrittenFiles files;
  if (!settings.streamPath.empty()) files.emplace_back("Stream in", settings.streamPath);
  if (!settings.picturesPath.empty()) files.emplace_back("Pictures in", settings.picturesPath);
  for (const SnapshotRequest& snapshot : settings.snapshots) files.emplace_back("Snapshot in", snapshot.path);
  if (!settings.reportPath.empty()) files.emplace_back("Report in", settings.reportPath);
  return conclude(runCall(settings, *source.value(), enough), out, options, interrupt, callJson,
                  [&files](const CallReport& report) { return callSummary(report, files); });
}

Outcome decode(const Options& options, const Interrupt& interrupt, std::stop_source& enough) {
  const auto stream = openAccessUnits(options.decodeInput, enough.get_token());
  if (!stream.ok()) return stream.failure();
  const std::string& path = options.decode.picturesPath;
  return conclude(runDecode(options.decode, *stream.value(), enough), summaryFile(isStandardOutput(path)),
                  options, interrupt, decodeJson,
                  [&path](const DecodeReport& report) { return decodeSummary(report, path); });
}

Outcome encode(const Options& options, const Interrupt& interrupt, std::stop_source& enough) {
  const auto source = openFrameSource(options.source, enough.get_token());
  if (!source.ok()) return source.failure();
  const std::string& path = options.encode.path;
  return conclude(runEncode(options.encode, *source.value(), enough), summaryFile(isStandardOutput(path)),
                  options, interrupt, encodeJson,
                  [&path](const EncodeReport& report) { return encodeSummary(report, path); });
}

Outcome convert(const Options& options, const Interrupt& interrupt, std::stop_source& enough) {
  const auto source = openFrameSource(options.source, enough.get_token());
  if (!source.ok()) return source.failure();
  const std::string& path = options.convert.path;
  return conclude(runConvert(options.convert, *source.value(), enough), summaryFile(isStandardOutput(path)),
                  options, interrupt, convertJson,
                  [&path](const ConvertReport& report) { return convertSummary(report, path); });
}

Outcome compare(const Options& options, const Interrupt& interrupt, std::stop_source& enough) {
  const auto one = openFrameSource(options.source, enough.get_token());
  if (!one.ok()) return one.failure();
  const auto other = openFrameSource(options.secondSource, enough.get_token());
  if (!other.ok()) return other.failure();
  return conclude(
      runCompare(*one.value(), *other.value(), enough), stdout, options, interrupt, compareJson,
      [&options](const CompareReport& report) { return compareSummary(report, options.perPicture); });
}

Outcome run(const Options& options, const Interrupt& interrupt) {
  // Ended from outside by Ctrl-C, from inside by failures.
  std::stop_source enough;
  const std::stop_callback link(interrupt.token(), [&enough] { enough.request_stop(); });
  switch (options.command) {
    case Options::Command::Call:
      return call(options, interrupt, enough);
    case Options::Command::Encode:
      return encode(options, interrupt, enough);
    case Options::Command::Convert:
      return convert(options, interrupt, enough);
    case Options::Command::Compare:
      return compare(options, interrupt, enough);
    case Options::Command::Decode:
      return decode(options, interrupt, enough);
    case Options::Command::Completion:
    case Options::Command::Manual:
      return print(stdout, options.text);
    case Options::Command::Devices:
      return print(stdout, listDevices(options.json));
    case Options::Command::Components: {
      const auto list = listComponents(options.json);
      return list.ok() ? print(stdout, list.value()) : list.failure();
    }
  }
  return {};
}

ExitCode runAndExplain(const Options& options) {
  const Interrupt interrupt;
  std::optional<QuietLog> quiet;
  if (getenv("OMXBRIDGE_LOG") == nullptr) {
    if (options.verbose) {
      setenv("OMXBRIDGE_LOG", "info", 1);
    } else {
      quiet.emplace();
    }
  }
  // The name has been checked.
  if (!options.device.empty()) static_cast<void>(omxhost::setDevice(options.device));
  const Outcome failure = run(options, interrupt);
  // An input that was left in the middle is no failure.
  const bool wasLeft = interrupt.requested() && failure && failure->code == ExitCode::Input;
  if (failure && !wasLeft) {
    fprintf(stderr, "omxbridge: %s\n", failure->text.c_str());
    if (quiet) quiet->explain(*failure);
    return failure->code;
  }
  return interrupt.requested() ? ExitCode::Interrupted : ExitCode::Done;
}

}  // namespace

}  // namespace tool

int main(int argc, char** argv) {
  tool::ExitCode code = tool::ExitCode::Done;
  const auto options = tool::parseCommandLine(argc, argv, code);
  if (options) code = tool::runAndExplain(*options);
  return static_cast<int>(code);
}
