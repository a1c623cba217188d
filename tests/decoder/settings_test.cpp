// What can be set and asked of a decoder.
#include <limits.h>

#include "tests/core/records.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

using SettingsTest = DecoderSessionTest;

TEST_F(SettingsTest, TheCompressionFormatIsWrittenIntoTheComponentsDefinition) {
  using Definition = OMX_PARAM_PORTDEFINITIONTYPE;
  constexpr auto kOwn = OMX_VIDEO_CodingMJPEG;  // none that a caller can ask for
  const std::pair<int, OMX_VIDEO_CODINGTYPE> formats[] = {{4, kOwn},
                                                          {INT_MIN, kOwn},
                                                          {1, OMX_VIDEO_CodingMPEG4},
                                                          {2, OMX_VIDEO_CodingH263},
                                                          {3, OMX_VIDEO_CodingWMV}};
  std::vector<mediaserver::VideoFormat> offered;
  for (const auto& [format, coding] : formats) offered.push_back({coding, OMX_COLOR_FormatUnused});
  script().setFormats(0, offered);
  script().editPort(0, [](Definition& port) { port.format.video.eCompressionFormat = kOwn; });
  create();
  for (const auto& [format, coding] : formats) {
    omx().clearCalls();
    EXPECT_EQ(decoder().setInputCompressionFormat(format), 0);
    const std::vector<Call> calls = omx().calls();
    EXPECT_EQ(calls[1].record, edited<Definition>(calls[0],
                                                  [value = coding](Definition& port) {
                                                    port.format.video.eCompressionFormat = value;
                                                  }))
        << format;
  }
  const unsigned char* clip = decoder().initClip();
  EXPECT_EQ(decoder()._clipTable, clip);
  destroy();  // the table outlives it
  for (int value = -278; value <= 535; ++value) EXPECT_EQ(clip[value], std::clamp(value, 0, 255));
}

}  // namespace
}  // namespace omxtest
