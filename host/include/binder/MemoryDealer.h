// MemoryDealer: hands out blocks of one shared heap. Any thread may call it.
//
// Blocks are multiples of 32 bytes at multiples of 32; the heap is the size asked for rounded up to
// whole pages. The smallest free piece that fits is taken, the lowest of several. A block keeps its
// dealer and the heap alive and goes back when its last reference is dropped.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <memory>

#include <binder/IMemory.h>
#include <utils/RefBase.h>

namespace android {

class MemoryDealer : public RefBase {
 public:
  // Where no such heap can be made the dealer exists, and has nothing to hand out.
  explicit MemoryDealer(size_t size, const char* name = nullptr);

  // Null where no piece is large enough. Size 0 gives an empty block at offset 0.
  virtual sp<IMemory> allocate(size_t size);

  // Gives the block at `offset` back before its references are gone; they must not be used for memory
  // any more. Giving a block back a second time does nothing, also when its place has a new user.
  virtual void deallocate(size_t offset);

  sp<IMemoryHeap> getMemoryHeap() const;

 protected:
  ~MemoryDealer() override;

 private:
  class Block;
  struct Books;

  void giveBack(size_t offset, uint64_t ticket);

  const sp<IMemoryHeap> _heap;
  const std::unique_ptr<Books> _books;
};

}  // namespace android
