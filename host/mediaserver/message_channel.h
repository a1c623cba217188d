// One observer's messages: a queue and the thread that delivers it, strictly in the order in which they were
// queued. They may be queued under the caller's locks; the observer is called without any lock of ours and
// never on the caller's thread. The channel does not keep the observer alive, except while it is called.
#pragma once

#include <functional>
#include <memory>
#include <mutex>
#include <thread>

#include <media/IOMX.h>
#include <utils/RefBase.h>

namespace mediaserver {

class MessageChannel {
 public:
  explicit MessageChannel(const android::sp<android::IOMXObserver>& observer);
  ~MessageChannel();  // closes; may run inside a delivery of its own
  MessageChannel(const MessageChannel&) = delete;
  MessageChannel& operator=(const MessageChannel&) = delete;

  // Starts the delivery thread, or does nothing when it runs. False when the system has no thread left.
  [[nodiscard]] bool open();

  // Queues a message; drops it unless the channel is open. `before`, if there is one, runs on the delivery
  // thread before the message is delivered. The thread need not see the message before the next wake: where a
  // processor sleeps, to wake one takes longer than all the rest, so messages that come together wake it
  // once.
  void queue(const android::omx_message& message, std::function<void()> before = nullptr);
  void wake();
  void post(const android::omx_message& message) {
    queue(message);
    wake();
  }

  // Drops what waits and returns when no delivery is in progress; nothing is delivered from then on until
  // the channel is opened again. Called from inside a delivery, it does not wait for that one.
  void close();

 private:
  struct Queue;
  static void deliver(const MessageChannel* channel, std::shared_ptr<Queue> queue,
                      const android::wp<android::IOMXObserver>& observer);
  void shut();

  const android::wp<android::IOMXObserver> _observer;
  std::mutex _lifecycle;  // guards _thread; held while it is joined
  std::thread _thread;
  std::mutex _mutex;              // guards _queue
  std::shared_ptr<Queue> _queue;  // null unless open; shared with the delivery thread
};

}  // namespace mediaserver
