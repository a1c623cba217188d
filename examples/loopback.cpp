// Both ends of a call, with the input buffers filled in place: encoder -> decoder, no copy of a frame on the
// application's side.
#include <omxbridge/omxbridge.h>

#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <optional>

namespace {

constexpr int kWidth = 640, kHeight = 480, kFrames = 60;
// Input buffers of a session that come back, and what it has put out.
struct Traffic {
  std::mutex mutex;
  std::condition_variable moved;
  int returned = 0, outputs = 0;

  void count(int Traffic::*what) {
    const std::lock_guard<std::mutex> held(mutex);
    ++(this->*what);
    moved.notify_all();
  }
  int get(int Traffic::*what) {
    const std::lock_guard<std::mutex> held(mutex);
    return this->*what;
  }
};

struct Call {
  void* encoder = nullptr;
  void* decoder = nullptr;
  Traffic encoding, decoding;

  bool failed() const {
    return omx_interface_error(encoder) != OMXI_OK || omx_interface_error(decoder) != OMXI_OK;
  }
  // Waits for `condition`, which the traffic's callbacks bring about, or for a failure.
  template <typename Condition>
  void wait(Traffic& traffic, Condition condition) {
    std::unique_lock<std::mutex> held(traffic.mutex);
    traffic.moved.wait(held, [&] { return condition() || failed(); });
  }
  struct Buffer {
    void *handle, *data;
  };
  // A free input buffer, which has to be sent then.
  std::optional<Buffer> reserve(void* session, Traffic& traffic) {
    for (;;) {
      const int before = traffic.get(&Traffic::returned);
      Buffer buffer{};
      const int result = omx_interface_reserve_input_buffer(session, &buffer.handle, &buffer.data);
      if (result == 0) return buffer;
      if (result != -1 || failed()) return std::nullopt;
      wait(traffic, [&] { return traffic.returned != before; });
    }
  }
};

int onInput(void*, void* traffic) {
  return static_cast<Traffic*>(traffic)->count(&Traffic::returned), 0;
}

int onPicture(void*, void*, unsigned, void*, void* call, unsigned) {
  return static_cast<Call*>(call)->decoding.count(&Traffic::outputs), 0;
}

// A network would be here. Waiting for the decoder's input is allowed: nothing of it depends on the encoder.
int onCoded(void*, void* data, unsigned length, void*, void* context, unsigned timestamp) {
  auto& call = *static_cast<Call*>(context);
  if (length == 0) return 0;
  if (const auto buffer = call.reserve(call.decoder, call.decoding)) {
    std::memcpy(buffer->data, data, length);
    omx_interface_send_input_buffer(call.decoder, buffer->handle, static_cast<int>(length),
                                    static_cast<int>(timestamp));
  }
  return call.encoding.count(&Traffic::outputs), 0;
}

}  // namespace

int main() {
  webrtc::VideoCodec settings{};
  settings.codecType = webrtc::kVideoCodecH264;
  settings.width = kWidth, settings.height = kHeight, settings.startBitrate = 800, settings.maxFramerate = 30;
  settings.codecSpecific.H264.profile = 66, settings.codecSpecific.H264.referenceFrames = 1;
  Call call;
  int result = OMXI_OK;
  if ((call.decoder = decoder_create(&result, nullptr)) != nullptr)
    call.encoder = encoder_create(&result, &settings);
  if (call.encoder == nullptr)
    return std::fprintf(stderr, "no session, code %d: %s\n", result, resultDescription(result)), 1;
  omx_interface_register_input_callback(call.encoder, onInput, &call.encoding);
  omx_interface_register_output_callback(call.encoder, onCoded, &call);
  omx_interface_register_input_callback(call.decoder, onInput, &call.decoding);
  omx_interface_register_output_callback(call.decoder, onPicture, &call);
  result = omx_interface_init(call.decoder);
  if (result == OMXI_OK) result = omx_interface_init(call.encoder);
  int sent = 0;
  for (; result == OMXI_OK && sent < kFrames; ++sent) {
    const auto buffer = call.reserve(call.encoder, call.encoding);
    if (!buffer) break;
    auto* const frame = static_cast<unsigned char*>(buffer->data);  // a camera would write here
    for (int i = 0; i < kWidth * kHeight; ++i) frame[i] = static_cast<unsigned char>(i % kWidth + 2 * sent);
    std::memset(frame + kWidth * kHeight, 128, kWidth * kHeight / 2);
    omx_interface_send_input_buffer(call.encoder, buffer->handle, kWidth * kHeight * 3 / 2, 33'333 * sent);
  }
  call.wait(call.encoding, [&] { return call.encoding.outputs == sent; });
  call.wait(call.decoding, [&] { return call.decoding.outputs == sent; });
  for (void* const session : {call.encoder, call.decoder}) {
    if (result == OMXI_OK && omx_interface_send_end_of_input_flag(session, 0) == 0)
      result = omx_interface_deinit(session);
  }
  omx_interface_destroy(call.encoder);
  omx_interface_destroy(call.decoder);
  std::printf("%d frames, %d pictures: %s\n", sent, call.decoding.outputs, resultDescription(result));
  return result == OMXI_OK && call.decoding.outputs == kFrames ? 0 : 1;
}
