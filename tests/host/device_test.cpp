#include <gtest/gtest.h>
#include <stdlib.h>

#include <array>
#include <memory>
#include <string>
#include <thread>
#include <vector>

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
std::string buildId(size_t count = 4) {
  std::string bytes(count, '#');
  const int got = omxhost::readSocBuildId(bytes.data(), count);
  return got < 0 ? "missing" : bytes.substr(0, static_cast<size_t>(got));
}

TEST(Device, IsMsm8960OrWhatTheEnvironmentSaysAtFirstUse) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        unsetenv("OMXBRIDGE_DEVICE");
        EXPECT_EQ(platform(), "msm8960");
        EXPECT_EQ(buildId(6), "M8960A");
      },
      testing::Eq(""));
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_DEVICE", "omap4", 1);
        std::vector<std::thread> threads;
        for (int i = 0; i < 8; ++i) threads.emplace_back([] { EXPECT_EQ(platform(), "omap4"); });
        for (std::thread& each : threads) each.join();
        setenv("OMXBRIDGE_DEVICE", "msm7x30", 1);
        EXPECT_EQ(buildId(), "missing");
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

TEST(Device, CodeHasTheLastWordOnDevicePropertyAndBuildId) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_DEVICE", "msm9999", 1);  // not even looked at
        EXPECT_FALSE(omxhost::setDevice("nothing"));
        EXPECT_TRUE(omxhost::setDevice("msm8x60"));
        EXPECT_EQ(platform() + buildId(), "msm8x608x60");
        EXPECT_EQ(property_set("ro.board.platform", "OMAP4430"), 0);
        EXPECT_EQ(platform(), "OMAP4430");
        omxhost::setBuildId("863");
        EXPECT_EQ(buildId(100) + buildId(2), "86386");
        omxhost::setBuildId(std::nullopt);
        EXPECT_EQ(buildId(), "missing");
        EXPECT_TRUE(omxhost::setDevice("msm7x30"));
        EXPECT_EQ(platform() + buildId(), "msm7x307x30");
      },
      testing::Eq(""));
}

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
