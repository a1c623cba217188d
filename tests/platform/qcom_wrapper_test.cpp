// How the Qualcomm wrapper sets up an encoder and a decoder: which records, byte for byte.
#include <gtest/gtest.h>

#include "decoder/omx_interface_decoder.h"
#include "platform/qcom_board_platform_wrapper.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

TEST(QcomWrapper, ConfiguresAnEncoderStepByStep) {
  EncoderRig rig("msm8960");
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(rig.create(), 0);
  std::vector<Call> calls = rig.settingCalls();
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
  Words avc = words(calls[4].record);
  avc[4] = 59;                         // nPFrames
  avc[5] = 0;                          // nBFrames
  avc[6] = 1;                          // bUseHadamard
  avc[7] = 2;                          // nRefFrames
  avc[11] = avc[12] = avc[13] = 0;     // bEnableFMO, bEnableASO, bEnableRS
  avc[14] = OMX_VIDEO_AVCProfileMain;  // eProfile
  avc[15] = OMX_VIDEO_AVCLevel31;      // eLevel
  avc[17] = 1;                         // bFrameMBsOnly
  avc[18] = 0;                         // bMBAFF
  avc[19] = 1;                         // bEntropyCodingCABAC
  avc[20] = 0;                         // bWeightedPPrediction
  avc[22] = 1;                         // bconstIpred
  avc[23] = 1;                         // bDirect8x8Inference
  avc[24] = 0;                         // bDirectSpatialTemporal
  EXPECT_EQ(words(calls[5].record), avc);
  EXPECT_EQ(calls[7].record, edited<Definition>(calls[6], [](Definition& definition) {
              definition.format.video.nBitrate = 500000;
            }));
  EXPECT_EQ(words(calls[9].record),
            (Words{20, kVersion, 1, OMX_Video_ControlRateVariableSkipFrames, 500000}));
  webrtc::VideoCodec codec = settings();
  codec.codecType = webrtc::kVideoCodecOther;  // has no H.264 settings
  ASSERT_EQ(rig.create(codec), 0);
  calls.erase(calls.begin() + 4, calls.begin() + 6);
  EXPECT_EQ(rig.settingCalls().size(), calls.size());
}

class AvcSettings : public ::testing::TestWithParam<const char*> {};

TEST_P(AvcSettings, FollowTheApplicationButOnAnMsm7x30) {
  const bool baselineOnly = GetParam() == std::string("msm7x30");
  const OMX_U32 own = patternRecord<108>(1)[14];
  const struct {
    int32_t profile;
    int32_t keyFrameInterval;
    uint8_t entropyCoding;
    uint8_t transform8x8;
    OMX_U32 pFrames;  // written
    OMX_U32 profileWord;
  } cases[] = {{66, 30, 0, 0, 29, 1},
               {100, 0, 1, 1, 0xFFFF, 8},  // no further key frames
               {88, INT32_MIN, 0, 0, 0x7FFFFFFF, own},
               {77, 1, 0xC8, 0x80, 0, 2}};  // flags other than 1
  EncoderRig rig(GetParam());
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(rig.create(), 0);
  for (const auto& each : cases) {
    webrtc::VideoCodecH264 h264 = {};
    h264.profile = each.profile;
    h264.keyFrameInterval = each.keyFrameInterval;
    h264.entropyCoding = each.entropyCoding;
    h264.transform8x8 = each.transform8x8;
    EXPECT_EQ(rig.session->setupAvcSettings(&h264), 0);
    const Words record = words(rig.settingCalls().back().record);
    EXPECT_EQ((Words{record[4], record[14], record[19], record[23]}),
              (baselineOnly ? Words{each.pFrames, OMX_VIDEO_AVCProfileBaseline, 0, 0}
                            : Words{each.pFrames, each.profileWord, each.entropyCoding, each.transform8x8}));
  }
}

INSTANTIATE_TEST_SUITE_P(Devices, AvcSettings, ::testing::Values("msm8960", "msm7x30"));

TEST(QcomWrapper, SendsADecoderOneVendorRecordForEachSetting) {
  ScriptedMediaServer server("msm8960");
  OmxInterfaceDecoder* session = nullptr;
  ASSERT_EQ(OmxInterfaceDecoder::Create(&session, nullptr), 0);
  const std::unique_ptr<OmxInterfaceDecoder> owner(session);
  const auto last = [&] { return words(server.omx().calls(Method::SetParameter).back().record); };
  for (const auto& [order, word] : {std::pair(0, 1u), std::pair(1, 2u), std::pair(2, 0u)}) {
    EXPECT_EQ(session->setPictureOrder(order), 0);
    EXPECT_EQ(last(), (Words{16, 0, 0, word}));  // without a version
  }
  for (const auto& [format, word] : {std::pair(1, 3u), std::pair(2, 1u), std::pair(7, 0u)}) {
    EXPECT_EQ(session->setInputPackingFormat(format), 0);
    EXPECT_EQ(last(), (Words{24, kVersion, 0, 0, 0, word}));
  }
}

}  // namespace
}  // namespace omxtest
