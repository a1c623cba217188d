#pragma once
// Stands between a node and its client for messages: what the node sends passes the tap, which lets it
// through, keeps it for later, drops or repeats it, and can send messages of its own making. One tap serves
// any number of nodes; each client gets one message at a time, of its node's on the node's thread, of those
// that are released or forged on the caller's, which comes back when the client has handled it.
// All functions may be called from any thread, but not from a delivery. Matches and filters run on the nodes'
// threads and must not call the tap. It outlives its nodes.

#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <optional>

#include <media/IOMX.h>

#include "tests/support/journal.h"

namespace omxtest {

enum class Fate { Pass, Hold, Drop, Repeat };  // Repeat: delivered twice

// May change the message.
using Filter = std::function<Fate(android::omx_message&)>;
using Messages = Journal<android::omx_message>;
using Match = Messages::Match;

// Matches for the usual kinds of messages. Words that are not given may be any.
inline Match anyMessage() {
  return [](const android::omx_message&) { return true; };
}
inline Match typeIs(uint32_t type) {
  return [=](const android::omx_message& message) { return message.type == type; };
}
inline Match anyEvent() {
  return typeIs(android::omx_message::EVENT);
}
inline Match emptyBufferDone() {
  return typeIs(android::omx_message::EMPTY_BUFFER_DONE);
}
inline Match fillBufferDone() {
  return typeIs(android::omx_message::FILL_BUFFER_DONE);
}
inline Match eventIs(OMX_EVENTTYPE event, std::optional<OMX_U32> data1 = {},
                     std::optional<OMX_U32> data2 = {}) {
  return [=](const android::omx_message& message) {
    const auto& data = message.u.event_data;
    return message.type == android::omx_message::EVENT && data.event == event &&
           data.data1 == data1.value_or(data.data1) && data.data2 == data2.value_or(data.data2);
  };
}
inline Match commandComplete(OMX_COMMANDTYPE command, std::optional<OMX_U32> data = {}) {
  return eventIs(OMX_EventCmdComplete, command, data);
}

// Messages to forge.
inline android::omx_message makeEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  android::omx_message message{.type = android::omx_message::EVENT, .node = nullptr, .u = {}};
  message.u.event_data = {event, data1, data2};
  return message;
}
inline android::omx_message makeEmptyBufferDone(android::IOMX::buffer_id buffer) {
  android::omx_message message{.type = android::omx_message::EMPTY_BUFFER_DONE, .node = nullptr, .u = {}};
  message.u.buffer_data.buffer = buffer;
  return message;
}
inline android::omx_message makeFillBufferDone(android::IOMX::buffer_id buffer, OMX_U32 length,
                                               OMX_U32 flags = 0) {
  android::omx_message message{.type = android::omx_message::FILL_BUFFER_DONE, .node = nullptr, .u = {}};
  message.u.extended_buffer_data = {buffer, 0, length, flags, 0, nullptr, nullptr};
  return message;
}

class MessageTap {
 public:
  // From now on messages that match are kept, and others treated as before.
  void hold(const Match& match) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _filter = [match, others = std::move(_filter)](android::omx_message& message) {
      return match(message) ? Fate::Hold : others ? others(message) : Fate::Pass;
    };
  }
  // Decides about every message from now on. What is held stays held.
  void setFilter(Filter filter) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _filter = std::move(filter);
  }
  // Messages pass again, and those that were held now.
  void passAll() {
    setFilter(nullptr);
    while (release()) {
    }
  }

  [[nodiscard]] bool waitForHeld(size_t count, std::chrono::milliseconds limit = kWaitLimit) const {
    std::unique_lock<std::mutex> lock(_mutex);
    return _changed.wait_for(lock, limit, [&] { return _held.size() >= count; });
  }
  // Delivers the held message at `position`, counted from the oldest (so reordering is a choice of
  // positions); false if there is none. Also when its node has been freed: that is a late message.
  bool release(size_t position = 0) {
    std::list<Held> released;
    {
      const std::lock_guard<std::mutex> lock(_mutex);
      if (position >= _held.size()) return false;
      const auto held = std::next(_held.begin(), static_cast<ptrdiff_t>(position));
      released.splice(released.end(), _held, held);
    }
    released.front().observer->deliver(released.front().message);
    return true;
  }
  // Delivers a message out of nothing to `node`'s client, also after freeNode.
  void forge(android::IOMX::node_id node, android::omx_message message) {
    std::unique_lock<std::mutex> lock(_mutex);
    const android::sp<Observer> observer = _observers.at(node);
    lock.unlock();
    message.node = node;
    observer->deliver(message);
  }

  // Messages that clients have handled, that is: their function has returned.
  size_t deliveredCount(const Match& match) const { return _delivered.count(match); }
  [[nodiscard]] bool waitForDelivered(const Match& match, size_t count = 1) const {
    return _delivered.waitFor(match, count);
  }

  // What the server takes for its client.
  class Observer final : public android::BnOMXObserver {
   public:
    Observer(MessageTap& tap, const android::sp<android::IOMXObserver>& client)
        : _tap(tap), _client(client) {}

    void onMessage(const android::omx_message& sent) override {
      android::omx_message message = sent;
      const Fate fate = _tap.decide(this, message);
      if (fate == Fate::Pass || fate == Fate::Repeat) deliver(message);
      if (fate == Fate::Repeat) deliver(message);
    }
    void deliver(const android::omx_message& message) {
      const std::lock_guard<std::mutex> lock(_oneAtATime);
      _client->onMessage(message);
      _tap._delivered.add(message);
    }

   private:
    MessageTap& _tap;
    const android::sp<android::IOMXObserver> _client;
    std::mutex _oneAtATime;
  };
  // For RecordingOmx: whose client it is. The tap keeps it for as long as it lives.
  void attach(const android::sp<Observer>& observer, android::IOMX::node_id node) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _observers[node] = observer;
  }

 private:
  struct Held {
    android::sp<Observer> observer;
    android::omx_message message;
  };

  Fate decide(Observer* observer, android::omx_message& message) {
    const std::lock_guard<std::mutex> lock(_mutex);
    const Fate fate = _filter ? _filter(message) : Fate::Pass;
    if (fate != Fate::Hold) return fate;
    _held.push_back({observer, message});
    _changed.notify_all();
    return fate;
  }

  Messages _delivered;
  mutable std::mutex _mutex;  // guards everything below; never held while a client is called
  mutable std::condition_variable _changed;
  Filter _filter;
  std::list<Held> _held;
  std::map<android::IOMX::node_id, android::sp<Observer>> _observers;
};

}  // namespace omxtest
