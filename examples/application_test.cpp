// A unit test of application code against an emulated device: does what our uploader puts into an encoder's
// input buffers come out of a decoder in the right colours, on every generation?
//
//   application_test DEVICE
#include <omxbridge/frames.h>
#include <omxbridge/omxbridge.h>

#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <vector>

namespace {

constexpr unsigned kWidth = 176, kHeight = 144;
constexpr int kY = 120, kU = 90, kV = 200;

// --- The application's code under test: an I420 picture into an encoder's input buffer. It has to know that
// MSM8x60 wants its chroma at a multiple of 2048 bytes. Returns the bytes used.
int upload(const unsigned char* planar, unsigned char* buffer) {
  const size_t luma = kWidth * kHeight, chroma = luma / 2;
  webrtc::ConvertI420ToNV12(planar, buffer, kWidth, kHeight);
  if (getHardwareBaseVersion() != HW_VERSION_MSM8X60) return static_cast<int>(luma + chroma);
  const size_t begin = (luma + 2047) / 2048 * 2048;
  std::memmove(buffer + begin, buffer + luma, chroma);
  return static_cast<int>(begin + chroma);
}

// --- The test.
struct Probe {
  void* decoder = nullptr;
  std::mutex mutex;  // guards what follows
  std::condition_variable moved;
  bool seen = false;
  int y = 0, u = 0, v = 0;
};

int onCoded(void*, void* data, unsigned length, void*, void* context, unsigned timestamp) {
  if (length > 0) {
    omx_interface_send_input_data(static_cast<Probe*>(context)->decoder, data, length,
                                  static_cast<int>(timestamp));
  }
  return 0;
}

// Looks at the middle of the picture.
int onPicture(void* description, void* data, unsigned, void*, void* context, unsigned) {
  auto& probe = *static_cast<Probe*>(context);
  const DECODEDDATAINFO& info = *static_cast<DECODEDDATAINFO*>(description);
  const auto* bytes = static_cast<const unsigned char*>(data);
  const size_t x = info.cropLeft + kWidth / 2, y = info.cropTop + kHeight / 2;
  const std::lock_guard<std::mutex> held(probe.mutex);
  if (info.dataType == DECODED_DATA_RGB565) {
    std::vector<unsigned char> planar(info.width * info.height * 3 / 2);
    webrtc::ConvertRGB565ToI420(bytes, info.width, info.height, planar.data());
    const unsigned char* const u = planar.data() + info.width * info.height;
    const size_t chroma = y / 2 * (info.width / 2) + x / 2;
    probe.y = planar[y * info.width + x];
    probe.u = u[chroma], probe.v = u[info.width * info.height / 4 + chroma];
  } else {
    const size_t top = info.cropTop / 2 + kHeight / 4;
    const unsigned char* const pair = bytes + info.width * (info.height + top) + x / 2 * 2;
    probe.y = bytes[y * info.width + x];
    probe.u = pair[0], probe.v = pair[1];
  }
  probe.seen = true;
  probe.moved.notify_all();
  return 0;
}

bool near(const char* what, int expected, int found) {
  const bool good = std::abs(expected - found) <= 8;  // the codec's loss, and RGB565's
  std::printf("  %s: expected %d, found %d%s\n", what, expected, found, good ? "" : "  <-- wrong");
  return good;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) return std::fputs("usage: application_test DEVICE\n", stderr), 2;
  setenv("OMXBRIDGE_DEVICE", argv[1], 1);  // before the first use of the library
  webrtc::VideoCodec settings{};
  settings.codecType = webrtc::kVideoCodecH264;
  settings.width = kWidth, settings.height = kHeight, settings.startBitrate = 500, settings.maxFramerate = 15;
  settings.codecSpecific.H264.profile = 66, settings.codecSpecific.H264.referenceFrames = 1;
  Probe probe;
  int result = OMXI_OK;
  void* encoder = nullptr;
  if ((probe.decoder = decoder_create(&result, nullptr)) != nullptr)
    encoder = encoder_create(&result, &settings);
  if (encoder == nullptr)
    return std::fprintf(stderr, "no session, code %d: %s\n", result, resultDescription(result)), 1;
  omx_interface_register_output_callback(encoder, onCoded, &probe);
  omx_interface_register_output_callback(probe.decoder, onPicture, &probe);
  if (omx_interface_init(probe.decoder) != OMXI_OK || omx_interface_init(encoder) != OMXI_OK) return 1;

  std::vector<unsigned char> planar(kWidth * kHeight, kY);
  planar.insert(planar.end(), kWidth * kHeight / 4, kU);
  planar.insert(planar.end(), kWidth * kHeight / 4, kV);
  void* handle = nullptr;
  void* data = nullptr;
  if (omx_interface_reserve_input_buffer(encoder, &handle, &data) != 0) return 1;
  omx_interface_send_input_buffer(encoder, handle, upload(planar.data(), static_cast<unsigned char*>(data)),
                                  0);
  std::unique_lock<std::mutex> held(probe.mutex);
  const bool seen = probe.moved.wait_for(held, std::chrono::seconds(20), [&] { return probe.seen; });
  held.unlock();
  // A session may be destroyed at any time: the test needs no end of stream.
  omx_interface_destroy(encoder);
  omx_interface_destroy(probe.decoder);
  std::printf("%s: %s\n", argv[1], seen ? "a picture came through" : "no picture");
  return seen && near("Y", kY, probe.y) & near("U", kU, probe.u) & near("V", kV, probe.v) ? 0 : 1;
}
