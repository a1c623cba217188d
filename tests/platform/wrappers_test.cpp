// The chip's generation, and how the vendors' wrappers set up encoders and decoders: which records, byte for
// byte.
#include <optional>

#include <cutils/properties.h>

#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

TEST(HardwareBaseVersionTest, FollowsThePropertyAndThenTheBuildId) {
  const struct {
    const char* property;
    std::optional<std::string> buildId;
    int version;
  } cases[] = {
      {"OMAP4", "7630", HW_VERSION_OMAP4},
      {"omap3630", "7630", HW_VERSION_MSM7X30},
      {"omap3630", std::nullopt, HW_VERSION_UNKNOWN},
      {"msm7x30", "7x30B-SCAQ", HW_VERSION_MSM7X30},
      {"msm7x30", "7631", HW_VERSION_QCOM_OTHER},
      {"msm7x30", "7640", HW_VERSION_QCOM_OTHER},
      {"msm7x30", "8255", HW_VERSION_MSM8X55},
      {"msm8660", "8260\n", HW_VERSION_MSM8X60},
      {"msm8960", "8960", HW_VERSION_MSM8X60},
      {"msm8960", "9960", HW_VERSION_QCOM_OTHER},
      {"msm8960", "866", HW_VERSION_UNKNOWN},
  };
  for (const auto& each : cases) {
    property_set("ro.board.platform", each.property);
    omxhost::setBuildId(each.buildId);
    EXPECT_EQ(CBoardPlatformWrapper::GetBoardPlatformType(), BOARD_PLATFORM_TI);
    EXPECT_EQ(getHardwareBaseVersion(), each.version)
        << each.property << " " << each.buildId.value_or("(no file)");  // asked anew at every call
  }
}

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;
using QcomWrapper = SessionTest;

class TiWrapper : public SessionTest {
 protected:
  TiWrapper() : SessionTest("omap4") {}
};

class EitherWrapper : public SessionTest, public ::testing::WithParamInterface<const char*> {
 protected:
  EitherWrapper() : SessionTest(GetParam()) {}
};

TEST_F(QcomWrapper, ConfiguresAnEncoderStepByStep) {
  script().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(createEncoder(), 0);
  const std::vector<Call> calls = settingCalls();
  ASSERT_EQ(calls.size(), 10U);
  for (const size_t step : {0U, 2U}) {
    EXPECT_EQ(calls[step + 1].record, edited<Definition>(calls[step], [](Definition& definition) {
                definition.format.video.nFrameWidth = 176;
                definition.format.video.nFrameHeight = 144;
                definition.format.video.xFramerate = 30 << 16;
                definition.format.video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;
              }));
  }
  // What the encoder's settings say, and everything else as the component has it.
  const auto p = patternRecord<108>(1);
  const OMX_U32 profile = OMX_VIDEO_AVCProfileMain, level = OMX_VIDEO_AVCLevel31;
  const Words avc{108,     kVersion, 1,     p[3], 59, 0, 1, 2,     p[8], p[9], p[10], 0,     0,    0,
                  profile, level,    p[16], 1,    0,  1, 0, p[21], 1,    1,    0,     p[25], p[26]};
  EXPECT_EQ(words(calls[5].record), avc);
  EXPECT_EQ(calls[7].record, edited<Definition>(calls[6], [](Definition& definition) {
              definition.format.video.nBitrate = 500000;
            }));
  EXPECT_EQ(words(calls[9].record),
            (Words{20, kVersion, 1, OMX_Video_ControlRateVariableSkipFrames, 500000}));
}

using AvcSettings = EitherWrapper;

TEST_P(AvcSettings, FollowTheApplicationButOnAnMsm7x30) {
  const bool baselineOnly = GetParam() == std::string("msm7x30");
  const OMX_U32 own = patternRecord<108>(1)[14];
  // As the application says; nPFrames, eProfile, CABAC and 8x8 as they are written.
  const std::pair<webrtc::VideoCodecH264, Words> cases[] = {
      {{{}, 66, 30, {}, 0, 0, 0}, {29, 1, 0, 0}},
      {{{}, 100, 0, {}, 0, 1, 1}, {0xFFFF, 8, 1, 1}},                            // no further key frames
      {{{}, 88, INT32_MIN, {}, 0, 0xC8, 0x80}, {0x7FFFFFFF, own, 0xC8, 0x80}}};  // flags other than 1
  script().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(createEncoder(), 0);
  for (auto [h264, written] : cases) {
    EXPECT_EQ(encoder().setupAvcSettings(&h264), 0);
    const Words record = words(settingCalls().back().record);
    if (baselineOnly) written = {written[0], OMX_VIDEO_AVCProfileBaseline, 0, 0};
    EXPECT_EQ((Words{record[4], record[14], record[19], record[23]}), written);
  }
}

INSTANTIATE_TEST_SUITE_P(Devices, AvcSettings, ::testing::Values("msm8960", "msm7x30"));

TEST_F(QcomWrapper, SendsADecoderOneVendorRecordForEachSetting) {
  ASSERT_EQ(createDecoder(), 0);
  const auto last = [&] { return words(omx().calls(Method::SetParameter).back().record); };
  for (const auto& [order, word] : {std::pair(0, 1u), std::pair(1, 2u), std::pair(2, 0u)}) {
    EXPECT_EQ(decoder().setPictureOrder(order), 0);
    EXPECT_EQ(last(), (Words{16, 0, 0, word}));  // without a version
  }
  for (const auto& [format, word] : {std::pair(1, 3u), std::pair(2, 1u), std::pair(7, 0u)}) {
    EXPECT_EQ(decoder().setInputPackingFormat(format), 0);
    EXPECT_EQ(last(), (Words{24, kVersion, 0, 0, 0, word}));
  }
}

constexpr auto kTiSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);

TEST_F(TiWrapper, ConfiguresAnEncoderStepByStep) {
  script().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  script().answer(OMX_IndexParamVideoProfileLevelCurrent, patternRecord<24>(1));
  // A near miss in front of the match.
  script().setFormats(1, {{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatYUV420SemiPlanar},
                          {OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}});
  webrtc::VideoCodec codec = settings();
  codec.width = 180;
  codec.codecSpecific.H264.entropyCoding = 0xC8;
  ASSERT_EQ(createEncoder(codec), 0);
  std::vector<Call> calls = settingCalls();
  ASSERT_EQ(calls.size(), 16U);
  EXPECT_EQ(calls[1].record, calls[0].record) << "the input's format is confirmed as it is";
  for (const size_t i : {0U, 1U}) EXPECT_EQ(words(calls[2 + i].record)[3], i);
  EXPECT_EQ(calls[4].record, calls[3].record) << "the output's second format is the one looked for";
  calls.erase(calls.begin() + 2);
  EXPECT_EQ(calls[5].record, edited<Definition>(calls[4], [](Definition& definition) {
              definition.nBufferSize = 180 * 144 * 3 / 2;
              auto& video = definition.format.video;
              video.nFrameWidth = 180;
              video.nFrameHeight = 144;
              video.nStride = 192;
              video.nSliceHeight = 0;
              video.xFramerate = 0x1E0000;
              video.eCompressionFormat = OMX_VIDEO_CodingUnused;
              video.eColorFormat = kTiSemiPlanar;
            }));
  EXPECT_EQ(calls[7].record, edited<Definition>(calls[6], [](Definition& definition) {
              definition.nBufferCountActual = 4;
              auto& video = definition.format.video;
              video.nFrameWidth = 180;
              video.nFrameHeight = 144;
              video.nBitrate = 500000;
              video.xFramerate = 0;
              video.eCompressionFormat = OMX_VIDEO_CodingAVC;
              video.eColorFormat = OMX_COLOR_FormatUnused;
            }));
  // All of it is ours but the weighted prediction mode.
  const OMX_U32 mode = patternRecord<108>(1)[21];
  const OMX_U32 profile = OMX_VIDEO_AVCProfileMain, level = OMX_VIDEO_AVCLevel31;
  const Words avc{108,     kVersion, 1, 0, 60, 0,    1, 2,    0, 0, 0, 0, 0, 0,
                  profile, level,    3, 1, 0,  0xC8, 0, mode, 0, 0, 0, 0, 0};
  EXPECT_EQ(words(calls[9].record), avc);
  EXPECT_EQ(words(calls[11].record), (Words{24, kVersion, 1, profile, level, patternRecord<24>(1)[5]}));
  EXPECT_EQ(words(calls[13].record), (Words{20, kVersion, 1, OMX_Video_ControlRateVariable, 500000}));
  EXPECT_EQ(calls[14].enable, OMX_FALSE);

  script().setFormats(1, {{OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused}});
  EXPECT_EQ(createEncoder(), -1);
}

TEST_F(TiWrapper, ComputesOnSignedWordsAndMapsProfilesAndRates) {
  for (const auto& [profile, word] : {std::pair(66, 1u), std::pair(100, 8u), std::pair(88, 0u)}) {
    webrtc::VideoCodec codec = settings();
    codec.codecSpecific.H264.profile = profile;
    codec.maxFramerate = 1;
    ASSERT_EQ(createEncoder(), 0);
    omx().clearCalls();
    EXPECT_EQ(encoder().configureEncoder(&codec), 0);
    EXPECT_EQ(codec.maxFramerate, 2u);  // in the caller's record
    const std::vector<Call> calls = settingCalls();
    EXPECT_EQ(calls[5].as<Definition>()->format.video.xFramerate, 2u << 16);
    EXPECT_EQ(words(calls[9].record)[14], word);
    EXPECT_EQ(words(calls[11].record)[3], word);
  }
  webrtc::VideoCodec codec = settings();
  codec.width = 40000;
  codec.height = 20000;
  omx().clearCalls();
  static_cast<void>(encoder().configureEncoder(&codec));  // the component may refuse such a size
  EXPECT_EQ(settingCalls().at(5).as<Definition>()->nBufferSize, 0xC7868C00) << "half of a negative word";
}

TEST_F(TiWrapper, ChoosesTheDecodersOwnOutputLayout) {
  _server.decoder().editPort(0, [](Definition& definition) { definition.nBufferCountActual = 9; });
  ASSERT_EQ(createDecoder(), 0);
  const std::vector<Call> calls = omx().calls();  // behind those that found the component
  ASSERT_EQ(calls.size(), 9U);
  EXPECT_EQ(calls[4].record, calls[3].record) << "the second format of the list is the one looked for";
  EXPECT_EQ(calls[4].as<OMX_VIDEO_PARAM_PORTFORMATTYPE>()->eColorFormat, kTiSemiPlanar);
  EXPECT_EQ(calls[6].record, edited<Definition>(calls[5], [](Definition& definition) {
              definition.nBufferCountActual = 4;
              definition.format.video.eCompressionFormat = OMX_VIDEO_CodingAVC;
            }));
  EXPECT_EQ(calls[8].record, edited<Definition>(calls[7], [](Definition& definition) {
              definition.format.video.eCompressionFormat = OMX_VIDEO_CodingUnused;
              definition.format.video.eColorFormat = kTiSemiPlanar;
            }));
}

struct Item {
  CONFIGTYPE type;
  unsigned long value;
  OMX_U32 index;
  Words record;
};

const std::vector<Item> kQcomItems = {
    {CONFIG_BITRATE, 500000, 0x06000011, {16, kVersion, 1, 500000}},
    // The size word is the rate as a float.
    {CONFIG_FRAMERATE, 15, 0x06000012, {0x41700000, kVersion, 1, 0x000F0000}},
    {CONFIG_INTRA_PERIOD, 30, 0x7F000007, {24, kVersion, 1, 1, 29, 0}},
    {CONFIG_INTRA_PERIOD, 0, 0x7F000007, {24, kVersion, 1, 1, 0xFFFFFFFF, 0}},
    {CONFIG_REQUEST_IFRAME, 77, 0x06000013, {16, kVersion, 1, 1}},
    {CONFIG_ROTATION, ~0UL, 0x0700000B, {16, kVersion, 1, 0xFFFFFFFF}},
};

const std::vector<Item> kTiItems = {
    {CONFIG_BITRATE, 500000, 0x06000011, {16, kVersion, 1, 500000}},
    {CONFIG_FRAMERATE, 15, 0x06000012, {16, kVersion, 0, 0x000F0000}},  // of the input port
    {CONFIG_FRAMERATE, 1, 0x06000012, {16, kVersion, 0, 0x00020000}},
    {CONFIG_REQUEST_IFRAME, 77, 0x06000013, {16, kVersion, 1, 1}},
    {CONFIG_ROTATION, 270, 0x0700000B, {16, kVersion, 1, 270}},
};

using RuntimeItems = EitherWrapper;

TEST_P(RuntimeItems, AreOneRecordEach) {
  ASSERT_EQ(createEncoder(), 0);
  const bool isTi = GetParam() == std::string("omap4");
  for (const Item& item : isTi ? kTiItems : kQcomItems) {
    SCOPED_TRACE(testing::Message() << "item " << item.type << " value " << item.value);
    omx().clearCalls();
    EXPECT_EQ(encoder().setConfig(item.type, item.value), 0);
    const std::vector<Call> calls = omx().calls();
    ASSERT_EQ(calls.size(), 1U);
    EXPECT_EQ(calls[0].method, Method::SetConfig);
    EXPECT_EQ(static_cast<OMX_U32>(calls[0].index), item.index);
    EXPECT_EQ(words(calls[0].record), item.record);
  }
  omx().clearCalls();
  EXPECT_EQ(encoder().setConfig(static_cast<CONFIGTYPE>(6), 1), OMXI_ERR_SET_CONFIG);
  EXPECT_TRUE(!isTi || encoder().setConfig(CONFIG_INTRA_PERIOD, 30) == 0);
  EXPECT_EQ(omx().count(), 0U);
  EXPECT_EQ(log(), LogLines());
}

INSTANTIATE_TEST_SUITE_P(Vendors, RuntimeItems, ::testing::Values("msm8960", "omap4"));

}  // namespace
}  // namespace omxtest
