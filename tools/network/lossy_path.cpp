#include "tools/network/lossy_path.h"

#include <algorithm>
#include <limits>
#include <utility>

namespace tool {

namespace {

constexpr size_t kPacketBytes = 1200;
constexpr int64_t kOvertaken = 30'000;           // microseconds that a reordered packet comes late
constexpr int64_t kPatience = 60'000;            // for packets that others have overtaken
constexpr int64_t kRequestAgainAfter = 250'000;  // and the time there and back

}  // namespace

LossyPath::LossyPath(const Impairments& impairments) : _impairments(impairments), _random(impairments.seed) {}

// From 0 to below 1, the same on every machine.
double LossyPath::chance() {
  constexpr double kUnit = 1.0 / (uint64_t{1} << 53);
  return static_cast<double>(_random() >> 11) * kUnit;
}

void LossyPath::send(CodedPicture picture, int64_t time) {
  const uint64_t count = std::max<uint64_t>(1, (picture.bytes.size() + kPacketBytes - 1) / kPacketBytes);
  const auto sent = std::make_shared<Sent>(Sent{std::move(picture), time, _nextToSend, count});
  bool whole = true;
  for (uint64_t i = 0; i < count; ++i) {
    // Both are drawn in any case, so that one option does not change what the other one does.
    const bool isLost = chance() < _impairments.loss;
    const bool isLate = chance() < _impairments.reorder;
    ++_figures.packets;
    if (isLost) {
      ++_figures.packetsLost;
      whole = false;
      continue;
    }
    if (isLate) ++_figures.packetsReordered;
    _underWay.push({_nextToSend + i, time + _impairments.delay + (isLate ? kOvertaken : 0), sent});
  }
  _nextToSend += count;
  ++_figures.picturesLost;  // until it comes out
  if (!whole) _figures.losses.push_back(time);
}

// Gives the next picture on, or drops it while frozen, if all of its packets are there.
bool LossyPath::takeWholePicture(int64_t now) {
  const auto first = _waiting.find(_next);
  if (first == _waiting.end()) return false;
  const std::shared_ptr<Sent> sent = first->second.of;
  auto end = first;
  for (uint64_t i = 0; i < sent->count; ++i, ++end) {
    if (end == _waiting.end() || end->first != sent->first + i) return false;
  }
  _waiting.erase(first, end);
  _next = sent->first + sent->count;
  if (sent->picture.isKey) _frozen = false;
  if (_frozen) return true;
  --_figures.picturesLost;
  sent->picture.networkDelay = now - sent->time;
  _out.push_back(std::move(sent->picture));
  return true;
}

// When the receiver does something by itself: gives up waiting for a gap to close, or asks again.
std::optional<int64_t> LossyPath::nextAlarm() const {
  std::optional<int64_t> alarm;
  if (_frozen) alarm = _lastRequest + kRequestAgainAfter + 2 * _impairments.delay;
  // What waits behind the gap: _next cannot be among it with all that belongs to it.
  uint64_t expected = _next;
  for (const auto& [number, packet] : _waiting) {
    if (number == expected) {
      ++expected;
      continue;
    }
    return std::min(alarm.value_or(std::numeric_limits<int64_t>::max()), packet.arrival + kPatience);
  }
  return alarm;
}

// What is missing will not come any more: on with the next picture that may be whole.
void LossyPath::giveUpGap(int64_t now) {
  uint64_t expected = _next;
  auto behind = _waiting.begin();
  while (behind != _waiting.end() && behind->first == expected) {
    ++behind;
    ++expected;
  }
  while (behind != _waiting.end() && behind->first != behind->second.of->first) ++behind;
  _next = behind != _waiting.end() ? behind->first : std::prev(behind)->first + 1;
  _waiting.erase(_waiting.begin(), behind);
  _frozen = true;
  requestKey(now);
}

void LossyPath::requestKey(int64_t now) {
  _lastRequest = now;
  if (_ended) return;
  _figures.keyRequests.push_back(now);
  _requestsUnderWay.push_back(now + _impairments.delay);
}

std::vector<CodedPicture> LossyPath::advance(int64_t now) {
  for (;;) {
    const auto alarm = nextAlarm();
    const bool isPacket = !_underWay.empty() && (!alarm || _underWay.top().arrival <= *alarm);
    const int64_t due = isPacket ? _underWay.top().arrival : alarm.value_or(now + 1);
    if (due > now) break;
    const int64_t time = _clock = std::max(_clock, due);
    if (isPacket) {
      // One that was given up meanwhile is of no use.
      if (_underWay.top().number >= _next) _waiting.emplace(_underWay.top().number, _underWay.top());
      _underWay.pop();
    } else if (_frozen && due >= _lastRequest + kRequestAgainAfter + 2 * _impairments.delay) {
      requestKey(time);
    } else {
      giveUpGap(time);
    }
    while (takeWholePicture(time)) {
    }
  }
  return std::exchange(_out, {});
}

std::vector<CodedPicture> LossyPath::drain() {
  _ended = true;
  // Late packets and gaps take less; waiting for a key frame would go on for ever.
  constexpr int64_t kLongest = 1'000'000;
  const int64_t next = _underWay.empty() ? 0 : _underWay.top().arrival;
  return advance(std::max(_clock, next) + _impairments.delay + kLongest);
}

bool LossyPath::takeKeyRequest(int64_t now) {
  bool any = false;
  while (!_requestsUnderWay.empty() && _requestsUnderWay.front() <= now) {
    _requestsUnderWay.pop_front();
    any = true;
  }
  return any;
}

}  // namespace tool
