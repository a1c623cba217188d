#include "host/mediaserver/message_channel.h"

#include <condition_variable>
#include <deque>
#include <system_error>
#include <utility>

namespace mediaserver {

namespace {
// The channel whose message this thread delivers: it must not wait for itself.
thread_local const MessageChannel* tDelivering = nullptr;
}  // namespace

// Outlives a channel that is destroyed inside a delivery, until the delivery thread has left.
struct MessageChannel::Queue {
  std::mutex mutex;
  std::condition_variable changed;
  struct Entry {
    android::omx_message message;
    std::function<void()> before;
  };
  std::deque<Entry> messages;
  bool untold = false;  // something was queued since the last wake
  bool closed = false;
};

MessageChannel::MessageChannel(const android::sp<android::IOMXObserver>& observer) : _observer(observer) {}

MessageChannel::~MessageChannel() {
  shut();
  if (tDelivering == this) {
    tDelivering = nullptr;
    _thread.detach();
  } else if (_thread.joinable()) {
    _thread.join();
  }
}

bool MessageChannel::open() {
  const auto isOpen = [this] {
    std::lock_guard<std::mutex> lock(_mutex);
    return _queue != nullptr;
  };
  // From inside a delivery, which a close in progress waits for.
  if (tDelivering == this) return isOpen();
  std::lock_guard<std::mutex> lifecycle(_lifecycle);
  if (isOpen()) return true;
  if (_thread.joinable()) _thread.join();  // closed from inside a delivery, which may still run
  auto queue = std::make_shared<Queue>();
  try {
    _thread = std::thread(&MessageChannel::deliver, this, queue, _observer);
  } catch (const std::system_error&) {
    return false;
  }
  std::lock_guard<std::mutex> lock(_mutex);
  _queue = std::move(queue);
  return true;
}

void MessageChannel::queue(const android::omx_message& message, std::function<void()> before) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_queue == nullptr) return;
  std::lock_guard<std::mutex> queueLock(_queue->mutex);
  _queue->messages.push_back({message, std::move(before)});
  _queue->untold = true;
}

void MessageChannel::wake() {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_queue == nullptr) return;
  {
    std::lock_guard<std::mutex> queueLock(_queue->mutex);
    if (!std::exchange(_queue->untold, false)) return;
  }
  _queue->changed.notify_one();  // outside, so that the thread that wakes need not wait for the lock
}

void MessageChannel::close() {
  if (tDelivering == this) return shut();
  // Both under the lock: in between somebody might open the channel again, and the thread to wait for
  // would be one that has just begun.
  std::lock_guard<std::mutex> lifecycle(_lifecycle);
  shut();
  if (_thread.joinable()) _thread.join();
}

void MessageChannel::shut() {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_queue == nullptr) return;
  {
    std::lock_guard<std::mutex> queueLock(_queue->mutex);
    _queue->closed = true;
    _queue->messages.clear();
    _queue->changed.notify_one();
  }
  _queue = nullptr;
}

void MessageChannel::deliver(const MessageChannel* channel, std::shared_ptr<Queue> queue,
                             const android::wp<android::IOMXObserver>& observer) {
  tDelivering = channel;
  std::unique_lock<std::mutex> lock(queue->mutex);
  for (;;) {
    queue->changed.wait(lock, [&] { return queue->closed || !queue->messages.empty(); });
    if (queue->closed) return;
    const Queue::Entry entry = std::move(queue->messages.front());
    queue->messages.pop_front();
    lock.unlock();
    if (entry.before) entry.before();
    {
      // It may be the last one that holds the observer by then, and the end of the block that of the channel.
      const android::sp<android::IOMXObserver> client = observer.promote();
      if (client != nullptr) client->onMessage(entry.message);
    }
    lock.lock();
  }
}

}  // namespace mediaserver
