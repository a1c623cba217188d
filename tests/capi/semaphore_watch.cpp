#include "tests/capi/semaphore_watch.h"

#include <dlfcn.h>
#include <semaphore.h>

#include <atomic>
#include <mutex>
#include <set>

namespace {

std::atomic<int> misuses{0};

// The semaphores that exist. Held over each call: what is used is not destroyed in between.
struct Semaphores {
  std::mutex lock;
  std::set<sem_t*> existing;
};

Semaphores& semaphores() {
  static auto& kSemaphores = *new Semaphores;
  return kSemaphores;
}

template <typename Function>
Function* next(const char* name) {
  return reinterpret_cast<Function*>(dlsym(RTLD_NEXT, name));
}

}  // namespace

int omxtest::semaphoreMisuses() {
  return misuses;
}

#define EXPORTED extern "C" __attribute__((visibility("default")))

EXPORTED int sem_init(sem_t* semaphore, int shared, unsigned int value) noexcept {
  static auto* const forward = next<int(sem_t*, int, unsigned int)>("sem_init");
  const std::lock_guard<std::mutex> held(semaphores().lock);
  if (!semaphores().existing.insert(semaphore).second) ++misuses;
  return forward(semaphore, shared, value);
}

EXPORTED int sem_post(sem_t* semaphore) noexcept {
  static auto* const forward = next<int(sem_t*)>("sem_post");
  const std::lock_guard<std::mutex> held(semaphores().lock);
  if (!semaphores().existing.contains(semaphore)) ++misuses;
  return forward(semaphore);
}

EXPORTED int sem_destroy(sem_t* semaphore) noexcept {
  static auto* const forward = next<int(sem_t*)>("sem_destroy");
  const std::lock_guard<std::mutex> held(semaphores().lock);
  if (semaphores().existing.erase(semaphore) == 0) ++misuses;
  return forward(semaphore);
}
