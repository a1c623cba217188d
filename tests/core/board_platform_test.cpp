// Detection happens once per process; each of these tests runs in one of its own.
#include <gtest/gtest.h>

#include <optional>
#include <string>

#include <cutils/properties.h>
#include <omxhost/device.h>

#include "core/omx_interface.h"
#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"
#include "platform/soc_build_id.h"

namespace {

struct PlatformCase {
  const char* property;
  int type;
  const char* decoder;
  const char* encoder;
};

std::ostream& operator<<(std::ostream& stream, const PlatformCase& each) {
  return stream << '"' << each.property << '"';
}

constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";
constexpr const char* kQcomEncoder = "OMX.qcom.video.encoder.avc";
constexpr const char* kTiDecoder = "OMX.TI.DUCATI1.VIDEO.DECODER==";
constexpr const char* kTiEncoder = "OMX.TI.DUCATI1.VIDEO.H264E";

class BoardPlatformTest : public ::testing::TestWithParam<PlatformCase> {};

TEST_P(BoardPlatformTest, IsDetectedFromTheProperty) {
  property_set("ro.board.platform", GetParam().property);
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), GetParam().type);
  EXPECT_STREQ(CBoardPlatformWrapper::getHardwareDecodeCodecIdentifierString(), GetParam().decoder);
  EXPECT_STREQ(CBoardPlatformWrapper::getHardwareEncodeCodecIdentifierString(), GetParam().encoder);
  CBoardPlatformWrapper* const wrapper =
      CBoardPlatformWrapper::CreateBoardPlatformWrapper(nullptr, nullptr, nullptr);
  EXPECT_EQ(wrapper != nullptr, GetParam().type != BOARD_PLATFORM_OTHER);
  CBoardPlatformWrapper::Destroy(wrapper);

  // Once detected it stays.
  property_set("ro.board.platform", GetParam().type == BOARD_PLATFORM_TI ? "msm8960" : "omap4430");
  EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), GetParam().type);
}

INSTANTIATE_TEST_SUITE_P(
    Properties, BoardPlatformTest,
    ::testing::Values(PlatformCase{"MSM8960", BOARD_PLATFORM_QCOM, kQcomDecoder, kQcomEncoder},
                      PlatformCase{"msm7627a", BOARD_PLATFORM_QCOM, kQcomDecoder, kQcomEncoder},
                      PlatformCase{"msm", BOARD_PLATFORM_QCOM, kQcomDecoder, kQcomEncoder},
                      PlatformCase{"OMAP4", BOARD_PLATFORM_TI, kTiDecoder, kTiEncoder},
                      PlatformCase{"omap3", BOARD_PLATFORM_TI, kTiDecoder, kTiEncoder},
                      PlatformCase{"oma", BOARD_PLATFORM_OTHER, nullptr, nullptr},
                      PlatformCase{"xmsm", BOARD_PLATFORM_OTHER, nullptr, nullptr},
                      PlatformCase{"exynos4", BOARD_PLATFORM_OTHER, nullptr, nullptr},
                      PlatformCase{"", BOARD_PLATFORM_OTHER, nullptr, nullptr}));

struct ModeCase {
  const char* property;
  bool isEncoder;
  int input;
  int output;
};

std::ostream& operator<<(std::ostream& stream, const ModeCase& each) {
  return stream << each.property << (each.isEncoder ? " encoder" : " decoder");
}

class BufferModeTest : public ::testing::TestWithParam<ModeCase> {};

TEST_P(BufferModeTest, IsSetByTheWrapper) {
  property_set("ro.board.platform", GetParam().property);
  OmxInterface session;
  session._isEncoder = GetParam().isEncoder;
  session.setPortBufferModes(7, 7);
  CBoardPlatformWrapper* const wrapper =
      CBoardPlatformWrapper::CreateBoardPlatformWrapper(&session, nullptr, nullptr);
  EXPECT_EQ(session._portBufferMode[kOmxInputPort], GetParam().input);
  EXPECT_EQ(session._portBufferMode[kOmxOutputPort], GetParam().output);
  CBoardPlatformWrapper::Destroy(wrapper);
}

INSTANTIATE_TEST_SUITE_P(Sessions, BufferModeTest,
                         ::testing::Values(ModeCase{"msm8960", true, 1, 1}, ModeCase{"msm8960", false, 1, 0},
                                           ModeCase{"omap4430", true, 0, 0},
                                           ModeCase{"omap4430", false, 0, 0}));

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
