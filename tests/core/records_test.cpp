// The small parts: records, queues, result texts.
#include <gtest/gtest.h>

#include <algorithm>
#include <deque>
#include <random>
#include <tuple>

#include <binder/MemoryDealer.h>
#include <utils/Vector.h>

#include "core/buffer_info.h"
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
  BufferInfo original;
  original.bufferId = &original;
  original.busy = true;
  original.memory = dealer->allocate(64);
  original.length = 1;
  original.data = original.memory->pointer();
  original.rangeLength = 2;
  original.outputData = &original.length;
  original.timestamp = 3;
  original.eos = true;
  pthread_mutex_lock(&original.lock);  // a mutex copied as bytes would be locked for ever
  android::Vector<BufferInfo> table;   // moves its records about
  for (int i = 0; i < 20; ++i) table.add(original);
  table.removeItemsAt(3, 10);
  table.editItemAt(0) = BufferInfo();
  table.editItemAt(0) = original;
  EXPECT_EQ(original.memory->getStrongCount(), 11);
  for (BufferInfo& record : table) {
    EXPECT_EQ(fields(record), fields(original));
    EXPECT_EQ(pthread_mutex_trylock(&record.lock), 0);
    pthread_mutex_unlock(&record.lock);
  }
  pthread_mutex_unlock(&original.lock);
}

TEST(SimpleQueue, BehavesAsAFifoUnderRandomUse) {
  const auto item = [](uintptr_t number) { return reinterpret_cast<void*>(number); };
  std::mt19937 random(20120912);
  SimpleQueue queue;
  std::deque<void*> model;
  for (int step = 0; step < 5000; ++step) {
    void* const some = item(random() % 50);  // null and doubles too
    if (random() % 2 == 0) {
      const faults::Fault shortage(faults::Failing::NothrowNew, step % 8 == 0 ? sizeof(SimpleNode) : 0);
      ASSERT_EQ(queue.add(some), step % 8 != 0);
      if (step % 8 != 0) model.push_back(some);
    } else {
      ASSERT_EQ(queue.dequeue(), model.empty() ? nullptr : model.front()) << "step " << step;
      if (!model.empty()) model.pop_front();
    }
    ASSERT_EQ(queue.size(), model.size());
    ASSERT_EQ(queue.isEmpty(), model.empty());
    ASSERT_EQ(queue.contains(some), std::find(model.begin(), model.end(), some) != model.end());
  }
  // Freeing the chain from its head would need a stack frame a node.
  for (uintptr_t number = 1; number <= 500000; ++number) queue.add(item(number));
}

TEST(Result, IsDescribedByTheTextThatApplicationsPrint) {
  static_assert(OMXI_ERR_IOMX == 3 && OMXI_ERR_EVENT_ERROR == 27 && OMXI_ERR_SET_INTRA_PERIOD == 37);
  EXPECT_STREQ(resultDescription(0), "No errors.");
  EXPECT_STREQ(resultDescription(13), "Could not get port definition");
  EXPECT_STREQ(resultDescription(OMXI_ERR_APPLICATION), "Application Error.  See Logs for Details");
  for (const int code : {33, -1}) EXPECT_STREQ(resultDescription(code), "Could not define result\n");
}

}  // namespace
