#include "tools/commands/call.h"

#include <condition_variable>
#include <mutex>
#include <thread>
#include <utility>
#include <vector>

#include "omxbridge/hardware_version.h"
#include "tools/base/cpu_time.h"
#include "tools/commands/link.h"
#include "tools/commands/progress_bar.h"
#include "tools/files/output_file.h"
#include "tools/files/picture_writer.h"
#include "tools/h264/access_units.h"
#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"

namespace tool {

namespace {

// Pictures that may wait between the encoder and the decoder.
constexpr size_t kLinkLimit = 4;

// Encoders may drop pictures, which only their silence tells.
constexpr std::chrono::seconds kPatience{2};

class Call {
 public:
  Call(const CallSettings& settings, FrameSource& source, std::stop_source& enough)
      : _settings(settings), _source(source), _enough(enough) {}

  Outcome open();
  Outcome run();
  CallReport report() const;

 private:
  using Deadline = std::optional<Clock::time_point>;

  void feed();
  Deadline awaitTurn(uint64_t frame);
  Outcome offer(Picture picture, uint64_t frame, Deadline deadline);
  void onCoded(std::span<const uint8_t> bytes, uint32_t timestamp);
  void carry();
  Outcome carryOne(const CodedPicture& picture);
  void onDecoded(const DECODEDDATAINFO& info, std::span<const uint8_t> data, uint32_t timestamp);

  uint32_t timestampOf(uint64_t frame) const;
  void fail(Failure failure);
  bool failed() const { return _broken.stop_requested(); }

  const CallSettings _settings;
  FrameSource& _source;
  std::stop_source& _enough;  // no more pictures are taken from the source
  std::stop_source _broken;   // nothing is of use any more; requests _enough as well
  const int _hardwareVersion = getHardwareBaseVersion();
  Clock::time_point _begin;  // of run()
  double _cpuAtBegin = 0;

  mutable std::mutex _mutex;
  std::condition_variable_any _stopped;  // only woken by stops
  Outcome _failure;                      // the first; under the mutex

  // The main thread's.
  Picture _picture;
  Outcome _inputFailure;
  // The encoder's output thread's.
  std::vector<uint8_t> _parameters;  // came without a picture: they go with the next one
  std::optional<SequenceInfo> _sequence;
  // The link thread's.
  std::unique_ptr<OutputFile> _streamFile;  // null: not kept
  uint64_t _carried = 0;                    // handed to the decoder
  // The decoder's output thread's.
  DecodedPictureReader _reader;
  Picture _decoded;
  std::unique_ptr<PictureWriter> _writer;

  CallBook _book;
  Link _link;
  // Last: when they are gone, no callback uses the rest.
  std::unique_ptr<Session> _decoder;
  std::unique_ptr<Session> _encoder;
};

// Everything that can go wrong before the first picture is sent does so here.
Outcome Call::open() {
  const auto first = _source.next(_picture);
  if (!first.ok()) return first.failure();
  if (!first.value()) {
    if (_enough.stop_requested()) return {};
    return Failure{ExitCode::Input, "the input holds no picture"};
  }
  if (!_settings.streamPath.empty()) {
    auto file = OutputFile::create(_settings.streamPath);
    if (!file.ok()) return file.failure();
    _streamFile = std::move(file.value());
  }
  auto writer = createPictureWriter(_settings.picturesPath, _settings.picturesFormat, _source.traits());
  if (!writer.ok()) return writer.failure();
  _writer = std::move(writer.value());

  auto decoder = Session::openDecoder([this](const DECODEDDATAINFO& info, std::span<const uint8_t> data,
                                             uint32_t timestamp) { onDecoded(info, data, timestamp); });
  if (!decoder.ok()) return decoder.failure();
  _decoder = std::move(decoder.value());
  auto encoder = Session::openEncoder(
      _settings.encoder,
      [this](std::span<const uint8_t> bytes, uint32_t timestamp) { onCoded(bytes, timestamp); });
  if (!encoder.ok()) return encoder.failure();
  _encoder = std::move(encoder.value());
  if (auto failed = _decoder->start()) return failed;
  return _encoder->start();
}

Outcome Call::run() {
  _begin = Clock::now();
  _cpuAtBegin = processCpuSeconds();
  if (_encoder == nullptr) return {};  // stopped before the first picture
  {
    const std::jthread carrier([this] { carry(); });
    feed();
    const uint64_t sent = _book.figures().framesSent;
    if (auto failure = _encoder->finish(sent, timestampOf(sent), kPatience)) fail(*failure);
    _link.close();
  }
  if (auto failure = _decoder->finish(_carried, timestampOf(_carried), kPatience)) fail(*failure);
  if (failed()) {
    const std::lock_guard held(_mutex);
    return _failure;
  }
  if (_streamFile != nullptr && _carried > 0) {
    if (auto failure = _streamFile->commit()) return failure;
  }
  return _writer->finish();
}

void Call::feed() {
  ProgressBar progress(_settings.frameLimit > 0 ? _settings.frameLimit : _source.frameCount());
  for (uint64_t frame = 0; !_enough.stop_requested(); ++frame) {
    const Deadline deadline = awaitTurn(frame);
    if (_enough.stop_requested()) return;
    if (auto failure = offer(std::move(_picture), frame, deadline)) return fail(*failure);
    progress.update(frame + 1);
    if (frame + 1 == _settings.frameLimit) return;
    const auto more = _source.next(_picture);
    if (!more.ok()) _inputFailure = more.failure();
    if (!more.ok() || !more.value()) return;
  }
}

// In real time: waits until the frame is due, and returns until when it has to have found a free buffer.
Call::Deadline Call::awaitTurn(uint64_t frame) {
  if (!_settings.realTime) return std::nullopt;
  const FrameRate rate = _settings.encoder.rate;
  const auto due = [&](uint64_t number) {
    return _begin + std::chrono::microseconds(rate.microseconds(number));
  };
  std::unique_lock held(_mutex);
  _stopped.wait_until(held, _enough.get_token(), due(frame), [] { return false; });
  return due(frame + 1);
}

// Sends one picture, or drops it where no buffer gets free in time.
Outcome Call::offer(Picture picture, uint64_t frame, Deadline deadline) {
  const auto captured = Clock::now();
  const std::stop_token stop = _enough.get_token();
  std::optional<Session::InputBuffer> buffer;
  if (_link.waitForRoom(kLinkLimit, stop, deadline)) {
    const auto reserved = _encoder->reserve(stop, deadline);
    if (!reserved.ok()) return reserved.failure();
    buffer = reserved.value();
  }
  if (!buffer && stop.stop_requested()) return {};
  _book.captured();
  if (!buffer) return {};
  const uint32_t timestamp = timestampOf(frame);
  const size_t length = layOutForEncoder(picture, _hardwareVersion, buffer->data);
  _book.sending({timestamp, std::move(picture), captured});
  return _encoder->send(*buffer, length, timestamp);
}

void Call::onCoded(std::span<const uint8_t> bytes, uint32_t timestamp) {
  if (failed()) return;
  if (!_sequence) _sequence = findSequenceInfo(bytes);
  _parameters.insert(_parameters.end(), bytes.begin(), bytes.end());
  if (!holdsPicture(bytes)) return;
  _book.encoded(_parameters.size());
  _link.push({std::exchange(_parameters, {}), timestamp});
}

void Call::carry() {
  while (const auto picture = _link.pop(_broken.get_token())) {
    if (auto failure = carryOne(*picture)) return fail(*failure);
  }
}

Outcome Call::carryOne(const CodedPicture& picture) {
  if (_streamFile != nullptr) {
    if (auto failure = _streamFile->write(picture.bytes)) return failure;
  }
  const auto sent = _decoder->sendCopy(picture.bytes, picture.timestamp, _broken.get_token());
  if (!sent.ok()) return sent.failure();
  if (sent.value()) ++_carried;
  return {};
}

void Call::onDecoded(const DECODEDDATAINFO& info, std::span<const uint8_t> data, uint32_t timestamp) {
  const auto now = Clock::now();
  if (failed()) return;
  if (auto failure = _reader.read(info, data, _decoded)) return fail(*failure);
  if (const auto source = _book.arrived(timestamp)) {
    const bool comparable = _decoded.size == source->picture.size;
    _book.decoded(now - source->captured,
                  comparable ? std::optional(psnr(_decoded.luma(), source->picture.luma())) : std::nullopt);
  } else {
    _book.strayed();
  }
  if (auto failure = _writer->write(_decoded)) fail(*failure);
}

uint32_t Call::timestampOf(uint64_t frame) const {
  // Microseconds, of which the interface carries the low 32 bits.
  return static_cast<uint32_t>(_settings.encoder.rate.microseconds(frame));
}

void Call::fail(Failure failure) {
  {
    const std::lock_guard held(_mutex);
    if (!_failure) _failure = std::move(failure);
  }
  _enough.request_stop();
  _broken.request_stop();
}

CallReport Call::report() const {
  CallReport report;
  report.figures = _book.figures();
  report.encoder = _settings.encoder;
  report.sequence = _sequence;
  report.hardwareVersion = _hardwareVersion;
  report.wallSeconds = std::chrono::duration<double>(Clock::now() - _begin).count();
  report.cpuSeconds = processCpuSeconds() - _cpuAtBegin;
  report.inputFailure = _inputFailure;
  return report;
}

}  // namespace

Result<CallReport> runCall(const CallSettings& settings, FrameSource& source, std::stop_source& enough) {
  CallSettings complete = settings;
  complete.encoder.size = source.size();
  complete.encoder.rate = source.traits().rate;
  Call call(complete, source, enough);
  if (auto failure = call.open()) return *failure;
  if (auto failure = call.run()) return *failure;
  return call.report();
}

}  // namespace tool
