#include "tools/commands/decode.h"

#include <mutex>
#include <nlohmann/json.hpp>

#include <omxhost/device.h>

#include "tools/base/cpu_time.h"
#include "tools/base/text.h"
#include "tools/commands/progress_bar.h"
#include "tools/commands/summary.h"
#include "tools/files/picture_writer.h"
#include "tools/session/session.h"
#include "tools/video/device_layout.h"

namespace tool {

namespace {

// Decoders that put pictures into order keep some until the end, two fields make one picture, and damage
// none: missing pictures are no exception here.
constexpr std::chrono::milliseconds kPatience{300};

class Decoding {
 public:
  Decoding(const DecodeSettings& settings, AccessUnitSource& stream, std::stop_source& enough)
      : _settings(settings), _stream(stream), _enough(enough) {}

  Outcome open();
  Outcome run();
  DecodeReport report() const;

 private:
  Outcome feed();
  void onPicture(const DECODEDDATAINFO& info, std::span<const uint8_t> data);
  void fail(Failure failure);

  const DecodeSettings _settings;
  AccessUnitSource& _stream;
  std::stop_source& _enough;
  FrameRate _rate;
  std::vector<uint8_t> _unit;
  DecodeReport _report;  // the counts of pictures are the output thread's until the session is finished
  std::mutex _mutex;
  Outcome _failure;  // the first; under the mutex
  DecodedPictureReader _reader;
  Picture _picture;
  std::unique_ptr<PictureWriter> _writer;
  // Last: when it is gone, no callback uses the rest.
  std::unique_ptr<Session> _session;
};

Outcome Decoding::open() {
  const auto first = _stream.next(_unit);
  if (!first.ok()) return first.failure();
  _rate = _settings.rate.value_or(_stream.frameRate().value_or(FrameRate()));
  auto writer = createPictureWriter(_settings.picturesPath, _settings.picturesFormat, {.rate = _rate});
  if (!writer.ok()) return writer.failure();
  _writer = std::move(writer.value());
  auto session = Session::openDecoder([this](const DECODEDDATAINFO& info, std::span<const uint8_t> data,
                                             uint32_t) { onPicture(info, data); });
  if (!session.ok()) return session.failure();
  _session = std::move(session.value());
  return _session->start();
}

Outcome Decoding::run() {
  const auto begin = Clock::now();
  const double cpuAtBegin = processCpuSeconds();
  if (auto failure = feed()) fail(*failure);
  const auto end = static_cast<uint32_t>(_rate.microseconds(_report.unitsIn));
  if (auto failure = _session->finish(_report.unitsIn, end, kPatience)) fail(*failure);
  _report.rate = _rate;
  _report.wallSeconds = std::chrono::duration<double>(Clock::now() - begin).count();
  _report.cpuSeconds = processCpuSeconds() - cpuAtBegin;
  {
    const std::lock_guard held(_mutex);
    if (_failure) return _failure;
  }
  if (_report.picturesOut == 0 && !_enough.stop_requested()) {
    return _stream.failure("gave no picture: the decoder made nothing of it");
  }
  return _writer->finish();
}

Outcome Decoding::feed() {
  ProgressBar progress(std::nullopt);
  while (!_enough.stop_requested()) {
    const auto timestamp = static_cast<uint32_t>(_rate.microseconds(_report.unitsIn));
    const auto sent = _session->sendCopy(_unit, timestamp, _enough.get_token());
    if (!sent.ok()) return sent.failure();
    if (!sent.value()) break;
    progress.update(++_report.unitsIn);
    const auto more = _stream.next(_unit);
    if (!more.ok()) _report.inputFailure = more.failure();
    if (!more.ok() || !more.value()) break;
  }
  return {};
}

void Decoding::onPicture(const DECODEDDATAINFO& info, std::span<const uint8_t> data) {
  {
    const std::lock_guard held(_mutex);
    if (_failure) return;
  }
  if (auto failure = _reader.read(info, data, _picture)) return fail(*failure);
  if (_report.picturesOut > 0 && _picture.size != _report.size) ++_report.sizeChanges;
  _report.size = _picture.size;
  ++_report.picturesOut;
  if (auto failure = _writer->write(_picture)) fail(*failure);
}

void Decoding::fail(Failure failure) {
  {
    const std::lock_guard held(_mutex);
    if (!_failure) _failure = std::move(failure);
  }
  _enough.request_stop();
}

DecodeReport Decoding::report() const {
  return _report;
}

}  // namespace

Result<DecodeReport> runDecode(const DecodeSettings& settings, AccessUnitSource& stream,
                               std::stop_source& enough) {
  Decoding decoding(settings, stream, enough);
  if (auto failure = decoding.open()) return *failure;
  if (auto failure = decoding.run()) return *failure;
  return decoding.report();
}

std::string decodeSummary(const DecodeReport& report, const std::string& picturesPath) {
  std::string text = videoRow(report.size, report.rate);
  text += row("Access units", report.unitsIn);
  text += row("Pictures", report.picturesOut);
  if (report.sizeChanges > 0) text += row("Size changes", std::to_string(report.sizeChanges));
  text += timeRow(report.cpuSeconds, report.wallSeconds, report.picturesOut);
  if (!picturesPath.empty()) text += row("Pictures in", picturesPath);
  return text;
}

std::string decodeJson(const DecodeReport& report, bool interrupted) {
  nlohmann::ordered_json object;
  object["device"] = omxhost::posedDevice().name;
  object["width"] = report.size.width;
  object["height"] = report.size.height;
  object["fps"] = rounded(report.rate.perSecond());
  object["access_units"] = report.unitsIn;
  object["frames_decoded"] = report.picturesOut;
  object["size_changes"] = report.sizeChanges;
  object["cpu_seconds"] = rounded(report.cpuSeconds);
  object["wall_seconds"] = rounded(report.wallSeconds);
  object["interrupted"] = interrupted;
  return object.dump() + "\n";
}

}  // namespace tool
