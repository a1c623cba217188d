// Waiting in session tests: a call on a thread of its own whose result is waited for with a limit, and a
// gate that threads stop at until a test lets them go on. Where a limit passes, the session hangs: there
// is no way to clean up behind that, so the program says where it was and ends.
#pragma once

#include <stdio.h>
#include <stdlib.h>

#include <atomic>
#include <functional>
#include <future>
#include <utility>

#include "tests/support/eventually.h"

namespace omxtest {

// What a hung test tells of itself before it ends; set by fixtures.
inline std::function<void()>& hangReport() {
  static std::function<void()> report;
  return report;
}

inline void require(bool came, const char* what) {
  if (came) return;
  fprintf(stderr, "HANG: %s did not come within the limit\n", what);
  if (hangReport()) hangReport()();
  abort();
}

template <typename Predicate>
void requireEventually(Predicate predicate, const char* what) {
  require(eventually(std::move(predicate)), what);
}

// A call in progress. The object waits for it at its end.
class Later {
 public:
  Later(const char* what, std::function<int()> call)
      : _what(what), _future(std::async(std::launch::async, std::move(call))) {}
  Later(Later&&) = default;
  ~Later() {
    if (_future.valid()) result();
  }

  bool isDone() const { return _future.wait_for(std::chrono::seconds(0)) == std::future_status::ready; }
  int result() {
    require(_future.wait_for(kWaitLimit) == std::future_status::ready, _what);
    return _future.get();
  }

 private:
  const char* _what;
  std::future<int> _future;
};

// Threads stop at pass() until open() is called, once and for all.
class Gate {
 public:
  ~Gate() { open(); }
  void pass() {
    _arrived = true;
    requireEventually([this] { return _open.load(); }, "opening a gate");
  }
  // Until a thread has come to the gate.
  void waitForArrival() {
    requireEventually([this] { return _arrived.load(); }, "arrival at a gate");
  }
  void open() { _open = true; }

 private:
  std::atomic<bool> _arrived{false};
  std::atomic<bool> _open{false};
};

}  // namespace omxtest
