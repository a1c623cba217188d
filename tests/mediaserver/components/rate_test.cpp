// Bit rates: reached over a stream in every mode, and reached again soon after every change.

#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

constexpr uint32_t kWidth = 176;
constexpr uint32_t kHeight = 144;

TEST(Rate, IsReachedInEveryModeAndAgainAfterChangesWithoutKeyFramesForIt) {
  struct Step {
    uint32_t bitRate;  // both 0: as before
    uint32_t framesPerSecond;
  };
  const struct {
    const char* device;
    OMX_VIDEO_CONTROLRATETYPE mode;
    uint32_t bitRate;
    uint32_t framesPerSecond;
    std::vector<Step> steps;
  } cases[] = {
      {"omap4",
       OMX_Video_ControlRateVariable,
       200000,
       15,
       {{80000, 0}, {160000, 0}, {320000, 0}, {160000, 0}, {80000, 0}}},
      {"msm8960", OMX_Video_ControlRateConstant, 300000, 15, {}},
      {"msm8960",
       OMX_Video_ControlRateVariableSkipFrames,
       240000,
       30,
       {{120000, 0}, {240000, 0}, {480000, 0}}},
      {"msm7x30", OMX_Video_ControlRateConstantSkipFrames, 150000, 10, {}},
      {"omap4", OMX_Video_ControlRateVariable, 240000, 30, {{0, 10}, {0, 25}}},
      {"msm8960", OMX_Video_ControlRateVariable, 240000, 30, {{0, 10}, {0, 25}}},
  };
  for (const auto& rate : cases) {
    EncoderRun run(rate.device, kWidth, kHeight, rate.framesPerSecond);
    run.setBitRate(rate.bitRate, rate.mode);
    run.setPFrames(0xFFFF);  // no further key frame
    run.start();
    const uint32_t pictures = rate.framesPerSecond * 5;
    run.encodeScene(kWidth, kHeight, pictures);
    EXPECT_NEAR(run.bits(0, pictures) / 5 / rate.bitRate, 1, 0.05) << rate.bitRate;
    uint32_t bitRate = rate.bitRate;
    uint32_t each = rate.framesPerSecond;
    for (const Step& step : rate.steps) {
      SCOPED_TRACE(::testing::Message() << rate.device << " " << step.bitRate << " " << step.framesPerSecond);
      if (step.bitRate != 0) bitRate = step.bitRate;
      if (step.framesPerSecond != 0) each = step.framesPerSecond;
      EXPECT_EQ(step.bitRate != 0 ? run.changeBitRate(bitRate) : run.changeFrameRate(each), kOk);
      const size_t begin = run.outputs.size();
      run.encodeScene(kWidth, kHeight, 4 * each);
      EXPECT_NEAR(run.bits(begin + each, each) / bitRate, 1, 0.2) << "from the second second on";
      EXPECT_NEAR(run.bits(begin, 3 * each) / 3 / bitRate, 1, step.bitRate != 0 ? 0.1 : 0.15);
    }
    EXPECT_EQ(run.keyFrames(), std::vector<size_t>{0});
  }
}

TEST(Rate, MeansNothingWithAConstantQuantizer) {
  double last = 1e9;
  for (const uint32_t quantizer : {20U, 30U, 40U}) {
    EncoderRun run("msm8960", 96, 80);
    run.setBitRate(0, OMX_Video_ControlRateDisable);
    auto record = makeRecord<OMX_VIDEO_PARAM_QUANTIZATIONTYPE>(kOutputPort);
    record.nQpI = record.nQpP = quantizer;
    ASSERT_EQ(run.set(OMX_IndexParamVideoQuantization, record), kOk);
    run.start();
    run.encodeScene(96, 80, 5);
    ASSERT_EQ(run.changeBitRate(100), kOk);
    run.encodeScene(96, 80, 5);
    EXPECT_LT(run.bits(0, 10), last / 2) << quantizer;
    EXPECT_NEAR(run.bits(5, 5) / run.bits(1, 4), 1.25, 0.5);
    last = run.bits(0, 10);
  }
}

}  // namespace
}  // namespace componenttest
