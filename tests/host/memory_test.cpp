#include <gtest/gtest.h>
#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <random>
#include <vector>

#include <binder/MemoryDealer.h>

namespace {

using android::IMemory;
using android::MemoryDealer;
using android::sp;

size_t pageSize() {
  return static_cast<size_t>(sysconf(_SC_PAGESIZE));
}

TEST(MemoryDealer, KeepsBlocksApart) {
  std::mt19937 random(1);
  const sp<MemoryDealer> dealer = new MemoryDealer(100 * 1000);
  const size_t all = dealer->getMemoryHeap()->getSize();
  std::vector<std::pair<sp<IMemory>, uint8_t>> held;  // with what is written into them
  bool wasFull = false;
  for (int step = 0; step < 10000; ++step) {
    if (random() % 5 < 3) {
      const size_t bytes = 1 + random() % (random() % 4 == 0 ? 20000 : 700);
      const sp<IMemory> memory = dealer->allocate(bytes);
      wasFull = wasFull || memory == nullptr;
      if (memory == nullptr) continue;
      ASSERT_TRUE(memory->size() == bytes && memory->offset() % 32 == 0);
      held.push_back({memory, static_cast<uint8_t>(random())});
      memset(memory->pointer(), held.back().second, bytes);
    } else if (!held.empty()) {
      std::swap(held[random() % held.size()], held.back());
      const auto [memory, mark] = held.back();
      held.pop_back();
      const auto* const bytes = static_cast<const uint8_t*>(memory->pointer());
      ASSERT_EQ(std::count(bytes, bytes + memory->size(), mark), static_cast<ssize_t>(memory->size()));
    }
  }
  EXPECT_TRUE(wasFull);
  held.clear();
  EXPECT_NE(dealer->allocate(all), nullptr) << "free pieces did not join";
}

TEST(MemoryDealer, WithoutMemoryItExistsAndRefuses) {
  for (const size_t size : {size_t{0}, SIZE_MAX, SIZE_MAX - pageSize() + 1, SIZE_MAX / 2 - 2 * pageSize()}) {
    const sp<MemoryDealer> dealer = new MemoryDealer(size, "large");
    EXPECT_EQ(dealer->getMemoryHeap()->base(), nullptr) << size;
    EXPECT_EQ(dealer->allocate(1), nullptr);
    EXPECT_EQ(dealer->allocate(0)->pointer(), nullptr);
    dealer->deallocate(0);
  }
  const sp<MemoryDealer> small = new MemoryDealer(pageSize());
  for (const size_t size : {SIZE_MAX, SIZE_MAX - 30, SIZE_MAX / 2, pageSize() + 1}) {
    EXPECT_EQ(small->allocate(size), nullptr) << size;
  }
  const sp<MemoryDealer> odd = new MemoryDealer(3 * 4095);
  EXPECT_EQ(odd->getMemoryHeap()->getSize() % pageSize(), 0U);
  const sp<IMemory> whole = small->allocate(pageSize());
  EXPECT_NE(small->allocate(0), nullptr);
  EXPECT_EQ(small->allocate(1), nullptr) << "the block at offset 0 went with the empty one";
}

}  // namespace
