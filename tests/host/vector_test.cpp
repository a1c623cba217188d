#include <gtest/gtest.h>
#include <stdint.h>

#include <random>
#include <set>
#include <type_traits>
#include <vector>

#include <utils/Vector.h>

namespace {

using android::Vector;

// Knows whether it stands where it was constructed, so a byte-wise move or a use after destruction
// shows, and registers itself, so a leak or a double destruction shows.
class Tracked {
 public:
  Tracked() : Tracked(0) {}
  explicit Tracked(int number) : value(number) { enter(); }
  Tracked(const Tracked& other) : value(other.get()) { enter(); }
  Tracked& operator=(const Tracked& other) {
    value = other.get();
    return *this;
  }
  ~Tracked() { EXPECT_EQ(alive().erase(this), 1U); }

  int get() const {
    EXPECT_TRUE(alive().contains(this)) << "an element is used that does not exist";
    return value;
  }

  static std::set<const Tracked*>& alive() {
    static std::set<const Tracked*> all;
    return all;
  }

 private:
  void enter() { EXPECT_TRUE(alive().insert(this).second); }

  int value;
};

std::vector<int> valuesOf(const Vector<Tracked>& vector) {
  std::vector<int> values;
  for (const Tracked& each : vector) values.push_back(each.get());
  return values;
}

static_assert(std::is_same_v<decltype(std::declval<Vector<int>&>()[0]), const int&>,
              "code that writes through it does not compile on a device");

TEST(Vector, FollowsAPlainModelThroughRandomOperations) {
  std::mt19937 random(1);
  const auto below = [&random](size_t limit) { return random() % limit; };
  {
    Vector<Tracked> vector;
    std::vector<int> model;
    for (int step = 0; step < 4000; ++step) {
      const size_t at = below(model.size() + 1);
      const auto where = model.begin() + static_cast<ptrdiff_t>(at);
      const size_t count = below(5);
      const size_t operation = below(7);
      if (operation <= 1) {
        EXPECT_EQ(vector.add(Tracked(step)), static_cast<ssize_t>(model.size()));
        model.push_back(step);
      } else if (operation == 2 && model.empty()) {
        EXPECT_EQ(vector.insertAt(Tracked(step), at, count), 0);
        model.assign(count, step);
      } else if (operation == 2) {
        // An element of its own, which may move away while it is being copied.
        EXPECT_EQ(vector.insertAt(vector[at / 2], at, count), static_cast<ssize_t>(at));
        model.insert(where, count, int{model[at / 2]});
      } else if (operation == 3) {
        const bool fits = at + count <= model.size();
        EXPECT_EQ(vector.removeItemsAt(at, count), fits ? static_cast<ssize_t>(at) : android::BAD_VALUE);
        if (fits) model.erase(where, where + static_cast<ptrdiff_t>(count));
      } else if (operation == 4 && at < model.size()) {
        vector.editItemAt(at) = Tracked(-step);
        model[at] = -step;
      } else if (operation == 5) {
        vector = Vector<Tracked>(vector);
      } else if (operation == 6 && model.size() < 100) {
        vector.appendVector(vector);
        const std::vector<int> copy(model);
        model.insert(model.end(), copy.begin(), copy.end());
      } else if (below(20) == 0) {
        vector.clear();
        model.clear();
      }
      EXPECT_EQ(vector.insertAt(Tracked(9), model.size() + 1), android::BAD_INDEX);
      EXPECT_EQ(vector.insertAt(Tracked(9), 0, SIZE_MAX / sizeof(Tracked) - below(9)), android::NO_MEMORY);
      ASSERT_EQ(valuesOf(vector), model) << "step " << step;
      ASSERT_GE(vector.capacity(), vector.size());
      ASSERT_EQ(Tracked::alive().size(), model.size()) << "step " << step;
    }
  }
  EXPECT_TRUE(Tracked::alive().empty());
}

}  // namespace
