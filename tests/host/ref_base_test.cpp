#include <gtest/gtest.h>

#include <atomic>
#include <latch>
#include <thread>
#include <type_traits>
#include <utility>

#include <utils/RefBase.h>

namespace {

using android::RefBase;
using android::sp;
using android::wp;

struct Life {
  std::atomic<int> firstRefs{0}, lastRefs{0}, destroyed{0};
};

class Interface : public virtual RefBase {
 public:
  virtual int value() const = 0;
};

class Object : public Interface {
 public:
  explicit Object(Life* life) : _life(life) {}
  int value() const override { return 42; }

  sp<Object> next;

 protected:
  ~Object() override { ++_life->destroyed; }
  void onFirstRef() override {
    ++_life->firstRefs;
    const sp<Object> passedAround(this);  // what onFirstRef() is for
  }
  void onLastStrongRef(const void* /*id*/) override { ++_life->lastRefs; }

 private:
  Life* const _life;
};

static_assert(!std::is_constructible_v<bool, sp<Object>>, "code that relies on it fails on a device");

TEST(StrongPointer, TellsOfTheFirstAndLastReferenceAndTakesTheNewBeforeItDropsTheOld) {
  Life life;
  {
    sp<Object> head = new Object(&life);
    sp<Interface> second = head;
    const sp<Object> third = std::move(head);
    EXPECT_EQ(third->getStrongCount(), 2);
    EXPECT_TRUE(head == nullptr && head == NULL && second == third && third.get() == second);
    EXPECT_TRUE(second->value() == 42 && life.destroyed == 0);
  }
  EXPECT_TRUE(life.firstRefs == 1 && life.lastRefs == 1 && life.destroyed == 1);
  sp<Object> head = new Object(&life);
  head->next = new Object(&life);
  head = head->next;  // The only other reference to the new one dies with the old one.
  EXPECT_EQ(life.destroyed, 2);
}

TEST(WeakPointer, PromotionRacesTheLastRelease) {
  for (int round = 0; round < 3000; ++round) {
    Life life;
    sp<Object> strong = new Object(&life);
    const wp<Object> weak = strong;
    std::latch start(2);
    std::thread promoter([&] {
      start.arrive_and_wait();
      const wp<Object> mine = weak;
      const sp<Object> got = mine.promote();
      for (int n = 0; n < 100 && got != nullptr; ++n) EXPECT_EQ(sp<Interface>(got)->value(), 42);
      EXPECT_TRUE(got == nullptr || life.destroyed == 0);
    });
    start.arrive_and_wait();
    strong.clear();
    promoter.join();
    ASSERT_TRUE(life.destroyed == 1 && life.lastRefs == 1);
  }
}

}  // namespace
