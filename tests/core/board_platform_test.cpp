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

struct Vendor {
  int type;
  const char* decoder;
  const char* encoder;
  int modes[3];  // of every input, of a decoder's output, of an encoder's; unchanged without a wrapper
};
constexpr Vendor kQcom{
    BOARD_PLATFORM_QCOM, "OMX.qcom.video.decoder.avc", "OMX.qcom.video.encoder.avc", {1, 0, 1}};
constexpr Vendor kTi{
    BOARD_PLATFORM_TI, "OMX.TI.DUCATI1.VIDEO.DECODER==", "OMX.TI.DUCATI1.VIDEO.H264E", {0, 0, 0}};
constexpr Vendor kOther{BOARD_PLATFORM_OTHER, nullptr, nullptr, {7, 7, 7}};

using PlatformCase = std::pair<const char*, Vendor>;

class BoardPlatformTest : public ::testing::TestWithParam<PlatformCase> {};

TEST_P(BoardPlatformTest, IsDetectedFromThePropertyOnce) {
  const auto& [property, vendor] = GetParam();
  property_set("ro.board.platform", property);
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), vendor.type);
  property_set("ro.board.platform", vendor.type == BOARD_PLATFORM_TI ? "msm8960" : "omap4430");
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), vendor.type);
  EXPECT_STREQ(CBoardPlatformWrapper::getHardwareDecodeCodecIdentifierString(), vendor.decoder);
  EXPECT_STREQ(CBoardPlatformWrapper::getHardwareEncodeCodecIdentifierString(), vendor.encoder);
  for (const bool encoder : {false, true}) {
    OmxInterface session;
    session._isEncoder = encoder;
    session.setPortBufferModes(7, 7);
    auto* const wrapper = CBoardPlatformWrapper::CreateBoardPlatformWrapper(&session, nullptr, nullptr);
    EXPECT_EQ(wrapper != nullptr, vendor.type != BOARD_PLATFORM_OTHER);
    EXPECT_EQ(session._portBufferMode[kOmxInputPort], vendor.modes[0]);
    EXPECT_EQ(session._portBufferMode[kOmxOutputPort], vendor.modes[encoder ? 2 : 1]);
    CBoardPlatformWrapper::Destroy(wrapper);
  }
}

INSTANTIATE_TEST_SUITE_P(Properties, BoardPlatformTest,
                         ::testing::Values(PlatformCase("MSM8960", kQcom), PlatformCase("msm7627a", kQcom),
                                           PlatformCase("msm", kQcom), PlatformCase("OMAP4", kTi),
                                           PlatformCase("omap3", kTi), PlatformCase("oma", kOther),
                                           PlatformCase("xmsm", kOther), PlatformCase("", kOther)));

TEST(HardwareBaseVersionTest, FollowsThePropertyAndThenTheBuildId) {
  const struct {
    const char* property;
    std::optional<std::string> buildId;
    int version;
  } cases[] = {
      {"omap4430", std::nullopt, HW_VERSION_OMAP4}, {"OMAP4", "7630", HW_VERSION_OMAP4},
      {"omap3630", "7630", HW_VERSION_MSM7X30},     {"omap3630", std::nullopt, HW_VERSION_UNKNOWN},
      {"msm7x30", "7630", HW_VERSION_MSM7X30},      {"msm7x30", "7x30B-SCAQ", HW_VERSION_MSM7X30},
      {"msm7x30", "7631", HW_VERSION_QCOM_OTHER},   {"msm7x30", "7640", HW_VERSION_QCOM_OTHER},
      {"msm7x30", "8255", HW_VERSION_MSM8X55},      {"msm7x30", "8x55", HW_VERSION_MSM8X55},
      {"msm7x30", "8250", HW_VERSION_QCOM_OTHER},   {"msm8660", "8660", HW_VERSION_MSM8X60},
      {"msm8660", "8260\n", HW_VERSION_MSM8X60},    {"msm8660", "8665", HW_VERSION_QCOM_OTHER},
      {"msm8960", "8960", HW_VERSION_MSM8X60},      {"msm8960", "9960", HW_VERSION_QCOM_OTHER},
      {"msm8960", "866", HW_VERSION_UNKNOWN},       {"msm8960", "", HW_VERSION_UNKNOWN},
      {"exynos4", "7830", HW_VERSION_MSM7X30},      {"", std::nullopt, HW_VERSION_UNKNOWN},
  };
  for (const auto& each : cases) {
    property_set("ro.board.platform", each.property);
    omxhost::setBuildId(each.buildId);
    EXPECT_EQ(getHardwareBaseVersion(), each.version)
        << each.property << " " << each.buildId.value_or("(no file)");  // asked anew at every call
  }
}

}  // namespace
