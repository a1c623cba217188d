#include "host/mediaserver/message_channel.h"

#include <condition_variable>
#include <deque>
#include <mutex>
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

  explicit Queue(const android::sp<android::IOMXObserver>& client) : observer(client) {}
  // Until nothing waits or the queue is closed. Only while nobody else delivers.
  void deliverAll(std::unique_lock<std::mutex>& lock);

  const android::wp<android::IOMXObserver> observer;
  std::mutex mutex;  // guards everything below
  std::condition_variable changed;
  std::deque<Entry> messages;
  bool untold = false;  // something was queued since the last wake
  bool delivering = false;
  bool closed = false;
};

void MessageChannel::Queue::deliverAll(std::unique_lock<std::mutex>& lock) {
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

MessageChannel::MessageChannel(const android::sp<android::IOMXObserver>& observer)
    : _queue(std::make_shared<Queue>(observer)) {}

MessageChannel::~MessageChannel() {
  shut();
  if (tDelivering == this) {
    tDelivering = nullptr;
    _thread.detach();
  } else {
    awaitEnd();
  }
}

bool MessageChannel::open() {
  try {
    _thread = std::thread(&MessageChannel::run, this, _queue);
  } catch (const std::system_error&) {
    return false;
  }
  return true;
}

void MessageChannel::queue(const android::omx_message& message, std::function<void()> before) {
  const std::lock_guard<std::mutex> lock(_queue->mutex);
  if (_queue->closed) return;
  _queue->messages.push_back({message, std::move(before)});
  _queue->untold = true;
}

void MessageChannel::wake() {
  {
    const std::lock_guard<std::mutex> lock(_queue->mutex);
    if (!std::exchange(_queue->untold, false)) return;
  }
  _queue->changed.notify_one();  // outside, so that the thread that wakes need not wait for the lock
}

void MessageChannel::deliver() {
  std::unique_lock<std::mutex> lock(_queue->mutex);
  _queue->untold = false;
  if (_queue->delivering) return;
  const MessageChannel* const outer = std::exchange(tDelivering, this);
  _queue->deliverAll(lock);
  tDelivering = outer;
}

void MessageChannel::close() {
  shut();
  if (tDelivering != this) awaitEnd();
}

void MessageChannel::shut() {
  std::deque<Queue::Entry> dropped;  // ends without the lock
  const std::lock_guard<std::mutex> lock(_queue->mutex);
  _queue->closed = true;
  dropped.swap(_queue->messages);
  _queue->changed.notify_all();
}

void MessageChannel::awaitEnd() {
  if (_thread.joinable()) _thread.join();
  std::unique_lock<std::mutex> lock(_queue->mutex);
  _queue->changed.wait(lock, [this] { return !_queue->delivering; });
}

void MessageChannel::run(const MessageChannel* channel, const std::shared_ptr<Queue>& queue) {
  tDelivering = channel;
  std::unique_lock<std::mutex> lock(queue->mutex);
  for (;;) {
    queue->changed.wait(lock,
                        [&] { return queue->closed || (!queue->messages.empty() && !queue->delivering); });
    if (queue->closed) return;
    queue->deliverAll(lock);
  }
}

}  // namespace mediaserver
