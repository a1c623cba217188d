// Keeps all processors from sleeping while it lives, by threads that work only when nobody else does. How
// long a processor takes to wake differs from machine to machine by more than what a session costs.
#pragma once

#include <atomic>
#include <thread>
#include <vector>

namespace bench {

class Awake {
 public:
  Awake();
  ~Awake();
  Awake(const Awake&) = delete;
  Awake& operator=(const Awake&) = delete;

 private:
  std::atomic<bool> _over{false};
  std::vector<std::thread> _threads;
};

}  // namespace bench
