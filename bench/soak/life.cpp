#include "bench/soak/life.h"

#include <string.h>

#include <algorithm>
#include <mutex>

#include "omxbridge/hardware_version.h"
#include "tools/video/device_layout.h"
#include "tools/video/scene.h"

namespace bench {

namespace {

constexpr uint32_t kFrames = 60;           // of material
constexpr uint32_t kFramesOfALife = 40;    // in the middle
constexpr uint32_t kOrderlyEndsOneIn = 2;  // the others are destroyed as they stand
constexpr std::chrono::seconds kPatience{10};

}  // namespace

tool::Result<Material> makeMaterial(tool::Size size) {
  Material material;
  material.settings = {.size = size, .rate = {}, .bitRate = 200'000, .keyInterval = 20};
  std::mutex mutex;
  auto encoder = tool::Session::openEncoder(material.settings, [&](std::span<const uint8_t> unit, uint32_t) {
    const std::lock_guard held(mutex);
    material.units.emplace_back(unit.begin(), unit.end());
  });
  if (!encoder.ok()) return encoder.failure();
  if (auto failed = encoder.value()->start()) return *failed;
  tool::Scene scene(size, material.settings.rate);
  tool::Picture picture;
  for (uint32_t i = 0; i < kFrames; ++i) {
    if (!scene.next(picture).ok()) break;
    const auto buffer = encoder.value()->reserve({}, std::nullopt);
    if (!buffer.ok()) return buffer.failure();
    const size_t length = tool::layOutForEncoder(picture, getHardwareBaseVersion(), buffer.value()->data);
    material.frames.emplace_back(buffer.value()->data, buffer.value()->data + length);
    if (auto failed = encoder.value()->send(*buffer.value(), length, i)) return *failed;
  }
  if (auto failed = encoder.value()->finish(kFrames, kFrames, kPatience)) return *failed;
  if (material.units.size() != kFrames)
    return tool::Failure{tool::ExitCode::Failed, "the encoder did not give a unit for each frame"};
  return material;
}

tool::Outcome Life::step() {
  if (_session == nullptr) return begin();
  return isDue(kFramesOfALife) ? end() : feed();
}

tool::Outcome Life::begin() {
  _isEncoder = isDue(2);
  _sent = 0;
  _answered = 0;
  auto opened = _isEncoder
                    ? tool::Session::openEncoder(
                          _material.settings,
                          [this](std::span<const uint8_t>, uint32_t timestamp) { answer(timestamp); })
                    : tool::Session::openDecoder([this](const DECODEDDATAINFO&, std::span<const uint8_t>,
                                                        uint32_t timestamp) { answer(timestamp); });
  if (!opened.ok()) return opened.failure();
  _session = std::move(opened.value());
  ++_born;
  return _session->start();
}

tool::Outcome Life::end() {
  tool::Outcome failed;
  if (isDue(kOrderlyEndsOneIn)) failed = _session->finish(_sent, _sent, kPatience);
  _session.reset();
  return failed;
}

tool::Outcome Life::feed() {
  if (_answered < _sent) return {};
  const auto buffer = _session->reserve({}, tool::Clock::now());
  if (!buffer.ok()) return buffer.failure();
  if (!buffer.value()) return {};  // its message is on the way
  const auto& all = _isEncoder ? _material.frames : _material.units;
  const std::vector<uint8_t>& bytes = all[_sent % all.size()];
  memcpy(buffer.value()->data, bytes.data(), bytes.size());
  _sentAt = tool::Clock::now().time_since_epoch().count();
  const uint32_t timestamp = _sent++;
  return _session->send(*buffer.value(), bytes.size(), timestamp);
}

void Life::answer(uint32_t timestamp) {
  const auto sent = tool::Clock::time_point(tool::Clock::duration(_sentAt));
  _latencies.add(std::chrono::duration<double, std::milli>(tool::Clock::now() - sent).count());
  _answered = timestamp + 1;
}

}  // namespace bench
