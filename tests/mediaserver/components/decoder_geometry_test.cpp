// Sizes of decoded pictures: what ports and rectangles say, and what happens when the stream changes them.

#include "tests/mediaserver/components/component_run.h"

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
      if (forecast) run.setInput(OMX_VIDEO_CodingAVC, each.size.width, each.size.height);
      run.run(encode({"libx264", {{"preset", "ultrafast"}}}, {Picture(each.size.width, each.size.height)}));
      ASSERT_EQ(run.outputs.size(), 1U);
      const Output& output = run.outputs.front();
      const auto& video = output.definition.format.video;
      EXPECT_EQ((std::vector{video.nFrameWidth, video.nFrameHeight, output.definition.nBufferSize}),
                (std::vector{each.frame.width, each.frame.height, each.bytes}));
      EXPECT_EQ(output.bytes.size(), each.bytes);
      const auto& crop = output.crop;
      EXPECT_EQ((std::vector{static_cast<uint32_t>(crop.nLeft), static_cast<uint32_t>(crop.nTop), crop.nWidth,
                             crop.nHeight}),
                (std::vector{each.corner.width, each.corner.height, each.size.width, each.size.height}));
      EXPECT_TRUE(!forecast || run.reconfigurations == 0) << "the client's forecast counts for both ports";
    }
  }
}

TEST(DecoderGeometry, SkipsPicturesThatAreTooLarge) {
  std::vector<Decoded> displayed;
  const std::vector<Unit> small = changingStream({{64, 48}}, 3, &displayed);
  DecoderRun run("msm8960");
  EXPECT_EQ(run.define(kInputPort,
                       [](auto& video) {
                         video.nFrameWidth = 2048;
                         video.nFrameHeight = 1104;
                       }),
            kUnsupported);
  run.start();
  run.sendAll(encode({"libx264", {{"preset", "ultrafast"}}}, {Picture(2048, 1104)}));
  run.sendAll(small);
  run.finish();
  expectSame(run.pictures(), displayed);
  EXPECT_EQ(run.errors, Errors{});
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
    run.run(units);
    expectSame(run.pictures(), wanted);
  }
}

}  // namespace
}  // namespace componenttest
