// WMV: the three ways in which a stream can tell what it is. No encoder is at hand, so headers are written
// here and the pictures' payload is arbitrary bits, which decode to arbitrary pictures.

#include "host/mediaserver/components/annex_b.h"
#include "tests/mediaserver/components/runs.h"

namespace componenttest {
namespace {

using Bytes = std::vector<uint8_t>;

constexpr uint8_t kWidth = 48;
constexpr uint8_t kHeight = 32;

void fill(mediaserver::BitWriter* writer, uint32_t seed) {
  for (int i = 0; i < 300; ++i) {
    seed = seed * 1664525 + 1013904223;
    writer->bits(seed >> 8 & 0x7F, 7);
  }
}

// Sequence header of main profile without any tool.
Bytes mainSequence() {
  mediaserver::BitWriter writer;
  writer.bits(1, 2);  // profile
  writer.bits(0, 10);
  writer.bits(0, 3);  // loop filter, intensity compensation, several resolutions
  writer.bits(1, 1);
  writer.bits(0, 15);
  writer.bits(1, 1);
  return writer.bytes();
}

Bytes mainPicture(bool predicted, uint32_t seed) {
  mediaserver::BitWriter writer;
  writer.bits(0, 2);
  writer.bits(predicted ? 1 : 0, 1);
  if (!predicted) writer.bits(0, 7);
  writer.bits(12, 5);  // quantizer
  fill(&writer, seed);
  return writer.bytes();
}

Bytes advancedHeaders() {
  mediaserver::BitWriter sequence;
  sequence.bits(3 << 5 | 1 << 2 | 1, 7);  // advanced, some level, 4:2:0
  sequence.bits(0, 9);
  sequence.bits(kWidth / 2 - 1, 12);
  sequence.bits(kHeight / 2 - 1, 12);
  sequence.bits(0, 4);
  sequence.bits(1, 1);
  sequence.bits(0, 3);
  sequence.finish();
  mediaserver::BitWriter entry;
  entry.bits(1, 2);
  entry.bits(0, 14);
  entry.finish();
  Bytes bytes = {0, 0, 1, 0x0F};
  bytes.insert(bytes.end(), sequence.bytes().begin(), sequence.bytes().end());
  bytes.insert(bytes.end(), {0, 0, 1, 0x0E});
  bytes.insert(bytes.end(), entry.bytes().begin(), entry.bytes().end());
  return bytes;
}

Bytes advancedPicture(uint32_t seed) {
  mediaserver::BitWriter writer;
  writer.bits(6, 3);  // intra
  writer.bits(0, 1);
  writer.bits(12, 5);  // quantizer
  fill(&writer, seed);
  Bytes bytes = {0, 0, 1, 0x0D};
  bytes.insert(bytes.end(), writer.bytes().begin(), writer.bytes().end());
  return bytes;
}

void append(Bytes* to, const Bytes& from) {
  to->insert(to->end(), from.begin(), from.end());
}

// The header of a file.
Bytes fileHeader() {
  Bytes bytes = {3, 0, 0, 0xC5, 4, 0, 0, 0};
  append(&bytes, mainSequence());
  append(&bytes, {kHeight, 0, 0, 0, kWidth, 0, 0, 0});
  bytes.resize(36);
  return bytes;
}

TEST(Wmv, TellsByItsHeadersHowItIsDecodedAndSurvivesThemCut) {
  const std::vector<Unit> units = {
      {mainPicture(false, 1), 0}, {mainPicture(true, 2), 1}, {mainPicture(true, 3), 2}};
  const std::vector<Decoded> wanted = decode("wmv3", units, mainSequence(), kWidth, kHeight);
  ASSERT_EQ(wanted.size(), 3U);
  DecoderRun settings("msm8960");
  settings.setInput(OMX_VIDEO_CodingWMV, kWidth, kHeight);
  settings.start();
  settings.sendAll(units);  // not understood yet, and no harm
  settings.send(mainSequence(), 0, OMX_BUFFERFLAG_CODECCONFIG);
  settings.sendAll(units);
  settings.finish();
  expectSame(settings.pictures(), wanted);

  // The header of a file or of the advanced profile, and the first picture behind it in the same buffer.
  std::vector<Unit> file = units;
  file[0].bytes = joined({{fileHeader()}, units[0]});
  const std::vector<Unit> advanced = {{joined({{advancedHeaders()}, {advancedPicture(3)}}), 0},
                                      {advancedPicture(4), 1}};
  const auto expectDecoded = [](const std::vector<Unit>& stream, const std::vector<Decoded>& pictures) {
    DecoderRun run("omap4");
    run.setInput(OMX_VIDEO_CodingWMV);
    run.start();
    run.sendAll(stream);
    run.finish();
    expectSame(run.pictures(), pictures);
    EXPECT_EQ(run.errors(), Errors{});
  };
  expectDecoded(file, wanted);
  expectDecoded(advanced, decode("vc1", advanced, advancedHeaders(), kWidth, kHeight));
  for (size_t size = 1; size < 36; size += 3) {
    const std::vector<uint8_t> header = fileHeader();
    expectDecoded({{{header.begin(), header.begin() + static_cast<ptrdiff_t>(size)}, 0}}, {});
  }
}

}  // namespace
}  // namespace componenttest
