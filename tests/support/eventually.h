#pragma once
// Waiting in tests, always with a limit.

#include <chrono>
#include <thread>

namespace omxtest {

inline constexpr std::chrono::milliseconds kWaitLimit{20000};

// True as soon as `predicate` is; false when the limit has passed. Asks again and again: where something
// can be waited for (calls, messages, inputs, log lines), wait for that instead.
template <typename Predicate>
[[nodiscard]] bool eventually(Predicate predicate, std::chrono::milliseconds limit = kWaitLimit) {
  const auto end = std::chrono::steady_clock::now() + limit;
  while (!predicate()) {
    if (std::chrono::steady_clock::now() >= end) return false;
    std::this_thread::yield();
  }
  return true;
}

}  // namespace omxtest
