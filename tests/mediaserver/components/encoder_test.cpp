// Encoding: streams that decode to the pictures that went in, on every device, and what may change while the
// encoder runs.

#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

const NalTypes kKeyUnit = {7, 8, 5};  // parameter sets in band

// What the units decode to, compared with what went in.
void expectLike(const std::vector<Unit>& units, const std::vector<Picture>& pictures, double decibels) {
  const std::vector<Decoded> decoded = decode("h264", units);
  ASSERT_EQ(decoded.size(), pictures.size());
  for (size_t i = 0; i < decoded.size(); ++i) {
    EXPECT_EQ(decoded[i].picture.width, pictures[i].width);
    EXPECT_GT(psnr(decoded[i].picture, pictures[i]), decibels) << "picture " << i;
    // Chroma in its place, and Cb before Cr.
    const size_t middle = pictures[i].chromaWidth() * (pictures[i].chromaHeight() / 2) + 3;
    for (const int plane : {1, 2}) {
      EXPECT_NEAR(decoded[i].picture.plane(plane)[middle], pictures[i].plane(plane)[middle], 12) << i;
    }
  }
}

TEST(Encoder, EncodesOnePictureToOneUnitOnEveryDevice) {
  // 98x54: macroblocks that are cut on both sides, and no multiple of anything that layouts round to.
  for (const char* device : kDevices) {
    for (const auto& [width, height] : {std::pair{96U, 80U}, {98U, 54U}, {16U, 16U}}) {
      SCOPED_TRACE(device);
      EncoderRun run(device, width, height);
      run.setBitRate(800000);
      run.start();
      const std::vector<Picture> pictures = scenes(width, height, 6);
      for (size_t i = 0; i < pictures.size(); ++i) {
        const Output& output = run.encode(pictures[i]);
        EXPECT_EQ(output.timestamp, static_cast<int64_t>(i) * 1000);
        EXPECT_EQ(output.flags, OMX_BUFFERFLAG_ENDOFFRAME | (i == 0 ? OMX_BUFFERFLAG_SYNCFRAME : 0U));
        EXPECT_EQ(nalTypes(output.bytes), i == 0 ? kKeyUnit : NalTypes{1});
      }
      expectLike(run.units(), pictures, 33);
      run.finish();
      EXPECT_EQ(run.errors, Errors{});
    }
  }
}

// A width that is no multiple of 16: the client agrees on a rounded pitch, and may send rows with or without.
TEST(Encoder, TellsTiRowsWithAGapFromRowsWithout) {
  const std::vector<Picture> pictures = scenes(90, 48, 3);
  for (const uint32_t pitch : {96U, 90U}) {
    EncoderRun run("omap4");
    auto input = run.node().definition(kInputPort);
    input.format.video.nFrameWidth = 90;
    input.format.video.nFrameHeight = 48;
    input.format.video.nStride = 96;
    input.format.video.nSliceHeight = 0;
    input.nBufferSize = 90 * 48 * 3 / 2;
    ASSERT_EQ(run.node().define(kInputPort, input), kOk);
    EXPECT_GE(run.node().definition(kInputPort).nBufferSize, 96U * 48 * 3 / 2);
    run.setBitRate(500000);
    run.start();
    for (const Picture& picture : pictures) {
      run.send(packInput(picture, omxhost::PictureLayout::TiPacked, pitch), 0);
    }
    run.awaitOutputs(3);
    expectLike(run.units(), pictures, 33);
  }
}

TEST(Encoder, TakesSizesThatItCanEncode) {
  const struct {
    const char* device;
    uint32_t width;
    uint32_t height;
    uint32_t bytes;  // of a picture; 0: refused
  } cases[] = {
      {"msm8960", 1920, 1088, 3133440}, {"msm8x60", 176, 144, 39296}, {"msm8960", 1920, 1104, 0},
      {"msm8960", 97, 80, 0},           {"omap4", 0, 0, 0},           {"msm8x60", 0xFFFFFFFE, 16, 0},
      {"msm8x60", 0x80000000, 16, 0},
  };
  for (const auto& each : cases) {
    EncoderRun run(each.device);
    const auto before = run.node().definition(kInputPort).nBufferSize;
    const auto resize = [&](auto& video) {
      video.nFrameWidth = each.width;
      video.nFrameHeight = each.height;
    };
    for (const OMX_U32 port : {kOutputPort, kInputPort}) {
      EXPECT_EQ(run.define(port, resize), each.bytes != 0 ? kOk : kUnsupported) << each.width;
    }
    EXPECT_EQ(run.node().definition(kInputPort).nBufferSize, each.bytes != 0 ? each.bytes : before);
  }
}

TEST(Encoder, SkipsAPictureThatIsNotWhole) {
  EncoderRun run("msm8960", 96, 80);
  run.start();
  const std::vector<Picture> pictures = scenes(96, 80, 2);
  run.encode(pictures[0]);
  std::vector<uint8_t> cut = packInput(pictures[1], omxhost::PictureLayout::SemiPlanar);
  cut.pop_back();
  run.send(cut, 0);
  run.encode(pictures[1]);
  EXPECT_EQ(run.errors, Errors{"error 0x8000100b"});
  expectLike(run.units(), pictures, 25);
}

TEST(Encoder, ReachesItsRateAgainAfterAChangeAndMakesKeyFramesOnRequestAlone) {
  for (const char* device : {"omap4", "msm8960"}) {
    EncoderRun run(device, 176, 144, 15);
    run.setBitRate(200000);
    EXPECT_EQ(run.setAvc([](auto& avc) { avc.nPFrames = 0xFFFF; }), kOk);
    run.start();
    run.encodeScene(176, 144, 75);
    EXPECT_NEAR(run.bits(0, 75) / 5 / 200000, 1, 0.05) << device;
    EXPECT_EQ(run.changeBitRate(100000), kOk);
    run.encodeScene(176, 144, 60);
    EXPECT_NEAR(run.bits(90, 45) / 3 / 100000, 1, 0.2) << device << ", from the second second on";
    EXPECT_EQ(run.requestKey(), kOk);
    run.encodeScene(176, 144, 2);
    EXPECT_EQ(run.keyFrames(), (std::vector<size_t>{0, 135}));
    EXPECT_EQ(nalTypes(run.outputs[135].bytes), kKeyUnit);
  }
}

TEST(Encoder, BeginsANewStreamForPicturesThatTurnOrGrow) {
  EncoderRun run("msm8960", 96, 64);
  run.start();
  run.encodeScene(96, 64, 2);
  EXPECT_EQ(run.rotate(90), kOk);
  for (const int32_t refused : {45, -90, 360, 1}) EXPECT_EQ(run.rotate(refused), kUnsupported) << refused;
  EXPECT_EQ(run.encode(scene(96, 64, 2)).definition.format.video.nFrameWidth, 64U);
  EXPECT_EQ(run.reconfigurations, 0U);
  // A larger size, by way of the input port.
  run.reopenInput([&] {
    const auto enlarge = [](auto& video) {
      video.nFrameWidth = 640;
      video.nFrameHeight = 480;
    };
    EXPECT_EQ(run.define(kInputPort, enlarge), kOk);
  });
  EXPECT_EQ(run.encode(scene(640, 480, 1)).definition.format.video.nFrameWidth, 480U);
  EXPECT_EQ(run.reconfigurations, 1U);
  EXPECT_EQ(run.keyFrames(), (std::vector<size_t>{0, 2, 3}));
  EXPECT_EQ(run.errors, Errors{});
}

TEST(Encoder, EndsAStreamAndBeginsAnotherAlsoAfterAFlush) {
  EncoderRun run("msm8960", 64, 48);
  run.start();
  run.encodeScene(64, 48, 2);
  // The mark on a picture's own buffer comes out on that picture's unit.
  run.send(packInput(scene(64, 48, 2), omxhost::PictureLayout::SemiPlanar), 7, OMX_BUFFERFLAG_EOS);
  run.awaitEnd();
  ASSERT_EQ(run.outputs.size(), 3U);
  EXPECT_EQ(run.outputs[2].flags, OMX_BUFFERFLAG_EOS | OMX_BUFFERFLAG_ENDOFFRAME);
  run.encodeScene(64, 48, 2);
  EXPECT_EQ(run.keyFrames(), (std::vector<size_t>{0, 3}));
  run.finish();
  EXPECT_EQ(run.outputs.size(), 5U);

  // What the client never got cannot be referred to.
  EncoderRun flushed("msm8960", 64, 48);
  flushed.node().toExecuting();  // and no output buffer given
  const std::vector<uint8_t> bytes = packInput(scene(64, 48, 0), omxhost::PictureLayout::SemiPlanar);
  const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  flushed.node().empty(0, text);
  flushed.node().expect(omxtest::emptyBufferDone());
  flushed.node().complete(OMX_CommandFlush, kOutputPort);
  flushed.node().empty(0, text);
  flushed.node().fillAll();
  flushed.node().expect(omxtest::fillBufferDone());
  EXPECT_EQ(nalTypes(flushed.node().outputs().back().bytes), kKeyUnit);
}

}  // namespace
}  // namespace componenttest
