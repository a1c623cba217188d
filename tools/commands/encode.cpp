#include "tools/commands/encode.h"

#include <inttypes.h>

#include <cmath>
#include <nlohmann/json.hpp>

#include <omxhost/device.h>

#include "tools/base/cpu_time.h"
#include "tools/base/text.h"
#include "tools/commands/summary.h"
#include "tools/media/stream_writer.h"

namespace tool {

namespace {

class Encoding : private SenderOwner {
 public:
  Encoding(const EncodeSettings& settings, FrameSource& source, std::stop_source& enough)
      : _settings(settings),
        _enough(enough),
        _sender(settings.sender, source, _book, *this, enough.get_token()) {}

  Outcome run();
  EncodeReport report() const;

 private:
  bool waitForRoom(const std::stop_token&, Deadline) override { return true; }
  bool wantsKeyFrame(int64_t) override { return false; }
  void onCoded(CodedPicture picture) override;

  const EncodeSettings _settings;
  std::stop_source& _enough;
  std::unique_ptr<StreamWriter> _writer;
  CallBook _book;
  // The encoder's output thread's until the sender's run() is over.
  Outcome _failure;
  uint64_t _keyFrames = 0;
  double _wallSeconds = 0;
  double _cpuSeconds = 0;
  // Last: when it is gone, no callback uses the rest.
  Sender _sender;
};

Outcome Encoding::run() {
  const auto opened = _sender.open();
  if (!opened.ok()) return opened.failure();
  if (!opened.value()) return {};
  const EncoderSettings& encoder = _sender.encoder();
  auto writer = createStreamWriter(_settings.path, _settings.format, encoder.size, encoder.rate);
  if (!writer.ok()) return writer.failure();
  _writer = std::move(writer.value());
  if (auto failure = _sender.start()) return failure;
  const auto begin = Clock::now();
  const double cpuAtBegin = processCpuSeconds();
  const Outcome ran = _sender.run();
  _wallSeconds = std::chrono::duration<double>(Clock::now() - begin).count();
  _cpuSeconds = processCpuSeconds() - cpuAtBegin;
  if (_failure) return _failure;
  return ran ? ran : _writer->finish();
}

void Encoding::onCoded(CodedPicture picture) {
  if (_failure) return;
  if (picture.isKey) ++_keyFrames;
  _failure = _writer->write(picture.bytes, _book.timeOf(picture.timestamp), picture.isKey);
  if (_failure) _enough.request_stop();
}

EncodeReport Encoding::report() const {
  EncodeReport report;
  report.figures = _book.figures();
  report.encoder = _sender.encoder();
  report.sequence = _sender.sequence();
  report.keyFrames = _keyFrames;
  report.seconds = _sender.seconds();
  report.meanBitRate = _sender.meanBitRate();
  report.wallSeconds = _wallSeconds;
  report.cpuSeconds = _cpuSeconds;
  report.inputFailure = _sender.inputFailure();
  return report;
}

}  // namespace

Result<EncodeReport> runEncode(const EncodeSettings& settings, FrameSource& source,
                               std::stop_source& enough) {
  Encoding encoding(settings, source, enough);
  if (auto failure = encoding.run()) return *failure;
  return encoding.report();
}

std::string encodeSummary(const EncodeReport& report, const std::string& path) {
  const CallFigures& figures = report.figures;
  std::string text = videoRow(report.encoder.size, report.encoder.rate);
  if (report.sequence) text += row("Stream", toText(*report.sequence));
  text += row("Frames in", figures.framesIn);
  text += row("Encoded", formatted("%" PRIu64 ", %" PRIu64 " of them key frames", figures.framesEncoded,
                                   report.keyFrames));
  text += bitRateRow(report.meanBitRate, bitRate(figures.streamBytes, report.seconds));
  text += timeRow(report.cpuSeconds, report.wallSeconds, figures.framesIn);
  if (!path.empty()) text += row("Stream in", path);
  return text;
}

std::string encodeJson(const EncodeReport& report, bool interrupted) {
  using Json = nlohmann::ordered_json;
  Json object;
  object["device"] = omxhost::posedDevice().name;
  object["width"] = report.encoder.size.width;
  object["height"] = report.encoder.size.height;
  object["fps"] = rounded(report.encoder.rate.perSecond());
  object["profile"] = report.sequence ? Json(report.sequence->profile) : Json();
  object["level"] = report.sequence ? Json(report.sequence->level / 10.0) : Json();
  object["frames_in"] = report.figures.framesIn;
  object["frames_encoded"] = report.figures.framesEncoded;
  object["key_frames"] = report.keyFrames;
  object["bytes"] = report.figures.streamBytes;
  object["bitrate_target"] = std::llround(report.meanBitRate);
  object["bitrate_reached"] = rounded(bitRate(report.figures.streamBytes, report.seconds));
  object["cpu_seconds"] = rounded(report.cpuSeconds);
  object["wall_seconds"] = rounded(report.wallSeconds);
  object["interrupted"] = interrupted;
  return object.dump() + "\n";
}

}  // namespace tool
