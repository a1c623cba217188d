#include "tests/decoder/semaphore_hook.h"

#include <dlfcn.h>

#include <mutex>
#include <utility>

namespace omxtest {

namespace {

std::mutex g_mutex;  // guards both
sem_t* g_semaphore = nullptr;
std::function<void(SemaphoreCall)> g_run;

void runHook(const sem_t* semaphore, SemaphoreCall call) {
  std::function<void(SemaphoreCall)> run;
  {
    const std::lock_guard<std::mutex> lock(g_mutex);
    if (semaphore != g_semaphore) return;
    run = g_run;
  }
  run(call);
}

}  // namespace

SemaphoreHook::SemaphoreHook(sem_t& semaphore, std::function<void(SemaphoreCall)> run) {
  const std::lock_guard<std::mutex> lock(g_mutex);
  g_semaphore = &semaphore;
  g_run = std::move(run);
}

SemaphoreHook::~SemaphoreHook() {
  const std::lock_guard<std::mutex> lock(g_mutex);
  g_semaphore = nullptr;
  g_run = nullptr;
}

}  // namespace omxtest

// Where a sanitizer is part of the executable, its own forms are behind these names.
extern "C" int __interceptor_sem_wait(sem_t*) __attribute__((weak));
extern "C" int __interceptor_sem_post(sem_t*) __attribute__((weak));

using SemaphoreFunction = int (*)(sem_t*);

extern "C" __attribute__((visibility("default"))) int sem_wait(sem_t* semaphore) {
  omxtest::runHook(semaphore, omxtest::SemaphoreCall::Wait);
  static const auto next = __interceptor_sem_wait != nullptr
                               ? &__interceptor_sem_wait
                               : reinterpret_cast<SemaphoreFunction>(dlsym(RTLD_NEXT, "sem_wait"));
  return next(semaphore);
}

extern "C" __attribute__((visibility("default"))) int sem_post(sem_t* semaphore) noexcept {
  omxtest::runHook(semaphore, omxtest::SemaphoreCall::Post);
  static const auto next = __interceptor_sem_post != nullptr
                               ? &__interceptor_sem_post
                               : reinterpret_cast<SemaphoreFunction>(dlsym(RTLD_NEXT, "sem_post"));
  return next(semaphore);
}
