#include "tests/support/message_tap.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <utility>

#include "host/mediaserver/message_channel.h"

namespace omxtest {

using android::IOMXObserver;
using android::omx_message;
using android::sp;

// The way from observers and deliveries back to the tap, which may end before they do.
struct MessageTap::Link {
  std::mutex mutex;
  MessageTap* tap;
};

// What the channel delivers to: the client, and then the tap's books.
class MessageTap::Delivery final : public android::BnOMXObserver {
 public:
  Delivery(std::shared_ptr<Link> link, const sp<IOMXObserver>& client)
      : _link(std::move(link)), _client(client) {}

  void onMessage(const omx_message& message) override {
    _client->onMessage(message);
    std::lock_guard<std::mutex> lock(_link->mutex);
    if (_link->tap != nullptr) _link->tap->noteDelivered(message);
  }

 private:
  const std::shared_ptr<Link> _link;
  const sp<IOMXObserver> _client;
};

// What the server takes for its client.
class MessageTap::Observer final : public android::BnOMXObserver {
 public:
  Observer(MessageTap* tap, const sp<IOMXObserver>& client)
      : _link(std::make_shared<Link>()), _delivery(new Delivery(_link, client)), _channel(_delivery) {
    _link->tap = tap;
  }

  void onMessage(const omx_message& message) override {
    std::lock_guard<std::mutex> lock(_link->mutex);
    if (_link->tap != nullptr) _link->tap->onMessage(this, message);
  }

  void deliver(const omx_message& message) {
    // Closed where its node has been freed: the message is a late one then.
    if (_channel.open()) _channel.post(message);
  }
  bool open() { return _channel.open(); }
  void close() { _channel.close(); }
  void leave() {
    {
      std::lock_guard<std::mutex> lock(_link->mutex);
      _link->tap = nullptr;
    }
    close();
  }

 private:
  const std::shared_ptr<Link> _link;
  const sp<IOMXObserver> _delivery;
  mediaserver::MessageChannel _channel;
};

MessageTap::MessageTap() = default;

MessageTap::~MessageTap() {
  std::map<NodeId, sp<Observer>> observers;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    _held.clear();
    observers.insert(_live.begin(), _live.end());
    observers.insert(_freed.begin(), _freed.end());
  }
  for (const auto& [node, observer] : observers) observer->leave();
}

void MessageTap::hold(Match match) {
  std::lock_guard<std::mutex> lock(_mutex);
  _holds.push_back(std::move(match));
}

void MessageTap::setFilter(Filter filter) {
  std::lock_guard<std::mutex> lock(_mutex);
  _filter = std::move(filter);
}

void MessageTap::passAll() {
  std::lock_guard<std::mutex> lock(_mutex);
  _holds.clear();
  _filter = nullptr;
}

void MessageTap::onMessage(const sp<Observer>& observer, omx_message message) {
  Fate fate = Fate::Pass;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    const bool kept =
        std::any_of(_holds.begin(), _holds.end(), [&](const Match& match) { return match(message); });
    fate = kept ? Fate::Hold : _filter ? _filter(message) : Fate::Pass;
    if (fate == Fate::Hold) {
      _held.push_back({observer, message});
      _changed.notify_all();
    }
  }
  if (fate == Fate::Pass || fate == Fate::Repeat) observer->deliver(message);
  if (fate == Fate::Repeat) observer->deliver(message);
}

std::vector<omx_message> MessageTap::held() const {
  std::lock_guard<std::mutex> lock(_mutex);
  std::vector<omx_message> messages;
  for (const Held& entry : _held) messages.push_back(entry.message);
  return messages;
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

bool MessageTap::forge(NodeId node, const omx_message& message) {
  sp<Observer> observer;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    for (const auto* nodes : {&_live, &_freed}) {
      const auto entry = nodes->find(node);
      if (entry != nodes->end()) observer = entry->second;
    }
  }
  if (observer.get() == nullptr) return false;
  omx_message forged = message;
  if (forged.node == nullptr) forged.node = node;
  observer->deliver(forged);
  return true;
}

void MessageTap::noteDelivered(const omx_message& message) {
  std::lock_guard<std::mutex> lock(_mutex);
  _delivered.push_back(message);
  _changed.notify_all();
}

size_t MessageTap::countDelivered(const Match& match) const {
  return static_cast<size_t>(std::count_if(_delivered.begin(), _delivered.end(), match));
}

size_t MessageTap::deliveredCount(const Match& match) const {
  std::lock_guard<std::mutex> lock(_mutex);
  return countDelivered(match);
}

bool MessageTap::waitForDelivered(const Match& match, size_t count) const {
  std::unique_lock<std::mutex> lock(_mutex);
  return _changed.wait_for(lock, kWaitLimit, [&] { return countDelivered(match) >= count; });
}

void MessageTap::forgetFreedNodes() {
  std::map<NodeId, sp<Observer>> freed;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    freed.swap(_freed);
    _held.remove_if([&](const Held& entry) {
      return std::any_of(freed.begin(), freed.end(),
                         [&](const auto& node) { return node.second == entry.observer; });
    });
  }
  for (const auto& [node, observer] : freed) observer->leave();
}

sp<IOMXObserver> MessageTap::wrap(const sp<IOMXObserver>& client) {
  const sp<Observer> observer = new Observer(this, client);
  if (!observer->open()) return nullptr;
  return observer;
}

void MessageTap::attach(const sp<IOMXObserver>& wrapped, NodeId node) {
  std::lock_guard<std::mutex> lock(_mutex);
  _live[node] = static_cast<Observer*>(wrapped.get());
}

void MessageTap::detach(NodeId node) {
  sp<Observer> observer;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    const auto entry = _live.find(node);
    if (entry == _live.end()) return;
    observer = entry->second;
    _freed.insert(*entry);
    _live.erase(entry);
  }
  observer->close();
}

Match anyMessage() {
  return [](const omx_message&) { return true; };
}

Match anyEvent() {
  return [](const omx_message& message) { return message.type == omx_message::EVENT; };
}

Match eventIs(OMX_EVENTTYPE event) {
  return [=](const omx_message& message) {
    return message.type == omx_message::EVENT && message.u.event_data.event == event;
  };
}

Match commandComplete(OMX_COMMANDTYPE command) {
  return [=](const omx_message& message) {
    return eventIs(OMX_EventCmdComplete)(message) &&
           message.u.event_data.data1 == static_cast<OMX_U32>(command);
  };
}

Match commandComplete(OMX_COMMANDTYPE command, OMX_U32 data) {
  return [=](const omx_message& message) {
    return commandComplete(command)(message) && message.u.event_data.data2 == data;
  };
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
