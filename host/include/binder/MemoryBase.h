// MemoryBase: a block of a heap, given by offset and size in bytes.
#pragma once

#include <stddef.h>
#include <sys/types.h>

#include <binder/IMemory.h>

namespace android {

class MemoryBase : public BnMemory {
 public:
  MemoryBase(const sp<IMemoryHeap>& heap, ssize_t offset, size_t size);

  sp<IMemoryHeap> getMemory(ssize_t* offset = nullptr, size_t* size = nullptr) const override;

 protected:
  ~MemoryBase() override;

 private:
  sp<IMemoryHeap> _heap;
  ssize_t _offset;
  size_t _size;
};

}  // namespace android
