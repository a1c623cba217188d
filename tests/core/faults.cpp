#include "tests/core/faults.h"

#include <dlfcn.h>
#include <errno.h>
#include <pthread.h>

#include <new>
#include <type_traits>

#include "omxbridge/omxbridge.h"

namespace faults {

namespace {

// Accessed atomically, also by a malloc() that is called before the program is up: no constructors.
size_t g_failing[4];  // by function; 0: none

size_t& failing(Failing function) {
  return g_failing[static_cast<size_t>(function)];
}

// Whether it is the product's code: others, the test's own among them, may ask for as many bytes.
bool isProduct(void* code) {
  Dl_info product = {};
  Dl_info caller = {};
  return dladdr(reinterpret_cast<void*>(&decoder_create), &product) != 0 && dladdr(code, &caller) != 0 &&
         caller.dli_fbase == product.dli_fbase;
}

// True for the one allocation that is to fail.
__attribute__((no_sanitize("address", "thread", "undefined"))) bool failsNow(Failing function, size_t size,
                                                                             void* caller) {
  size_t* const place = &g_failing[static_cast<size_t>(function)];
  size_t expected = size;
  return size != 0 && __atomic_load_n(place, __ATOMIC_SEQ_CST) == size && isProduct(caller) &&
         __atomic_compare_exchange_n(place, &expected, size_t{0}, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST);
}

bool threadFailsNow() {
  size_t* const place = &failing(Failing::Thread);
  size_t left = __atomic_load_n(place, __ATOMIC_SEQ_CST);
  while (left > 0 &&
         !__atomic_compare_exchange_n(place, &left, left - 1, false, __ATOMIC_SEQ_CST, __ATOMIC_SEQ_CST)) {
  }
  return left == 1;
}

}  // namespace

Fault::Fault(Failing function, size_t number) : _function(function) {
  __atomic_store_n(&failing(function), number, __ATOMIC_SEQ_CST);
}
Fault::~Fault() {
  __atomic_store_n(&failing(_function), size_t{0}, __ATOMIC_SEQ_CST);
}
size_t Fault::left() const {
  return __atomic_load_n(&failing(_function), __ATOMIC_SEQ_CST);
}

}  // namespace faults

using faults::Failing;

// Memory still comes from the library's (or a sanitizer's) own form, and goes back to it.
void* operator new(size_t size) {
  using New = void* (*)(size_t);
  constexpr const char* kName = std::is_same_v<size_t, unsigned long> ? "_Znwm" : "_Znwj";
  static const auto next = reinterpret_cast<New>(dlsym(RTLD_NEXT, kName));
  if (faults::failsNow(Failing::New, size, __builtin_return_address(0))) throw std::bad_alloc();
  return next(size);
}

void* operator new(size_t size, const std::nothrow_t& /*unused*/) noexcept {
  return faults::failsNow(Failing::NothrowNew, size, __builtin_return_address(0)) ? nullptr
                                                                                  : ::operator new(size);
}

void* operator new(size_t size, std::align_val_t alignment, const std::nothrow_t& /*unused*/) noexcept {
  return faults::failsNow(Failing::NothrowNew, size, __builtin_return_address(0))
             ? nullptr
             : ::operator new(size, alignment);
}

// Where a sanitizer is part of the executable, its own forms are behind these names.
#define REPLACED extern "C" __attribute__((visibility("default")))
extern "C" {
void* __interceptor_malloc(size_t size) __attribute__((weak));
void* __libc_malloc(size_t size);
int __interceptor_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*)
    __attribute__((weak));
}

// Called before the program, and the sanitizers, are up: nothing in here may need them.
REPLACED __attribute__((no_sanitize("address", "thread", "undefined"))) void* malloc(size_t size) {
  if (faults::failsNow(Failing::Malloc, size, __builtin_return_address(0))) return nullptr;
  return __interceptor_malloc != nullptr ? __interceptor_malloc(size) : __libc_malloc(size);
}

REPLACED int pthread_create(pthread_t* thread, const pthread_attr_t* attributes, void* (*entry)(void*),
                            void* argument) {
  if (faults::threadFailsNow()) return EAGAIN;
  static auto* const create =
      __interceptor_pthread_create != nullptr
          ? &__interceptor_pthread_create
          : reinterpret_cast<decltype(&pthread_create)>(dlsym(RTLD_NEXT, "pthread_create"));
  return create(thread, attributes, entry, argument);
}
