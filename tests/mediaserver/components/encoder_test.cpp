// Encoding: streams that decode to the pictures that went in, on every device, what clients set before the
// encoder starts, and what may change while it runs.

#include "host/mediaserver/components/annex_b.h"
#include "tests/mediaserver/components/component_run.h"
#include "tools/video/psnr.h"

namespace componenttest {
namespace {

const NalTypes kKeyUnit = {7, 8, 5};  // parameter sets in band

// What the units decode to, compared with what went in.
void expectLike(const std::vector<Unit>& units, const std::vector<Picture>& pictures, double decibels) {
  const std::vector<Decoded> decoded = decode("h264", units);
  ASSERT_EQ(decoded.size(), pictures.size());
  for (size_t i = 0; i < decoded.size(); ++i) {
    ASSERT_EQ(decoded[i].picture.width, pictures[i].width);
    ASSERT_EQ(decoded[i].picture.height, pictures[i].height);
    EXPECT_GT(tool::psnr(decoded[i].picture.luma(), pictures[i].luma()), decibels) << "picture " << i;
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
    auto input = run.definition(kInputPort);
    input.format.video.nFrameWidth = 90;
    input.format.video.nFrameHeight = 48;
    input.format.video.nStride = 96;
    input.format.video.nSliceHeight = 0;
    input.nBufferSize = 90 * 48 * 3 / 2;
    ASSERT_EQ(run.define(kInputPort, input), kOk);
    EXPECT_GE(run.definition(kInputPort).nBufferSize, 96U * 48 * 3 / 2);
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
    const auto before = run.definition(kInputPort).nBufferSize;
    for (const OMX_U32 port : {kOutputPort, kInputPort}) {
      const android::status_t status = run.resize(port, each.width, each.height);
      EXPECT_EQ(status, each.bytes != 0 ? kOk : kUnsupported) << each.width;
    }
    EXPECT_EQ(run.definition(kInputPort).nBufferSize, each.bytes != 0 ? each.bytes : before);
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

// The first access unit of a stream made with the settings.
std::vector<uint8_t> firstUnit(EncoderRun* run) {
  run->setSize(96, 80);
  run->start();
  return run->encode(scene(96, 80, 0)).bytes;
}

bool isCabac(const std::vector<uint8_t>& unit) {
  const std::vector<uint8_t> payload = mediaserver::unescape(nals(unit).at(1));
  mediaserver::BitReader reader(payload);
  for (int i = 0; i < 2; ++i) reader.ue();  // ids
  return reader.flag();
}

TEST(EncoderSettings, ShowInTheParameterSets) {
  const struct {
    OMX_VIDEO_AVCPROFILETYPE profile;
    bool cabac;
    OMX_U32 references;
    int idc;
    bool isCabac;
  } cases[] = {
      {OMX_VIDEO_AVCProfileBaseline, true, 2, 66, false},
      {OMX_VIDEO_AVCProfileMain, false, 3, 77, false},
      {OMX_VIDEO_AVCProfileMain, true, 1, 77, true},
      {OMX_VIDEO_AVCProfileHigh, true, 16, 100, true},
  };
  for (const auto& each : cases) {
    for (const char* device : {"msm8960", "omap4"}) {
      EncoderRun run(device);
      ASSERT_EQ(run.setAvc([&](auto& avc) {
        avc.eProfile = each.profile;
        avc.eLevel = OMX_VIDEO_AVCLevel31;
        avc.bEntropyCodingCABAC = static_cast<OMX_BOOL>(each.cabac ? 2 : 0);
        avc.nRefFrames = each.references;
      }),
                kOk);
      const std::vector<uint8_t> unit = firstUnit(&run);
      const auto set = sequenceSet(unit);
      EXPECT_EQ(set.profileIdc, each.idc);
      EXPECT_EQ(set.levelIdc, 31);
      EXPECT_EQ(set.referenceFrames, each.references);
      EXPECT_EQ(set.macroblocks, 30U);
      EXPECT_EQ(set.reorderFrames, std::optional<uint32_t>(0)) << "or decoders hold pictures back";
      EXPECT_EQ(isCabac(unit), each.isCabac) << each.idc;
      EXPECT_EQ(decode("h264", {{unit, 0}}).size(), 1U) << "declared profile " << each.idc;
    }
  }
}

TEST(EncoderSettings, RefuseWhatTheComponentCannotDo) {
  using Change = void (*)(OMX_VIDEO_PARAM_AVCTYPE&);
  const Change refused[] = {
      [](auto& avc) { avc.nBFrames = 1; },
      [](auto& avc) { avc.bEnableFMO = OMX_TRUE; },
      [](auto& avc) { avc.bEnableASO = OMX_TRUE; },
      [](auto& avc) { avc.bEnableRS = OMX_TRUE; },
      [](auto& avc) { avc.bFrameMBsOnly = OMX_FALSE; },
      [](auto& avc) { avc.nRefFrames = 17; },
      [](auto& avc) { avc.eProfile = OMX_VIDEO_AVCProfileExtended; },
      [](auto& avc) { avc.eLevel = static_cast<OMX_VIDEO_AVCLEVELTYPE>(3); },
      [](auto& avc) { avc.nAllowedPictureTypes = OMX_VIDEO_PictureTypeP; },
      [](auto& avc) { avc.nCabacInitIdc = 3; },
  };
  EncoderRun run("msm8960");
  const OMX_VIDEO_PARAM_AVCTYPE before = run.avc();
  for (const Change change : refused) EXPECT_EQ(run.setAvc(change), kUnsupported);
  const OMX_VIDEO_PARAM_AVCTYPE after = run.avc();
  EXPECT_EQ(memcmp(&before, &after, sizeof(before)), 0) << "nothing of it was taken";
}

TEST(Encoder, ReachesItsRateAgainAfterAChangeAndMakesKeyFramesOnRequestAlone) {
  for (const char* device : {"omap4", "msm8960"}) {
    EncoderRun run(device, 176, 144, 15);
    run.setBitRate(200000);
    EXPECT_EQ(run.setAvc([](auto& avc) { avc.nPFrames = 0xFFFF; }), kOk);
    run.start();
    run.encodeScene(176, 144, 75);
    EXPECT_NEAR(run.bits(0, 75) / 5 / 200000, 1, 0.05) << device;
    const auto rate = &OMX_VIDEO_CONFIG_BITRATETYPE::nEncodeBitrate;
    EXPECT_EQ(run.change(OMX_IndexConfigVideoBitrate, rate, 100000), kOk);
    run.encodeScene(176, 144, 60);
    EXPECT_NEAR(run.bits(90, 45) / 3 / 100000, 1, 0.2) << device << ", from the second second on";
    const auto key = &OMX_CONFIG_INTRAREFRESHVOPTYPE::IntraRefreshVOP;
    EXPECT_EQ(run.change(OMX_IndexConfigVideoIntraVOPRefresh, key, OMX_TRUE), kOk);
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
  run.reopenInput([&] { EXPECT_EQ(run.resize(kInputPort, 640, 480), kOk); });
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
  flushed.toExecuting();  // and no output buffer given
  const std::vector<uint8_t> bytes = packInput(scene(64, 48, 0), omxhost::PictureLayout::SemiPlanar);
  const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  flushed.empty(0, text);
  flushed.expect(omxtest::emptyBufferDone());
  flushed.complete(OMX_CommandFlush, kOutputPort);
  flushed.empty(0, text);
  flushed.fillAll();
  flushed.expect(omxtest::fillBufferDone());
  EXPECT_EQ(nalTypes(flushed.OmxClient::outputs().back().bytes), kKeyUnit);
}

}  // namespace
}  // namespace componenttest
