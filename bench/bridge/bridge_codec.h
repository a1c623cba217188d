// Sessions through the C interface, fed as fast as they take it or one at a time.
#pragma once

#include <stdint.h>

#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <span>

#include "bench/bridge/direct_codec.h"
#include "omxbridge/omxbridge.h"

namespace bench {

using Clock = std::chrono::steady_clock;

class BridgeCodec {
 public:
  // One output: its time is taken before anything is done with it.
  using OutputHandler = std::function<void(std::span<const uint8_t> data)>;

  static BridgeCodec encoder(tool::Size size, int framesPerSecond, int64_t bitRate, OutputHandler handler);
  static BridgeCodec decoder(OutputHandler handler);
  ~BridgeCodec();
  BridgeCodec(const BridgeCodec&) = delete;
  BridgeCodec& operator=(const BridgeCodec&) = delete;

  // Copies the input into a free buffer, once there is one, and sends it.
  void send(std::span<const uint8_t> input);
  // An encoder: its next frame becomes a key frame.
  void requestKey();
  // Waits until as many outputs as inputs have come.
  void waitForAll();
  // When the last output came.
  Clock::time_point lastOutput() const;

 private:
  BridgeCodec(void* handle, OutputHandler handler);
  static int onInput(void* session, void* context);
  static int onOutput(void* session, void* data, unsigned int length, void* bufferId, void* context,
                      unsigned int timestamp);

  void* const _handle;
  const OutputHandler _handler;
  uint64_t _sent = 0;
  mutable std::mutex _mutex;
  std::condition_variable _inputReturned;
  std::condition_variable _outputCame;
  uint64_t _returned = 0;
  uint64_t _outputs = 0;
  Clock::time_point _lastOutput;
};

}  // namespace bench
