#include "core/buffer_info.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include <binder/MemoryDealer.h>
#include <utils/Vector.h>

#include "core/shared_value.h"

namespace {

BufferInfo filled(const android::sp<android::IMemory>& memory) {
  static int places[2] = {};
  BufferInfo record;
  record.bufferId = &places[0];
  record.busy = true;
  record.memory = memory;
  record.length = 1;
  record.data = memory->pointer();
  record.rangeLength = 2;
  record.outputData = &places[1];
  record.timestamp = 3;
  record.eos = true;
  return record;
}

void expectEqual(const BufferInfo& copy, const BufferInfo& original) {
  EXPECT_EQ(copy.bufferId, original.bufferId);
  EXPECT_EQ(copy.busy, original.busy);
  EXPECT_EQ(copy.memory.get(), original.memory.get());
  EXPECT_EQ(copy.length, original.length);
  EXPECT_EQ(copy.data, original.data);
  EXPECT_EQ(copy.rangeLength, original.rangeLength);
  EXPECT_EQ(copy.outputData, original.outputData);
  EXPECT_EQ(copy.timestamp, original.timestamp);
  EXPECT_EQ(copy.eos, original.eos);
}

class BufferInfoTest : public ::testing::Test {
 protected:
  const android::sp<android::MemoryDealer> _dealer = new android::MemoryDealer(4096, "test");
  const android::sp<android::IMemory> _memory = _dealer->allocate(64);
};

TEST_F(BufferInfoTest, BeginsEmpty) {
  const BufferInfo record;
  EXPECT_EQ(record.bufferId, nullptr);
  EXPECT_FALSE(record.busy);
  EXPECT_TRUE(record.memory == nullptr);
  EXPECT_EQ(record.length, 0u);
  EXPECT_EQ(record.data, nullptr);
  EXPECT_EQ(record.rangeLength, 0u);
  EXPECT_EQ(record.outputData, nullptr);
  EXPECT_EQ(record.timestamp, 0u);
  EXPECT_FALSE(record.eos);
}

TEST_F(BufferInfoTest, SharesItsMemoryWithItsCopies) {
  const auto references = _memory->getStrongCount();
  {
    const BufferInfo original = filled(_memory);
    EXPECT_EQ(_memory->getStrongCount(), references + 1);
    const BufferInfo copy(original);
    expectEqual(copy, original);
    EXPECT_EQ(_memory->getStrongCount(), references + 2);
    BufferInfo assigned = filled(_dealer->allocate(32));
    assigned = original;
    expectEqual(assigned, original);
    EXPECT_EQ(_memory->getStrongCount(), references + 3);
    const BufferInfo& same = assigned;
    assigned = same;
    expectEqual(assigned, original);
    EXPECT_EQ(_memory->getStrongCount(), references + 3);
  }
  EXPECT_EQ(_memory->getStrongCount(), references);
}

TEST_F(BufferInfoTest, HasAMutexOfItsOwnInEachCopy) {
  BufferInfo original;
  pthread_mutex_lock(&original.lock);  // a mutex copied as bytes would be locked for ever
  BufferInfo copy(original);
  EXPECT_EQ(pthread_mutex_trylock(&copy.lock), 0);
  pthread_mutex_unlock(&copy.lock);
  BufferInfo assigned;
  assigned = original;
  EXPECT_EQ(pthread_mutex_trylock(&assigned.lock), 0);
  pthread_mutex_unlock(&assigned.lock);
  pthread_mutex_unlock(&original.lock);
}

TEST_F(BufferInfoTest, KeepsItsMemoryWhileATableMovesIt) {
  const auto references = _memory->getStrongCount();
  {
    android::Vector<BufferInfo> table;
    for (int i = 0; i < 20; ++i) table.add(filled(_memory));
    EXPECT_EQ(_memory->getStrongCount(), references + 20);
    table.removeItemsAt(3, 10);
    EXPECT_EQ(_memory->getStrongCount(), references + 10);
    for (const BufferInfo& record : table) expectEqual(record, filled(_memory));
  }
  EXPECT_EQ(_memory->getStrongCount(), references);
}

TEST(SharedValue, LetsOneOfTwoThreadsSeeTheOther) {
  // "Store mine, then load yours": with weaker order both could miss each other's store.
  for (int round = 0; round < 2000; ++round) {
    SharedValue<bool> mine(false);
    SharedValue<bool> yours(false);
    bool sawYours = false;
    bool sawMine = false;
    std::thread other([&] {
      yours = true;
      sawMine = mine;
    });
    mine = true;
    sawYours = yours;
    other.join();
    ASSERT_TRUE(sawYours || sawMine);
  }
}

TEST(SharedValue, CopiesItsValue) {
  SharedValue<int32_t> value(5);
  const SharedValue<int32_t> copy(value);
  value = 6;
  EXPECT_EQ(copy, 5);
  SharedValue<int32_t> assigned;
  EXPECT_EQ(assigned, 0);
  assigned = value;
  EXPECT_EQ(assigned, 6);
}

}  // namespace
