// Decoding: the pictures are libavcodec's own, for all kinds of streams, in the order that was asked for.

#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "host/mediaserver/components/annex_b.h"
#include "tests/mediaserver/components/decoder_fixture.h"

namespace componenttest {
namespace {

using mediaserver::QcomOrder;
using mediaserver::QcomPacking;

constexpr auto kUnsupported = static_cast<android::status_t>(android::ERROR_UNSUPPORTED);

// Takes away what a stream of Main profile says about its timing and reordering.
std::vector<Unit> withoutAnnouncement(std::vector<Unit> units) {
  for (Unit& unit : units) {
    std::vector<uint8_t> bytes;
    mediaserver::Bytes stream(unit.bytes);
    for (auto nal = mediaserver::takeNal(&stream); !nal.empty(); nal = mediaserver::takeNal(&stream)) {
      if (mediaserver::nalType(nal) != mediaserver::kNalSequenceSet) {
        bytes.insert(bytes.end(), {0, 0, 1});
        bytes.insert(bytes.end(), nal.begin(), nal.end());
        continue;
      }
      const std::vector<uint8_t> payload = mediaserver::unescape(nal);
      mediaserver::BitReader reader(payload);
      mediaserver::BitWriter writer;
      reader.bits(24);
      for (int i = 0; i < 5; ++i) reader.ue();  // up to the number of reference frames; order type 0
      reader.bits(1);
      reader.ue();
      reader.ue();
      reader.bits(2);
      if (reader.flag()) {
        for (int i = 0; i < 4; ++i) reader.ue();
      }
      mediaserver::BitReader again(payload);
      while (again.position() < reader.position()) writer.bits(again.bits(1), 1);
      writer.bits(0, 1);
      writer.finish();
      mediaserver::appendNal(nal[0], writer.bytes(), &bytes);
    }
    unit.bytes = bytes;
  }
  return units;
}

struct StreamCase {
  const char* name;
  const char* decoder;
  OMX_VIDEO_CODINGTYPE coding;
  StreamOptions options;
  uint32_t width;
  uint32_t height;
  bool unannounced = false;
};

using Options = std::map<std::string, std::string>;
constexpr auto kAvc = OMX_VIDEO_CodingAVC;

const StreamCase kStreams[] = {
    {"Baseline", "h264", kAvc, {"libx264", Options{{"profile", "baseline"}}}, 96, 80},
    {"OneMacroblock", "h264", kAvc, {"libx264", Options{{"profile", "baseline"}}}, 16, 16},
    {"CabacWithSlices", "h264", kAvc, {"libx264", Options{{"slices", "4"}, {"bf", "0"}}}, 160, 128},
    {"Cavlc", "h264", kAvc, {"libx264", Options{{"coder", "vlc"}, {"8x8dct", "1"}, {"bf", "0"}}}, 128, 96},
    {"BPictures",
     "h264",
     kAvc,
     {"libx264", Options{{"bf", "3"}, {"b-pyramid", "normal"}, {"refs", "4"}}},
     128,
     96},
    // Held back as far as the level allows: more pictures than there are buffers at first.
    {"BPicturesUnannounced",
     "h264",
     kAvc,
     {"libx264", Options{{"bf", "3"}, {"profile", "main"}}},
     128,
     96,
     true},
    {"CroppedOddly", "h264", kAvc, {"libx264", Options{{"bf", "0"}}}, 98, 54},
    {"Interlaced", "h264", kAvc, {"libx264", Options{{"bf", "2"}}, true}, 96, 96},
    {"ManyKeyFrames", "h264", kAvc, {"libx264", Options{{"g", "2"}, {"bf", "1"}}}, 64, 48},
    {"Mpeg4", "mpeg4", OMX_VIDEO_CodingMPEG4, {"mpeg4", Options{}}, 112, 80},
    {"Mpeg4WithBPictures", "mpeg4", OMX_VIDEO_CodingMPEG4, {"mpeg4", Options{{"bf", "2"}}}, 112, 80},
    {"H263", "h263", OMX_VIDEO_CodingH263, {"h263", Options{}}, 128, 96},
};

class Streams : public testing::TestWithParam<StreamCase> {};

TEST_P(Streams, ComeOutAsLibavcodecDecodesThem) {
  const StreamCase& stream = GetParam();
  std::vector<Unit> units = encode(stream.options, scenes(stream.width, stream.height, 12));
  if (stream.unannounced) units = withoutAnnouncement(units);
  const std::vector<Decoded> displayed = decode(stream.decoder, units);
  ASSERT_EQ(displayed.size(), units.size());
  for (const char* device : {"msm7x30", "msm8x60", "msm8960", "omap4"}) {
    DecoderRun run(device);
    run.setInput(stream.coding);
    run.start();
    run.sendAll(units);
    run.finish();
    SCOPED_TRACE(std::string(device) + " in display order");
    expectSame(run.pictures(), displayed);
    EXPECT_EQ(run.errors(), std::vector<std::string>{});
  }
  for (const char* device : {"msm8x55", "msm8x60"}) {
    DecoderRun run(device);
    run.setInput(stream.coding);
    ASSERT_EQ(run.setOrder(QcomOrder::Decode), android::OK);
    run.start();
    for (size_t i = 0; i < units.size(); ++i) {
      run.send(units[i].bytes, units[i].timestamp);
      run.awaitOutputs(i + 1);  // one in, one out
    }
    run.finish();
    SCOPED_TRACE(std::string(device) + " in order of decoding");
    expectSame(run.pictures(), inDecodingOrder(displayed, units));
  }
}

INSTANTIATE_TEST_SUITE_P(Decoder, Streams, testing::ValuesIn(kStreams),
                         [](const auto& test) { return test.param.name; });

TEST(Decoder, FindsPicturesInAnyPieces) {
  const std::vector<Unit> units =
      encode({"libx264", Options{{"bf", "2"}, {"slices", "2"}}}, scenes(96, 80, 10));
  const std::vector<Decoded> wanted = inDecodingOrder(decode("h264", units), units);
  for (const size_t bytes : {size_t{1} << 20, size_t{1500}, size_t{37}}) {
    DecoderRun run("msm8960");
    ASSERT_EQ(run.setOrder(QcomOrder::Decode), android::OK);
    ASSERT_EQ(run.setPacking(QcomPacking::Arbitrary), android::OK);
    run.start();
    run.sendPieces(joined(units), bytes);
    run.awaitOutputs(9);  // where the last one ends, only the end of the stream tells
    run.finish();
    SCOPED_TRACE(bytes);
    expectSamePictures(run.pictures(), wanted);
  }
  // Whole pictures, several at once: the last one does not wait for another buffer.
  DecoderRun run("msm8960");
  ASSERT_EQ(run.setOrder(QcomOrder::Decode), android::OK);
  ASSERT_EQ(run.setPacking(QcomPacking::CompleteFrames), android::OK);
  run.start();
  run.send(joined({units.begin(), units.begin() + 3}), 0);
  run.awaitOutputs(3);
  run.send(joined({units.begin() + 3, units.end()}), 0);
  run.awaitOutputs(10);
  expectSamePictures(run.pictures(), wanted);
}

TEST(Decoder, TakesParameterSetsApart) {
  std::vector<Unit> units = encode({"libx264", Options{{"bf", "0"}}}, scenes(96, 80, 4));
  const std::vector<Decoded> wanted = decode("h264", units);
  mediaserver::Bytes stream(units[0].bytes);
  std::vector<uint8_t> sets;
  std::vector<uint8_t> rest;
  for (auto nal = mediaserver::takeNal(&stream); !nal.empty(); nal = mediaserver::takeNal(&stream)) {
    std::vector<uint8_t>& part = mediaserver::nalType(nal) >= mediaserver::kNalSequenceSet ? sets : rest;
    part.insert(part.end(), {0, 0, 0, 1});
    part.insert(part.end(), nal.begin(), nal.end());
  }
  units[0].bytes = rest;
  for (const OMX_U32 flags : {OMX_BUFFERFLAG_CODECCONFIG, OMX_BUFFERFLAG_ENDOFFRAME}) {
    DecoderRun run("msm8960");
    run.start();
    run.send(sets, 0, flags);
    run.sendAll(units);
    run.finish();
    expectSame(run.pictures(), wanted);
  }
}

TEST(Decoder, SkipsWhatComesBeforeTheFirstKeyFrame) {
  const std::vector<Unit> units = encode({"libx264", Options{{"bf", "0"}, {"g", "5"}}}, scenes(96, 80, 9));
  const std::vector<Decoded> all = decode("h264", units);
  const std::vector<Unit> late(units.begin() + 2, units.end());
  for (const QcomOrder order : {QcomOrder::Display, QcomOrder::Decode}) {
    DecoderRun run("msm8960");
    ASSERT_EQ(run.setOrder(order), android::OK);
    run.start();
    run.send(units[0].bytes, 0);
    run.awaitOutputs(1);
    EXPECT_EQ(run.node().command(OMX_CommandFlush, mediaserver::kInputPort), android::OK);
    run.node().expectComplete(OMX_CommandFlush, mediaserver::kInputPort);
    run.outputs().clear();
    run.sendAll(late);
    run.finish();
    expectSame(run.pictures(), {all.begin() + 5, all.end()});
  }
}

TEST(Decoder, SurvivesDamage) {
  // 24 pictures, a key frame every 8; the second group is damaged in every way.
  const std::vector<Unit> units =
      encode({"libx264", Options{{"bf", "1"}, {"g", "8"}, {"slices", "3"}}}, scenes(128, 96, 24));
  const std::vector<Decoded> displayed = decode("h264", units);
  ASSERT_EQ(displayed.size(), units.size());
  for (uint32_t kind = 0; kind < 12; ++kind) {
    for (const QcomOrder order : {QcomOrder::Display, QcomOrder::Decode}) {
      std::vector<Unit> damaged = units;
      uint32_t random = kind * 7919 + 1;
      for (size_t i = 8; i < 16; ++i) {
        std::vector<uint8_t>& bytes = damaged[i].bytes;
        for (uint32_t n = 0; n <= kind % 4 * 3; ++n) {
          random = random * 1664525 + 1013904223;
          if (bytes.empty()) break;
          if (kind < 4) bytes[random / 7 % bytes.size()] ^= static_cast<uint8_t>(1 + random % 255);
          if (kind >= 4 && kind < 8) bytes.resize(random / 7 % (bytes.size() + 1));
          if (kind >= 8)
            bytes.insert(bytes.begin() + static_cast<ptrdiff_t>(random / 7 % bytes.size()), 0x55);
        }
      }
      DecoderRun run("msm8960");
      ASSERT_EQ(run.setOrder(order), android::OK);
      run.start();
      run.sendAll(damaged);
      run.finish();
      SCOPED_TRACE(kind);
      EXPECT_EQ(run.errors(), std::vector<std::string>{});
      // What comes before and after is as it was.
      const std::vector<Decoded> wanted =
          order == QcomOrder::Display ? displayed : inDecodingOrder(displayed, units);
      const std::vector<Decoded> got = run.pictures();
      ASSERT_GE(got.size(), 16U);
      expectSamePictures({got.begin(), got.begin() + 7}, {wanted.begin(), wanted.begin() + 7});
      expectSamePictures({got.end() - 7, got.end()}, {wanted.end() - 7, wanted.end()});
    }
  }
}

TEST(Decoder, EndsStreamsAndBeginsOthers) {
  const std::vector<Unit> units = encode({"libx264", Options{{"bf", "2"}}}, scenes(96, 80, 6));
  const std::vector<Decoded> wanted = decode("h264", units);
  for (const char* device : {"msm8960", "omap4"}) {
    DecoderRun run(device);
    run.start();
    for (int stream = 0; stream < 3; ++stream) {
      run.outputs().clear();
      run.sendAll({units.begin(), units.end() - 1});
      // The end mark on the last unit itself.
      run.send(units.back().bytes, units.back().timestamp, OMX_BUFFERFLAG_EOS);
      run.await([&] { return run.ended(); });
      expectSame(run.pictures(), wanted);
      // Through Idle and back: nothing is left of what was.
      run.node().executingToIdle();
      run.node().idleToLoaded();
      run.start();
    }
    run.finish();
    EXPECT_EQ(run.outputs().size(), units.size()) << "an end without a stream has no pictures";
  }
}

// Another format on a running component, by way of the input port.
TEST(Decoder, ChangesTheFormatWithTheInputPort) {
  const std::vector<Unit> avc = encode({"libx264", Options{{"bf", "0"}}}, scenes(96, 80, 3));
  const std::vector<Unit> mpeg4 = encode({"mpeg4", Options{}}, scenes(96, 80, 3));
  DecoderRun run("msm8960");
  run.start();
  run.sendAll(avc);
  run.awaitOutputs(3);
  run.reopenInput([&] { run.setInput(OMX_VIDEO_CodingMPEG4); });
  run.sendAll(mpeg4);
  run.awaitOutputs(6);
  std::vector<Decoded> wanted = decode("h264", avc);
  for (const Decoded& each : decode("mpeg4", mpeg4)) wanted.push_back(each);
  expectSame(run.pictures(), wanted);
}

TEST(Decoder, KnowsItsVendorsSettingsAlone) {
  DecoderRun qcom("msm8960");
  EXPECT_EQ(qcom.setOrder(QcomOrder::NothingAsked), android::OK);
  EXPECT_EQ(qcom.setOrder(static_cast<QcomOrder>(3)), kUnsupported);
  EXPECT_EQ(qcom.setPacking(QcomPacking::OneCompleteFrame), android::OK);
  EXPECT_EQ(qcom.setPacking(QcomPacking::OneCompleteSubFrame), android::OK);
  EXPECT_EQ(qcom.setPacking(static_cast<QcomPacking>(5)), kUnsupported);
  DecoderRun ti("omap4");
  EXPECT_NE(ti.setOrder(QcomOrder::Decode), android::OK);
  EXPECT_NE(ti.setPacking(QcomPacking::Arbitrary), android::OK);
}

}  // namespace
}  // namespace componenttest
