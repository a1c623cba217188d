#include "tests/core/faults.h"

#include <dlfcn.h>
#include <errno.h>
#include <pthread.h>

#include <atomic>
#include <new>

namespace faults {

namespace {

std::atomic<size_t> g_failing[2];  // by function; 0: none

std::atomic<size_t>& failing(Failing function) {
  return g_failing[static_cast<size_t>(function)];
}

bool memoryFailsNow(size_t size) {
  size_t expected = size;
  return size != 0 && failing(Failing::Memory).compare_exchange_strong(expected, 0);
}

bool threadFailsNow() {
  size_t left = failing(Failing::Thread);
  while (left > 0 && !failing(Failing::Thread).compare_exchange_weak(left, left - 1)) {
  }
  return left == 1;
}

}  // namespace

Fault::Fault(Failing function, size_t number) : _function(function) {
  failing(function) = number;
}
Fault::~Fault() {
  failing(_function) = 0;
}

}  // namespace faults

using faults::Failing;

// Memory still comes from the library's (or a sanitizer's) own form, and goes back to it.
void* operator new(size_t size, const std::nothrow_t& /*unused*/) noexcept {
  return faults::memoryFailsNow(size) ? nullptr : ::operator new(size);
}

// Where a sanitizer is part of the executable, its own form is behind this name.
extern "C" {
int __interceptor_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*)
    __attribute__((weak));

__attribute__((visibility("default"))) int pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                                                          void* (*entry)(void*), void* argument) {
  if (faults::threadFailsNow()) return EAGAIN;
  static auto* const create =
      __interceptor_pthread_create != nullptr
          ? &__interceptor_pthread_create
          : reinterpret_cast<decltype(&pthread_create)>(dlsym(RTLD_NEXT, "pthread_create"));
  return create(thread, attributes, entry, argument);
}
}
