// WMV: the three ways in which a stream can tell what it is. No encoder is at hand, so headers are written
// here and the pictures' payload is arbitrary bits, which decode to arbitrary pictures.

#include <gtest/gtest.h>

#include "host/mediaserver/components/annex_b.h"
#include "tests/mediaserver/components/decoder_fixture.h"

namespace componenttest {
namespace {

using Bytes = std::vector<uint8_t>;

constexpr uint32_t kWidth = 48;
constexpr uint32_t kHeight = 32;

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
  sequence.bits(3, 2);
  sequence.bits(1, 3);
  sequence.bits(1, 2);  // 4:2:0
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

Bytes littleEndian(uint32_t word) {
  Bytes bytes;
  for (int shift = 0; shift < 32; shift += 8) bytes.push_back(static_cast<uint8_t>(word >> shift));
  return bytes;
}

TEST(Wmv, DecodesMainProfileBehindItsSequenceHeader) {
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

  // The header of a file, and the first picture behind it in the same buffer.
  Bytes file = {3, 0, 0, 0xC5};
  append(&file, littleEndian(4));
  append(&file, mainSequence());
  append(&file, littleEndian(kHeight));
  append(&file, littleEndian(kWidth));
  file.resize(36);
  std::vector<Unit> whole = units;
  append(&file, units[0].bytes);
  whole[0].bytes = file;
  DecoderRun run("omap4");
  run.setInput(OMX_VIDEO_CodingWMV);
  run.start();
  run.sendAll(whole);
  run.finish();
  expectSame(run.pictures(), wanted);
  EXPECT_EQ(run.errors(), std::vector<std::string>{});
}

TEST(Wmv, DecodesAdvancedProfileFromTheStreamItself) {
  std::vector<Unit> units = {{advancedHeaders(), 0}, {advancedPicture(4), 1}};
  append(&units[0].bytes, advancedPicture(3));
  const std::vector<Decoded> wanted = decode("vc1", units, advancedHeaders(), kWidth, kHeight);
  ASSERT_EQ(wanted.size(), 2U);
  DecoderRun run("msm8x60");
  run.setInput(OMX_VIDEO_CodingWMV);
  run.start();
  run.sendAll(units);
  run.finish();
  expectSame(run.pictures(), wanted);
}

TEST(Wmv, SurvivesHeadersThatAreCut) {
  Bytes file = {3, 0, 0, 0xC5, 4, 0, 0, 0};
  append(&file, mainSequence());
  for (const Bytes& header : {file, advancedHeaders(), Bytes{0, 0, 1, 0x0F}, Bytes{1}}) {
    for (size_t size = 1; size <= header.size(); size += 3) {
      DecoderRun run("msm8960");
      run.setInput(OMX_VIDEO_CodingWMV);
      run.start();
      run.send({header.begin(), header.begin() + static_cast<ptrdiff_t>(size)}, 0,
               OMX_BUFFERFLAG_CODECCONFIG);
      run.send(mainPicture(false, 5), 0);
      run.finish();
      EXPECT_EQ(run.errors(), std::vector<std::string>{});
    }
  }
}

}  // namespace
}  // namespace componenttest
