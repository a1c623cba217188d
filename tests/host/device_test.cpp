#include <gtest/gtest.h>
#include <stdlib.h>
#include <string.h>

#include <array>
#include <memory>
#include <string>

#include <cutils/properties.h>
#include <omxhost/device.h>

#include "tests/host/new_process.h"

namespace {

std::string platform() {
  std::array<char, PROPERTY_VALUE_MAX> value{};
  property_get("ro.board.platform", value.data(), "");
  return value.data();
}

// What a reader of the file gets, "missing" where there is none.
std::string buildId(size_t count) {
  std::string bytes(count, '#');
  const int got = omxhost::readSocBuildId(bytes.data(), count);
  return got < 0 ? "missing" : bytes.substr(0, static_cast<size_t>(got));
}

TEST(Device, IsMsm8960OrWhatTheEnvironmentSaysAtFirstUse) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        unsetenv("OMXBRIDGE_DEVICE");
        EXPECT_EQ(platform(), "msm8960");
        EXPECT_EQ(buildId(6) + buildId(2), "M8960AM8");
      },
      testing::Eq(""));
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_DEVICE", "omap4", 1);
        EXPECT_EQ(platform(), "omap4");
        setenv("OMXBRIDGE_DEVICE", "msm7x30", 1);
        EXPECT_EQ(buildId(4), "missing");
      },
      testing::Eq(""));
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_DEVICE", "msm9999", 1);
        unsetenv("OMXBRIDGE_LOG");
        EXPECT_EQ(platform(), "msm8960");
        EXPECT_EQ(platform(), "msm8960");
      },
      testing::ContainsRegex("^E/omxhost: .*\"msm9999\".*msm7x30.*exynos4.*msm8960\n$"));
}

TEST(Properties, GiveTheDefaultWhereUnsetOrEmptyAndKeepExactLimits) {
  // Into a buffer of exactly the size that callers must have.
  const auto read = [](const char* key, const char* otherwise) {
    const auto buffer = std::make_unique<std::array<char, PROPERTY_VALUE_MAX>>();
    const int length = property_get(key, buffer->data(), otherwise);
    EXPECT_EQ(strlen(buffer->data()), static_cast<size_t>(length));
    return std::string(buffer->data());
  };
  const std::string value91(91, 'v'), key31(31, 'k');
  EXPECT_EQ(read("test.unset", nullptr), "");
  EXPECT_EQ(read("test.unset", (value91 + "cut").c_str()), value91);
  for (const char* value : {"set", ""}) {
    EXPECT_EQ(property_set("test.value", value), 0);
    EXPECT_EQ(read("test.value", "fallback"), *value == 0 ? "fallback" : value);
  }
  EXPECT_EQ(property_set(key31.c_str(), value91.c_str()), 0);
  EXPECT_EQ(property_set(key31.c_str(), (value91 + "v").c_str()), -1);
  EXPECT_EQ(read(key31.c_str(), ""), value91);
  EXPECT_EQ(property_set((key31 + "k").c_str(), "value"), -1);
}

}  // namespace
