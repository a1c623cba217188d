// What a session costs: the same frames through the C interface and through libavcodec directly, in turns.
//
// Throughput is of frames fed as fast as they are taken; latency is added time of frames sent one by one,
// from the frame in the application's memory to the callback that delivers, without the time that libavcodec
// itself takes. Figures are medians.
#include <stdio.h>
#include <stdlib.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <exception>
#include <vector>

#include <omxhost/device.h>

#include "bench/bridge/allocations.h"
#include "bench/bridge/awake.h"
#include "bench/bridge/bridge_codec.h"
#include "bench/bridge/codec_time.h"
#include "bench/bridge/direct_codec.h"
#include "tools/video/device_layout.h"
#include "tools/video/scene.h"

namespace bench {
namespace {

constexpr int kFrameRate = 30;
constexpr int64_t kBitRate = 2'000'000;
constexpr size_t kFrames = 90;
constexpr int kRounds = 9;
// Rounds before the first that counts.
constexpr int kWarmUp = 1;

using Microseconds = std::chrono::duration<double, std::micro>;

double median(std::vector<double> values) {
  const auto middle = values.begin() + static_cast<ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

std::vector<Frame> sceneFrames(tool::Size size) {
  tool::Scene scene(size, {.numerator = kFrameRate, .denominator = 1});
  std::vector<Frame> frames;
  tool::Picture picture;
  while (frames.size() < kFrames && scene.next(picture).ok()) {
    frames.emplace_back(tool::pictureBytes(size));
    tool::layOutForEncoder(picture, HW_VERSION_QCOM_OTHER, frames.back().data());
  }
  return frames;
}

template <typename Work>
double seconds(Work work) {
  const Clock::time_point begin = Clock::now();
  work();
  return std::chrono::duration<double>(Clock::now() - begin).count();
}

// One kind of codec, both ways: `direct(i)` and `sendToBridge(i)` take item i of one list.
struct Subject {
  std::function<void(size_t)> direct;
  std::function<void(size_t)> sendToBridge;
  BridgeCodec& bridge;
};

struct Cost {
  double directRate;                            // frames per second
  double bridgeRate;                            // frames per second
  double throughput;                            // bridge / direct
  double addedLatency;                          // microseconds, the processors being awake
  double addedByCopying;                        // of it, in the application's copy of the input
  double addedLatencyAsleep;                    // the same when they sleep in between
  std::map<std::string, uint64_t> allocations;  // during as many frames as one round has
};

// What one frame takes, in microseconds, without the codec's own time, which varies by more than what is to
// be measured.
class Latency {
 public:
  // Measures frames one by one, the first of the list on.
  void measure(const Subject& subject) {
    const auto rest = [](Clock::duration whole) { return Microseconds(whole - takeCodecTime()).count(); };
    const auto copied = [] { return Microseconds(takeCopyTime()).count(); };
    takeCodecTime();
    takeCopyTime();
    for (size_t i = 0; i < kFrames / 3; ++i) {
      Clock::time_point begin = Clock::now();
      subject.direct(i);
      _direct.push_back(rest(Clock::now() - begin));
      _directCopies.push_back(copied());
      begin = Clock::now();
      subject.sendToBridge(i);
      subject.bridge.waitForAll();
      _bridge.push_back(rest(subject.bridge.lastOutput() - begin));
      _bridgeCopies.push_back(copied());
    }
  }
  double added() const { return median(_bridge) - median(_direct); }
  double addedByCopying() const { return median(_bridgeCopies) - median(_directCopies); }

 private:
  std::vector<double> _direct;
  std::vector<double> _directCopies;
  std::vector<double> _bridge;
  std::vector<double> _bridgeCopies;
};

Cost measure(const Subject& subject) {
  std::vector<double> directRates;
  std::vector<double> bridgeRates;
  std::vector<double> ratios;
  Latency awake;
  Latency asleep;
  for (int round = 0; round < kRounds + kWarmUp; ++round) {
    const double direct = seconds([&] {
      for (size_t i = 0; i < kFrames; ++i) subject.direct(i);
    });
    const double bridge = seconds([&] {
      for (size_t i = 0; i < kFrames; ++i) subject.sendToBridge(i);
      subject.bridge.waitForAll();
    });
    if (round < kWarmUp) continue;
    directRates.push_back(kFrames / direct);
    bridgeRates.push_back(kFrames / bridge);
    ratios.push_back(direct / bridge);
    // In every round, so that both kinds of figures are of the same minute.
    asleep.measure(subject);
    const Awake keep;
    awake.measure(subject);
  }

  countAllocations();
  for (size_t i = 0; i < kFrames; ++i) subject.sendToBridge(i);
  subject.bridge.waitForAll();
  return {median(directRates),    median(bridgeRates), median(ratios),   awake.added(),
          awake.addedByCopying(), asleep.added(),      takeAllocations()};
}

double perFrame(const Cost& cost, const char* library) {
  uint64_t count = 0;
  for (const auto& [name, allocations] : cost.allocations) {
    if (name.starts_with(library)) count += allocations;
  }
  return static_cast<double>(count) / kFrames;
}

void print(const char* device, const char* kind, tool::Size size, const Cost& cost) {
  printf("| %s | %s | %dx%d | %.0f | %.0f | %.3f | %.0f | %.0f | %.0f | %.1f |\n", device, kind, size.width,
         size.height, cost.directRate, cost.bridgeRate, cost.throughput, cost.addedLatency,
         cost.addedByCopying, cost.addedLatencyAsleep, perFrame(cost, "libomxbridge"));
  fflush(stdout);
}

void measureSize(const char* device, tool::Size size) {
  const std::vector<Frame> frames = sceneFrames(size);
  std::vector<Unit> units;
  {
    DirectEncoder direct(size, kFrameRate, kBitRate);
    BridgeCodec bridge = BridgeCodec::encoder(size, kFrameRate, kBitRate, nullptr);
    const auto send = [&](size_t i) {
      if (i == 0) bridge.requestKey();
      bridge.send(frames[i]);
    };
    const auto encode = [&](size_t i) {
      const auto unit = direct.encodeCopied(frames[i], i == 0);
      if (units.size() < frames.size()) units.emplace_back(unit.begin(), unit.end());
    };
    print(device, "encode", size, measure({encode, send, bridge}));
    const auto encodeInPlace = [&](size_t i) { direct.encode(frames[i], i == 0); };
    print(device, "encode, from where it lies", size, measure({encodeInPlace, send, bridge}));
  }
  DirectDecoder direct;
  BridgeCodec bridge = BridgeCodec::decoder(nullptr);
  const auto sendToBridge = [&](size_t i) { bridge.send(units[i]); };
  print(device, "decode", size,
        measure({[&](size_t i) { direct.decodeForDevice(units[i]); }, sendToBridge, bridge}));
  print(device, "decode, left planar", size,
        measure({[&](size_t i) { direct.decode(units[i]); }, sendToBridge, bridge}));
}

int measureDevice(const char* device) {
  setenv("OMXBRIDGE_LOG", "silent", 0);  // the table is what this prints
  if (!omxhost::setDevice(device)) {
    fprintf(stderr, "bridge_bench: no device %s\n", device);
    return 2;
  }
  try {
    for (const tool::Size size : {tool::Size{640, 480}, tool::Size{1280, 720}}) measureSize(device, size);
  } catch (const std::exception& problem) {
    fprintf(stderr, "bridge_bench: %s: %s\n", device, problem.what());
    return 1;
  }
  return 0;
}

}  // namespace
}  // namespace bench

// Arguments: the devices to pose as. Each gets a process of its own, as the library looks at the device once.
int main(int argc, char** argv) {
  const char* const usual[] = {"msm8960", "omap4"};
  std::span<const char* const> devices(usual);
  if (argc > 1) devices = std::span<const char* const>(argv, static_cast<size_t>(argc)).subspan(1);
  printf(
      "| Device | | Size | libavcodec, frames/s | session, frames/s | ratio | added latency, us "
      "| of it copying, us | asleep, us | allocations per frame |\n");
  printf("| --- | --- | --- | ---: | ---: | ---: | ---: | ---: | ---: | ---: |\n");
  fflush(stdout);
  for (const char* const device : devices) {
    const pid_t child = fork();
    if (child < 0) return 1;
    if (child == 0) {
      const int result = bench::measureDevice(device);
      fflush(stdout);
      _exit(result);
    }
    int status = 0;
    if (waitpid(child, &status, 0) != child || status != 0) return 1;
  }
  return 0;
}
