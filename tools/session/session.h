// One encoding or decoding session with the device's component, through the C interface.
//
// One thread, the owner, makes, starts, feeds, finishes and destroys it; the output handler runs on the
// session's own thread. Waiting is woken by the session's callbacks, never by time alone.
#pragma once

#include <stdint.h>

#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <span>
#include <stop_token>

#include "omxbridge/omxbridge.h"
#include "tools/base/clock.h"
#include "tools/base/failure.h"
#include "tools/base/units.h"

namespace tool {

struct EncoderSettings {
  Size size;
  FrameRate rate;
  uint32_t bitRate = 1'000'000;  // bits per second; the encoder takes whole thousands
  int profile = 66;              // profile_idc
  int keyInterval = 0;           // frames from one key frame to the next; 0: only the first is one
  uint32_t references = 1;
  bool arithmeticCoding = false;  // CABAC instead of CAVLC
  bool largeTransform = false;    // 8x8
};

// What the encoder is really asked for, in bits per second.
uint32_t bitRateTarget(const EncoderSettings& settings);
// Encoders are told whole frames a second, and divide their bits among these: with fewer frames than that
// they have to be told more bits.
uint8_t wholeFrameRate(FrameRate rate);
double bitRateFactor(FrameRate rate);

class Session {
 public:
  // Encoders: a piece of byte stream, as the component cuts it, never empty.
  using StreamHandler = std::function<void(std::span<const uint8_t> bytes, uint32_t timestamp)>;
  using PictureHandler =
      std::function<void(const DECODEDDATAINFO& info, std::span<const uint8_t> data, uint32_t timestamp)>;

  static Result<std::unique_ptr<Session>> openEncoder(const EncoderSettings& settings, StreamHandler handler);
  static Result<std::unique_ptr<Session>> openDecoder(PictureHandler handler);
  // Ends the session in whatever state it is; afterwards the handler is not called any more.
  ~Session();
  Session(const Session&) = delete;
  Session& operator=(const Session&) = delete;

  // From now on input may be sent.
  Outcome start();

  struct InputBuffer {
    void* handle;
    uint8_t* data;
  };
  // Waits for a free input buffer. Nothing once a stop has been requested or the deadline is over.
  // A buffer that was reserved has to be sent.
  Result<std::optional<InputBuffer>> reserve(const std::stop_token& stop,
                                             std::optional<Clock::time_point> deadline);
  Outcome send(const InputBuffer& buffer, size_t length, uint32_t timestamp);

  // Waits until the component has given all input back: what is changed then holds from the next picture on.
  void settle(const std::stop_token& stop);
  // Changes an encoder while it runs.
  Outcome change(CONFIGTYPE item, uint32_t value);

  // Waits for a free input buffer, copies the bytes into it and sends them. False once a stop has been
  // requested.
  Result<bool> sendCopy(std::span<const uint8_t> bytes, uint32_t timestamp, const std::stop_token& stop);

  // Ends the stream. First lets the output of what was sent come back: after the end of input the session
  // gives no output buffer to the component any more, which could then not deliver all it has. Outputs may
  // be missing for good, or come only after the end: when all input is back and then nothing has moved for
  // as long as `patience`, this goes on without them.
  Outcome finish(uint64_t expectedOutputs, uint32_t timestamp, Clock::duration patience);

 private:
  enum class Kind { Encoder, Decoder };
  // What is common to both handlers: the first argument is the callback's own.
  using OutputHandler =
      std::function<void(const void* first, std::span<const uint8_t> data, uint32_t timestamp)>;

  Session(Kind kind, OutputHandler handler);
  // `create` makes the handle, or stores the code of what failed.
  static Result<std::unique_ptr<Session>> connect(std::unique_ptr<Session> session,
                                                  const std::function<void*(int*)>& create);

  static int onInputReturned(void* session, void* context);
  static int onOutput(void* sessionOrInfo, void* data, unsigned int length, void* bufferId, void* context,
                      unsigned int timestamp);

  const char* kindName() const;
  Failure failure(ExitCode code, const char* step, int result) const;
  Outcome recordedFailure() const;
  uint64_t activity() const;
  template <typename Ready>
  bool await(const std::stop_token& stop, std::optional<Clock::time_point> deadline, Ready ready);
  void awaitOutputs(uint64_t expected, Clock::duration patience);

  const Kind _kind;
  const OutputHandler _handler;
  void* _handle = nullptr;
  uint64_t _sent = 0;  // input buffers; owner's

  mutable std::mutex _mutex;  // guards what follows; never held while the library is called
  std::condition_variable_any _moved;
  uint64_t _returned = 0;   // input callbacks: buffers that came back, and failures recorded
  uint64_t _delivered = 0;  // outputs that the handler has done with
};

}  // namespace tool
