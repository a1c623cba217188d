#include "bench/frames/measure.h"

#include <algorithm>
#include <chrono>
#include <cstring>
#include <random>

namespace bench {
namespace {

constexpr std::size_t kAlignment = 4096;
constexpr unsigned kRounds = 12;

std::size_t roundUp(std::size_t n) {
  return (n + kAlignment - 1) / kAlignment * kAlignment;
}

class Stopwatch {
 public:
  double seconds() const { return std::chrono::duration<double>(Clock::now() - _start).count(); }

 private:
  using Clock = std::chrono::steady_clock;
  Clock::time_point _start = Clock::now();
};

double once(const std::function<void()>& run) {
  const Stopwatch watch;
  run();
  return watch.seconds();
}

}  // namespace

Buffers::Buffers(std::size_t srcBytes, std::size_t dstBytes) {
  // The limit copies half of what is read and written, which may be more than the smaller of the two has.
  const std::size_t half = (srcBytes + dstBytes) / 2;
  const std::size_t src = roundUp(std::max(srcBytes, half)), dst = roundUp(std::max(dstBytes, half));
  // Half a page apart: loads and stores at the same place of two pages get in each other's way.
  _memory = std::make_unique<std::uint8_t[]>(src + dst + 2 * kAlignment);
  _src = _memory.get() + (kAlignment - reinterpret_cast<std::uintptr_t>(_memory.get()) % kAlignment);
  _dst = _src + src + kAlignment / 2;
  std::minstd_rand random(1);
  std::generate_n(_src, src, [&random] { return static_cast<std::uint8_t>(random() >> 8); });
}

Result measure(const Case& c, double secondsPerContender) {
  const std::size_t moved = (c.bytesRead + c.bytesWritten) / 2;
  const Buffers& buffers = *c.buffers;
  std::vector<Contender> all = {
      {"", c.ours},
      {"", [&] { std::memcpy(buffers.dst(), buffers.src(), moved); }},
      {"", [&] { copyByVectors(buffers.src(), buffers.dst(), moved); }},
  };
  all.insert(all.end(), c.peers.begin(), c.peers.end());

  std::vector<double> shortest(all.size(), 1e9);
  for (unsigned round = 0; round < kRounds; ++round) {
    for (std::size_t k = 0; k < all.size(); ++k) {
      all[k].run();
      const Stopwatch watch;
      do {
        shortest[k] = std::min(shortest[k], once(all[k].run));
      } while (watch.seconds() < secondsPerContender / kRounds);
    }
  }

  Result result{.ours = shortest[0], .limit = std::min(shortest[1], shortest[2]), .bestPeerName = {}};
  for (std::size_t k = 3; k < all.size(); ++k) {
    if (result.bestPeer != 0 && shortest[k] >= result.bestPeer) continue;
    result.bestPeer = shortest[k];
    result.bestPeerName = all[k].name;
  }
  return result;
}

}  // namespace bench
