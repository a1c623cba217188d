// A minimal decoder, H.264 byte stream in, raw I420 pictures out: decoder INPUT.264 OUTPUT.yuv
#include <omxbridge/frames.h>
#include <omxbridge/omxbridge.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <mutex>
#include <string>
#include <vector>

namespace {

struct Decoder {
  std::ofstream file;
  std::vector<unsigned char> visible, planar;
  std::mutex mutex;
  std::condition_variable moved;
  std::atomic<int> returned = 0, pictures = 0;  // input buffers that came back, pictures that came out

  int count(std::atomic<int>& what) {
    const std::lock_guard<std::mutex> held(mutex);
    return ++what, moved.notify_all(), 0;
  }
};

int onInput(void*, void* context) {
  return static_cast<Decoder*>(context)->count(static_cast<Decoder*>(context)->returned);
}

// What a picture looks like depends on the device; I420 is the same everywhere.
int onPicture(void* description, void* data, unsigned int, void*, void* context, unsigned int) {
  auto& decoder = *static_cast<Decoder*>(context);
  const DECODEDDATAINFO& info = *static_cast<DECODEDDATAINFO*>(description);
  const auto* picture = static_cast<const unsigned char*>(data);
  unsigned width = info.width, height = info.height;
  if (info.dataType == DECODED_DATA_CROPPED) {
    width = info.cropWidth, height = info.cropHeight;
    decoder.visible.resize(width * height * 3 / 2);
    const int left = int(info.cropLeft), top = int(info.cropTop);
    webrtc::ConvertNV12ToNV12(picture, int(info.width), int(info.height), left, top, left + int(width) - 1,
                              top + int(height) - 1, decoder.visible.data());
    picture = decoder.visible.data();
  }
  decoder.planar.resize(width * height * 3 / 2);
  if (info.dataType == DECODED_DATA_RGB565) {
    webrtc::ConvertRGB565ToI420(picture, width, height, decoder.planar.data());
  } else {
    webrtc::ConvertNV12ToI420(picture, decoder.planar.data(), width, height);
  }
  decoder.file.write(reinterpret_cast<char*>(decoder.planar.data()), std::streamsize(decoder.planar.size()));
  return decoder.count(decoder.pictures);
}

// One coded picture each, parameter sets in front: the way a decoder wants its input.
std::vector<std::string> accessUnits(const std::string& stream) {
  std::vector<std::string> units;
  const std::string code("\0\0\1", 3);
  bool hasSlice = false;  // the unit in hand
  for (size_t begin = stream.find(code), next = 0; begin != std::string::npos; begin = next) {
    next = stream.find(code, begin + 3);
    if (begin + 4 >= stream.size()) break;
    const int type = stream[begin + 3] & 0x1F;
    const bool slice = type >= 1 && type <= 5;
    const bool first = (type >= 6 && type <= 9) || (slice && (stream[begin + 4] & 0x80) != 0);
    const bool begins = units.empty() || (hasSlice && first);
    if (begins) units.emplace_back(1, '\0');
    units.back() += stream.substr(begin, next - begin);
    hasSlice = slice || (hasSlice && !begins);
  }
  return units;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) return std::fputs("usage: decoder INPUT.264 OUTPUT.yuv\n", stderr), 2;
  std::ifstream input(argv[1], std::ios::binary);
  auto units = accessUnits({std::istreambuf_iterator<char>(input), {}});
  Decoder decoder;
  decoder.file.open(argv[2], std::ios::binary);
  int result = OMXI_OK;
  void* const session = decoder_create(&result, nullptr);
  if (session == nullptr)
    return std::fprintf(stderr, "no decoder, code %d: %s\n", result, resultDescription(result)), 1;
  omx_interface_register_input_callback(session, onInput, &decoder);
  omx_interface_register_output_callback(session, onPicture, &decoder);
  result = omx_interface_init(session);
  // Not for ever: pictures that are held back for their order come at the end of the stream only.
  const auto waitFor = [&](auto condition) {
    std::unique_lock<std::mutex> held(decoder.mutex);
    decoder.moved.wait_for(held, std::chrono::seconds(1),
                           [&] { return omx_interface_error(session) != OMXI_OK || condition(); });
  };
  int sent = 0;
  for (size_t i = 0; i < units.size() && result == OMXI_OK && omx_interface_error(session) == OMXI_OK;) {
    const int before = decoder.returned;
    const auto size = static_cast<unsigned>(units[i].size());
    if (omx_interface_send_input_data(session, units[i].data(), size, sent) == 0) {
      ++i, ++sent;
    } else if (before < sent) {
      waitFor([&] { return decoder.returned != before; });
    } else {
      break;  // with all buffers free it is the size that does not fit
    }
  }
  if (result == OMXI_OK) {
    // First what is under way: after the end of input no output buffer goes back to the component.
    waitFor([&] { return decoder.pictures >= sent; });
    omx_interface_send_end_of_input_flag(session, sent);
    result = omx_interface_deinit(session);
  }
  omx_interface_destroy(session);
  std::printf("%d units, %d pictures: %s\n", sent, decoder.pictures.load(), resultDescription(result));
  return result == OMXI_OK && decoder.pictures > 0 ? 0 : 1;
}
