#include <gtest/gtest.h>

#include <vector>

#include <utils/List.h>

namespace {

using android::List;

TEST(List, InsertsAndErasesWhileIteratorsStay) {
  List<int> list;
  EXPECT_TRUE(list.empty());
  list.push_back(2);
  list.push_back(4);
  list.push_front(1);
  const List<int>::iterator four = --list.end();
  EXPECT_EQ(*list.insert(four, 3), 3);
  EXPECT_EQ(*list.erase(list.begin()), 2);
  EXPECT_EQ(*four, 4);
  EXPECT_EQ(list.size(), 3U);

  List<int> copy(list);
  EXPECT_EQ(*copy.erase(copy.begin(), --copy.end()), 4);
  copy.insert(copy.end(), list.begin(), list.end());
  std::vector<int> values;
  const List<int>& read = copy;
  for (List<int>::const_iterator each = read.begin(); each != read.end(); each++) values.push_back(*each);
  EXPECT_EQ(values, (std::vector<int>{4, 2, 3, 4}));
  list.clear();
  EXPECT_TRUE(list.empty());
}

}  // namespace
