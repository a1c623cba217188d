// Sizes of decoded pictures: what ports and rectangles say, and what happens when the stream changes them.

#include "tests/mediaserver/components/runs.h"

namespace componenttest {
namespace {

struct Size {
  uint32_t width;
  uint32_t height;
};

// A stream that changes its size with a key frame every `count` pictures, and its pictures in display order.
std::vector<Unit> changingStream(const std::vector<Size>& sizes, uint32_t count,
                                 std::vector<Decoded>* displayed) {
  std::vector<Unit> stream;
  for (const Size& size : sizes) {
    std::vector<Unit> units = encode({"libx264", {{"bf", "2"}}}, scenes(size.width, size.height, count));
    std::vector<Decoded> pictures = decode("h264", units);
    EXPECT_EQ(pictures.size(), units.size());
    const auto offset = static_cast<int64_t>(stream.size());
    for (Unit& unit : units) unit.timestamp += offset;
    for (Decoded& picture : pictures) picture.timestamp += offset;
    stream.insert(stream.end(), units.begin(), units.end());
    displayed->insert(displayed->end(), pictures.begin(), pictures.end());
  }
  return stream;
}

TEST(DecoderGeometry, FollowsTheStreamAndLosesNoPicture) {
  const std::vector<Size> sizes = {{64, 48}, {160, 128}, {16, 16}, {98, 54}, {176, 144}};
  std::vector<Decoded> displayed;
  const std::vector<Unit> units = changingStream(sizes, 7, &displayed);
  for (const char* device : kDevices) {
    for (const bool decoding : {false, true}) {
      SCOPED_TRACE(std::string(device) + (decoding ? " decoding" : " display"));
      DecoderRun run(device);
      if (run.isTi() && decoding) continue;
      EXPECT_TRUE(!decoding || run.setOrder(QcomOrder::Decode) == android::OK);
      run.start();
      // As fast as it goes: pictures of the old size are still on their way when the new one is decoded.
      run.sendAll(units);
      run.awaitOutputs(units.size() - 6);
      run.finish();
      expectSame(run.pictures(), decoding ? inDecodingOrder(displayed, units) : displayed);
      EXPECT_GE(run.reconfigurations(), run.isTi() ? 2U : sizes.size());
      EXPECT_EQ(run.errors(), Errors{});
    }
  }
}

// Two sizes in one padded size: the rectangle alone changes, and no buffers.
TEST(DecoderGeometry, ChangesTheRectangleWithoutNewBuffers) {
  std::vector<Decoded> displayed;
  const std::vector<Unit> units = changingStream({{96, 78}, {100, 80}, {90, 66}}, 5, &displayed);
  DecoderRun run("omap4");
  run.start();
  run.sendAll(units);
  run.finish();
  expectSame(run.pictures(), displayed);
  EXPECT_EQ(run.reconfigurations(), 1U);
}

TEST(DecoderGeometry, IsWhatEachDeviceMakesOfASize) {
  const struct {
    const char* device;
    Size size;
    Size frame;
    uint32_t bytes;
    Size corner;
  } cases[] = {
      {"msm8960", {176, 144}, {176, 144}, 38016, {0, 0}}, {"msm7x30", {98, 54}, {98, 54}, 7938, {0, 0}},
      {"msm8x60", {176, 144}, {176, 144}, 65536, {0, 0}}, {"msm8x60", {640, 480}, {640, 480}, 475136, {0, 0}},
      {"omap4", {176, 144}, {256, 240}, 92160, {32, 24}}, {"omap4", {640, 478}, {768, 576}, 663552, {32, 24}},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.device);
    for (const bool forecast : {false, true}) {
      DecoderRun run(each.device);
      EXPECT_GE(run.node().definition(kOutputPort).nBufferCountActual,
                run.node().definition(kInputPort).nBufferCountActual + 2);
      if (forecast) run.setInput(OMX_VIDEO_CodingAVC, each.size.width, each.size.height);
      run.start();
      run.sendAll(
          encode({"libx264", {{"preset", "ultrafast"}}}, {Picture(each.size.width, each.size.height)}));
      run.finish();
      ASSERT_EQ(run.outputs().size(), 1U);
      const Output& output = run.outputs().front();
      EXPECT_EQ(output.definition.format.video.nFrameWidth, each.frame.width);
      EXPECT_EQ(output.definition.format.video.nFrameHeight, each.frame.height);
      EXPECT_EQ(output.bytes.size(), each.bytes);
      EXPECT_EQ(output.definition.nBufferSize, each.bytes);
      EXPECT_EQ(output.crop.nLeft, static_cast<OMX_S32>(each.corner.width));
      EXPECT_EQ(output.crop.nTop, static_cast<OMX_S32>(each.corner.height));
      EXPECT_EQ(output.crop.nWidth, each.size.width);
      EXPECT_EQ(output.crop.nHeight, each.size.height);
      EXPECT_TRUE(!forecast || run.reconfigurations() == 0) << "the client's forecast counts for both ports";
    }
  }
}

TEST(DecoderGeometry, SkipsPicturesThatAreTooLarge) {
  std::vector<Decoded> displayed;
  const std::vector<Unit> small = changingStream({{64, 48}}, 3, &displayed);
  DecoderRun run("msm8960");
  auto definition = run.node().definition(kInputPort);
  definition.format.video.nFrameWidth = 2048;
  definition.format.video.nFrameHeight = 1104;
  EXPECT_EQ(run.node().define(kInputPort, definition), kUnsupported);
  run.start();
  run.sendAll(encode({"libx264", {{"preset", "ultrafast"}}}, {Picture(2048, 1104)}));
  run.sendAll(small);
  run.finish();
  expectSame(run.pictures(), displayed);
  EXPECT_EQ(run.errors(), Errors{});
}

// MPEG-4 has odd sizes. Clients get even ones, with the last column and row twice.
TEST(DecoderGeometry, RoundsOddPicturesUp) {
  const std::vector<Unit> units = encode({"mpeg4", {}}, scenes(67, 35, 2));
  std::vector<Decoded> wanted = decode("mpeg4", units);
  for (Decoded& each : wanted) {
    Picture even(68, 36);
    for (uint32_t y = 0; y < 36; ++y) {
      const uint8_t* const row = each.picture.plane(0) + size_t{std::min(y, 34U)} * 67;
      for (uint32_t x = 0; x < 68; ++x) even.plane(0)[y * 68 + x] = row[std::min(x, 66U)];
    }
    std::copy_n(each.picture.plane(1), 2 * 34 * 18, even.plane(1));
    each.picture = even;
  }
  for (const char* device : {"msm8960", "msm8x60", "omap4"}) {
    DecoderRun run(device);
    run.setInput(OMX_VIDEO_CodingMPEG4);
    run.start();
    run.sendAll(units);
    run.finish();
    expectSame(run.pictures(), wanted);
  }
}

}  // namespace
}  // namespace componenttest
