#include "tools/commands/convert.h"

#include <inttypes.h>

#include <nlohmann/json.hpp>

#include "tools/base/clock.h"
#include "tools/base/text.h"
#include "tools/commands/progress_bar.h"
#include "tools/commands/summary.h"
#include "tools/files/picture_writer.h"
#include "tools/video/rework.h"

namespace tool {

namespace {

bool isWithin(Size inner, Size outer) {
  return inner.width <= outer.width && inner.height <= outer.height;
}

std::string text(Size size) {
  return formatted("%dx%d", size.width, size.height);
}

// What the settings make of pictures of this size.
Result<Size> resultingSize(const ConvertSettings& settings, Size size) {
  if (settings.cut) {
    if (!isWithin(*settings.cut, size)) {
      return Failure{ExitCode::Usage, "--cut " + text(*settings.cut) +
                                          " is larger than the picture, which is " + text(size) +
                                          "; use --pad or --scale"};
    }
    size = *settings.cut;
  }
  if (settings.scale) size = *settings.scale;
  if (settings.rotation % 180 != 0) size = {size.height, size.width};
  if (settings.pad) {
    if (!isWithin(size, *settings.pad)) {
      return Failure{ExitCode::Usage, "--pad " + text(*settings.pad) +
                                          " is smaller than the picture, which is " + text(size) +
                                          "; use --cut or --scale"};
    }
    size = *settings.pad;
  }
  return size;
}

class Conversion {
 public:
  explicit Conversion(const ConvertSettings& settings) : _settings(settings) {}

  const Picture& apply(const Picture& picture) {
    const Picture* result = &picture;
    if (_settings.cut) {
      cut(*result, *_settings.cut, _cut);
      result = &_cut;
    }
    if (_settings.scale && *_settings.scale != result->size) {
      scale(*result, *_settings.scale, _scaled);
      result = &_scaled;
    }
    result = &turned(*result, _settings.rotation, _turned);
    if (_settings.pad) {
      pad(*result, *_settings.pad, _padded);
      result = &_padded;
    }
    return *result;
  }

 private:
  const ConvertSettings _settings;
  Picture _cut;
  Picture _scaled;
  Picture _turned;
  Picture _padded;
};

}  // namespace

Result<ConvertReport> runConvert(const ConvertSettings& settings, FrameSource& source,
                                 std::stop_source& enough) {
  const auto size = resultingSize(settings, source.size());
  if (!size.ok()) return size.failure();
  VideoTraits traits = source.traits();
  traits.layout = settings.layout;
  auto writer = createPictureWriter(settings.path, settings.format, traits);
  if (!writer.ok()) return writer.failure();

  const auto begin = Clock::now();
  ConvertReport report{.from = source.size(), .to = size.value(), .inputFailure = {}};
  Conversion conversion(settings);
  Picture picture;
  ProgressBar progress(settings.frameLimit > 0 ? settings.frameLimit : source.frameCount());
  while (!enough.stop_requested() && (settings.frameLimit == 0 || report.pictures < settings.frameLimit)) {
    const auto more = source.next(picture);
    if (!more.ok()) report.inputFailure = more.failure();
    if (!more.ok() || !more.value()) break;
    if (auto failure = writer.value()->write(conversion.apply(picture))) return *failure;
    progress.update(++report.pictures);
  }
  report.wallSeconds = std::chrono::duration<double>(Clock::now() - begin).count();
  if (auto failure = writer.value()->finish()) return *failure;
  return report;
}

std::string convertSummary(const ConvertReport& report, const std::string& path) {
  std::string lines = row("Video", text(report.from) + " to " + text(report.to));
  lines +=
      row("Pictures", formatted("%" PRIu64 " in %.2f s, %.1f frames/s", report.pictures, report.wallSeconds,
                                static_cast<double>(report.pictures) / report.wallSeconds));
  if (!path.empty()) lines += row("Pictures in", path);
  return lines;
}

std::string convertJson(const ConvertReport& report, bool interrupted) {
  nlohmann::ordered_json object;
  object["frames"] = report.pictures;
  object["width_in"] = report.from.width;
  object["height_in"] = report.from.height;
  object["width"] = report.to.width;
  object["height"] = report.to.height;
  object["wall_seconds"] = rounded(report.wallSeconds);
  object["interrupted"] = interrupted;
  return object.dump() + "\n";
}

}  // namespace tool
