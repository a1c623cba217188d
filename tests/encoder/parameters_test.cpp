// The encoder's own records: what the application's settings become, and what refusals are reported as.
#include <gtest/gtest.h>

#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

// Positions in the H.264 record, in words.
enum { kPFrames = 4, kRefFrames = 7, kProfile = 14, kCabac = 19, kDirect8x8 = 23 };

constexpr OMX_U32 kComponentsOwn = 0x0A0B0C00 + kProfile;

struct AvcCase {
  int32_t profile;
  int32_t keyFrameInterval;
  uint32_t referenceFrames;
  uint8_t entropyCoding;
  uint8_t transform8x8;
  OMX_U32 pFrames;  // written
  OMX_U32 profileWord;
};

constexpr AvcCase kAvcCases[] = {
    {66, 30, 1, 0, 0, 29, 1},
    {77, 60, 3, 1, 0, 59, 2},
    {100, 60, 4, 1, 1, 59, 8},
    {88, 60, 1, 0, 0, 59, kComponentsOwn},
    {-5, 60, 1, 0, 0, 59, kComponentsOwn},
    {77, 0, 1, 0, 0, 0xFFFF, 2},  // no further key frames
    {77, 1, 1, 0, 0, 0, 2},
    {77, -1, 1, 0, 0, 0xFFFFFFFE, 2},
    {77, INT32_MIN, 1, 0, 0, 0x7FFFFFFF, 2},
    {77, 60, 0xFFFFFFFF, 0xC8, 0x80, 59, 2},  // flags other than 1
};

class AvcSettings : public ::testing::TestWithParam<const char*> {};

TEST_P(AvcSettings, FollowTheApplicationButOnAnMsm7x30) {
  const bool baselineOnly = GetParam() == std::string("msm7x30");
  EncoderRig rig(GetParam());
  rig.server.encoder().answer(OMX_IndexParamVideoAvc, patternRecord<108>(1));
  ASSERT_EQ(rig.create(), 0);
  for (const AvcCase& each : kAvcCases) {
    SCOPED_TRACE(&each - kAvcCases);
    webrtc::VideoCodecH264 h264 = {};
    h264.profile = each.profile;
    h264.keyFrameInterval = each.keyFrameInterval;
    h264.referenceFrames = each.referenceFrames;
    h264.entropyCoding = each.entropyCoding;
    h264.transform8x8 = each.transform8x8;
    EXPECT_EQ(rig.session->setupAvcSettings(&h264), 0);
    const Words record = words(rig.server.omx().calls(Method::SetParameter).back().record);
    ASSERT_EQ(record.size(), 27U);
    EXPECT_EQ(record[kPFrames], each.pFrames);
    EXPECT_EQ(record[kRefFrames], each.referenceFrames);
    EXPECT_EQ(record[kProfile], baselineOnly ? OMX_VIDEO_AVCProfileBaseline : each.profileWord);
    EXPECT_EQ(record[kCabac], baselineOnly ? 0 : each.entropyCoding);
    EXPECT_EQ(record[kDirect8x8], baselineOnly ? 0 : each.transform8x8);
  }
}

INSTANTIATE_TEST_SUITE_P(Devices, AvcSettings, ::testing::Values("msm8960", "msm8x55", "msm7x30"));

TEST(EncoderUpdates, WriteOneRecordEach) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  const auto calls = [&] {
    std::vector<Call> result = settingCalls(rig.server.omx());
    rig.server.omx().clearCalls();
    return result;
  };
  calls();
  EXPECT_EQ(rig.session->updateBitRate(300000), 0);
  std::vector<Call> made = calls();
  EXPECT_EQ(inShort(made),  // asked of the input, set on the output
            (std::vector<std::string>{"getConfig 6000011 port 0", "setConfig 6000011 port 1"}));
  EXPECT_EQ(words(made[1].record), (Words{16, kVersion, 1, 300000}));

  const struct {
    int period;
    Words record;
  } periods[] = {{30, {20, kVersion, 1, 30, 29}},
                 {1, {20, kVersion, 1, 1, 0}},
                 {0, {20, kVersion, 1, 0, 0xFFFFFFFF}},
                 {INT32_MIN, {20, kVersion, 1, 0x80000000, 0x7FFFFFFF}}};
  for (const auto& each : periods) {
    EXPECT_EQ(rig.session->updateAVCIntraPeriod(each.period), 0);
    made = calls();
    EXPECT_EQ(inShort(made), std::vector<std::string>{"setConfig 6000019 port 1"});
    EXPECT_EQ(words(made.at(0).record), each.record);
  }

  EXPECT_EQ(rig.session->requestIFrame(), 0);
  made = calls();
  EXPECT_EQ(inShort(made), std::vector<std::string>{"setConfig 6000013 port 1"});
  EXPECT_EQ(words(made.at(0).record), (Words{16, kVersion, 1, 1}));

  EXPECT_EQ(rig.session->setupRateControl(2, -1), 0);
  made = calls();
  EXPECT_EQ(inShort(made),
            (std::vector<std::string>{"getParameter 6000004 port 1", "setParameter 6000004 port 1"}));
  EXPECT_EQ(words(made[1].record), (Words{20, kVersion, 1, 2, 0xFFFFFFFF}));
}

TEST(EncoderUpdates, ReportRefusalsWithoutALine) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  RecordingOmx& omx = rig.server.omx();
  omx.fail(Method::GetConfig);
  EXPECT_EQ(rig.session->updateBitRate(1), OMXI_ERR_GET_BITRATE);
  omx.fail(Method::SetConfig);
  EXPECT_EQ(rig.session->updateBitRate(1), OMXI_ERR_SET_BITRATE);
  omx.fail(Method::SetConfig);
  EXPECT_EQ(rig.session->updateAVCIntraPeriod(1), OMXI_ERR_SET_INTRA_PERIOD);
  omx.fail(Method::SetConfig);
  EXPECT_EQ(rig.session->requestIFrame(), OMXI_ERR_REQUEST_IFRAME);
  EXPECT_EQ(logLines(rig.log), LogLines());
}

}  // namespace
