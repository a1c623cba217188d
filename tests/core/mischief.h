// What is between the sessions of the stress test and their components: late and repeated messages, forged
// ones, failed calls.
#pragma once

#include <atomic>
#include <iterator>
#include <map>
#include <mutex>
#include <random>
#include <thread>
#include <utility>
#include <vector>

#include "tests/support/scripted_media_server.h"

namespace omxtest::stress {

// Any thread.
class Random {
 public:
  explicit Random(unsigned seed) : _engine(seed) {}
  // One of 0 to `count` - 1.
  unsigned draw(size_t count) {
    const std::lock_guard<std::mutex> lock(_mutex);
    return static_cast<unsigned>(_engine() % count);
  }
  // True in `percent` of the cases.
  bool chance(unsigned percent) { return draw(100) < percent; }

 private:
  std::mutex _mutex;
  std::mt19937 _engine;
};

class Mischief {
 public:
  Mischief(ScriptedMediaServer& server, unsigned seed) : _server(server), _random(seed) {
    server.messages().setFilter([this](const android::omx_message& message) { return fate(message); });
    server.omx().failWhere([this](const Call& call) {
      return call.method != Method::FreeNode && isVictim(call.node) && _random.chance(2);
    });
    _thread = std::thread([this] { run(); });
  }
  ~Mischief() {
    _over = true;
    _thread.join();
    _server.messages().passAll();
    _server.messages().releaseAll();
    _server.omx().failNothing();
  }

  // From now on this node's messages and calls are tampered with, and messages with these buffers are forged.
  void pester(void* node, std::vector<void*> buffers) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _victims[node] = std::move(buffers);
  }
  void leaveAlone(void* node) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _victims.erase(node);
  }

 private:
  bool isVictim(void* node) {
    const std::lock_guard<std::mutex> lock(_mutex);
    return _victims.contains(node);
  }

  Fate fate(const android::omx_message& message) {
    const std::lock_guard<std::mutex> lock(_mutex);
    const bool victim = _victims.contains(message.node);
    // Late messages of an honest component still come in their order: one holds up those behind it.
    size_t& held = _held[message.node];
    if (_random.chance(10) || (!victim && held > 0)) {
      ++held;
      return Fate::Hold;
    }
    return victim && _random.chance(10) ? Fate::Repeat : Fate::Pass;
  }

  // Lets one of the held messages go, some of them after their session.
  void releaseOne() {
    const std::vector<android::omx_message> held = _server.messages().held();
    if (held.empty()) return;
    size_t position = _random.draw(held.size());
    void* const node = held[position].node;
    for (size_t older = 0; older < position && !isVictim(node); ++older) {
      if (held[older].node == node) position = older;
    }
    _server.messages().release(position);
    const std::lock_guard<std::mutex> lock(_mutex);
    --_held[node];
  }

  void run() {
    MessageTap& messages = _server.messages();
    for (unsigned round = 1; !_over; ++round) {
      if (messages.waitForHeld(1, std::chrono::milliseconds(1))) releaseOne();
      if (_random.chance(30)) forge();
      if (round % 128 == 0) messages.forgetFreedNodes();  // each may have a thread for its late messages
    }
  }

  void forge() {
    void* node = nullptr;
    void* buffer = this;
    {
      const std::lock_guard<std::mutex> lock(_mutex);
      if (_victims.empty()) return;
      const auto victim = std::next(_victims.begin(), _random.draw(_victims.size()));
      node = victim->first;
      const auto& buffers = victim->second;
      if (!buffers.empty() && _random.chance(90)) buffer = buffers[_random.draw(buffers.size())];
    }
    const OMX_U32 few = _random.draw(5);
    const auto event = static_cast<OMX_EVENTTYPE>(_random.draw(8));
    const android::omx_message messages[] = {
        makeEvent(event, few, few),
        makeEvent(OMX_EventCmdComplete, OMX_CommandStateSet, few),
        makeEvent(OMX_EventCmdComplete, _random.draw(5), few),
        makeEvent(OMX_EventPortSettingsChanged, 1, 0),
        makeEmptyBufferDone(buffer),
        makeEmptyBufferDone(buffer),
        makeFillBufferDone(buffer, few, _random.chance(10) ? OMX_BUFFERFLAG_EOS : 0),
        makeFillBufferDone(buffer, few)};
    _server.messages().forge(node, messages[_random.draw(std::size(messages))]);
  }

  ScriptedMediaServer& _server;
  Random _random;
  std::mutex _mutex;  // guards the two below
  std::map<void*, std::vector<void*>> _victims;
  std::map<void*, size_t> _held;  // by node
  std::atomic<bool> _over{false};
  std::thread _thread;
};

}  // namespace omxtest::stress
