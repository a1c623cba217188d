// How the TI wrapper configures an encoder: which records, in which order, byte for byte.
#include <gtest/gtest.h>

#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

constexpr OMX_U32 kTiSemiPlanar = 0x7F000100;

const std::vector<std::string> kSteps = {
    "getParameter 6000001 port 0",     "setParameter 6000001 port 0",  // format of the input
    "getParameter 6000001 port 1",     "setParameter 6000001 port 1",  // format of the output
    "getParameter 2000001 port 0",     "setParameter 2000001 port 0",  // the input
    "getParameter 2000001 port 1",     "setParameter 2000001 port 1",  // the output
    "getParameter 600000d port 1",     "setParameter 600000d port 1",  // H.264
    "getParameter 6000010 port 1",     "setParameter 6000010 port 1",  // profile and level
    "getParameter 6000004 port 1",     "setParameter 6000004 port 1",  // rate control
    "storeMetaDataInBuffers 0 port 0",
};

TEST(TiWrapper, ConfiguresAnEncoderStepByStep) {
  EncoderRig rig("omap4");
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  rig.server.encoder().answer(OMX_IndexParamVideoProfileLevelCurrent, patternRecord<24>(1));
  webrtc::VideoCodec codec = settings();
  codec.width = 180;
  codec.codecSpecific.H264.entropyCoding = 0xC8;
  ASSERT_EQ(rig.create(codec), 0);
  const std::vector<Call> calls = settingCalls(rig.server.omx());
  ASSERT_EQ(inShort(calls), kSteps);

  EXPECT_EQ(calls[1].record, calls[0].record) << "the input's format is confirmed as it is";
  EXPECT_EQ(calls[3].record, calls[2].record) << "the output's first format is the one looked for";
  EXPECT_EQ(calls[5].record, edited<Definition>(calls[4], [](Definition& definition) {
              definition.nBufferSize = 180 * 144 * 3 / 2;
              auto& video = definition.format.video;
              video.nFrameWidth = 180;
              video.nFrameHeight = 144;
              video.nStride = 192;
              video.nSliceHeight = 0;
              video.xFramerate = 0x1E0000;
              video.eCompressionFormat = OMX_VIDEO_CodingUnused;
              video.eColorFormat = static_cast<OMX_COLOR_FORMATTYPE>(kTiSemiPlanar);
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
  const OMX_U32 predictionMode = words(calls[8].record)[21];
  const Words avc{108,
                  kVersion,
                  1,
                  0,
                  60,
                  0,
                  1,
                  2,
                  0,
                  0,
                  0,
                  0,
                  0,
                  0,
                  OMX_VIDEO_AVCProfileMain,
                  OMX_VIDEO_AVCLevel31,
                  3,
                  1,
                  0,
                  0xC8,
                  0,
                  predictionMode,
                  0,
                  0,
                  0,
                  0,
                  0};
  EXPECT_EQ(words(calls[9].record), avc);
  EXPECT_EQ(predictionMode, patternRecord<108>(1)[21]);
  EXPECT_EQ(words(calls[11].record), (Words{24, kVersion, 1, OMX_VIDEO_AVCProfileMain, OMX_VIDEO_AVCLevel31,
                                            patternRecord<24>(1)[5]}));
  EXPECT_EQ(words(calls[13].record), (Words{20, kVersion, 1, OMX_Video_ControlRateVariable, 500000}));
  EXPECT_EQ(calls[14].enable, OMX_FALSE);

  EXPECT_EQ(rig.session->_portBufferMode[kOmxInputPort], OMX_BUFFER_COMPONENT_ALLOCATES);
  EXPECT_EQ(rig.session->_portBufferMode[kOmxOutputPort], OMX_BUFFER_COMPONENT_ALLOCATES);
  EXPECT_EQ(logLines(rig.log), LogLines());
}

TEST(TiWrapper, LooksForTheOutputFormatUntilTheListEnds) {
  EncoderRig rig("omap4");
  const auto indices = [&] {
    std::vector<OMX_U32> result;
    for (const Call& call : rig.server.omx().calls(Method::GetParameter)) {
      const Words record = words(call.record);
      if (call.index == OMX_IndexParamVideoPortFormat && record[2] == 1) result.push_back(record[3]);
    }
    return result;
  };
  // Near misses in front of the match: another coding, a colour besides the coding.
  rig.server.encoder().setFormats(1, {{OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused},
                                      {OMX_VIDEO_CodingAVC, OMX_COLOR_FormatYUV420SemiPlanar},
                                      {OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}});
  EXPECT_EQ(rig.create(), 0);
  EXPECT_EQ(indices(), (std::vector<OMX_U32>{0, 1, 2}));

  rig.server.encoder().setFormats(1, {{OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused}});
  EXPECT_EQ(rig.create(), -1);
  EXPECT_EQ(indices(), (std::vector<OMX_U32>{0, 1}));
  EXPECT_EQ(rig.log.count("get OMX_IndexParamVideoPortFormat OutPort Error:"), 1U);
}

TEST(TiWrapper, ComputesOnSignedWordsAndMapsProfilesAndRates) {
  EncoderRig rig("omap4");
  const struct {
    int32_t profile;
    OMX_U32 profileWord;  // zero for one that is not offered
    uint8_t rate;
    uint8_t rateLeft;  // in the caller's record
    uint16_t width;
    uint16_t height;
    OMX_U32 bytes;
    OMX_S32 stride;
  } cases[] = {{66, 1, 0, 2, 176, 144, 38016, 176},
               {77, 2, 1, 2, 1920, 1088, 3133440, 1920},
               {100, 8, 2, 2, 3, 1, 4, 16},                          // 9 halved
               {88, 0, 30, 30, 40000, 20000, 0xC7868C00, 40000},     // 2400000000 as a signed word, halved
               {-1, 0, 255, 255, 65535, 65535, 0xFFFD0001, 65536}};  // wrapped
  for (const auto& each : cases) {
    SCOPED_TRACE(each.profile);
    ASSERT_EQ(rig.create(), 0);
    rig.server.omx().clearCalls();
    webrtc::VideoCodec codec = settings();
    codec.codecSpecific.H264.profile = each.profile;
    codec.maxFramerate = each.rate;
    EXPECT_EQ(rig.session->configureEncoder(&codec), 0);
    EXPECT_EQ(codec.maxFramerate, each.rateLeft);
    std::vector<Call> calls = settingCalls(rig.server.omx());
    EXPECT_EQ(calls[5].as<Definition>()->format.video.xFramerate, OMX_U32{each.rateLeft} << 16);
    EXPECT_EQ(words(calls[9].record)[14], each.profileWord);
    EXPECT_EQ(words(calls[11].record)[3], each.profileWord);
    rig.server.omx().clearCalls();
    codec.width = each.width;
    codec.height = each.height;
    static_cast<void>(rig.session->configureEncoder(&codec));  // the component may refuse such a size
    const auto definition = settingCalls(rig.server.omx()).at(5).as<Definition>();
    EXPECT_EQ(definition->nBufferSize, each.bytes);
    EXPECT_EQ(definition->format.video.nStride, each.stride);
  }
}

}  // namespace
