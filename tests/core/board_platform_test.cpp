// Detection happens once per process; each of these tests runs in one of its own.
#include <gtest/gtest.h>

#include <optional>
#include <string>

#include <cutils/properties.h>
#include <omxhost/device.h>

#include "core/omx_interface.h"
#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"

namespace {

using PlatformCase = std::pair<const char*, BoardPlatformType>;

class BoardPlatformTest : public ::testing::TestWithParam<PlatformCase> {};

TEST_P(BoardPlatformTest, IsDetectedFromThePropertyOnce) {
  const auto& [property, type] = GetParam();
  property_set("ro.board.platform", property);
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), type);
  property_set("ro.board.platform", type == BOARD_PLATFORM_TI ? "msm8960" : "omap4430");
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), type);
  const bool other = type == BOARD_PLATFORM_OTHER;
  EXPECT_EQ(CBoardPlatformWrapper::getHardwareDecodeCodecIdentifierString() == nullptr, other);
  EXPECT_EQ(CBoardPlatformWrapper::getHardwareEncodeCodecIdentifierString() == nullptr, other);
  EXPECT_EQ(CBoardPlatformWrapper::CreateBoardPlatformWrapper(nullptr, nullptr, nullptr) == nullptr, other);
}

INSTANTIATE_TEST_SUITE_P(Properties, BoardPlatformTest,
                         ::testing::Values(PlatformCase("MSM7627a", BOARD_PLATFORM_QCOM),
                                           PlatformCase("omap3", BOARD_PLATFORM_TI),
                                           PlatformCase("xmsm", BOARD_PLATFORM_OTHER),
                                           PlatformCase("", BOARD_PLATFORM_OTHER)));

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
    EXPECT_EQ(getHardwareBaseVersion(), each.version)
        << each.property << " " << each.buildId.value_or("(no file)");  // asked anew at every call
  }
}

}  // namespace
