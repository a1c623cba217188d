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

}  // namespace
}  // namespace componenttest
