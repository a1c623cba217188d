// Settings of a running encoder: halves and doubles the bit rate, asks for key frames, and shows what the
// stream makes of it, second by second.
#include <omxbridge/omxbridge.h>

#include <atomic>
#include <condition_variable>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <random>
#include <vector>

namespace {

constexpr int kWidth = 320, kHeight = 240, kFramesPerSecond = 30, kSeconds = 9;

struct Stream {
  std::mutex mutex;  // guards what follows
  std::condition_variable moved;
  int outputs = 0;
  std::vector<unsigned> bits = std::vector<unsigned>(kSeconds);
  std::vector<int> keyFrames;
};

// Looks for an IDR slice among the first NAL units of a coded picture.
bool isKeyFrame(const unsigned char* data, unsigned length) {
  for (unsigned i = 0; i + 4 < length && i < 256; ++i) {
    if (data[i] == 0 && data[i + 1] == 0 && data[i + 2] == 1 && (data[i + 3] & 0x1F) == 5) return true;
  }
  return false;
}

// The time stamp that a frame was sent with comes back with its coded picture; here it is a frame number.
int onOutput(void*, void* data, unsigned length, void*, void* context, unsigned timestamp) {
  auto& stream = *static_cast<Stream*>(context);
  if (length == 0) return 0;
  const std::lock_guard<std::mutex> held(stream.mutex);
  ++stream.outputs;
  stream.bits[timestamp / kFramesPerSecond] += 8 * length;
  if (isKeyFrame(static_cast<unsigned char*>(data), length))
    stream.keyFrames.push_back(static_cast<int>(timestamp));
  stream.moved.notify_all();
  return 0;
}

// Something that costs bits: noise that moves, and a little new noise in each frame.
void draw(std::vector<unsigned char>& frame, int number) {
  static std::minstd_rand random(1);
  static const auto noise = [] {
    std::vector<unsigned char> bytes(kWidth * kHeight * 2);
    for (unsigned char& byte : bytes) byte = static_cast<unsigned char>(64 + random() % 128);
    return bytes;
  }();
  std::memcpy(frame.data(), noise.data() + 3 * number % kWidth, kWidth * kHeight);
  for (int i = 0; i < 2000; ++i) frame[random() % (kWidth * kHeight)] = static_cast<unsigned char>(random());
  std::memset(frame.data() + kWidth * kHeight, 128, kWidth * kHeight / 2);
}

}  // namespace

int main() {
  webrtc::VideoCodec settings{};
  settings.codecType = webrtc::kVideoCodecH264;
  settings.width = kWidth, settings.height = kHeight;
  settings.startBitrate = 1000;  // kilobits per second
  settings.maxFramerate = kFramesPerSecond;
  settings.codecSpecific.H264.profile = 66;
  settings.codecSpecific.H264.referenceFrames = 1;

  Stream stream;
  int result = OMXI_OK;
  void* const session = encoder_create(&result, &settings);
  if (session == nullptr)
    return std::fprintf(stderr, "no encoder, code %d: %s\n", result, resultDescription(result)), 1;
  omx_interface_register_output_callback(session, onOutput, &stream);
  result = omx_interface_init(session);
  std::vector<unsigned char> frame(kWidth * kHeight * 3 / 2);
  for (int i = 0; i < kSeconds * kFramesPerSecond && result == OMXI_OK; ++i) {
    if (i == 3 * kFramesPerSecond) result = omx_interface_set_config(session, CONFIG_BITRATE, 500'000);
    if (i == 6 * kFramesPerSecond) result = omx_interface_set_config(session, CONFIG_BITRATE, 2'000'000);
    if (i % 100 == 50) result = omx_interface_set_config(session, CONFIG_REQUEST_IFRAME, 0);
    draw(frame, i);
    omx_interface_send_input_data(session, frame.data(), static_cast<unsigned>(frame.size()), i);
    // One frame at a time, so that a change concerns the frame that is sent next.
    std::unique_lock<std::mutex> held(stream.mutex);
    stream.moved.wait(held, [&] { return stream.outputs > i || omx_interface_error(session) != OMXI_OK; });
    if (omx_interface_error(session) != OMXI_OK) result = omx_interface_error(session);
  }
  if (result == OMXI_OK) {
    omx_interface_send_end_of_input_flag(session, 0);
    result = omx_interface_deinit(session);
  }
  omx_interface_destroy(session);
  for (int second = 0; second < kSeconds; ++second) {
    std::printf("second %d: %4u kbit\n", second, stream.bits[static_cast<size_t>(second)] / 1000);
  }
  std::printf("key frames:");
  for (const int number : stream.keyFrames) std::printf(" %d", number);
  std::printf("\n%s\n", resultDescription(result));
  return result == OMXI_OK && stream.keyFrames == std::vector<int>{0, 50, 150, 250} ? 0 : 1;
}
