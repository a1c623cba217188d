#include "tools/report/html_report.h"

#include <inttypes.h>

#include <algorithm>
#include <cmath>
#include <limits>

extern "C" {
#include <libavutil/base64.h>
}

#include "tools/base/text.h"
#include "tools/commands/devices.h"
#include "tools/media/png.h"
#include "tools/report/page_style.h"
#include "tools/report/plot.h"
#include "tools/video/rework.h"

namespace tool {

namespace {

constexpr int kWidestSnapshot = 640;  // pixels

double seconds(int64_t microseconds) {
  return static_cast<double>(microseconds) / 1e6;
}

std::string escaped(const std::string& text) {
  std::string result;
  for (const char letter : text) {
    if (letter == '&') {
      result += "&amp;";
    } else if (letter == '<') {
      result += "&lt;";
    } else {
      result += letter;
    }
  }
  return result;
}

// --- What is plotted --------------------------------------------------------------------------------------

Marks marksOf(const CallReport& report) {
  Marks marks;
  for (const ChangeTrace& change : report.trace.changes) marks.changes.push_back(seconds(change.time));
  for (const int64_t loss : report.path.losses) marks.losses.push_back(seconds(loss));
  constexpr double kNever = -1;
  double frozenSince = kNever;
  for (const PictureTrace& picture : report.trace.pictures) {
    const double time = seconds(picture.time);
    if (!picture.isDecoded && frozenSince == kNever) frozenSince = time;
    if (picture.isDecoded && frozenSince != kNever) {
      marks.frozen.emplace_back(frozenSince, time);
      frozenSince = kNever;
    }
  }
  if (frozenSince != kNever) marks.frozen.emplace_back(frozenSince, report.seconds);
  return marks;
}

template <typename Value>
Series seriesOf(const CallReport& report, Series series, Value value) {
  for (const PictureTrace& picture : report.trace.pictures) {
    series.points.emplace_back(seconds(picture.time), value(picture));
  }
  return series;
}

// Kilobits a second over the second before each picture.
Series bitRate(const CallReport& report) {
  const auto& pictures = report.trace.pictures;
  const double window = std::min(1.0, report.seconds / 4);
  Series series{"line", Drawn::Line, Extreme::Highest, {}};
  double bits = 0;
  size_t oldest = 0;
  for (size_t i = 0; i < pictures.size(); ++i) {
    bits += static_cast<double>(pictures[i].bytes) * 8;
    const double now = seconds(pictures[i].time);
    for (; seconds(pictures[oldest].time) <= now - window + 1e-6; ++oldest) {
      bits -= static_cast<double>(pictures[oldest].bytes) * 8;
    }
    if (oldest > 0) series.points.emplace_back(now, bits / window / 1e3);
  }
  return series;
}

Series bitRateAsked(const CallReport& report) {
  Series series{"asked", Drawn::Steps, Extreme::Highest, {{0, bitRateTarget(report.encoder) / 1e3}}};
  for (const ChangeTrace& change : report.trace.changes) {
    if (change.item == CONFIG_BITRATE) series.points.emplace_back(seconds(change.time), change.value / 1e3);
  }
  return series;
}

std::string plots(const CallReport& report) {
  const double kNothing = std::numeric_limits<double>::quiet_NaN();
  const Marks marks = marksOf(report);
  const auto size = [&](bool isKey) {
    return seriesOf(report, {isKey ? "key" : "bar", Drawn::Bars, Extreme::Highest, {}},
                    [=](const PictureTrace& picture) {
                      return picture.isKey == isKey ? static_cast<double>(picture.bytes) / 1e3 : 0;
                    });
  };
  const Plot all[] = {
      {"Quality",
       "PSNR of luma, dB",
       {seriesOf(report, {"line", Drawn::Line, Extreme::Lowest, {}},
                 [=](const PictureTrace& picture) { return picture.psnr.value_or(kNothing); })},
       false},
      {"Bit rate", "kbit/s over one second; dashed: asked for", {bitRateAsked(report), bitRate(report)}},
      {"Pictures", "kB each; <i class=\"key\">key frames</i>", {size(false), size(true)}},
      {"Latency",
       "ms from capture to picture",
       {seriesOf(
           report, {"line", Drawn::Line, Extreme::Highest, {}},
           [=](const PictureTrace& picture) { return picture.isDecoded ? picture.latency : kNothing; })}},
  };
  std::string html;
  for (const Plot& plot : all) html += renderPlot(plot, report.seconds, marks);
  std::string legend;
  for (size_t i = 0; i < report.trace.changes.size(); ++i) {
    const ChangeTrace& change = report.trace.changes[i];
    legend += formatted("<li><b>%zu</b> %g s: %s</li>", i + 1, seconds(change.time), change.text.c_str());
  }
  if (!marks.losses.empty()) legend += "<li><i class=\"lost\"></i> packets lost</li>";
  if (!marks.frozen.empty()) legend += "<li><i class=\"still\"></i> no new picture shown</li>";
  return html + (legend.empty() ? "" : "<ul class=\"legend\">" + legend + "</ul>\n");
}

// --- The rest of the page
// -----------------------------------------------------------------------------------

std::string tile(const char* label, const std::string& value, const std::string& detail) {
  return formatted("<div><dt>%s</dt><dd>%s<small>%s</small></dd></div>", label, value.c_str(),
                   detail.c_str());
}

std::string summary(const CallReport& report) {
  const CallFigures& figures = report.figures;
  const double reached =
      report.seconds > 0 ? static_cast<double>(figures.streamBytes) * 8 / report.seconds : 0;
  return "<dl class=\"tiles\">" +
         tile("Decoded", formatted("%" PRIu64, figures.framesDecoded),
              formatted("of %" PRIu64 " pictures", figures.framesIn)) +
         tile("Quality", formatted("%.1f dB", figures.psnr), "mean PSNR") +
         tile("Bit rate", formatted("%.0f kbit/s", reached / 1e3),
              formatted("of %.0f asked", report.meanBitRate / 1e3)) +
         tile("Latency", formatted("%.0f ms", figures.latencies.p50),
              formatted("median; p95 %.0f, p99 %.0f", figures.latencies.p95, figures.latencies.p99)) +
         tile("Speed", formatted("%.0f/s", static_cast<double>(figures.framesIn) / report.wallSeconds),
              formatted("pictures; %.1f s CPU", report.cpuSeconds)) +
         "</dl>\n";
}

std::string row(const char* label, const std::string& value) {
  return formatted("<tr><th>%s</th><td>%s</td></tr>", label, value.c_str());
}

std::string settings(const CallReport& report) {
  const EncoderSettings& encoder = report.encoder;
  std::string rows;
  rows += row("Device", deviceLine());
  rows += row("Components", componentsLine());
  rows += row("Input", report.input.empty() ? "built-in scene" : escaped(report.input));
  rows += row("Video", formatted("%dx%d, %.4g frames/s, %.4g s", encoder.size.width, encoder.size.height,
                                 encoder.rate.perSecond(), report.seconds));
  if (report.sequence) rows += row("Stream", toText(*report.sequence));
  rows += row("Key frames", encoder.keyInterval > 0 ? formatted("every %d frames", encoder.keyInterval)
                                                    : "the first, and on request");
  rows += row("Coding", formatted("%s, %u reference frame%s", encoder.arithmeticCoding ? "CABAC" : "CAVLC",
                                  encoder.references, encoder.references > 1 ? "s" : ""));
  if (report.impairments.any()) {
    const Impairments& way = report.impairments;
    rows +=
        row("On the way", formatted("%g %% loss, %g %% overtaken, %g ms delay, seed %" PRIu64, way.loss * 100,
                                    way.reorder * 100, static_cast<double>(way.delay) / 1e3, way.seed));
    rows += row("Result", formatted("%" PRIu64 " of %" PRIu64 " packets lost, %" PRIu64
                                    " pictures lost, %zu key frames asked for",
                                    report.path.packetsLost, report.path.packets, report.path.picturesLost,
                                    report.path.keyRequests.size()));
  }
  return "<table>" + rows + "</table>\n";
}

std::string imageOf(const Picture& picture, const char* label) {
  Picture scaled;
  const Picture* shown = &picture;
  if (picture.size.width > kWidestSnapshot) {
    const int height = picture.size.height * kWidestSnapshot / picture.size.width / 2 * 2;
    scale(picture, {kWidestSnapshot, std::max(2, height)}, scaled);
    shown = &scaled;
  }
  const auto png = toPng(*shown);
  if (!png) return {};
  std::string text(AV_BASE64_SIZE(png->size()), '\0');
  av_base64_encode(text.data(), static_cast<int>(text.size()), png->data(), static_cast<int>(png->size()));
  text.resize(text.find('\0'));
  return formatted("<img alt=\"%s\" src=\"data:image/png;base64,", label) + text + "\">";
}

std::string snapshot(const char* name, const std::optional<Snapshot>& snapshot) {
  if (!snapshot) return {};
  return "<figure class=\"pair\"><div>" + imageOf(snapshot->before, "before") +
         imageOf(snapshot->after, "after") +
         formatted(
             "</div><figcaption>%s <small>%.3f s, %.1f dB; before and after</small></figcaption></figure>\n",
             name, seconds(snapshot->time), snapshot->psnr);
}

}  // namespace

std::string htmlReport(const CallReport& report, const SnapshotTaker::Kept& snapshots) {
  const std::string device = deviceLine();
  const std::string name = device.substr(0, device.find(' '));
  return "<!DOCTYPE html>\n<html lang=\"en\"><head><meta charset=\"utf-8\">"
         "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\"><title>Call on " +
         name + "</title><style>" + kPageStyle + "</style></head><body><main>\n<h1>Call on " + name +
         "</h1>\n" + summary(report) + plots(report) + "<h2>Pictures</h2>\n" +
         snapshot("First", snapshots.first) + snapshot("Worst", snapshots.worst) +
         snapshot("Last", snapshots.last) + "<h2>Settings</h2>\n" + settings(report) +
         "</main></body></html>\n";
}

}  // namespace tool
