// Decoding: the pictures are libavcodec's own, for all kinds of streams, in the order that was asked for;
// what ports and rectangles say of their sizes, and what happens when the stream changes them.

#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

struct StreamCase {
  const char *name, *encoder, *options;
  uint32_t width, height;
  OMX_VIDEO_CODINGTYPE coding = OMX_VIDEO_CodingAVC;
  const char* decoder = "h264";
};

const StreamCase kStreams[] = {
    {"Baseline", "libx264", "profile=baseline refs=3", 96, 80},
    {"Largest", "libx264", "preset=ultrafast slices=8", 1920, 1088},
    {"CavlcWithSlices", "libx264", "coder=vlc 8x8dct=1 bf=0 slices=3", 128, 96},
    {"BPictures", "libx264", "bf=3 b-pyramid=normal refs=4", 128, 96},
    {"CroppedOddly", "libx264", "bf=0", 98, 54},
    {"CroppedOnAllSides", "libx264", "x264-params=crop-rect=2,4,6,8", 100, 60},
    {"Interlaced", "libx264", "bf=2 x264-params=tff=1", 96, 96},
    {"Mpeg4", "mpeg4", "bf=2", 112, 80, OMX_VIDEO_CodingMPEG4, "mpeg4"},
    {"H263", "h263", "", 128, 96, OMX_VIDEO_CodingH263, "h263"},
};

class Streams : public testing::TestWithParam<StreamCase> {};

TEST_P(Streams, ComeOutAsLibavcodecDecodesThemOnEveryDevice) {
  const StreamCase& stream = GetParam();
  const bool largest = stream.width > 1000;
  const std::vector<Unit> units =
      encode(stream.encoder, stream.options, scenes(stream.width, stream.height, largest ? 3 : 12));
  const std::vector<Decoded> displayed = decode(stream.decoder, units);
  const std::vector<Decoded> decoded = inDecodingOrder(displayed, units);
  ASSERT_EQ(displayed.size(), units.size());
  for (const char* device : kDevices) {
    SCOPED_TRACE(device);
    DecoderRun display(device);
    // Most learn their size from the stream; the largest needs larger input buffers.
    display.setInput(stream.coding, largest ? stream.width : 0, largest ? stream.height : 0);
    display.run(units);
    expectSame(display.pictures(), displayed);
    EXPECT_EQ(display.errors, Errors{});
    if (display.isTi()) continue;
    DecoderRun run(device);
    EXPECT_EQ(run.setOrder(QcomOrder::Decode), kOk);
    run.setInput(stream.coding, stream.width, stream.height);
    run.start();
    for (size_t i = 0; i < units.size(); ++i) {
      run.send(units[i].bytes, units[i].timestamp);
      run.awaitOutputs(i + 1);  // one in, one out
    }
    run.finish();
    expectSame(run.pictures(), decoded);
  }
}

INSTANTIATE_TEST_SUITE_P(Decoder, Streams, testing::ValuesIn(kStreams),
                         [](const auto& test) { return test.param.name; });

TEST(Decoder, FindsPicturesInAnyPieces) {
  const std::vector<Unit> units = encode("libx264", "bf=2 slices=2", scenes(96, 80, 10));
  const std::vector<Decoded> wanted = inDecodingOrder(decode("h264", units), units);
  const std::vector<uint8_t> stream = joined(units);
  for (const size_t piece : {stream.size(), size_t{1500}, size_t{37}}) {
    DecoderRun run("msm8x60");
    EXPECT_EQ(run.setOrder(QcomOrder::Decode), kOk);
    auto packing = makeRecord<mediaserver::QcomPortDefinition>(kInputPort);
    packing.nFramePackingFormat = static_cast<OMX_U32>(mediaserver::QcomPacking::Arbitrary);
    EXPECT_EQ(run.set(mediaserver::kQcomPortDefinitionIndex, packing), kOk);
    run.start();
    for (size_t at = 0; at < stream.size(); at += piece) {
      const auto begin = stream.begin() + static_cast<ptrdiff_t>(at);
      run.send({begin, begin + static_cast<ptrdiff_t>(std::min(piece, stream.size() - at))}, 0);
    }
    run.awaitOutputs(9);  // where the last one ends, only the end of the stream tells
    run.finish();
    SCOPED_TRACE(piece);
    expectSame(run.pictures(), wanted, false);
  }
}

TEST(Decoder, TakesParameterSetsApartAndSkipsWhatComesBeforeAKeyFrame) {
  std::vector<Unit> units = encode("libx264", "bf=0 g=5", scenes(96, 80, 9));
  std::vector<Decoded> wanted = decode("h264", units);
  wanted.erase(wanted.begin() + 1, wanted.begin() + 5);
  std::vector<uint8_t> sets, rest;
  for (const auto& nal : nals(units[0].bytes)) {
    std::vector<uint8_t>& part = mediaserver::nalType(nal) >= mediaserver::kNalSequenceSet ? sets : rest;
    mediaserver::appendNal(nal[0], mediaserver::unescape(nal), &part);
  }
  for (const OMX_U32 flags : {OMX_BUFFERFLAG_CODECCONFIG, OMX_BUFFERFLAG_ENDOFFRAME}) {
    DecoderRun run("msm8960");
    run.start();
    run.send(sets, 0, flags);
    run.send(rest, 0);
    run.awaitOutputs(1);
    run.complete(OMX_CommandFlush, kInputPort);
    run.sendAll({units.begin() + 2, units.end()});
    run.finish();
    expectSame(run.pictures(), wanted);
  }
}

TEST(Decoder, EndsStreamsAndBeginsOthers) {
  const std::vector<Unit> units = encode("libx264", "bf=2", scenes(96, 80, 6));
  const std::vector<Decoded> wanted = decode("h264", units);
  for (const char* device : {"msm8960", "omap4"}) {
    DecoderRun run(device);
    run.start();
    for (int stream = 0; stream < 3; ++stream) {
      run.outputs.clear();
      run.sendAll({units.begin(), units.end() - 1});
      // The end mark on the last unit itself.
      run.send(units.back().bytes, units.back().timestamp, OMX_BUFFERFLAG_EOS);
      run.awaitEnd();
      expectSame(run.pictures(), wanted);
    }
    run.finish();
    EXPECT_EQ(run.outputs.size(), units.size()) << "an end without a stream has no pictures";
  }
}

struct Size {
  uint32_t width, height;
};

TEST(DecoderGeometry, FollowsTheStreamAndLosesNoPicture) {
  const std::vector<Size> sizes = {{64, 48}, {160, 128}, {16, 16}, {98, 54}, {176, 144}};
  std::vector<Unit> units;
  std::vector<Decoded> displayed;
  for (const Size& size : sizes) {
    const std::vector<Unit> part = encode("libx264", "bf=2", scenes(size.width, size.height, 7));
    const auto offset = static_cast<int64_t>(units.size());
    for (const Decoded& each : decode("h264", part))
      displayed.push_back({each.picture, each.timestamp + offset});
    for (const Unit& unit : part) units.push_back({unit.bytes, unit.timestamp + offset});
  }
  for (const char* device : kDevices) {
    for (const QcomOrder order : {QcomOrder::Display, QcomOrder::Decode}) {
      SCOPED_TRACE(std::string(device) + (order == QcomOrder::Decode ? " decoding" : " display"));
      DecoderRun run(device);
      if (run.setOrder(order) != kOk && order == QcomOrder::Decode) continue;
      run.start();
      // As fast as it goes: pictures of the old size are still on their way when the new one is decoded.
      run.sendAll(units);
      run.awaitOutputs(units.size() - 6);
      run.finish();
      expectSame(run.pictures(), order == QcomOrder::Decode ? inDecodingOrder(displayed, units) : displayed);
      EXPECT_GE(run.reconfigurations, run.isTi() ? 2U : sizes.size());
      EXPECT_EQ(run.errors, Errors{});
    }
  }
}

TEST(DecoderGeometry, IsWhatEachDeviceMakesOfASize) {
  // Width, height, bytes, and the left upper corner of what is visible.
  const std::tuple<const char*, Size, std::vector<size_t>> cases[] = {
      {"msm8960", {176, 144}, {176, 144, 38016, 0, 0}}, {"msm7x30", {98, 54}, {98, 54, 7938, 0, 0}},
      {"msm8x60", {176, 144}, {176, 144, 65536, 0, 0}}, {"msm8x60", {640, 480}, {640, 480, 475136, 0, 0}},
      {"omap4", {176, 144}, {256, 240, 92160, 32, 24}}, {"omap4", {640, 478}, {768, 576, 663552, 32, 24}}};
  for (const auto& [device, size, frame] : cases) {
    SCOPED_TRACE(device);
    DecoderRun run(device);
    run.setInput(OMX_VIDEO_CodingAVC, size.width, size.height);
    run.run(encode("libx264", "preset=ultrafast", {Picture(size.width, size.height)}));
    const auto& [definition, crop] = std::pair(run.outputs.at(0).definition, run.outputs[0].crop);
    const auto& video = definition.format.video;
    EXPECT_EQ((std::vector<size_t>{video.nFrameWidth, video.nFrameHeight, definition.nBufferSize,
                                   static_cast<size_t>(crop.nLeft), static_cast<size_t>(crop.nTop)}),
              frame);
    EXPECT_EQ(run.outputs[0].bytes.size(), definition.nBufferSize);
    EXPECT_TRUE(crop.nWidth == size.width && crop.nHeight == size.height);
    EXPECT_EQ(run.reconfigurations, 0U) << "the client's forecast counts for both ports";
  }
}

TEST(DecoderGeometry, SkipsPicturesThatAreTooLarge) {
  const std::vector<Unit> small = encode("libx264", "", scenes(64, 48, 3));
  DecoderRun run("msm8960");
  EXPECT_EQ(run.resize(kInputPort, 2048, 1104), kUnsupported);
  run.start();
  run.sendAll(encode("libx264", "preset=ultrafast", {Picture(2048, 1104)}));
  run.sendAll(small);
  run.finish();
  expectSame(run.pictures(), decode("h264", small));
  EXPECT_EQ(run.errors, Errors{});
}

// MPEG-4 has odd sizes. Clients get even ones, with the last column and row twice.
TEST(DecoderGeometry, RoundsOddPicturesUp) {
  const std::vector<Unit> units = encode("mpeg4", "", scenes(67, 35, 2));
  std::vector<Decoded> wanted = decode("mpeg4", units);
  for (Decoded& each : wanted) {
    Picture even(68, 36);
    for (uint32_t i = 0; i < 68 * 36; ++i)
      even.bytes[i] = each.picture.bytes[std::min(i / 68, 34U) * 67 + std::min(i % 68, 66U)];
    std::copy_n(each.picture.plane(1), 2 * 34 * 18, even.plane(1));
    each.picture = even;
  }
  for (const char* device : {"msm8960", "msm8x60", "omap4"}) {
    DecoderRun run(device);
    run.setInput(OMX_VIDEO_CodingMPEG4);
    run.run(units);
    expectSame(run.pictures(), wanted);
  }
}

}  // namespace
}  // namespace componenttest
