#include "tests/encoder/failing_allocation.h"

#include <stdlib.h>

#include <new>

std::atomic<size_t> omxtest::failingSize{0};

namespace {

void* allocate(size_t size, size_t alignment) {
  size_t wanted = size;
  if (size != 0 && omxtest::failingSize.compare_exchange_strong(wanted, 0)) return nullptr;
  if (alignment <= __STDCPP_DEFAULT_NEW_ALIGNMENT__) return malloc(size != 0 ? size : 1);
  return aligned_alloc(alignment, (size + alignment - 1) / alignment * alignment);
}

void* allocateOrThrow(size_t size, size_t alignment) {
  void* memory = allocate(size, alignment);
  if (memory == nullptr) throw std::bad_alloc();
  return memory;
}

}  // namespace

void* operator new(size_t size) {
  return allocateOrThrow(size, 1);
}
void* operator new[](size_t size) {
  return allocateOrThrow(size, 1);
}
void* operator new(size_t size, std::align_val_t alignment) {
  return allocateOrThrow(size, static_cast<size_t>(alignment));
}
void* operator new[](size_t size, std::align_val_t alignment) {
  return allocateOrThrow(size, static_cast<size_t>(alignment));
}
void* operator new(size_t size, const std::nothrow_t& /*unused*/) noexcept {
  return allocate(size, 1);
}
void* operator new[](size_t size, const std::nothrow_t& /*unused*/) noexcept {
  return allocate(size, 1);
}
void operator delete(void* memory) noexcept {
  free(memory);
}
void operator delete[](void* memory) noexcept {
  free(memory);
}
void operator delete(void* memory, size_t /*size*/) noexcept {
  free(memory);
}
void operator delete[](void* memory, size_t /*size*/) noexcept {
  free(memory);
}
void operator delete(void* memory, std::align_val_t /*alignment*/) noexcept {
  free(memory);
}
void operator delete[](void* memory, std::align_val_t /*alignment*/) noexcept {
  free(memory);
}
void operator delete(void* memory, size_t /*size*/, std::align_val_t /*alignment*/) noexcept {
  free(memory);
}
void operator delete[](void* memory, size_t /*size*/, std::align_val_t /*alignment*/) noexcept {
  free(memory);
}
void operator delete(void* memory, const std::nothrow_t& /*unused*/) noexcept {
  free(memory);
}
void operator delete[](void* memory, const std::nothrow_t& /*unused*/) noexcept {
  free(memory);
}
