#include <gtest/gtest.h>

#include <array>
#include <string>

#include <cutils/properties.h>

namespace {

// Reads into a buffer of exactly the size that callers must have, in memory that ends behind it.
void expectRead(const char* key, const char* otherwise, const std::string& value) {
  const auto buffer = std::make_unique<std::array<char, PROPERTY_VALUE_MAX>>();
  buffer->fill('#');
  EXPECT_EQ(property_get(key, buffer->data(), otherwise), static_cast<int>(value.size()));
  EXPECT_EQ(std::string(buffer->data()), value);
}

TEST(Properties, GiveTheDefaultWhereUnsetOrEmptyAndKeepExactLimits) {
  expectRead("test.unset", "fallback", "fallback");
  expectRead("test.unset", nullptr, "");
  expectRead(nullptr, "fallback", "fallback");
  for (const char* value : {"set", "", "again", static_cast<const char*>(nullptr)}) {
    EXPECT_EQ(property_set("test.value", value), 0);
    const bool empty = value == nullptr || *value == 0;
    expectRead("test.value", "fallback", empty ? "fallback" : value);
  }
  const std::string value91(91, 'v');
  const std::string key31(31, 'k');
  EXPECT_EQ(property_set(key31.c_str(), value91.c_str()), 0);
  EXPECT_EQ(property_set(key31.c_str(), (value91 + "v").c_str()), -1);
  expectRead(key31.c_str(), "", value91);
  for (const char* key : {"a.name.of.thirty-two.characters2", "", static_cast<const char*>(nullptr)}) {
    EXPECT_EQ(property_set(key, "value"), -1);
  }
  expectRead("test.unset", (value91 + "cut").c_str(), value91);
}

}  // namespace
