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
  ~Worker() {
    start(nullptr);
    _thread.join();
  }

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
  int result() const { return _result; }

 private:
  void run() {
    std::unique_lock<std::mutex> lock(_mutex);
    for (;;) {
      _changed.wait(lock, [this] { return _due; });
      if (!_call) return;
      lock.unlock();
      _result = _call();
      lock.lock();
      _due = false;
    }
  }

  mutable std::mutex _mutex;  // guards _due, which says whose turn the others are
  std::condition_variable _changed;
  std::function<int()> _call;
  int _result = 0;
  bool _due = false;
  std::thread _thread{[this] { run(); }};  // last: it uses the others
};

}  // namespace omxtest
