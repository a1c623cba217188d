// One place in the crowd: a session that is made, fed a frame at a time, ended one way or another, and made
// again. Used by one thread; outputs arrive on the session's.
#pragma once

#include <stdint.h>

#include <atomic>
#include <memory>
#include <random>
#include <vector>

#include "bench/soak/samples.h"
#include "tools/base/clock.h"
#include "tools/base/failure.h"
#include "tools/session/session.h"

namespace bench {

// What sessions are fed, over and over.
struct Material {
  tool::EncoderSettings settings;
  std::vector<std::vector<uint8_t>> frames;  // laid out for the device's encoder
  std::vector<std::vector<uint8_t>> units;   // the same pictures coded, the first one a key picture
};
tool::Result<Material> makeMaterial(tool::Size size);

class Life {
 public:
  Life(const Material& material, Latencies& latencies, uint32_t seed)
      : _material(material), _latencies(latencies), _random(seed) {}

  // One step: makes the session, sends its next frame unless the last one is still on its way, or ends it.
  tool::Outcome step();
  // Sessions made so far.
  uint64_t born() const { return _born; }

 private:
  bool isDue(uint32_t oneIn) { return _random() % oneIn == 0; }
  tool::Outcome begin();
  tool::Outcome end();
  tool::Outcome feed();
  void answer(uint32_t timestamp);

  const Material& _material;
  Latencies& _latencies;
  std::minstd_rand _random;
  bool _isEncoder = false;
  uint64_t _born = 0;
  uint32_t _sent = 0;
  std::atomic<uint32_t> _answered{0};
  std::atomic<tool::Clock::rep> _sentAt{0};
  std::unique_ptr<tool::Session> _session;  // last: its thread uses the others
};

}  // namespace bench
