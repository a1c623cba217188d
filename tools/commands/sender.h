// The sending end: takes pictures from a source, has them encoded, and carries out what is to change on the
// way. The thread that calls run() feeds the encoder; coded pictures come on the encoder's output thread.
#pragma once

#include <stdint.h>

#include <memory>
#include <optional>
#include <stop_token>
#include <vector>

#include "tools/base/failure.h"
#include "tools/commands/call_book.h"
#include "tools/commands/change.h"
#include "tools/commands/progress_bar.h"
#include "tools/files/frame_source.h"
#include "tools/h264/headers.h"
#include "tools/network/link.h"
#include "tools/session/session.h"

namespace tool {

struct SenderSettings {
  EncoderSettings encoder;      // size and rate are the source's
  uint64_t frameLimit = 0;      // 0: all that the source has
  bool realTime = false;        // paced by the frame rate; pictures that find no free buffer are dropped
  std::vector<Change> changes;  // in the order of their time
};

// What a sender tells its owner and asks of it.
class SenderOwner {
 public:
  using Deadline = std::optional<Clock::time_point>;

  virtual ~SenderOwner() = default;
  // Before a picture: waits until the way can take one more. False once it is to be dropped.
  virtual bool waitForRoom(const std::stop_token& stop, Deadline deadline) = 0;
  // Whether the picture of this time has to be a key frame.
  virtual bool wantsKeyFrame(int64_t time) = 0;
  virtual void onCoded(CodedPicture picture) = 0;
};

class Sender {
 public:
  // `enough`: no more pictures are taken from the source.
  Sender(const SenderSettings& settings, FrameSource& source, CallBook& book, SenderOwner& owner,
         std::stop_token enough);

  // Takes the first picture and creates the encoder. False where there was a stop before.
  Result<bool> open();
  Outcome start() { return _encoder->start(); }
  // Returns at the end of the source, the limit, or a stop; then all has been encoded.
  Outcome run();

  const EncoderSettings& encoder() const { return _settings.encoder; }
  const std::optional<SequenceInfo>& sequence() const { return _sequence; }  // when run() is over
  const Outcome& inputFailure() const { return _inputFailure; }              // the source broke off
  double seconds() const;                                                    // of video taken from the source
  double meanBitRate() const;                                                // asked for, in bits per second
  int64_t timeOf(uint64_t frame) const { return _settings.encoder.rate.microseconds(frame); }

 private:
  using Deadline = SenderOwner::Deadline;

  Outcome feed();
  Outcome applyChanges(int64_t time);
  Outcome apply(const Change& change);
  bool isSkipped(int64_t time);
  Deadline awaitTurn(uint64_t frame);
  Outcome offer(Picture picture, uint64_t frame, Deadline deadline);
  void onStream(std::span<const uint8_t> bytes, uint32_t timestamp);

  const SenderSettings _settings;
  FrameSource& _source;
  CallBook& _book;
  SenderOwner& _owner;
  const std::stop_token _enough;
  const int _hardwareVersion;
  Clock::time_point _begin;
  std::mutex _mutex;
  std::condition_variable_any _stopped;  // only woken by stops

  Picture _picture;
  Outcome _inputFailure;
  uint64_t _taken = 0;      // pictures of the source
  size_t _nextChange = 0;   // of the settings'
  uint32_t _bitRate;        // in force
  double _bitRateFactor;    // see bitRateFactor()
  double _bitsAsked = 0;    // so far
  int _rotation = 0;        // degrees
  FrameRate _rate;          // in force
  int64_t _rateSince = 0;   // the time of the picture from which on it holds
  uint64_t _sentSince = 0;  // pictures since then
  // The encoder's output thread's.
  std::vector<uint8_t> _parameters;  // came without a picture: they go with the next one
  std::optional<SequenceInfo> _sequence;
  // Last: when it is gone, no callback uses the rest.
  std::unique_ptr<Session> _encoder;
};

}  // namespace tool
