#include "tests/decoder/failing_malloc.h"

namespace {

size_t g_failingSize = 0;  // 0: none; accessed atomically

}  // namespace

namespace faults {

FailedMalloc::FailedMalloc(size_t size) {
  __atomic_store_n(&g_failingSize, size, __ATOMIC_SEQ_CST);
}

FailedMalloc::~FailedMalloc() {
  __atomic_store_n(&g_failingSize, size_t{0}, __ATOMIC_SEQ_CST);
}

bool FailedMalloc::happened() const {
  return __atomic_load_n(&g_failingSize, __ATOMIC_SEQ_CST) == 0;
}

}  // namespace faults

// Memory still comes from where it would, and goes back there. Where a sanitizer is part of the executable,
// its own form is behind the first name.
extern "C" void* __interceptor_malloc(size_t size) __attribute__((weak));
extern "C" void* __libc_malloc(size_t size);

// Called before the program, and the sanitizers, are up: nothing in here may need them.
extern "C" __attribute__((visibility("default"), no_sanitize("address", "thread", "undefined"))) void* malloc(
    size_t size) {
  size_t expected = size;
  if (size != 0 && __atomic_load_n(&g_failingSize, __ATOMIC_SEQ_CST) == size &&
      __atomic_compare_exchange_n(&g_failingSize, &expected, size_t{0}, false, __ATOMIC_SEQ_CST,
                                  __ATOMIC_SEQ_CST)) {
    return nullptr;
  }
  return __interceptor_malloc != nullptr ? __interceptor_malloc(size) : __libc_malloc(size);
}
