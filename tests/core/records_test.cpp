// The small parts: records, queues, result texts.
#include <gtest/gtest.h>
#include <limits.h>

#include <algorithm>
#include <deque>
#include <random>
#include <thread>
#include <tuple>

#include <binder/MemoryDealer.h>
#include <utils/Vector.h>

#include "core/buffer_info.h"
#include "core/shared_value.h"
#include "core/simple_queue.h"
#include "omxbridge/result.h"
#include "tests/core/faults.h"

namespace {

auto fields(const BufferInfo& record) {
  return std::make_tuple(record.bufferId, record.busy, record.memory.get(), record.length, record.data,
                         record.rangeLength, record.outputData, record.timestamp, record.eos);
}

TEST(BufferInfo, SharesItsMemoryWithItsCopiesButNotItsMutex) {
  const android::sp<android::MemoryDealer> dealer = new android::MemoryDealer(4096, "test");
  const android::sp<android::IMemory> memory = dealer->allocate(64);
  const auto references = memory->getStrongCount();
  {
    BufferInfo original;
    EXPECT_EQ(fields(original), std::make_tuple(nullptr, false, nullptr, 0, nullptr, 0, nullptr, 0, false));
    original.bufferId = &original;
    original.busy = true;
    original.memory = memory;
    original.length = 1;
    original.data = memory->pointer();
    original.rangeLength = 2;
    original.outputData = &original.length;
    original.timestamp = 3;
    original.eos = true;
    pthread_mutex_lock(&original.lock);  // a mutex copied as bytes would be locked for ever
    const BufferInfo& same = original;
    original = same;
    BufferInfo copy(original);
    BufferInfo assigned;
    assigned.memory = dealer->allocate(32);
    assigned = original;
    for (BufferInfo* each : {&copy, &assigned}) {
      EXPECT_EQ(fields(*each), fields(original));
      EXPECT_EQ(pthread_mutex_trylock(&each->lock), 0);
      pthread_mutex_unlock(&each->lock);
    }
    pthread_mutex_unlock(&original.lock);
    EXPECT_EQ(memory->getStrongCount(), references + 3);
    android::Vector<BufferInfo> table;  // moves its records about
    for (int i = 0; i < 20; ++i) table.add(copy);
    table.removeItemsAt(3, 10);
    EXPECT_EQ(memory->getStrongCount(), references + 13);
    for (const BufferInfo& record : table) EXPECT_EQ(fields(record), fields(copy));
  }
  EXPECT_EQ(memory->getStrongCount(), references);
}

TEST(SharedValue, LetsOneOfTwoThreadsSeeTheOther) {
  // "Store mine, then load yours": with weaker order both could miss each other's store.
  for (int round = 0; round < 1000; ++round) {
    SharedValue<bool> mine(false);
    SharedValue<bool> yours(false);
    bool sawMine = false;
    std::thread other([&] {
      yours = true;
      sawMine = mine;
    });
    mine = true;
    const bool sawYours = yours;
    other.join();
    ASSERT_TRUE(sawYours || sawMine);
  }
}

void* item(uintptr_t number) {
  return reinterpret_cast<void*>(number);
}

TEST(SimpleQueue, BehavesAsAFifoUnderRandomUse) {
  std::mt19937 random(20120912);
  SimpleQueue queue;
  std::deque<void*> model;
  for (int step = 0; step < 20000; ++step) {
    if (random() % 2 == 0) {
      void* const added = item(random() % 50);  // null and doubles too
      const faults::Fault shortage(faults::Failing::NothrowNew, step % 8 == 0 ? sizeof(SimpleNode) : 0);
      ASSERT_EQ(queue.add(added), step % 8 != 0);
      if (step % 8 != 0) model.push_back(added);
    } else {
      ASSERT_EQ(queue.dequeue(), model.empty() ? nullptr : model.front()) << "step " << step;
      if (!model.empty()) model.pop_front();
    }
    ASSERT_EQ(queue.isEmpty(), model.empty()) << "step " << step;
    ASSERT_EQ(queue.size(), model.size()) << "step " << step;
    const void* const sought = item(random() % 50);
    ASSERT_EQ(queue.contains(sought), std::find(model.begin(), model.end(), sought) != model.end());
  }
}

TEST(SimpleQueue, IsLockedAndDestroyedWithManyItems) {
  // Freeing the chain from its head would need a stack frame a node.
  constexpr uintptr_t kItems = 250000;
  SimpleQueue queue;
  const auto produce = [&queue] {
    for (uintptr_t number = 1; number <= kItems; ++number) {
      queue.lock();
      queue.add(item(number));
      queue.unlock();
    }
  };
  std::thread other(produce);
  produce();
  other.join();
  EXPECT_EQ(queue.size(), 2 * kItems);
}

TEST(Result, IsDescribedByTheTextThatApplicationsPrint) {
  static_assert(OMXI_ERR_IOMX == 3 && OMXI_ERR_GET_PORT_DEFINITION == 13 && OMXI_ERR_EVENT_ERROR == 27 &&
                OMXI_ERR_APPLICATION == 32 && OMXI_ERR_SET_INTRA_PERIOD == 37);
  const char* const texts[] = {"No errors.",
                               "Could not Acquire Media Player Service",
                               "Could not Create OmxInterface",
                               "Could not Acquire iOMX Interface",
                               "Could not Allocate OpenMax Component",
                               "Could not Create OmxCodecObserver",
                               "OMX Component Node Not Found.",
                               "Buffers not registered by OMX component.  Pmem not available.",
                               "Error filling buffer.",
                               "Failed changing port setting.",
                               "Interface entered an invalid state.",
                               "Interface found to be in the incorrect state.",
                               "OMX State was found to be not executing.",
                               "Could not get port definition",
                               "Could not set port definition",
                               "Could not allocate memory",
                               "Could not request IFrame.",
                               "Could not get Bitrate Parameters",
                               "Could not set Bitrate Parameters",
                               "Could not set Codec Configuration",
                               "Could not send Command State",
                               "Could not set Execution State",
                               "Could not create Event Thread",
                               "Could not create Output Thread",
                               "Invalid buffer passed.  Not found in buffer list.",
                               "Buffer already owned.",
                               "Buffer not emptied after deallocation.",
                               "OMX Event Error received.  Check Logs for more details.",
                               "Invalid Encoding Parameters submitted.",
                               "Error: Could not setup surface renderer",
                               "Error: Could not setup decoder picture order",
                               "Error: Could not setup frame packing format",
                               "Application Error.  See Logs for Details"};
  for (int code = 0; code <= OMXI_ERR_APPLICATION; ++code) EXPECT_STREQ(resultDescription(code), texts[code]);
  for (const int code : {33, 36, 38, INT_MAX, -1, INT_MIN}) {
    EXPECT_STREQ(resultDescription(code), "Could not define result\n") << code;
  }
}

}  // namespace
