#include "bench/bridge/bridge_codec.h"

#include <stdexcept>
#include <string>
#include <utility>

#include "bench/bridge/codec_time.h"

namespace bench {

namespace {

void* made(void* handle, int result) {
  if (handle == nullptr) throw std::runtime_error(std::string("no session: ") + resultDescription(result));
  return handle;
}

webrtc::VideoCodec settingsOf(tool::Size size, int framesPerSecond, int64_t bitRate) {
  webrtc::VideoCodec codec{};
  codec.codecType = webrtc::kVideoCodecH264;
  codec.width = static_cast<uint16_t>(size.width);
  codec.height = static_cast<uint16_t>(size.height);
  codec.startBitrate = static_cast<uint32_t>(bitRate / 1000);
  codec.maxFramerate = static_cast<uint8_t>(framesPerSecond);
  codec.codecSpecific.H264.profile = 66;
  codec.codecSpecific.H264.referenceFrames = 1;
  return codec;
}

}  // namespace

BridgeCodec::BridgeCodec(void* handle, OutputHandler handler)
    : _handle(handle), _handler(std::move(handler)) {
  omx_interface_register_input_callback(_handle, onInput, this);
  omx_interface_register_output_callback(_handle, onOutput, this);
  const int result = omx_interface_init(_handle);
  if (result != OMXI_OK) throw std::runtime_error(std::string("no start: ") + resultDescription(result));
}

BridgeCodec BridgeCodec::encoder(tool::Size size, int framesPerSecond, int64_t bitRate,
                                 OutputHandler handler) {
  int result = OMXI_OK;
  webrtc::VideoCodec codec = settingsOf(size, framesPerSecond, bitRate);
  void* const handle = encoder_create(&result, &codec);
  return {made(handle, result), std::move(handler)};
}

BridgeCodec BridgeCodec::decoder(OutputHandler handler) {
  int result = OMXI_OK;
  void* const handle = decoder_create(&result, nullptr);
  return {made(handle, result), std::move(handler)};
}

BridgeCodec::~BridgeCodec() {
  omx_interface_destroy(_handle);
}

void BridgeCodec::send(std::span<const uint8_t> input) {
  for (;;) {
    uint64_t before = 0;
    {
      const std::lock_guard held(_mutex);
      before = _returned;
    }
    void* buffer = nullptr;
    void* data = nullptr;
    if (omx_interface_reserve_input_buffer(_handle, &buffer, &data) == 0) {
      copyInput(input, static_cast<uint8_t*>(data));
      if (omx_interface_send_input_buffer(_handle, buffer, static_cast<int>(input.size()),
                                          static_cast<int>(_sent)) != 0) {
        throw std::runtime_error("an input was refused");
      }
      ++_sent;
      return;
    }
    std::unique_lock held(_mutex);
    _inputReturned.wait(held, [&] { return _returned != before; });
  }
}

void BridgeCodec::requestKey() {
  if (omx_interface_set_config(_handle, CONFIG_REQUEST_IFRAME, 0) != OMXI_OK) {
    throw std::runtime_error("a key frame request was refused");
  }
}

void BridgeCodec::waitForAll() {
  std::unique_lock held(_mutex);
  _outputCame.wait(held, [this] { return _outputs >= _sent; });
}

Clock::time_point BridgeCodec::lastOutput() const {
  const std::lock_guard held(_mutex);
  return _lastOutput;
}

int BridgeCodec::onInput(void* /*session*/, void* context) {
  auto& self = *static_cast<BridgeCodec*>(context);
  const std::lock_guard held(self._mutex);
  ++self._returned;
  self._inputReturned.notify_all();
  return 0;
}

int BridgeCodec::onOutput(void* /*session*/, void* data, unsigned int length, void* /*bufferId*/,
                          void* context, unsigned int /*timestamp*/) {
  const Clock::time_point now = Clock::now();
  auto& self = *static_cast<BridgeCodec*>(context);
  if (self._handler) self._handler({static_cast<const uint8_t*>(data), length});
  const std::lock_guard held(self._mutex);
  self._lastOutput = now;
  ++self._outputs;
  self._outputCame.notify_all();
  return 0;
}

}  // namespace bench
