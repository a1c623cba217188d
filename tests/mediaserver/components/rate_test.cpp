// Bit rates: reached over a stream, and reached again soon after every change.

#include "tests/mediaserver/components/runs.h"

namespace componenttest {
namespace {

constexpr uint32_t kWidth = 176;
constexpr uint32_t kHeight = 144;
constexpr OMX_U32 kNoFurtherKey = 0xFFFF;

TEST(Rate, IsReachedInEveryModeWithoutDroppingPictures) {
  const struct {
    const char* device;
    OMX_VIDEO_CONTROLRATETYPE mode;
    uint32_t bitRate;
    uint32_t framesPerSecond;
  } cases[] = {
      {"omap4", OMX_Video_ControlRateVariable, 200000, 30},
      {"msm8960", OMX_Video_ControlRateConstant, 300000, 15},
      {"msm8960", OMX_Video_ControlRateVariableSkipFrames, 400000, 24},
      {"msm7x30", OMX_Video_ControlRateConstantSkipFrames, 150000, 10},
  };
  for (const auto& rate : cases) {
    EncoderRun run(rate.device);
    run.setSize(kWidth, kHeight, rate.framesPerSecond);
    run.setBitRate(rate.bitRate, rate.mode);
    run.start();
    const uint32_t pictures = rate.framesPerSecond * 5;
    run.encodeScene(kWidth, kHeight, pictures);
    EXPECT_EQ(run.outputs().size(), pictures);
    EXPECT_NEAR(run.bits(0, pictures) / 5 / rate.bitRate, 1, 0.05) << rate.bitRate;
  }
}

TEST(Rate, StepsWithinASecondAndTakesNoKeyFrameForIt) {
  for (const auto& [device, framesPerSecond] : {std::pair{"msm8960", 30U}, {"omap4", 15U}}) {
    EncoderRun run(device);
    run.setSize(kWidth, kHeight, framesPerSecond);
    uint32_t bitRate = 160000;
    run.setBitRate(bitRate);
    ASSERT_EQ(run.setAvc([](auto& avc) { avc.nPFrames = kNoFurtherKey; }), android::OK);
    run.start();
    run.encodeScene(kWidth, kHeight, 3 * framesPerSecond);
    for (const double factor : {0.5, 2.0, 2.0, 0.5, 0.5}) {
      bitRate = static_cast<uint32_t>(bitRate * factor);
      const size_t begin = run.outputs().size();
      ASSERT_EQ(run.changeBitRate(bitRate), android::OK);
      run.encodeScene(kWidth, kHeight, 3 * framesPerSecond);
      EXPECT_NEAR(run.bits(begin + framesPerSecond, framesPerSecond) / bitRate, 1, 0.2)
          << bitRate << ", from the second second on";
      EXPECT_NEAR(run.bits(begin, 3 * framesPerSecond) / 3 / bitRate, 1, 0.1) << bitRate << ", on the whole";
    }
    EXPECT_EQ(run.keyFrames(), std::vector<size_t>{0});
  }
}

TEST(Rate, StaysWhenTheFrameRateChanges) {
  for (const char* device : {"msm8960", "omap4"}) {
    EncoderRun run(device);
    run.setSize(kWidth, kHeight, 30);
    run.setBitRate(240000);
    ASSERT_EQ(run.setAvc([](auto& avc) { avc.nPFrames = kNoFurtherKey; }), android::OK);
    run.start();
    run.encodeScene(kWidth, kHeight, 60);
    for (const uint32_t framesPerSecond : {10U, 25U}) {
      const size_t begin = run.outputs().size();
      ASSERT_EQ(run.changeFrameRate(framesPerSecond), android::OK);
      run.encodeScene(kWidth, kHeight, 4 * framesPerSecond);
      EXPECT_NEAR(run.bits(begin, 4 * framesPerSecond) / 4 / 240000, 1, 0.15) << framesPerSecond;
    }
    EXPECT_EQ(run.keyFrames(), std::vector<size_t>{0});
  }
}

TEST(Rate, MeansNothingWithAConstantQuantizer) {
  double last = 1e9;
  for (const uint32_t quantizer : {20U, 30U, 40U}) {
    EncoderRun run("msm8960");
    run.setSize(96, 80);
    run.setBitRate(0, OMX_Video_ControlRateDisable);
    auto record = makeRecord<OMX_VIDEO_PARAM_QUANTIZATIONTYPE>(kOutputPort);
    record.nQpI = record.nQpP = quantizer;
    ASSERT_EQ(run.set(OMX_IndexParamVideoQuantization, record), android::OK);
    run.start();
    run.encodeScene(96, 80, 5);
    ASSERT_EQ(run.changeBitRate(100), android::OK);
    run.encodeScene(96, 80, 5);
    EXPECT_LT(run.bits(0, 10), last / 2) << quantizer;
    EXPECT_NEAR(run.bits(5, 5) / run.bits(1, 4), 1.25, 0.5);
    last = run.bits(0, 10);
  }
}

}  // namespace
}  // namespace componenttest
