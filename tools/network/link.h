// The way from the encoder to the decoder: coded pictures in order, on the thread of whoever takes them.
// Any thread.
#pragma once

#include <stdint.h>

#include <condition_variable>
#include <deque>
#include <mutex>
#include <optional>
#include <stop_token>
#include <vector>

#include "tools/base/clock.h"

namespace tool {

struct CodedPicture {
  std::vector<uint8_t> bytes;
  uint32_t timestamp = 0;
  bool isKey = false;
  int64_t networkDelay = 0;  // microseconds of the video that it was under way
};

class Link {
 public:
  // Never waits: it is called from the encoder's callback. The feeder keeps the queue short.
  void push(CodedPicture picture) {
    const std::lock_guard held(_mutex);
    _queue.push_back(std::move(picture));
    _changed.notify_all();
  }

  // No more will come.
  void close() {
    const std::lock_guard held(_mutex);
    _closed = true;
    _changed.notify_all();
  }

  // The next picture. Nothing when the link is closed and empty, or a stop has been requested.
  std::optional<CodedPicture> pop(const std::stop_token& stop) {
    std::unique_lock held(_mutex);
    if (!_changed.wait(held, stop, [this] { return _closed || !_queue.empty(); }) || _queue.empty()) {
      return std::nullopt;
    }
    CodedPicture picture = std::move(_queue.front());
    _queue.pop_front();
    _changed.notify_all();
    return picture;
  }

  // Waits until fewer than `limit` pictures are under way. False once a stop has been requested or the
  // deadline is over.
  bool waitForRoom(size_t limit, const std::stop_token& stop, std::optional<Clock::time_point> deadline) {
    std::unique_lock held(_mutex);
    const auto ready = [&] { return _queue.size() < limit; };
    return deadline ? _changed.wait_until(held, stop, *deadline, ready) : _changed.wait(held, stop, ready);
  }

 private:
  std::mutex _mutex;
  std::condition_variable_any _changed;
  std::deque<CodedPicture> _queue;
  bool _closed = false;
};

}  // namespace tool
