// Encoding: streams that decode to the pictures that went in, on every device, and what clients set before
// the encoder starts.

#include "host/mediaserver/components/sequence_set.h"
#include "tests/mediaserver/components/component_run.h"
#include "tools/video/psnr.h"

namespace componenttest {
namespace {

const std::vector<unsigned> kKeyUnit = {7, 8, 5};  // parameter sets in band

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
      run.start();
      const std::vector<Picture> pictures = scenes(width, height, 6);
      for (size_t i = 0; i < pictures.size(); ++i) {
        const Output& output = run.encode(pictures[i]);
        EXPECT_EQ(output.timestamp, static_cast<int64_t>(i) * 1000);
        EXPECT_EQ(output.flags, OMX_BUFFERFLAG_ENDOFFRAME | (i == 0 ? OMX_BUFFERFLAG_SYNCFRAME : 0U));
        EXPECT_EQ(nalTypes(output.bytes), i == 0 ? kKeyUnit : std::vector<unsigned>{1});
      }
      expectLike(run.units(), pictures, 33);
      run.finish();
      EXPECT_EQ(run.errors, Errors{});
    }
  }
}

// The scene is the same but for its right edge. Rows without a gap are those of the sizes above.
TEST(Encoder, SkipsTheGapBehindTiRows) {
  EncoderRun run("omap4", 90, 48);
  auto input = run.definition(kInputPort);
  input.format.video.nStride = 96;
  input.format.video.nSliceHeight = 0;
  ASSERT_EQ(run.define(kInputPort, input), kOk);
  run.start();
  run.encode(scene(96, 48, 0));
  expectLike(run.units(), {scene(90, 48, 0)}, 28);
}

TEST(Encoder, TakesSizesThatItCanEncode) {
  // Bytes of a picture; 0: refused.
  const std::tuple<const char*, uint32_t, uint32_t, uint32_t> cases[] = {
      {"msm8960", 1920, 1088, 3133440}, {"msm8x60", 176, 144, 39296}, {"msm8960", 1920, 1104, 0},
      {"msm8960", 97, 80, 0},           {"omap4", 0, 0, 0},           {"msm8x60", 0xFFFFFFFE, 16, 0}};
  for (const auto& [device, width, height, bytes] : cases) {
    EncoderRun run(device);
    const auto before = run.definition(kInputPort).nBufferSize;
    for (const OMX_U32 port : {kOutputPort, kInputPort})
      EXPECT_EQ(run.resize(port, width, height), bytes != 0 ? kOk : kUnsupported) << width;
    EXPECT_EQ(run.definition(kInputPort).nBufferSize, bytes != 0 ? bytes : before);
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

// What the second parameter set says.
bool isCabac(const std::vector<uint8_t>& unit) {
  const std::vector<uint8_t> payload = mediaserver::unescape(nals(unit).at(1));
  mediaserver::BitReader reader(payload);
  for (int i = 0; i < 2; ++i) reader.ue();  // ids
  return reader.flag();
}

TEST(EncoderSettings, ShowInTheParameterSets) {
  const std::tuple<OMX_VIDEO_AVCPROFILETYPE, int, bool, OMX_U32> cases[] = {
      {OMX_VIDEO_AVCProfileBaseline, 66, true, 2},
      {OMX_VIDEO_AVCProfileMain, 77, false, 3},
      {OMX_VIDEO_AVCProfileHigh, 100, true, 16}};
  for (const auto& [profile, idc, cabac, references] : cases) {
    for (const char* device : {"msm8960", "omap4"}) {
      EncoderRun run(device, 96, 80);
      const auto status =
          run.setAvc([&, profile = profile, cabac = cabac, references = references](auto& avc) {
            avc.eProfile = profile;
            avc.eLevel = OMX_VIDEO_AVCLevel31;
            avc.bEntropyCodingCABAC = static_cast<OMX_BOOL>(cabac ? 2 : 0);
            avc.nRefFrames = references;
          });
      ASSERT_EQ(status, kOk);
      run.start();
      const std::vector<uint8_t> unit = run.encode(scene(96, 80, 0)).bytes;
      const auto set = mediaserver::readSequenceSet(nals(unit).at(0)).value();
      EXPECT_TRUE(set.profileIdc == idc && set.levelIdc == 31 && set.macroblocks == 30U) << idc;
      EXPECT_EQ(set.referenceFrames, references);
      EXPECT_EQ(set.reorderFrames, std::optional<uint32_t>(0)) << "or decoders hold pictures back";
      EXPECT_EQ(isCabac(unit), cabac && idc != 66) << idc;
      EXPECT_EQ(decode("h264", {{unit, 0}}).size(), 1U) << "declared profile " << idc;
    }
  }
}

TEST(EncoderSettings, RefuseWhatTheComponentCannotDo) {
  EncoderRun run("msm8960");
  EXPECT_EQ(run.setAvc([](auto& avc) { avc.nBFrames = 1; }), kUnsupported);
  EXPECT_EQ(run.setAvc([](auto& avc) { avc.bEnableFMO = OMX_TRUE; }), kUnsupported);
  EXPECT_EQ(run.setAvc([](auto& avc) { avc.nRefFrames = 17; }), kUnsupported);
  EXPECT_EQ(run.setAvc([](auto& avc) { avc.eProfile = OMX_VIDEO_AVCProfileExtended; }), kUnsupported);
  EXPECT_EQ(run.setAvc([](auto& avc) { avc.eLevel = static_cast<OMX_VIDEO_AVCLEVELTYPE>(3); }), kUnsupported);
  EXPECT_EQ(run.setAvc([](auto&) {}), kOk) << "something of it was taken";
}

TEST(Encoder, EndsAStreamAndBeginsAnother) {
  EncoderRun run("msm8960", 64, 48);
  run.start();
  run.encode(scene(64, 48, 0));
  // The mark on a picture's own buffer comes out on that picture's unit.
  run.send(packInput(scene(64, 48, 2), omxhost::PictureLayout::SemiPlanar), 7, OMX_BUFFERFLAG_EOS);
  run.awaitEnd();
  ASSERT_EQ(run.outputs.size(), 2U);
  EXPECT_EQ(run.outputs[1].flags, OMX_BUFFERFLAG_EOS | OMX_BUFFERFLAG_ENDOFFRAME);
  EXPECT_EQ(nalTypes(run.encode(scene(64, 48, 2)).bytes), kKeyUnit);
  run.finish();
  EXPECT_EQ(run.outputs.size(), 3U);
}

}  // namespace
}  // namespace componenttest
