#include "tests/support/message_tap.h"

#include <atomic>
#include <iterator>
#include <utility>
#include <vector>

#include "host/mediaserver/message_channel.h"

namespace omxtest {

using android::IOMXObserver;
using android::omx_message;
using android::sp;

namespace {

// What a channel delivers to: the client, and then the tap's books.
class Delivery final : public android::BnOMXObserver {
 public:
  Delivery(Messages& delivered, const sp<IOMXObserver>& client) : _delivered(delivered), _client(client) {}

  void onMessage(const omx_message& message) override {
    _client->onMessage(message);
    _delivered.add(message);
  }

 private:
  Messages& _delivered;
  const sp<IOMXObserver> _client;
};

}  // namespace

// What the server takes for its client.
class MessageTap::Observer final : public android::BnOMXObserver {
 public:
  Observer(MessageTap& tap, const sp<IOMXObserver>& client)
      : delivery(new Delivery(tap._delivered, client)), channel(delivery), _tap(tap) {}

  void onMessage(const omx_message& message) override { _tap.onMessage(this, message); }
  void deliver(const omx_message& message) {
    // Closed where its node has been freed: the message is a late one then.
    if (channel.open()) channel.post(message);
  }

  const sp<IOMXObserver> delivery;
  mediaserver::MessageChannel channel;
  std::atomic<bool> freed{false};

 private:
  MessageTap& _tap;
};

MessageTap::MessageTap() = default;
MessageTap::~MessageTap() = default;

void MessageTap::hold(const Match& match) {
  std::lock_guard<std::mutex> lock(_mutex);
  _filter = [match, others = std::move(_filter)](omx_message& message) {
    return match(message) ? Fate::Hold : others ? others(message) : Fate::Pass;
  };
}

void MessageTap::setFilter(Filter filter) {
  std::lock_guard<std::mutex> lock(_mutex);
  _filter = std::move(filter);
}

void MessageTap::onMessage(const sp<Observer>& observer, omx_message message) {
  Fate fate = Fate::Pass;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (_filter) fate = _filter(message);
    if (fate == Fate::Hold) {
      _held.push_back({observer, message});
      _changed.notify_all();
    }
  }
  if (fate == Fate::Pass || fate == Fate::Repeat) observer->deliver(message);
  if (fate == Fate::Repeat) observer->deliver(message);
}

bool MessageTap::waitForHeld(size_t count, std::chrono::milliseconds limit) const {
  std::unique_lock<std::mutex> lock(_mutex);
  return _changed.wait_for(lock, limit, [&] { return _held.size() >= count; });
}

bool MessageTap::release(size_t position) {
  Held entry;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (position >= _held.size()) return false;
    const auto found = std::next(_held.begin(), static_cast<ptrdiff_t>(position));
    entry = *found;
    _held.erase(found);
  }
  entry.observer->deliver(entry.message);
  return true;
}

sp<MessageTap::Observer> MessageTap::find(NodeId node) const {
  std::lock_guard<std::mutex> lock(_mutex);
  const auto entry = _observers.find(node);
  return entry == _observers.end() ? sp<Observer>() : entry->second;
}

bool MessageTap::forge(NodeId node, const omx_message& message) {
  const sp<Observer> observer = find(node);
  if (observer.get() == nullptr) return false;
  omx_message forged = message;
  if (forged.node == nullptr) forged.node = node;
  observer->deliver(forged);
  return true;
}

void MessageTap::forgetFreedNodes() {
  std::vector<sp<Observer>> forgotten;  // end without the lock, which their deliveries may wait for
  std::lock_guard<std::mutex> lock(_mutex);
  std::erase_if(_observers, [&](const auto& entry) {
    if (entry.second->freed) forgotten.push_back(entry.second);
    return entry.second->freed.load();
  });
  _held.remove_if([](const Held& entry) { return entry.observer->freed.load(); });
}

sp<IOMXObserver> MessageTap::wrap(const sp<IOMXObserver>& client) {
  const sp<Observer> observer = new Observer(*this, client);
  if (!observer->channel.open()) return nullptr;
  return observer;
}

void MessageTap::attach(const sp<IOMXObserver>& wrapped, NodeId node) {
  std::lock_guard<std::mutex> lock(_mutex);
  _observers[node] = static_cast<Observer*>(wrapped.get());
}

void MessageTap::detach(NodeId node) {
  const sp<Observer> observer = find(node);
  if (observer.get() == nullptr) return;
  observer->freed = true;
  observer->channel.close();
}

Match anyMessage() {
  return [](const omx_message&) { return true; };
}

Match anyEvent() {
  return [](const omx_message& message) { return message.type == omx_message::EVENT; };
}

Match eventIs(OMX_EVENTTYPE event, std::optional<OMX_U32> data1, std::optional<OMX_U32> data2) {
  return [=](const omx_message& message) {
    const auto& data = message.u.event_data;
    return message.type == omx_message::EVENT && data.event == event &&
           data.data1 == data1.value_or(data.data1) && data.data2 == data2.value_or(data.data2);
  };
}

Match commandComplete(OMX_COMMANDTYPE command, std::optional<OMX_U32> data) {
  return eventIs(OMX_EventCmdComplete, command, data);
}

Match emptyBufferDone() {
  return [](const omx_message& message) { return message.type == omx_message::EMPTY_BUFFER_DONE; };
}

Match fillBufferDone() {
  return [](const omx_message& message) { return message.type == omx_message::FILL_BUFFER_DONE; };
}

omx_message makeEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  omx_message message{};
  message.type = omx_message::EVENT;
  message.u.event_data.event = event;
  message.u.event_data.data1 = data1;
  message.u.event_data.data2 = data2;
  return message;
}

omx_message makeEmptyBufferDone(android::IOMX::buffer_id buffer) {
  omx_message message{};
  message.type = omx_message::EMPTY_BUFFER_DONE;
  message.u.buffer_data.buffer = buffer;
  return message;
}

omx_message makeFillBufferDone(android::IOMX::buffer_id buffer, OMX_U32 length, OMX_U32 flags) {
  omx_message message{};
  message.type = omx_message::FILL_BUFFER_DONE;
  message.u.extended_buffer_data.buffer = buffer;
  message.u.extended_buffer_data.range_length = length;
  message.u.extended_buffer_data.flags = flags;
  return message;
}

}  // namespace omxtest
