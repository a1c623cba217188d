// WMV: the three ways in which a stream can tell what it is. No encoder is at hand, so headers are written
// here and the pictures' payload is arbitrary bits, which decode to arbitrary pictures.

#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

using Bytes = std::vector<uint8_t>;

constexpr uint8_t kWidth = 48, kHeight = 32;

// The header's bits, and many more.
Bytes picture(Bytes bytes, uint32_t seed) {
  for (int i = 0; i < 260; ++i) {
    seed = seed * 1664525 + 1013904223;
    bytes.push_back(static_cast<uint8_t>(seed >> 8 & 0x7F));
  }
  return bytes;
}

const Bytes kMainSequence = {0x40, 0x01, 0x00, 0x01};  // without any tool
// 4:2:0 of the size above; and the entry point.
const Bytes kAdvancedHeaders = {0,    0,    1, 0x0F, 0xCA, 0x00, 0x01, 0x70, 0x0F,
                                0x08, 0x80, 0, 0,    1,    0x0E, 0x40, 0x00, 0x80};

Bytes fileHeader() {
  Bytes bytes = {3, 0, 0, 0xC5, 4, 0, 0, 0, 0x40, 0x01, 0x00, 0x01, kHeight, 0, 0, 0, kWidth};
  bytes.resize(36);
  return bytes;
}

TEST(Wmv, TellsByItsHeadersHowItIsDecodedAndSurvivesThemCut) {
  const std::vector<Unit> units = {
      {picture({0x00, 0x18}, 1), 0}, {picture({0x2C}, 2), 1}, {picture({0x2C}, 3), 2}};
  const std::vector<Decoded> wanted = decode("wmv3", units, kMainSequence, kWidth, kHeight);
  ASSERT_EQ(wanted.size(), 3U);
  DecoderRun settings("msm8960");
  settings.setInput(OMX_VIDEO_CodingWMV, kWidth, kHeight);
  settings.start();
  settings.sendAll(units);  // not understood yet, and no harm
  settings.send(kMainSequence, 0, OMX_BUFFERFLAG_CODECCONFIG);
  settings.sendAll(units);
  settings.finish();
  expectSame(settings.pictures(), wanted);

  // The header of a file or of the advanced profile, and the first picture behind it in the same buffer.
  std::vector<Unit> file = units;
  file[0].bytes = joined({{fileHeader()}, units[0]});
  const std::vector<Unit> advanced = {
      {joined({{kAdvancedHeaders}, {picture({0, 0, 1, 0x0D, 0xC6, 0x00}, 3)}}), 0},
      {picture({0, 0, 1, 0x0D, 0xC6, 0x00}, 4), 1}};
  const auto expectDecoded = [](const std::vector<Unit>& stream, const std::vector<Decoded>& pictures) {
    DecoderRun run("omap4");
    run.setInput(OMX_VIDEO_CodingWMV);
    run.run(stream);
    expectSame(run.pictures(), pictures);
    EXPECT_EQ(run.errors, Errors{});
  };
  expectDecoded(file, wanted);
  const std::vector<Decoded> two = decode("vc1", advanced, kAdvancedHeaders, kWidth, kHeight);
  ASSERT_EQ(two.size(), 2U);
  expectDecoded(advanced, two);
  for (size_t size = 1; size < 36; size += 3) {
    Bytes header = fileHeader();
    header.resize(size);
    expectDecoded({{header, 0}}, {});
  }
}

}  // namespace
}  // namespace componenttest
