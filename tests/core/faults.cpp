#include "tests/core/faults.h"

#include <dlfcn.h>
#include <errno.h>
#include <pthread.h>

#include <atomic>
#include <mutex>
#include <new>
#include <utility>

namespace {

using Form = faults::FailedAllocation::Form;

std::atomic<size_t> g_failingSizes[2];   // by form; 0: none
std::atomic<int> g_threadsToFailure{0};  // 0: none

std::atomic<size_t>& failingSize(Form form) {
  return g_failingSizes[form == Form::Throws ? 1 : 0];
}

// True for the one allocation that is to fail.
bool failsNow(size_t size, Form form) {
  size_t expected = size;
  return size != 0 && failingSize(form).compare_exchange_strong(expected, 0);
}

bool threadFailsNow() {
  int left = g_threadsToFailure;
  while (left > 0 && !g_threadsToFailure.compare_exchange_weak(left, left - 1)) {
  }
  return left == 1;
}

std::mutex g_hookMutex;  // guards the two below
faults::ThreadHook::Entry g_hookedEntry = nullptr;
std::function<void()> g_hook;

void runThreadHook(faults::ThreadHook::Entry entry) {
  std::function<void()> hook;
  {
    const std::lock_guard<std::mutex> lock(g_hookMutex);
    if (entry == g_hookedEntry) hook = g_hook;
  }
  if (hook) hook();
}

}  // namespace

namespace faults {

FailedAllocation::FailedAllocation(size_t size, Form form) : _form(form) {
  failingSize(form) = size;
}

FailedAllocation::~FailedAllocation() {
  failingSize(_form) = 0;
}

bool FailedAllocation::happened() const {
  return failingSize(_form) == 0;
}

FailedThread::FailedThread(int nth) {
  g_threadsToFailure = nth;
}

FailedThread::~FailedThread() {
  g_threadsToFailure = 0;
}

bool FailedThread::happened() const {
  return g_threadsToFailure == 0;
}

ThreadHook::ThreadHook(Entry entry, std::function<void()> before) {
  const std::lock_guard<std::mutex> lock(g_hookMutex);
  g_hookedEntry = entry;
  g_hook = std::move(before);
}

ThreadHook::~ThreadHook() {
  const std::lock_guard<std::mutex> lock(g_hookMutex);
  g_hookedEntry = nullptr;
  g_hook = nullptr;
}

}  // namespace faults

// Memory still comes from the library's (or a sanitizer's) own form, and goes back to it.
void* operator new(size_t size) {
  using New = void* (*)(size_t);
  static const auto next = reinterpret_cast<New>(dlsym(RTLD_NEXT, "_Znwm"));
  if (failsNow(size, Form::Throws)) throw std::bad_alloc();
  return next(size);
}

void* operator new(size_t size, const std::nothrow_t& /*unused*/) noexcept {
  if (failsNow(size, Form::ReturnsNull)) return nullptr;
  try {
    return ::operator new(size);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

void* operator new(size_t size, std::align_val_t alignment, const std::nothrow_t& /*unused*/) noexcept {
  if (failsNow(size, Form::ReturnsNull)) return nullptr;
  try {
    return ::operator new(size, alignment);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

// Where a sanitizer is part of the executable, its own form is behind this name.
extern "C" int __interceptor_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*)
    __attribute__((weak));

extern "C" __attribute__((visibility("default"))) int pthread_create(pthread_t* thread,
                                                                     const pthread_attr_t* attributes,
                                                                     void* (*entry)(void*), void* argument) {
  runThreadHook(entry);
  if (threadFailsNow()) return EAGAIN;
  using Create = int (*)(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
  static const auto next = __interceptor_pthread_create != nullptr
                               ? &__interceptor_pthread_create
                               : reinterpret_cast<Create>(dlsym(RTLD_NEXT, "pthread_create"));
  return next(thread, attributes, entry, argument);
}
