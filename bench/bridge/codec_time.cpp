#include "bench/bridge/codec_time.h"

#include <dlfcn.h>
#include <stdlib.h>
#include <string.h>

#include <atomic>

extern "C" {
#include <libavcodec/avcodec.h>
}

namespace {

using Clock = std::chrono::steady_clock;

std::atomic<Clock::rep> spent{0};
std::atomic<Clock::rep> copying{0};

// The function of that name behind the one that this program defines.
template <typename Function>
Function* next(const char* name) {
  auto* const found = reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
  if (found == nullptr) abort();
  return found;
}

template <typename... Arguments>
int timed(int (*function)(Arguments...), Arguments... arguments) {
  const Clock::time_point begin = Clock::now();
  const int result = function(arguments...);
  spent += (Clock::now() - begin).count();
  return result;
}

}  // namespace

#pragma GCC visibility push(default)  // for the media server to find them
extern "C" {
int avcodec_send_frame(AVCodecContext* context, const AVFrame* frame) {
  static const auto function = next<decltype(avcodec_send_frame)>("avcodec_send_frame");
  return timed(function, context, frame);
}
int avcodec_receive_packet(AVCodecContext* context, AVPacket* packet) {
  static const auto function = next<decltype(avcodec_receive_packet)>("avcodec_receive_packet");
  return timed(function, context, packet);
}
int avcodec_send_packet(AVCodecContext* context, const AVPacket* packet) {
  static const auto function = next<decltype(avcodec_send_packet)>("avcodec_send_packet");
  return timed(function, context, packet);
}
int avcodec_receive_frame(AVCodecContext* context, AVFrame* frame) {
  static const auto function = next<decltype(avcodec_receive_frame)>("avcodec_receive_frame");
  return timed(function, context, frame);
}
}
#pragma GCC visibility pop

namespace bench {

std::chrono::nanoseconds takeCodecTime() {
  return Clock::duration(spent.exchange(0));
}

void copyInput(std::span<const uint8_t> input, uint8_t* to) {
  const Clock::time_point begin = Clock::now();
  memcpy(to, input.data(), input.size());
  copying += (Clock::now() - begin).count();
}

std::chrono::nanoseconds takeCopyTime() {
  return Clock::duration(copying.exchange(0));
}

}  // namespace bench
