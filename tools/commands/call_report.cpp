#include "tools/commands/call_report.h"

#include <inttypes.h>

#include <cmath>
#include <nlohmann/json.hpp>

#include <omxhost/device.h>

#include "tools/base/text.h"
#include "tools/commands/devices.h"
#include "tools/commands/summary.h"

namespace tool {

namespace {

nlohmann::ordered_json keyFrames(const CallTrace& trace) {
  auto list = nlohmann::ordered_json::array();
  for (size_t i = 0; i < trace.pictures.size(); ++i) {
    if (trace.pictures[i].isKey) list.push_back(i);
  }
  return list;
}

nlohmann::ordered_json changes(const CallTrace& trace) {
  auto list = nlohmann::ordered_json::array();
  for (const ChangeTrace& change : trace.changes) {
    list.push_back({{"seconds", static_cast<double>(change.time) / 1e6}, {"change", change.text}});
  }
  return list;
}

nlohmann::ordered_json network(const CallReport& report) {
  return {{"loss", report.impairments.loss},
          {"reorder", report.impairments.reorder},
          {"delay_ms", static_cast<double>(report.impairments.delay) / 1e3},
          {"seed", report.impairments.seed},
          {"packets", report.path.packets},
          {"packets_lost", report.path.packetsLost},
          {"packets_late", report.path.packetsReordered},
          {"pictures_lost", report.path.picturesLost},
          {"key_requests", report.path.keyRequests.size()}};
}

}  // namespace

std::string callSummary(const CallReport& report, const WrittenFiles& files) {
  const CallFigures& figures = report.figures;
  std::string text = videoRow(report.encoder.size, report.encoder.rate);
  if (report.sequence) text += row("Stream", toText(*report.sequence));
  text += row("Frames in", figures.framesIn);
  text += row("Encoded", figures.framesEncoded);
  text += row("Decoded", figures.framesDecoded);
  text += row("Dropped", figures.framesDropped());
  if (figures.framesOutOfOrder > 0) text += row("Out of order", figures.framesOutOfOrder);
  if (report.impairments.any()) {
    const PathFigures& path = report.path;
    text += row("On the way", formatted("%" PRIu64 " packets, %" PRIu64 " lost, %" PRIu64 " late; %" PRIu64
                                        " pictures lost, %zu key frames asked for",
                                        path.packets, path.packetsLost, path.packetsReordered,
                                        path.picturesLost, path.keyRequests.size()));
  }
  for (const ChangeTrace& change : report.trace.changes) {
    text += row("Changed",
                formatted("at %.3f s: %s", static_cast<double>(change.time) / 1e6, change.text.c_str()));
  }
  text += bitRateRow(report.meanBitRate, bitRate(figures.streamBytes, report.seconds));
  text += row("PSNR", formatted("%.2f dB (luma, mean)", figures.psnr));
  text += row("Latency", formatted("p50 %.1f ms, p95 %.1f ms, p99 %.1f ms", figures.latencies.p50,
                                   figures.latencies.p95, figures.latencies.p99));
  text += timeRow(report.cpuSeconds, report.wallSeconds, figures.framesIn);
  for (const auto& [label, path] : files) text += row(label.c_str(), path);
  return text;
}

std::string callJson(const CallReport& report, bool interrupted) {
  const CallFigures& figures = report.figures;
  const omxhost::Device& device = omxhost::posedDevice();
  nlohmann::ordered_json object;
  object["device"] = device.name;
  object["hardware_version"] = report.hardwareVersion;
  object["encoder"] = orNull(device.encoderComponent);
  object["decoder"] = orNull(device.decoderComponent);
  object["width"] = report.encoder.size.width;
  object["height"] = report.encoder.size.height;
  object["fps"] = rounded(report.encoder.rate.perSecond());
  object["profile"] = report.sequence ? nlohmann::ordered_json(report.sequence->profile) : nullptr;
  object["level"] = report.sequence ? nlohmann::ordered_json(report.sequence->level / 10.0) : nullptr;
  object["frames_in"] = figures.framesIn;
  object["frames_encoded"] = figures.framesEncoded;
  object["frames_decoded"] = figures.framesDecoded;
  object["frames_dropped"] = figures.framesDropped();
  object["frames_out_of_order"] = figures.framesOutOfOrder;
  object["bitrate_target"] = std::llround(report.meanBitRate);
  object["bitrate_reached"] = rounded(bitRate(figures.streamBytes, report.seconds));
  object["psnr_y"] = rounded(figures.psnr);
  object["latency_ms"] = {{"p50", rounded(figures.latencies.p50)},
                          {"p95", rounded(figures.latencies.p95)},
                          {"p99", rounded(figures.latencies.p99)}};
  object["key_frames"] = keyFrames(report.trace);
  object["changes"] = changes(report.trace);
  if (report.impairments.any()) object["network"] = network(report);
  object["cpu_seconds"] = rounded(report.cpuSeconds);
  object["wall_seconds"] = rounded(report.wallSeconds);
  object["interrupted"] = interrupted;
  return object.dump() + "\n";
}

}  // namespace tool
