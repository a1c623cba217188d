#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <latch>
#include <memory>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include <utils/RefBase.h>

namespace {

using android::RefBase;
using android::sp;
using android::wp;

struct Life {
  std::atomic<int> firstRefs{0};
  std::atomic<int> lastRefs{0};
  std::atomic<int> destroyed{0};
};

class Interface : public virtual RefBase {
 public:
  virtual int value() const = 0;
};

class Object : public Interface {
 public:
  explicit Object(Life* life = nullptr) : _life(life) {}

  int value() const override { return 42; }

  std::atomic<int> uses{0};
  std::function<void()> atDestruction;
  sp<Object> next;

 protected:
  ~Object() override {
    if (atDestruction) atDestruction();
    if (_life != nullptr) ++_life->destroyed;
  }
  void onFirstRef() override {
    if (_life == nullptr) return;
    ++_life->firstRefs;
    const sp<Object> passedAround(this);  // what onFirstRef() is for
  }
  void onLastStrongRef(const void* /*id*/) override {
    if (_life != nullptr) ++_life->lastRefs;
  }

 private:
  Life* const _life;
};

template <typename Pointer>
concept TestableAsBool = requires(Pointer p) {
  p ? 1 : 0;
}
|| requires(Pointer p) {
  !p;
};
static_assert(!TestableAsBool<sp<Object>>, "code that relies on it does not compile on a device");
static_assert(std::is_convertible_v<Object*, sp<Object>> && std::is_convertible_v<sp<Object>, sp<Interface>>);
static_assert(sizeof(sp<Object>) == sizeof(void*));

void onThreads(int count, const std::function<void(int)>& work) {
  std::latch start(count);
  std::vector<std::thread> threads;
  for (int i = 0; i < count; ++i) {
    threads.emplace_back([&, i] {
      start.arrive_and_wait();
      work(i);
    });
  }
  for (std::thread& each : threads) each.join();
}

TEST(StrongPointer, FirstAndLastReferenceAreToldOnce) {
  Life life;
  {
    sp<Object> first = new Object(&life);
    EXPECT_EQ(first->getStrongCount(), 1);
    sp<Interface> second = first;
    const sp<Object> third = std::move(first);
    EXPECT_EQ(third->getStrongCount(), 2);
    EXPECT_TRUE(first == nullptr && first == NULL && first == 0 && NULL == first);
    EXPECT_TRUE(second == third && third == second && third.get() == second && !(second < third));
    EXPECT_EQ(second->value(), 42);
    EXPECT_EQ(life.destroyed, 0);
  }
  EXPECT_EQ(life.firstRefs, 1);
  EXPECT_EQ(life.lastRefs, 1);
  EXPECT_EQ(life.destroyed, 1);
}

TEST(StrongPointer, AssignmentTakesTheNewBeforeItDropsTheOld) {
  Life life;
  sp<Object> head = new Object(&life);
  head->next = new Object(&life);
  head = head->next;  // The only other reference to the new one dies with the old one.
  EXPECT_EQ(life.destroyed, 1);
  EXPECT_EQ(head->value(), 42);
  // A destructor that looks at the pointer that is being changed sees its new value.
  const Object* seen = head.get();
  const sp<Object>& alias = head;
  head = alias;
  head->atDestruction = [&] { seen = head.get(); };
  head = nullptr;
  EXPECT_EQ(seen, nullptr);
  EXPECT_EQ(life.destroyed, 2);
}

TEST(StrongPointer, ManyThreadsDestroyOnceAndAfterTheLastUse) {
  for (int round = 0; round < 20; ++round) {
    Life life;
    int usesAtTheEnd = 0;
    sp<Object> shared = new Object(&life);
    shared->atDestruction = [&usesAtTheEnd, object = shared.get()] { usesAtTheEnd = object->uses; };
    std::vector<sp<Object>> held(4, shared);
    shared.clear();
    onThreads(4, [&](int i) {
      sp<Object> mine = std::move(held[static_cast<size_t>(i)]);
      for (int n = 0; n < 2000; ++n) {
        const sp<Interface> copy = mine;
        mine->uses.fetch_add(1, std::memory_order_relaxed);  // only the count orders it before the destructor
      }
    });
    ASSERT_EQ(life.firstRefs, 1);
    ASSERT_EQ(life.destroyed, 1);
    ASSERT_EQ(usesAtTheEnd, 4 * 2000);
  }
}

TEST(WeakPointer, PromotesExactlyWhileTheObjectLives) {
  Life life;
  wp<Object> weak;
  EXPECT_EQ(weak.promote(), nullptr);
  {
    const sp<Object> strong = new Object(&life);
    weak = strong;
    const wp<Interface> asInterface = strong;
    EXPECT_EQ(weak.promote(), strong);
    EXPECT_EQ(asInterface.promote(), strong);
    EXPECT_EQ(strong->getStrongCount(), 1);
  }
  EXPECT_EQ(life.destroyed, 1);
  EXPECT_EQ(weak.promote(), nullptr);

  // Promotion may make the first reference.
  weak = new Object(&life);
  EXPECT_NE(weak.promote(), nullptr);
  EXPECT_EQ(life.firstRefs, 2);
  EXPECT_EQ(life.destroyed, 2);
  EXPECT_EQ(weak.promote(), nullptr);
}

TEST(WeakPointer, PromotionRacesTheLastRelease) {
  int won = 0;
  for (int round = 0; round < 3000; ++round) {
    Life life;
    sp<Object> strong = new Object(&life);
    const wp<Object> weak = strong;
    std::atomic<int> promoted{0};
    onThreads(2, [&](int i) {
      if (i == 0) {
        strong.clear();
        return;
      }
      const wp<Object> mine = weak;
      const sp<Object> got = mine.promote();
      if (got == nullptr) return;
      ++promoted;
      EXPECT_EQ(got->value(), 42);
      EXPECT_EQ(life.destroyed, 0);
    });
    won += promoted;
    ASSERT_EQ(life.destroyed, 1);
    ASSERT_EQ(life.lastRefs, 1);
  }
  RecordProperty("promotions", won);
}

}  // namespace
