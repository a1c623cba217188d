#include <gtest/gtest.h>
#include <stdlib.h>

#include <array>
#include <set>
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

TEST(Device, TableNamesEachDeviceOnceWithAllThatItNeeds) {
  std::set<std::string> names;
  for (const omxhost::Device& each : omxhost::devices()) {
    EXPECT_TRUE(names.insert(each.name).second) << each.name;
    EXPECT_EQ(omxhost::findDevice(each.name), &each);
    EXPECT_EQ(each.decoderComponent == nullptr, each.encoderComponent == nullptr) << each.name;
  }
  EXPECT_EQ(names, (std::set<std::string>{"msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4", "msm-unknown",
                                          "exynos4"}));
  EXPECT_EQ(omxhost::findDevice("MSM8960"), nullptr);
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
        EXPECT_TRUE(omxhost::setDevice("exynos4"));
        EXPECT_EQ(omxhost::posedDevice().decoderComponent, nullptr);
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

}  // namespace
