#include <gtest/gtest.h>
#include <stdint.h>

#include <algorithm>
#include <memory>
#include <random>
#include <string>
#include <type_traits>
#include <vector>

#include <utils/Vector.h>

namespace {

using android::Vector;

// Short texts do not stand a byte-wise move, long ones no use after their destruction, and owners can be
// counted: leaks and double destructions show.
using Element = std::pair<std::string, std::shared_ptr<int>>;

static_assert(std::is_same_v<decltype(std::declval<Vector<int>&>()[0]), const int&>,
              "code that writes through it does not compile on a device");

TEST(Vector, FollowsAPlainModelThroughRandomOperations) {
  std::mt19937 random(1);
  const auto below = [&random](size_t limit) { return random() % limit; };
  const auto owned = std::make_shared<int>();
  {
    Vector<Element> vector;
    std::vector<Element> model;
    for (size_t step = 0; step < 4000; ++step) {
      const Element element(std::string(step % 2 * 30, 'x') + std::to_string(step), owned);
      const size_t at = below(model.size() + 1);
      const auto where = model.begin() + static_cast<ptrdiff_t>(at);
      const size_t count = below(5);
      const size_t operation = below(7);
      if (operation <= 1 || model.empty()) {
        EXPECT_EQ(vector.add(element), static_cast<ssize_t>(model.size()));
        model.push_back(element);
      } else if (operation == 2) {
        // An element of its own, which may move away while it is being copied.
        const size_t own = below(model.size());
        EXPECT_EQ(vector.insertAt(vector[own], at, count), static_cast<ssize_t>(at));
        model.insert(where, count, Element{model[own]});
      } else if (operation == 3) {
        const bool fits = at + count <= model.size();
        EXPECT_EQ(vector.removeItemsAt(at, count), fits ? static_cast<ssize_t>(at) : android::BAD_VALUE);
        if (fits) model.erase(where, where + static_cast<ptrdiff_t>(count));
      } else if (operation == 4 && at < model.size()) {
        vector.editItemAt(at) = model[at] = element;
      } else if (operation == 5) {
        vector = Vector<Element>(vector);
      } else if (below(20) == 0) {
        vector.clear();
        model.clear();
      }
      EXPECT_EQ(vector.insertAt(element, model.size() + 1), android::BAD_INDEX);
      EXPECT_EQ(vector.insertAt(element, 0, SIZE_MAX / sizeof(element) - below(9)), android::NO_MEMORY);
      ASSERT_TRUE(std::equal(vector.begin(), vector.end(), model.begin(), model.end())) << "step " << step;
      ASSERT_EQ(owned.use_count(), static_cast<long>(2 + 2 * model.size())) << "step " << step;
    }
  }
  EXPECT_EQ(owned.use_count(), 1);
}

}  // namespace
