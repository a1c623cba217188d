#include "tools/commands/sender.h"

#include <cmath>
#include <utility>

#include "omxbridge/hardware_version.h"
#include "tools/h264/access_units.h"
#include "tools/video/device_layout.h"

namespace tool {

namespace {

// Encoders may drop pictures, which only their silence tells.
constexpr std::chrono::seconds kPatience{2};

}  // namespace

Sender::Sender(const SenderSettings& settings, FrameSource& source, CallBook& book, SenderOwner& owner,
               std::stop_token enough)
    : _settings([&] {
        SenderSettings complete = settings;
        complete.encoder.size = source.size();
        complete.encoder.rate = source.traits().rate;
        return complete;
      }()),
      _source(source),
      _book(book),
      _owner(owner),
      _enough(std::move(enough)),
      _hardwareVersion(getHardwareBaseVersion()),
      _bitRate(bitRateTarget(_settings.encoder)),
      _bitRateFactor(bitRateFactor(_settings.encoder.rate)),
      _rate(_settings.encoder.rate) {}

Result<bool> Sender::open() {
  for (const Change& change : _settings.changes) {
    if (change.item == CONFIG_FRAMERATE && change.value > _rate.perSecond()) {
      return Failure{ExitCode::Usage,
                     change.text + " is more than the input has; pictures can only be left out"};
    }
  }
  const auto first = _source.next(_picture);
  if (!first.ok()) return first.failure();
  if (!first.value()) {
    if (_enough.stop_requested()) return false;
    return Failure{ExitCode::Input, "the input holds no picture"};
  }
  auto encoder = Session::openEncoder(
      _settings.encoder,
      [this](std::span<const uint8_t> bytes, uint32_t timestamp) { onStream(bytes, timestamp); });
  if (!encoder.ok()) return encoder.failure();
  _encoder = std::move(encoder.value());
  return true;
}

Outcome Sender::run() {
  _begin = Clock::now();
  const Outcome fed = feed();
  const uint64_t sent = _book.figures().framesSent;
  const Outcome finished = _encoder->finish(sent, static_cast<uint32_t>(timeOf(_taken)), kPatience);
  return fed ? fed : finished;
}

Outcome Sender::feed() {
  ProgressBar progress(_settings.frameLimit > 0 ? _settings.frameLimit : _source.frameCount());
  for (;;) {
    const int64_t time = timeOf(_taken);
    const Deadline deadline = awaitTurn(_taken);
    if (_enough.stop_requested()) return {};
    if (auto failure = applyChanges(time)) return failure;
    _bitsAsked += _bitRate / _settings.encoder.rate.perSecond();
    if (!isSkipped(time)) {
      if (auto failure = offer(std::move(_picture), _taken, deadline)) return failure;
    }
    progress.update(++_taken);
    if (_enough.stop_requested() || _taken == _settings.frameLimit) return {};
    const auto more = _source.next(_picture);
    if (!more.ok()) _inputFailure = more.failure();
    if (!more.ok() || !more.value()) return {};
  }
}

Outcome Sender::applyChanges(int64_t time) {
  while (_nextChange < _settings.changes.size() && _settings.changes[_nextChange].at <= time) {
    const Change& change = _settings.changes[_nextChange++];
    if (change.item == CONFIG_FRAMERATE) {
      _rate = {change.value, 1};
      _rateSince = time;
      _sentSince = 0;
      _bitRateFactor = 1;
    }
    if (change.item == CONFIG_BITRATE) _bitRate = change.value;
    if (change.item == CONFIG_ROTATION) _rotation = static_cast<int>(change.value);
    if (auto failure = apply(change)) {
      failure->text = change.text + ": " + failure->text;
      return failure;
    }
    const bool isIgnored = change.item == CONFIG_INTRA_PERIOD && _hardwareVersion == HW_VERSION_OMAP4;
    _book.changed(
        {time, change.item, change.value, change.text + (isIgnored ? " (ignored by this device)" : "")});
  }
  return {};
}

// What is under way has been encoded as it was, so that the change holds for the next picture exactly.
Outcome Sender::apply(const Change& change) {
  _encoder->settle(_enough);
  if (change.item != CONFIG_BITRATE) return _encoder->change(change.item, change.value);
  return _encoder->change(change.item, static_cast<uint32_t>(std::lround(change.value * _bitRateFactor)));
}

// A source that is faster than the rate in force: a picture is sent when it is the first at or behind its
// turn.
bool Sender::isSkipped(int64_t time) {
  if (_rate == _settings.encoder.rate) return false;
  if (time - _rateSince < _rate.microseconds(_sentSince)) return true;
  ++_sentSince;
  return false;
}

// In real time: waits until the frame is due, and returns until when it has to have found a free buffer.
Sender::Deadline Sender::awaitTurn(uint64_t frame) {
  if (!_settings.realTime) return std::nullopt;
  const auto due = [&](uint64_t number) { return _begin + std::chrono::microseconds(timeOf(number)); };
  std::unique_lock held(_mutex);
  _stopped.wait_until(held, _enough, due(frame), [] { return false; });
  return due(frame + 1);
}

// Sends one picture, or drops it where no buffer gets free in time.
Outcome Sender::offer(Picture picture, uint64_t frame, Deadline deadline) {
  const auto captured = Clock::now();
  std::optional<Session::InputBuffer> buffer;
  if (_owner.waitForRoom(_enough, deadline)) {
    if (_owner.wantsKeyFrame(timeOf(frame))) {
      if (auto failure = apply({0, CONFIG_REQUEST_IFRAME, 1, ""})) return failure;
    }
    const auto reserved = _encoder->reserve(_enough, deadline);
    if (!reserved.ok()) return reserved.failure();
    buffer = reserved.value();
  }
  if (!buffer && _enough.stop_requested()) return {};
  _book.captured();
  if (!buffer) return {};
  // Microseconds, of which the interface carries the low 32 bits.
  const auto timestamp = static_cast<uint32_t>(timeOf(frame));
  const size_t length = layOutForEncoder(picture, _hardwareVersion, buffer->data);
  _book.sending({timestamp, std::move(picture), captured, timeOf(frame), _rotation});
  return _encoder->send(*buffer, length, timestamp);
}

void Sender::onStream(std::span<const uint8_t> bytes, uint32_t timestamp) {
  if (!_sequence) _sequence = findSequenceInfo(bytes);
  _parameters.insert(_parameters.end(), bytes.begin(), bytes.end());
  if (!holdsPicture(bytes)) return;
  const bool isKey = holdsKeyPicture(bytes);
  _book.encoded(timestamp, _parameters.size(), isKey);
  _owner.onCoded({std::exchange(_parameters, {}), timestamp, isKey});
}

double Sender::seconds() const {
  return static_cast<double>(_taken) / _settings.encoder.rate.perSecond();
}

double Sender::meanBitRate() const {
  return _taken > 0 ? _bitsAsked / seconds() : bitRateTarget(_settings.encoder);
}

}  // namespace tool
