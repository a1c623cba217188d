// One observer's messages: a queue and the thread that delivers it, one message at a time and strictly in the
// order in which they were queued. They may be queued under the caller's locks; the observer is called
// without any lock of ours, on the delivery thread or on one that calls deliver(). The channel does not keep
// the observer alive, except while it is called.
#pragma once

#include <functional>
#include <memory>
#include <thread>

#include <media/IOMX.h>
#include <utils/RefBase.h>

namespace mediaserver {

class MessageChannel {
 public:
  explicit MessageChannel(const android::sp<android::IOMXObserver>& observer);
  ~MessageChannel();  // closes; may run inside a delivery on the channel's own thread
  MessageChannel(const MessageChannel&) = delete;
  MessageChannel& operator=(const MessageChannel&) = delete;

  // Starts the delivery thread; once, before everything else. False when the system has no thread left.
  [[nodiscard]] bool open();

  // Queues a message; drops it once the channel is closed. `before`, if there is one, runs before the message
  // is delivered, on the same thread. The delivery thread need not see the message before the next wake:
  // where a processor sleeps, to wake one takes longer than all the rest, so messages that come together wake
  // it once.
  void queue(const android::omx_message& message, std::function<void()> before = nullptr);
  void wake();
  void post(const android::omx_message& message) {
    queue(message);
    wake();
  }

  // Delivers what waits on the calling thread, which nobody has to wake for it; leaves it to the thread that
  // delivers at the moment, if one does. The caller holds no lock, and sees to it that the channel, which may
  // well be closed meanwhile, is still there at the end.
  void deliver();

  // Drops what waits and returns when no delivery is in progress; nothing is delivered from then on. Called
  // from inside a delivery, it does not wait for that one. By one thread at a time.
  void close();

 private:
  struct Queue;
  static void run(const MessageChannel* channel, const std::shared_ptr<Queue>& queue);
  void shut();
  void awaitEnd();

  const std::shared_ptr<Queue> _queue;  // shared with the delivery thread, which may outlive the channel
  std::thread _thread;
};

}  // namespace mediaserver
