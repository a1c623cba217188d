// Code of a test's that runs just before a thread waits for, or posts, one semaphore; on that thread, and it
// may block. The test executable replaces the two functions, so the product runs as it ships. One at a time.
#pragma once

#include <semaphore.h>

#include <functional>

namespace omxtest {

enum class SemaphoreCall { Wait, Post };

class SemaphoreHook {
 public:
  SemaphoreHook(sem_t& semaphore, std::function<void(SemaphoreCall)> run);
  ~SemaphoreHook();
  SemaphoreHook(const SemaphoreHook&) = delete;
  SemaphoreHook& operator=(const SemaphoreHook&) = delete;
};

}  // namespace omxtest
