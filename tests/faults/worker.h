// A thread that makes one call after the other for somebody who does not want to wait in them. Made before
// faults are, so that its own thread is none of those that fail.
#pragma once

#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>
#include <utility>

namespace omxtest {

class Worker {
 public:
  Worker() : _thread([this] { run(); }) {}
  ~Worker() {
    start(nullptr);
    _thread.join();
  }
  Worker(const Worker&) = delete;
  Worker& operator=(const Worker&) = delete;

  // The last call has to be done. Null: the end of the thread.
  void start(std::function<int()> call) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _call = std::move(call);
    _due = true;
    _changed.notify_all();
  }
  bool isDone() const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return !_due;
  }
  // Of the last call, which is done.
  int result() const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return _result;
  }

 private:
  void run() {
    std::unique_lock<std::mutex> lock(_mutex);
    for (;;) {
      _changed.wait(lock, [this] { return _due; });
      if (!_call) return;
      const auto call = std::exchange(_call, nullptr);
      lock.unlock();
      const int result = call();
      lock.lock();
      _result = result;
      _due = false;
    }
  }

  mutable std::mutex _mutex;  // guards everything below; not held during a call
  std::condition_variable _changed;
  std::function<int()> _call;
  bool _due = false;
  int _result = 0;
  std::thread _thread;  // last: it uses the others
};

}  // namespace omxtest
