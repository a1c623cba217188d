// How the Qualcomm wrapper configures an encoder: which records, in which order, byte for byte.
#include <gtest/gtest.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

const std::vector<std::string> kSteps = {
    "getParameter 2000001 port 0", "setParameter 2000001 port 0",  // geometry of the input
    "getParameter 2000001 port 1", "setParameter 2000001 port 1",  // geometry of the output
    "getParameter 600000d port 1", "setParameter 600000d port 1",  // H.264
    "getParameter 2000001 port 1", "setParameter 2000001 port 1",  // bit rate of the port
    "getParameter 6000004 port 1", "setParameter 6000004 port 1",  // rate control
};

TEST(QcomWrapper, ConfiguresAnEncoderStepByStep) {
  EncoderRig rig("msm8960");
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(rig.create(), 0);
  const std::vector<Call> calls = settingCalls(rig.server.omx());
  ASSERT_EQ(inShort(calls), kSteps);

  for (const size_t step : {0U, 2U}) {
    SCOPED_TRACE(step);
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

  EXPECT_EQ(rig.session->_portBufferMode[kOmxInputPort], OMX_BUFFER_CLIENT_MEMORY);
  EXPECT_EQ(rig.session->_portBufferMode[kOmxOutputPort], OMX_BUFFER_CLIENT_MEMORY);
  EXPECT_EQ(logLines(rig.log), LogLines());
}

TEST(QcomWrapper, LeavesH264SettingsAloneForOtherCodecs) {
  EncoderRig rig("msm8960");
  webrtc::VideoCodec codec = settings();
  codec.codecType = webrtc::kVideoCodecOther;
  ASSERT_EQ(rig.create(codec), 0);
  std::vector<std::string> expected = kSteps;
  expected.erase(expected.begin() + 4, expected.begin() + 6);
  EXPECT_EQ(inShort(settingCalls(rig.server.omx())), expected);
}

TEST(QcomWrapper, NeedsAnEncoderSessionToConfigure) {
  webrtc::VideoCodec codec = settings();
  CQcomBoardPlatformWrapper ownerless(nullptr, nullptr, nullptr);
  EXPECT_EQ(ownerless.configureEncoder(&codec), OMXI_ERR_CREATE_INTERFACE);
  OmxInterface notAnEncoder;
  CQcomBoardPlatformWrapper misplaced(&notAnEncoder, nullptr, nullptr);
  EXPECT_EQ(misplaced.configureEncoder(&codec), OMXI_ERR_CREATE_INTERFACE);
  EXPECT_EQ(ownerless.setConfig(CONFIG_BITRATE, 1), OMXI_ERR_SET_CONFIG);
  EXPECT_EQ(ownerless.setPictureOrder(1), OMXI_ERR_PICTURE_ORDER);
}

}  // namespace
