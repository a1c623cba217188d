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
  struct Entry {
    android::omx_message message;
    std::function<void()> before;
  };

  // Until nothing waits or the queue is closed. Only while nobody else delivers.
  void deliverAll(std::unique_lock<std::mutex>& lock, const android::wp<android::IOMXObserver>& observer);

  std::mutex mutex;  // guards everything below
  std::condition_variable changed;
  std::deque<Entry> messages;
  bool untold = false;  // something was queued since the last wake
  bool delivering = false;
  bool closed = false;
};

void MessageChannel::Queue::deliverAll(std::unique_lock<std::mutex>& lock,
                                       const android::wp<android::IOMXObserver>& observer) {
  delivering = true;
  while (!closed && !messages.empty()) {
    const Entry entry = std::move(messages.front());
    messages.pop_front();
    lock.unlock();
    if (entry.before) entry.before();
    {
      // It may be the last one that holds the observer by then, and the end of the block that of the channel.
      const android::sp<android::IOMXObserver> client = observer.promote();
      if (client != nullptr) client->onMessage(entry.message);
    }
    lock.lock();
  }
  delivering = false;
  if (closed) changed.notify_all();
}

MessageChannel::MessageChannel(const android::sp<android::IOMXObserver>& observer) : _observer(observer) {}

MessageChannel::~MessageChannel() {
  shut();
  if (tDelivering == this) {
    tDelivering = nullptr;
    _thread.detach();
  } else {
    awaitEnd();
  }
}

std::shared_ptr<MessageChannel::Queue> MessageChannel::present() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _queue;
}

bool MessageChannel::open() {
  const auto isOpen = [this] {
    const std::shared_ptr<Queue> queue = present();
    if (queue == nullptr) return false;
    std::lock_guard<std::mutex> lock(queue->mutex);
    return !queue->closed;
  };
  // From inside a delivery, which a close in progress waits for.
  if (tDelivering == this) return isOpen();
  std::lock_guard<std::mutex> lifecycle(_lifecycle);
  if (isOpen()) return true;
  awaitEnd();  // closed from inside a delivery, which may still run
  auto queue = std::make_shared<Queue>();
  try {
    _thread = std::thread(&MessageChannel::run, this, queue, _observer);
  } catch (const std::system_error&) {
    return false;
  }
  std::lock_guard<std::mutex> lock(_mutex);
  _queue = std::move(queue);
  return true;
}

void MessageChannel::queue(const android::omx_message& message, std::function<void()> before) {
  const std::shared_ptr<Queue> queue = present();
  if (queue == nullptr) return;
  std::lock_guard<std::mutex> lock(queue->mutex);
  if (queue->closed) return;
  queue->messages.push_back({message, std::move(before)});
  queue->untold = true;
}

void MessageChannel::wake() {
  const std::shared_ptr<Queue> queue = present();
  if (queue == nullptr) return;
  {
    std::lock_guard<std::mutex> lock(queue->mutex);
    if (!std::exchange(queue->untold, false)) return;
  }
  queue->changed.notify_one();  // outside, so that the thread that wakes need not wait for the lock
}

void MessageChannel::deliver() {
  const std::shared_ptr<Queue> queue = present();
  if (queue == nullptr) return;
  std::unique_lock<std::mutex> lock(queue->mutex);
  queue->untold = false;
  if (queue->delivering) return;
  const MessageChannel* const outer = std::exchange(tDelivering, this);
  queue->deliverAll(lock, _observer);
  tDelivering = outer;
}

void MessageChannel::close() {
  if (tDelivering == this) return shut();
  // Both under the lock: in between somebody might open the channel again, and the end to wait for would be
  // that of a thread that has just begun.
  std::lock_guard<std::mutex> lifecycle(_lifecycle);
  shut();
  awaitEnd();
}

void MessageChannel::shut() {
  const std::shared_ptr<Queue> queue = present();
  if (queue == nullptr) return;
  std::deque<Queue::Entry> dropped;  // ends without the lock
  std::lock_guard<std::mutex> lock(queue->mutex);
  queue->closed = true;
  dropped.swap(queue->messages);
  queue->changed.notify_all();
}

void MessageChannel::awaitEnd() {
  if (_thread.joinable()) _thread.join();
  const std::shared_ptr<Queue> queue = present();
  if (queue == nullptr) return;
  std::unique_lock<std::mutex> lock(queue->mutex);
  queue->changed.wait(lock, [&] { return !queue->delivering; });
}

void MessageChannel::run(const MessageChannel* channel, std::shared_ptr<Queue> queue,
                         const android::wp<android::IOMXObserver>& observer) {
  tDelivering = channel;
  std::unique_lock<std::mutex> lock(queue->mutex);
  for (;;) {
    queue->changed.wait(lock,
                        [&] { return queue->closed || (!queue->messages.empty() && !queue->delivering); });
    if (queue->closed) return;
    queue->deliverAll(lock, observer);
  }
}

}  // namespace mediaserver
