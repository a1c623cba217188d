// How the TI wrapper sets up an encoder and a decoder: which records, byte for byte.
#include <gtest/gtest.h>

#include "decoder/omx_interface_decoder.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

constexpr auto kTiSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);

TEST(TiWrapper, ConfiguresAnEncoderStepByStep) {
  EncoderRig rig("omap4");
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  rig.server.encoder().answer(OMX_IndexParamVideoProfileLevelCurrent, patternRecord<24>(1));
  // Near misses in front of the match: another coding, a colour besides the coding.
  rig.server.encoder().setFormats(1, {{OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused},
                                      {OMX_VIDEO_CodingAVC, OMX_COLOR_FormatYUV420SemiPlanar},
                                      {OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}});
  webrtc::VideoCodec codec = settings();
  codec.width = 180;
  codec.codecSpecific.H264.entropyCoding = 0xC8;
  ASSERT_EQ(rig.create(codec), 0);
  std::vector<Call> calls = rig.settingCalls();
  ASSERT_EQ(calls.size(), 17U);
  EXPECT_EQ(calls[1].record, calls[0].record) << "the input's format is confirmed as it is";
  for (const size_t i : {0U, 1U, 2U}) EXPECT_EQ(words(calls[2 + i].record)[3], i);
  EXPECT_EQ(calls[5].record, calls[4].record) << "the output's third format is the one looked for";
  calls.erase(calls.begin() + 2, calls.begin() + 4);
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
  Words avc(27, 0);
  const std::pair<size_t, OMX_U32> set[] = {{0, 108},
                                            {1, kVersion},
                                            {2, 1},
                                            {4, 60},
                                            {6, 1},
                                            {7, 2},
                                            {14, OMX_VIDEO_AVCProfileMain},
                                            {15, OMX_VIDEO_AVCLevel31},
                                            {16, 3},
                                            {17, 1},
                                            {19, 0xC8},
                                            {21, patternRecord<108>(1)[21]}};
  for (const auto& [place, value] : set) avc[place] = value;
  EXPECT_EQ(words(calls[9].record), avc);
  EXPECT_EQ(words(calls[11].record), (Words{24, kVersion, 1, OMX_VIDEO_AVCProfileMain, OMX_VIDEO_AVCLevel31,
                                            patternRecord<24>(1)[5]}));
  EXPECT_EQ(words(calls[13].record), (Words{20, kVersion, 1, OMX_Video_ControlRateVariable, 500000}));
  EXPECT_EQ(calls[14].enable, OMX_FALSE);

  rig.server.encoder().setFormats(1, {{OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused}});
  EXPECT_EQ(rig.create(), -1);
  EXPECT_EQ(rig.settingCalls().size(), 4U);  // up to the list's end
}

TEST(TiWrapper, ComputesOnSignedWordsAndMapsProfilesAndRates) {
  EncoderRig rig("omap4");
  for (const auto& [profile, word] : {std::pair(66, 1u), std::pair(100, 8u), std::pair(88, 0u)}) {
    webrtc::VideoCodec codec = settings();
    codec.codecSpecific.H264.profile = profile;
    codec.maxFramerate = 1;
    ASSERT_EQ(rig.create(), 0);
    rig.server.omx().clearCalls();
    EXPECT_EQ(rig.session->configureEncoder(&codec), 0);
    EXPECT_EQ(codec.maxFramerate, 2u);  // in the caller's record
    const std::vector<Call> calls = rig.settingCalls();
    EXPECT_EQ(calls[5].as<Definition>()->format.video.xFramerate, 2u << 16);
    EXPECT_EQ(words(calls[9].record)[14], word);
    EXPECT_EQ(words(calls[11].record)[3], word);
  }
  const std::tuple<uint16_t, uint16_t, OMX_U32, OMX_S32> sizes[] = {
      {3, 1, 4, 16},                       // 9 halved
      {40000, 20000, 0xC7868C00, 40000},   // 2400000000 as a signed word, halved
      {65535, 65535, 0xFFFD0001, 65536}};  // wrapped
  for (const auto& [width, height, bytes, stride] : sizes) {
    webrtc::VideoCodec codec = settings();
    codec.width = width;
    codec.height = height;
    rig.server.omx().clearCalls();
    static_cast<void>(rig.session->configureEncoder(&codec));  // the component may refuse such a size
    const auto definition = rig.settingCalls().at(5).as<Definition>();
    EXPECT_EQ(definition->nBufferSize, bytes);
    EXPECT_EQ(definition->format.video.nStride, stride);
  }
}

TEST(TiWrapper, ChoosesTheDecodersOwnOutputLayout) {
  ScriptedMediaServer server("omap4");
  server.decoder().editPort(0, [](Definition& definition) { definition.nBufferCountActual = 9; });
  OmxInterfaceDecoder* session = nullptr;
  ASSERT_EQ(OmxInterfaceDecoder::Create(&session, nullptr), 0);
  const std::unique_ptr<OmxInterfaceDecoder> owner(session);
  const std::vector<Call> calls = server.omx().calls();  // behind those that found the component
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
  EXPECT_EQ(session->setInputPackingFormat(1), 0);  // without a call
  EXPECT_EQ(server.omx().count(), 9U);
}

}  // namespace
}  // namespace omxtest
