// The chip's generation. (The platform's family is detected once a process.)
#include <gtest/gtest.h>

#include <optional>
#include <string>

#include <cutils/properties.h>
#include <omxhost/device.h>

#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"

namespace {

TEST(HardwareBaseVersionTest, FollowsThePropertyAndThenTheBuildId) {
  const struct {
    const char* property;
    std::optional<std::string> buildId;
    int version;
  } cases[] = {
      {"omap4430", std::nullopt, HW_VERSION_OMAP4},  {"OMAP4", "7630", HW_VERSION_OMAP4},
      {"omap3630", "7630", HW_VERSION_MSM7X30},      {"omap3630", std::nullopt, HW_VERSION_UNKNOWN},
      {"msm7x30", "7x30B-SCAQ", HW_VERSION_MSM7X30}, {"msm7x30", "7631", HW_VERSION_QCOM_OTHER},
      {"msm7x30", "7640", HW_VERSION_QCOM_OTHER},    {"msm7x30", "8255", HW_VERSION_MSM8X55},
      {"msm8660", "8260\n", HW_VERSION_MSM8X60},     {"msm8960", "8960", HW_VERSION_MSM8X60},
      {"msm8960", "9960", HW_VERSION_QCOM_OTHER},    {"msm8960", "866", HW_VERSION_UNKNOWN},
  };
  for (const auto& each : cases) {
    property_set("ro.board.platform", each.property);
    omxhost::setBuildId(each.buildId);
    EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), BOARD_PLATFORM_TI);
    EXPECT_EQ(getHardwareBaseVersion(), each.version)
        << each.property << " " << each.buildId.value_or("(no file)");  // asked anew at every call
  }
}

}  // namespace
