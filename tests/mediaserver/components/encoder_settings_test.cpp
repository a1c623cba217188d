// What clients set before an encoder starts, read back from the stream.

#include "host/mediaserver/components/annex_b.h"
#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

// The first access unit of a stream made with the settings.
std::vector<uint8_t> firstUnit(EncoderRun* run) {
  run->setSize(96, 80);
  run->start();
  return run->encode(scene(96, 80, 0)).bytes;
}

// What the picture parameter set says: "cabac", "constrained", "8x8".
std::string pictureSet(const std::vector<uint8_t>& unit) {
  const std::vector<uint8_t> payload = mediaserver::unescape(nals(unit).at(1));
  mediaserver::BitReader reader(payload);
  std::string set;
  for (int i = 0; i < 2; ++i) reader.ue();
  if (reader.flag()) set += "cabac ";
  reader.flag();
  for (int i = 0; i < 3; ++i) reader.ue();  // one slice group; references
  reader.bits(3);                           // weighted prediction
  for (int i = 0; i < 3; ++i) reader.se();
  reader.flag();
  if (reader.flag()) set += "constrained ";
  reader.flag();
  // More follows unless only the stop bit is left, the last that is set.
  size_t stop = payload.size() * 8 - 1;
  while ((payload[stop / 8] >> (7 - stop % 8) & 1) == 0) --stop;
  if (reader.position() < stop && reader.flag()) set += "8x8 ";
  return set;
}

TEST(EncoderSettings, ShowInTheParameterSets) {
  const struct {
    OMX_VIDEO_AVCPROFILETYPE profile;
    bool cabac, transform;
    OMX_U32 references;
    int idc;
    const char* pictureSet;
  } cases[] = {
      {OMX_VIDEO_AVCProfileBaseline, true, true, 2, 66, "constrained "},
      {OMX_VIDEO_AVCProfileMain, false, true, 3, 77, "constrained "},
      {OMX_VIDEO_AVCProfileMain, true, false, 1, 77, "cabac constrained "},
      {OMX_VIDEO_AVCProfileHigh, false, false, 1, 100, "constrained "},
      {OMX_VIDEO_AVCProfileHigh, true, true, 16, 100, "cabac constrained 8x8 "},
  };
  for (const auto& each : cases) {
    for (const char* device : {"msm8960", "omap4"}) {
      EncoderRun run(device);
      ASSERT_EQ(run.setAvc([&](auto& avc) {
        avc.eProfile = each.profile;
        avc.eLevel = OMX_VIDEO_AVCLevel31;
        avc.bEntropyCodingCABAC = static_cast<OMX_BOOL>(each.cabac ? 2 : 0);
        avc.bDirect8x8Inference = each.transform ? OMX_TRUE : OMX_FALSE;
        avc.bconstIpred = OMX_TRUE;
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
      EXPECT_EQ(pictureSet(unit), each.pictureSet) << each.idc;
      EXPECT_EQ(decode("h264", {{unit, 0}}).size(), 1U) << "declared profile " << each.idc;
    }
  }
}

TEST(EncoderSettings, RaiseTheLevelToWhatHoldsTheStream) {
  const struct {
    OMX_VIDEO_AVCLEVELTYPE asked;
    uint32_t width, height, framesPerSecond, bitRate;
    int level;
  } cases[] = {
      {OMX_VIDEO_AVCLevel1, 176, 144, 10, 64000, 10},
      {OMX_VIDEO_AVCLevel1, 176, 144, 30, 64000, 11},
      {OMX_VIDEO_AVCLevel1, 176, 144, 30, 3000000, 21},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 30, 14000000, 31},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 31, 1000000, 32},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 30, 14000001, 32},
      {static_cast<OMX_VIDEO_AVCLEVELTYPE>(0), 176, 144, 10, 64000, 10},
  };
  for (const auto& each : cases) {
    EncoderRun run("msm8960", each.width, each.height, each.framesPerSecond);
    ASSERT_EQ(run.setAvc([&](auto& avc) { avc.eLevel = each.asked; }), kOk);
    run.setBitRate(each.bitRate);
    run.start();
    const auto set = sequenceSet(run.encode(Picture(each.width, each.height)).bytes);
    EXPECT_EQ(set.levelIdc, each.level) << each.width << "x" << each.height << " " << each.framesPerSecond;
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

  for (const auto& [device, count] : {std::pair{"msm7x30", 1U}, {"msm8960", 3U}, {"omap4", 3U}}) {
    EncoderRun each(device);
    for (const auto profile : {OMX_VIDEO_AVCProfileMain, OMX_VIDEO_AVCProfileHigh}) {
      EXPECT_EQ(each.setAvc([&](auto& avc) { avc.eProfile = profile; }), count == 1 ? kUnsupported : kOk);
    }
    auto entry = makeRecord<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(kOutputPort);
    const auto index = OMX_IndexParamVideoProfileLevelQuerySupported;
    while (each.get(index, &entry) == kOk) ++entry.nProfileIndex;
    EXPECT_EQ(entry.nProfileIndex, count) << device;
  }
}

// A client that knows no profile writes 0 and gets the component's own.
TEST(EncoderSettings, KeepTheProfileThatNobodyAsksToChangeAndCutPicturesIntoSlices) {
  EncoderRun run("omap4");
  auto current = makeRecord<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(kOutputPort);
  current.eProfile = OMX_VIDEO_AVCProfileMain;
  current.eLevel = OMX_VIDEO_AVCLevel2;
  ASSERT_EQ(run.set(OMX_IndexParamVideoProfileLevelCurrent, current), kOk);
  ASSERT_EQ(run.setAvc([](auto& avc) {
    avc.eProfile = static_cast<OMX_VIDEO_AVCPROFILETYPE>(0);
    avc.nSliceHeaderSpacing = 10;
  }),
            kOk);
  const std::vector<uint8_t> unit = firstUnit(&run);
  EXPECT_EQ(sequenceSet(unit).profileIdc, 77);
  EXPECT_EQ(sequenceSet(unit).levelIdc, 20);
  EXPECT_EQ(nalTypes(unit), (NalTypes{7, 8, 5, 5, 5}));
}

TEST(EncoderSettings, AreReadWhereClientsReadThem) {
  EncoderRun run("msm8960");
  const auto expectRate = [&](uint32_t wanted) {
    auto rate = makeRecord<OMX_VIDEO_CONFIG_BITRATETYPE>(kInputPort);
    EXPECT_EQ(run.getConfig(OMX_IndexConfigVideoBitrate, &rate), kOk);
    EXPECT_EQ(rate.nEncodeBitrate, wanted);
    auto parameter = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOutputPort);
    EXPECT_EQ(run.get(OMX_IndexParamVideoBitrate, &parameter), kOk);
    EXPECT_EQ(parameter.nTargetBitrate, wanted);
  };
  run.setBitRate(123000);
  expectRate(123000);
  EXPECT_EQ(run.changeBitRate(0), kUnknownError);
  EXPECT_EQ(run.changeBitRate(456000), kOk);
  expectRate(456000);
  auto parameter = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kInputPort);
  EXPECT_EQ(run.set(OMX_IndexParamVideoBitrate, parameter), kUnknownError);
  // The last word on the port's definition counts, too.
  EXPECT_EQ(run.define(kOutputPort, [](auto& video) { video.nBitrate = 789000; }), kOk);
  expectRate(789000);
  EXPECT_EQ(run.changeFrameRate(0), kUnknownError);
  EXPECT_EQ(run.changeFrameRate(12), kOk);
  auto frames = makeRecord<OMX_CONFIG_FRAMERATETYPE>(kOutputPort);
  EXPECT_EQ(run.getConfig(OMX_IndexConfigVideoFramerate, &frames), kOk);
  EXPECT_EQ(frames.xEncodeFramerate, 12U << 16);
  const auto store = [&](OMX_BOOL enable) {
    return run.node().omx()->storeMetaDataInBuffers(run.node().node(), kInputPort, enable);
  };
  EXPECT_EQ(store(OMX_FALSE), kOk);
  EXPECT_EQ(store(OMX_TRUE), kUnsupported);
}

}  // namespace
}  // namespace componenttest
