// Shared memory: a heap is one mapping, an IMemory is a block of a heap and keeps the heap alive.
// Any thread may ask for addresses and sizes; what lies in the memory is the users' business.
#pragma once

#include <stddef.h>
#include <stdint.h>
#include <sys/types.h>

#include <binder/IInterface.h>

namespace android {

class IMemoryHeap : public IInterface {
 public:
  DECLARE_META_INTERFACE(MemoryHeap);

  enum : uint32_t { READ_ONLY = 0x00000001 };

  // The descriptor of the memory file, owned by the heap, or -1.
  virtual int getHeapID() const = 0;
  // Null where there is no mapping.
  virtual void* getBase() const = 0;
  // Bytes of the mapping.
  virtual size_t getSize() const = 0;
  virtual uint32_t getFlags() const = 0;
  virtual uint32_t getOffset() const = 0;

  int heapID() const { return getHeapID(); }
  void* base() const { return getBase(); }
  size_t virtualSize() const { return getSize(); }
};

class BnMemoryHeap : public BnInterface<IMemoryHeap> {
 protected:
  BnMemoryHeap();
  ~BnMemoryHeap() override;
};

class IMemory : public IInterface {
 public:
  DECLARE_META_INTERFACE(Memory);

  virtual sp<IMemoryHeap> getMemory(ssize_t* offset = nullptr, size_t* size = nullptr) const = 0;

  // Null where the heap has no mapping.
  void* pointer() const;
  size_t size() const;
  ssize_t offset() const;
};

class BnMemory : public BnInterface<IMemory> {
 protected:
  BnMemory();
  ~BnMemory() override;
};

}  // namespace android
