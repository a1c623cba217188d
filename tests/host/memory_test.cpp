#include <gtest/gtest.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <map>
#include <random>
#include <thread>
#include <vector>

#include <binder/MemoryBase.h>
#include <binder/MemoryDealer.h>
#include <binder/MemoryHeapBase.h>
#include <omxhost/faults.h>

namespace {

using android::IMemory;
using android::IMemoryHeap;
using android::MemoryDealer;
using android::MemoryHeapBase;
using android::sp;

size_t pageSize() {
  return static_cast<size_t>(sysconf(_SC_PAGESIZE));
}

uint8_t* bytesOf(const sp<IMemory>& memory) {
  return static_cast<uint8_t*>(memory->pointer());
}

// A heap as a row of 32-byte cells, each taken or not.
class CellModel {
 public:
  explicit CellModel(size_t heapBytes) : _taken(heapBytes / 32, false) {}

  // The offset where a block goes, or -1.
  ssize_t take(size_t bytes) {
    const size_t cells = (bytes + 31) / 32;
    size_t best = 0;
    size_t bestLength = SIZE_MAX;
    for (size_t begin = 0; begin < _taken.size();) {
      size_t end = begin;
      while (end < _taken.size() && !_taken[end]) ++end;
      if (end - begin >= cells && end - begin < bestLength) {
        best = begin;
        bestLength = end - begin;
      }
      begin = end + 1;
    }
    if (bestLength == SIZE_MAX) return -1;
    mark(best * 32, bytes, true);
    return static_cast<ssize_t>(best * 32);
  }

  void mark(size_t offset, size_t bytes, bool taken) {
    std::fill_n(_taken.begin() + static_cast<ptrdiff_t>(offset / 32), (bytes + 31) / 32, taken);
  }

 private:
  std::vector<bool> _taken;
};

TEST(MemoryDealer, PlacesBlocksLikeAPlainModelAndKeepsThemApart) {
  struct Held {
    sp<IMemory> memory;
    uint8_t mark;
  };
  for (unsigned seed = 0; seed < 4; ++seed) {
    std::mt19937 random(seed);
    const sp<MemoryDealer> dealer = new MemoryDealer(100 * 1000);
    CellModel model(dealer->getMemoryHeap()->getSize());
    std::vector<Held> held;
    std::vector<sp<IMemory>> givenBack;
    int refused = 0;
    for (int step = 0; step < 3000; ++step) {
      if (random() % 5 < 3) {
        const size_t bytes = 1 + random() % (random() % 4 == 0 ? 20000 : 700);
        const sp<IMemory> memory = dealer->allocate(bytes);
        const ssize_t expected = model.take(bytes);
        ASSERT_EQ(memory != nullptr ? memory->offset() : -1, expected) << "seed " << seed << " step " << step;
        if (memory == nullptr) {
          ++refused;
          continue;
        }
        ASSERT_EQ(memory->size(), bytes);
        const auto mark = static_cast<uint8_t>(random());
        memset(memory->pointer(), mark, bytes);
        held.push_back({memory, mark});
      } else if (!held.empty()) {
        const size_t at = random() % held.size();
        const Held gone = held[at];
        held.erase(held.begin() + static_cast<ptrdiff_t>(at));
        const uint8_t* const bytes = bytesOf(gone.memory);
        ASSERT_TRUE(
            std::all_of(bytes, bytes + gone.memory->size(), [&](uint8_t b) { return b == gone.mark; }));
        model.mark(static_cast<size_t>(gone.memory->offset()), gone.memory->size(), false);
        if (random() % 3 == 0) {
          // Given back by hand, and again when the reference goes, long after the place has new users.
          dealer->deallocate(static_cast<size_t>(gone.memory->offset()));
          dealer->deallocate(static_cast<size_t>(gone.memory->offset()));
          givenBack.push_back(gone.memory);
        }
      }
      if (givenBack.size() > 20) givenBack.clear();
    }
    EXPECT_GT(refused, 10) << "the sequence never filled the heap";
    held.clear();
    const size_t all = dealer->getMemoryHeap()->getSize();
    EXPECT_NE(dealer->allocate(all), nullptr) << "free pieces did not join";
  }
}

TEST(MemoryDealer, RoundsBlocksTo32BytesAndTheHeapToPages) {
  struct Case {
    size_t count;
    size_t size;
    size_t blocks;  // that fit a dealer of count * size, on pages of 4096 bytes
  };
  const Case cases[] = {
      {4, 38016, 4},    // 176x144; the page that is left over is too small for one more
      {8, 3110400, 8},  // 1920x1080
      {10, 100, 32},    // 128 bytes each, on one page
      {3, 4095, 3},     // paid for by the 3 bytes that rounding to pages adds
      {100, 33, 64},    // 31 bytes lost each
      {1, 1, 128},     {1, 4097, 1},
  };
  if (pageSize() != 4096) GTEST_SKIP() << "the numbers are for pages of 4096 bytes";
  for (const Case& each : cases) {
    const sp<MemoryDealer> dealer = new MemoryDealer(each.count * each.size);
    std::vector<sp<IMemory>> blocks;
    while (true) {
      const sp<IMemory> block = dealer->allocate(each.size);
      if (block == nullptr) break;
      EXPECT_EQ(block->offset() % 32, 0);
      EXPECT_EQ(reinterpret_cast<uintptr_t>(block->pointer()) % 32, 0U);
      blocks.push_back(block);
    }
    EXPECT_EQ(blocks.size(), each.blocks) << each.count << " x " << each.size;
    EXPECT_EQ(dealer->getMemoryHeap()->getSize() % 4096, 0U);
  }
}

TEST(MemoryDealer, WithoutMemoryItExistsAndRefuses) {
  for (const size_t size : {size_t{0}, SIZE_MAX, SIZE_MAX - pageSize() + 1, SIZE_MAX / 2 - 2 * pageSize()}) {
    const sp<MemoryDealer> dealer = new MemoryDealer(size, "large");
    EXPECT_EQ(dealer->getMemoryHeap()->base(), nullptr) << size;
    EXPECT_EQ(dealer->getMemoryHeap()->heapID(), -1);
    EXPECT_EQ(dealer->allocate(1), nullptr);
    EXPECT_EQ(dealer->allocate(size == 0 ? 32 : size), nullptr);
    EXPECT_EQ(dealer->allocate(0)->pointer(), nullptr);
    dealer->deallocate(0);
  }
  const sp<MemoryDealer> small = new MemoryDealer(pageSize());
  for (const size_t size : {SIZE_MAX, SIZE_MAX - 30, SIZE_MAX / 2, pageSize() + 1}) {
    EXPECT_EQ(small->allocate(size), nullptr) << size;
  }
  const sp<IMemory> whole = small->allocate(pageSize());
  sp<IMemory> empty = small->allocate(0);
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(empty->offset(), 0);
  empty.clear();
  EXPECT_EQ(small->allocate(1), nullptr) << "the block at offset 0 went with the empty one";
}

TEST(MemoryDealer, BlocksOutliveTheDealersOwner) {
  sp<MemoryDealer> dealer = new MemoryDealer(pageSize());
  const android::wp<MemoryDealer> watched = dealer;
  sp<IMemory> block = dealer->allocate(100);
  sp<IMemoryHeap> heap = block->getMemory();
  dealer.clear();
  memset(block->pointer(), 1, 100);
  EXPECT_NE(watched.promote(), nullptr);
  block.clear();
  EXPECT_EQ(watched.promote(), nullptr);
  EXPECT_EQ(static_cast<uint8_t*>(heap->base())[99], 1) << "the heap lives on its own reference";
}

TEST(MemoryDealer, PagesGivenBackReadAsZeroAndNeighboursStay) {
  const size_t page = pageSize();
  const sp<MemoryDealer> dealer = new MemoryDealer(4 * page);
  const sp<IMemory> before = dealer->allocate(32);
  const sp<IMemory> middle = dealer->allocate(3 * page);
  const sp<IMemory> after = dealer->allocate(page - 32);
  ASSERT_NE(after, nullptr);
  for (const sp<IMemory>& each : {before, middle, after}) memset(each->pointer(), 0xAB, each->size());
  const auto* const heap = static_cast<const uint8_t*>(dealer->getMemoryHeap()->base());
  dealer->deallocate(static_cast<size_t>(middle->offset()));
  EXPECT_TRUE(std::all_of(heap + page, heap + 3 * page, [](uint8_t byte) { return byte == 0; }));
  EXPECT_TRUE(std::all_of(heap, heap + 32, [](uint8_t byte) { return byte == 0xAB; }));
  EXPECT_TRUE(std::all_of(heap + 3 * page + 32, heap + 4 * page, [](uint8_t byte) { return byte == 0xAB; }));
}

TEST(MemoryHeap, IsAFileThatOthersCanMap) {
  const sp<IMemoryHeap> heap = new MemoryHeapBase(1, 0, "shared");
  ASSERT_EQ(heap->virtualSize(), pageSize());
  void* const other = mmap(nullptr, heap->getSize(), PROT_READ, MAP_SHARED, heap->heapID(), 0);
  ASSERT_NE(other, MAP_FAILED);
  static_cast<uint8_t*>(heap->base())[17] = 42;
  EXPECT_EQ(static_cast<const uint8_t*>(other)[17], 42);
  munmap(other, heap->getSize());

  const sp<IMemory> part = new android::MemoryBase(heap, 16, 100);
  EXPECT_EQ(bytesOf(part)[1], 42);
  EXPECT_EQ(part->size(), 100U);
  EXPECT_EQ(part->getMemory(), heap);
}

}  // namespace
