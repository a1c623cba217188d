// What clients set before an encoder starts, read back from the stream.

#include <gtest/gtest.h>

#include <media/stagefright/MediaErrors.h>

#include "host/mediaserver/components/vendor_records.h"
#include "tests/mediaserver/components/encoder_fixture.h"

namespace componenttest {
namespace {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;

constexpr auto kUnknownError = static_cast<android::status_t>(android::UNKNOWN_ERROR);
constexpr auto kUnsupported = static_cast<android::status_t>(android::ERROR_UNSUPPORTED);

// The first access unit of a stream made with the settings.
std::vector<uint8_t> firstUnit(EncoderRun* run, uint32_t width = 96, uint32_t height = 80) {
  run->setSize(width, height);
  run->start();
  return run->encode(scene(width, height, 0)).bytes;
}

// Entropy coding and transform, as the picture parameter set says.
struct PictureSet {
  bool cabac;
  bool constrainedIntra;
  bool transform8x8;
};
PictureSet pictureSet(const std::vector<uint8_t>& unit) {
  mediaserver::Bytes stream(unit);
  mediaserver::Bytes nal = mediaserver::takeNal(&stream);
  while (!nal.empty() && mediaserver::nalType(nal) != mediaserver::kNalPictureSet)
    nal = mediaserver::takeNal(&stream);
  const std::vector<uint8_t> payload = mediaserver::unescape(nal);
  mediaserver::BitReader reader(payload);
  PictureSet set{};
  reader.ue();
  reader.ue();
  set.cabac = reader.flag();
  reader.flag();
  reader.ue();  // slice groups: one
  reader.ue();
  reader.ue();
  reader.bits(3);  // weighted prediction
  reader.se();
  reader.se();
  reader.se();
  reader.flag();
  set.constrainedIntra = reader.flag();
  reader.flag();
  // More follows unless only the stop bit is left, the last that is set.
  size_t stop = payload.size() * 8 - 1;
  while ((payload[stop / 8] >> (7 - stop % 8) & 1) == 0) --stop;
  if (reader.position() < stop) set.transform8x8 = reader.flag();
  return set;
}

TEST(EncoderSettings, ShowInTheParameterSets) {
  struct {
    OMX_VIDEO_AVCPROFILETYPE profile;
    bool cabac;
    bool transform;
    OMX_U32 references;
    int idc;
    PictureSet wanted;
  } const cases[] = {
      {OMX_VIDEO_AVCProfileBaseline, false, false, 1, 66, {false, true, false}},
      {OMX_VIDEO_AVCProfileBaseline, true, true, 2, 66, {false, true, false}},
      {OMX_VIDEO_AVCProfileMain, false, true, 3, 77, {false, true, false}},
      {OMX_VIDEO_AVCProfileMain, true, false, 1, 77, {true, true, false}},
      {OMX_VIDEO_AVCProfileHigh, false, false, 1, 100, {false, true, false}},
      {OMX_VIDEO_AVCProfileHigh, true, false, 4, 100, {true, true, false}},
      {OMX_VIDEO_AVCProfileHigh, true, true, 16, 100, {true, true, true}},
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
                android::OK);
      const std::vector<uint8_t> unit = firstUnit(&run);
      const auto set = sequenceSet(unit);
      ASSERT_TRUE(set);
      EXPECT_EQ(set->profileIdc, each.idc);
      EXPECT_EQ(set->levelIdc, 31);
      EXPECT_EQ(set->referenceFrames, each.references);
      EXPECT_EQ(set->macroblocks, 30U);
      EXPECT_EQ(set->reorderFrames, std::optional<uint32_t>(0)) << "or decoders hold pictures back";
      EXPECT_EQ(pictureSet(unit).cabac, each.wanted.cabac);
      EXPECT_EQ(pictureSet(unit).transform8x8, each.wanted.transform8x8);
      EXPECT_EQ(pictureSet(unit).constrainedIntra, each.wanted.constrainedIntra);
      EXPECT_EQ(decode("h264", {{unit, 0}}).size(), 1U) << "declared profile " << each.idc;
    }
  }
}

TEST(EncoderSettings, RaiseTheLevelToWhatHoldsTheStream) {
  struct {
    OMX_VIDEO_AVCLEVELTYPE asked;
    uint32_t width, height, framesPerSecond, bitRate;
    int level;
  } const cases[] = {
      {OMX_VIDEO_AVCLevel1, 176, 144, 10, 64000, 10},
      {OMX_VIDEO_AVCLevel1, 176, 144, 30, 64000, 11},
      {OMX_VIDEO_AVCLevel1, 176, 144, 30, 3000000, 21},
      {OMX_VIDEO_AVCLevel31, 176, 144, 10, 64000, 31},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 30, 14000000, 31},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 31, 1000000, 32},
      {OMX_VIDEO_AVCLevel31, 1280, 720, 30, 14000001, 32},
      {OMX_VIDEO_AVCLevel31, 1920, 1088, 24, 1000000, 40},
      {static_cast<OMX_VIDEO_AVCLEVELTYPE>(0), 176, 144, 10, 64000, 10},
  };
  for (const auto& each : cases) {
    EncoderRun run("msm8960");
    ASSERT_EQ(run.setAvc([&](auto& avc) { avc.eLevel = each.asked; }), android::OK);
    run.setSize(each.width, each.height, each.framesPerSecond);
    run.setBitRate(each.bitRate);
    run.start();
    const auto set = sequenceSet(run.encode(Picture(each.width, each.height)).bytes);
    ASSERT_TRUE(set);
    EXPECT_EQ(set->levelIdc, each.level) << each.width << "x" << each.height << " " << each.framesPerSecond;
  }
}

TEST(EncoderSettings, RefuseWhatTheComponentCannotDo) {
  using Change = void (*)(OMX_VIDEO_PARAM_AVCTYPE&);
  const Change refused[] = {
      [](auto& avc) { avc.nBFrames = 1; },
      [](auto& avc) { avc.bEnableFMO = OMX_TRUE; },
      [](auto& avc) { avc.bEnableASO = OMX_TRUE; },
      [](auto& avc) { avc.bEnableRS = OMX_TRUE; },
      [](auto& avc) { avc.bEnableUEP = OMX_TRUE; },
      [](auto& avc) { avc.bFrameMBsOnly = OMX_FALSE; },
      [](auto& avc) { avc.bMBAFF = OMX_TRUE; },
      [](auto& avc) { avc.nRefFrames = 17; },
      [](auto& avc) { avc.eProfile = OMX_VIDEO_AVCProfileExtended; },
      [](auto& avc) { avc.eProfile = OMX_VIDEO_AVCProfileHigh10; },
      [](auto& avc) { avc.eLevel = static_cast<OMX_VIDEO_AVCLEVELTYPE>(3); },
      [](auto& avc) { avc.nAllowedPictureTypes = OMX_VIDEO_PictureTypeP; },
      [](auto& avc) { avc.nCabacInitIdc = 3; },
  };
  EncoderRun run("msm8960");
  const OMX_VIDEO_PARAM_AVCTYPE before = run.avc();
  for (const Change change : refused) EXPECT_EQ(run.setAvc(change), kUnsupported);
  const OMX_VIDEO_PARAM_AVCTYPE after = run.avc();
  EXPECT_EQ(memcmp(&before, &after, sizeof(before)), 0) << "nothing of it was taken";

  EncoderRun baseline("msm7x30");
  for (const auto profile : {OMX_VIDEO_AVCProfileMain, OMX_VIDEO_AVCProfileHigh}) {
    EXPECT_EQ(baseline.setAvc([&](auto& avc) { avc.eProfile = profile; }), kUnsupported);
  }
  EXPECT_EQ(baseline.setAvc([](auto& avc) { avc.eProfile = OMX_VIDEO_AVCProfileBaseline; }), android::OK);
}

// A client that knows no profile writes 0 and gets the component's own.
TEST(EncoderSettings, KeepTheProfileThatNobodyAsksToChange) {
  EncoderRun run("omap4");
  auto current = makeRecord<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(kOutputPort);
  current.eProfile = OMX_VIDEO_AVCProfileMain;
  current.eLevel = OMX_VIDEO_AVCLevel2;
  ASSERT_EQ(run.set(OMX_IndexParamVideoProfileLevelCurrent, current), android::OK);
  ASSERT_EQ(run.setAvc([](auto& avc) { avc.eProfile = static_cast<OMX_VIDEO_AVCPROFILETYPE>(0); }),
            android::OK);
  EXPECT_EQ(run.avc().eProfile, OMX_VIDEO_AVCProfileMain);
  const auto set = sequenceSet(firstUnit(&run));
  ASSERT_TRUE(set);
  EXPECT_EQ(set->profileIdc, 77);
  EXPECT_EQ(set->levelIdc, 20);
}

TEST(EncoderSettings, EnumerateProfiles) {
  for (const auto& [device, count] : {std::pair{"msm7x30", 1U}, {"msm8960", 3U}, {"omap4", 3U}}) {
    EncoderRun run(device);
    auto entry = makeRecord<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(kOutputPort);
    while (run.get(OMX_IndexParamVideoProfileLevelQuerySupported, &entry) == android::OK)
      ++entry.nProfileIndex;
    EXPECT_EQ(entry.nProfileIndex, count) << device;
  }
}

TEST(EncoderSettings, AreReadWhereClientsReadThem) {
  EncoderRun run("msm8960");
  run.setBitRate(123000);
  // Asked on the input port, changed on the output port.
  auto rate = makeRecord<OMX_VIDEO_CONFIG_BITRATETYPE>(kInputPort);
  EXPECT_EQ(run.getConfig(OMX_IndexConfigVideoBitrate, &rate), android::OK);
  EXPECT_EQ(rate.nEncodeBitrate, 123000U);
  EXPECT_EQ(run.changeBitRate(0), kUnknownError);
  EXPECT_EQ(run.changeBitRate(456000), android::OK);
  auto parameter = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOutputPort);
  EXPECT_EQ(run.get(OMX_IndexParamVideoBitrate, &parameter), android::OK);
  EXPECT_EQ(parameter.nTargetBitrate, 456000U);
  parameter.nPortIndex = kInputPort;
  EXPECT_EQ(run.set(OMX_IndexParamVideoBitrate, parameter), kUnknownError);
  // The last word on the port's definition counts, too.
  auto definition = run.node().definition(kOutputPort);
  definition.format.video.nBitrate = 789000;
  EXPECT_EQ(run.node().define(kOutputPort, definition), android::OK);
  EXPECT_EQ(run.getConfig(OMX_IndexConfigVideoBitrate, &rate), android::OK);
  EXPECT_EQ(rate.nEncodeBitrate, 789000U);
  EXPECT_EQ(run.changeFrameRate(0), kUnknownError);
  EXPECT_EQ(run.changeFrameRate(12), android::OK);
  auto frames = makeRecord<OMX_CONFIG_FRAMERATETYPE>(kOutputPort);
  EXPECT_EQ(run.getConfig(OMX_IndexConfigVideoFramerate, &frames), android::OK);
  EXPECT_EQ(frames.xEncodeFramerate, 12U << 16);
}

TEST(EncoderSettings, TakePixelsAndNoHandles) {
  for (const char* device : {"omap4", "msm8960"}) {
    EncoderRun run(device);
    const auto store = [&](OMX_BOOL enable) {
      return run.node().omx()->storeMetaDataInBuffers(run.node().node(), kInputPort, enable);
    };
    EXPECT_EQ(store(OMX_FALSE), android::OK);
    EXPECT_EQ(store(OMX_TRUE), kUnsupported);
  }
}

TEST(EncoderSettings, CutPicturesIntoSlices) {
  EncoderRun run("msm8960");
  ASSERT_EQ(run.setAvc([](auto& avc) { avc.nSliceHeaderSpacing = 10; }), android::OK);
  EXPECT_EQ(nalTypes(firstUnit(&run)), (std::vector<unsigned>{7, 8, 5, 5, 5}));
}

}  // namespace
}  // namespace componenttest
