// What can be set and asked of a decoder, and its creation without memory.
#include <limits.h>
#include <string.h>

#include <vector>

#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

using SettingsTest = DecoderSessionTest;
using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

TEST_F(SettingsTest, ACreationWithoutMemoryLeavesNoSession) {
  using faults::Failing;
  struct Failure {
    Failing function;
    size_t size;
    int code;
  };
  std::vector<Failure> failures = {
      {Failing::NothrowNew, sizeof(OmxInterfaceDecoder), OMXI_ERR_CREATE_INTERFACE},
      {Failing::New, sizeof(SessionState), OMXI_ERR_CREATE_INTERFACE},
      {Failing::New, sizeof(OmxCodecObserver), OMXI_ERR_CREATE_OBSERVER}};
  // Of two of one size the first fails.
  if (sizeof(OmxCodecObserver) == sizeof(SessionState)) failures.pop_back();
  for (const auto& failure : failures) {
    int other = 0;
    auto* session = reinterpret_cast<OmxInterfaceDecoder*>(&other);
    const faults::Fault failed(failure.function, failure.size);
    EXPECT_EQ(OmxInterfaceDecoder::Create(&session, nullptr), failure.code);
    EXPECT_EQ(session, nullptr);
    EXPECT_TRUE(failed.happened());
  }
}

TEST_F(SettingsTest, TheCompressionFormatIsWrittenIntoTheComponentsDefinition) {
  constexpr auto kOwn = OMX_VIDEO_CodingMJPEG;  // none that a caller can ask for
  // Those that leave the component's own come first.
  const std::pair<int, OMX_VIDEO_CODINGTYPE> formats[] = {{4, kOwn},
                                                          {-1, kOwn},
                                                          {INT_MAX, kOwn},
                                                          {INT_MIN, kOwn},
                                                          {0, OMX_VIDEO_CodingAVC},
                                                          {1, OMX_VIDEO_CodingMPEG4},
                                                          {2, OMX_VIDEO_CodingH263},
                                                          {3, OMX_VIDEO_CodingWMV}};
  std::vector<mediaserver::VideoFormat> offered;
  for (const auto& [format, coding] : formats) offered.push_back({coding, OMX_COLOR_FormatUnused});
  script().setFormats(0, offered);
  script().editPort(0, [](Definition& port) {
    port.format.video.eCompressionFormat = kOwn;
    port.format.video.nFrameWidth = 352;
  });
  create();
  for (const auto& [format, coding] : formats) {
    SCOPED_TRACE(format);
    omx().clearCalls();
    EXPECT_EQ(decoder().setInputCompressionFormat(format), 0);
    EXPECT_EQ(trace(), (Trace{"getParameter definition of port 0 size word 0",
                              "setParameter definition of port 0 size word 0"}));
    auto expected = *omx().calls()[0].as<Definition>();
    EXPECT_EQ(expected.format.video.nFrameWidth, 352u);
    expected.format.video.eCompressionFormat = coding;
    const auto written = *omx().calls()[1].as<Definition>();
    EXPECT_EQ(memcmp(&written, &expected, sizeof(written)), 0);
  }
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(SettingsTest, TheBufferCountIsTheInputPortsPresentOne) {
  script().editPort(0, [](Definition& port) { port.nBufferCountActual = 7; });
  create();
  omx().clearCalls();
  EXPECT_EQ(decoder().getBufferNum(), 7);
  EXPECT_EQ(trace(), Trace{"getParameter definition of port 0"});
}

TEST_F(SettingsTest, TheClipTableClampsToAByteAndOutlivesItsSession) {
  create();
  EXPECT_EQ(decoder()._clipTable, nullptr);
  const unsigned char* clip = decoder().initClip();
  EXPECT_EQ(decoder()._clipTable, clip);
  destroy();
  create();
  EXPECT_EQ(decoder().initClip(), clip);
  destroy();
  for (int value = -278; value <= 535; ++value) EXPECT_EQ(clip[value], std::clamp(value, 0, 255));
}

}  // namespace
}  // namespace omxtest
