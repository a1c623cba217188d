// MemoryHeapBase: a heap on an anonymous memory file, mapped for as long as the heap lives.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <binder/IMemory.h>

namespace android {

class MemoryHeapBase : public virtual BnMemoryHeap {
 public:
  // `size` is rounded up to whole pages. Without memory, and for size 0, the heap has no mapping: base
  // null, size 0, descriptor -1. `flags` is 0 or READ_ONLY.
  explicit MemoryHeapBase(size_t size, uint32_t flags = 0, const char* name = nullptr);

  int getHeapID() const override;
  void* getBase() const override;
  size_t getSize() const override;
  uint32_t getFlags() const override;
  uint32_t getOffset() const override;

 protected:
  ~MemoryHeapBase() override;

 private:
  int _file = -1;
  void* _base = nullptr;
  size_t _size = 0;
  uint32_t _flags;
};

}  // namespace android
