#include "host/binder/memory_faults.h"

#include <mutex>

#include <omxhost/faults.h>

namespace omxhost {

namespace {

constinit std::mutex mutex;
uint64_t asked = 0;
uint64_t failing = 0;

}  // namespace

bool memoryBlockFails() {
  const std::lock_guard lock(mutex);
  return ++asked == failing;
}

void failMemoryBlock(uint64_t n) {
  const std::lock_guard lock(mutex);
  asked = 0;
  failing = n;
}

uint64_t memoryBlocksAsked() {
  const std::lock_guard lock(mutex);
  return asked;
}

}  // namespace omxhost
