#include "core/simple_queue.h"

#include <gtest/gtest.h>
#include <stdint.h>

#include <algorithm>
#include <deque>
#include <memory>
#include <random>
#include <thread>
#include <vector>

#include "tests/core/faults.h"

namespace {

void* item(uintptr_t number) {
  return reinterpret_cast<void*>(number);
}

TEST(SimpleNode, OwnsTheNodesBehindIt) {
  // Node by node off the heap: what the first one does not free, the leak check finds.
  auto first = std::make_unique<SimpleNode>(item(1));
  EXPECT_EQ(first->getNext(), nullptr);
  auto* second = new SimpleNode(item(2));
  second->setNext(new SimpleNode(item(3)));
  first->setNext(second);
  EXPECT_EQ(first->getData(), item(1));
  EXPECT_EQ(first->getNext(), second);
  EXPECT_EQ(first->getNext()->getNext()->getData(), item(3));
}

TEST(SimpleNode, LeavesTheNodesThatWereTakenFromIt) {
  auto first = std::make_unique<SimpleNode>(item(1));
  const auto second = std::make_unique<SimpleNode>(item(2));
  first->setNext(second.get());
  first->setNext(nullptr);
  first.reset();
  EXPECT_EQ(second->getData(), item(2));
}

TEST(SimpleQueue, HasNothingToGiveWhenItIsEmpty) {
  SimpleQueue queue;
  for (int round = 0; round < 2; ++round) {
    EXPECT_TRUE(queue.isEmpty());
    EXPECT_EQ(queue.dequeue(), nullptr);
    EXPECT_TRUE(queue.add(item(1)));  // its end is in order: this one is found again
    EXPECT_EQ(queue.dequeue(), item(1));
  }
}

TEST(SimpleQueue, BehavesAsAFifoUnderRandomUse) {
  std::mt19937 random(20120912);
  SimpleQueue queue;
  std::deque<void*> model;
  for (int step = 0; step < 20000; ++step) {
    if (random() % 2 == 0) {
      void* const added = item(random() % 50);  // null and doubles too
      ASSERT_TRUE(queue.add(added));
      model.push_back(added);
    } else {
      void* const expected = model.empty() ? nullptr : model.front();
      ASSERT_EQ(queue.dequeue(), expected) << "step " << step;
      if (!model.empty()) model.pop_front();
    }
    ASSERT_EQ(queue.isEmpty(), model.empty()) << "step " << step;
    ASSERT_EQ(queue.size(), model.size()) << "step " << step;
    const void* const sought = item(random() % 50);
    ASSERT_EQ(queue.contains(sought), std::find(model.begin(), model.end(), sought) != model.end());
  }
}

TEST(SimpleQueue, IsDestroyedWithManyItemsAndLeavesThemAlone) {
  std::vector<int> items(500000, 7);
  {
    SimpleQueue queue;
    for (int& each : items) queue.add(&each);
  }  // freeing the chain from its head would need a stack frame a node
  EXPECT_EQ(items.front() + items.back(), 14);
}

TEST(SimpleQueue, StaysAsItWasWhenANodeCannotBeHad) {
  SimpleQueue queue;
  {
    const faults::FailedAllocation failed(sizeof(SimpleNode));
    EXPECT_FALSE(queue.add(item(1)));
    EXPECT_TRUE(failed.happened());
  }
  EXPECT_TRUE(queue.isEmpty());
  ASSERT_TRUE(queue.add(item(2)));
  {
    const faults::FailedAllocation failed(sizeof(SimpleNode));
    EXPECT_FALSE(queue.add(item(3)));
  }
  ASSERT_TRUE(queue.add(item(4)));
  EXPECT_EQ(queue.dequeue(), item(2));
  EXPECT_EQ(queue.dequeue(), item(4));
  EXPECT_EQ(queue.dequeue(), nullptr);
}

TEST(SimpleQueue, HandsItemsFromThreadToThreadUnderItsLock) {
  constexpr uintptr_t kItems = 5000;
  SimpleQueue queue;
  const auto produce = [&queue](uintptr_t from) {
    for (uintptr_t number = from; number < from + kItems; ++number) {
      queue.lock();
      queue.add(item(number));
      queue.unlock();
    }
  };
  std::thread first(produce, 1);
  std::thread second(produce, 1 + kItems);
  uintptr_t lastOfFirst = 0;
  uintptr_t lastOfSecond = kItems;
  for (uintptr_t taken = 0; taken < 2 * kItems;) {
    queue.lock();
    const auto number = reinterpret_cast<uintptr_t>(queue.dequeue());
    queue.unlock();
    if (number == 0) {
      std::this_thread::yield();
      continue;
    }
    ++taken;
    uintptr_t& last = number <= kItems ? lastOfFirst : lastOfSecond;
    EXPECT_EQ(number, last + 1);
    last = number;
  }
  first.join();
  second.join();
}

}  // namespace
