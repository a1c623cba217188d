// Bit rates: reached over a stream, and reached again soon after every change.

#include <gtest/gtest.h>

#include "tests/mediaserver/components/encoder_fixture.h"

namespace componenttest {
namespace {

constexpr uint32_t kWidth = 176;
constexpr uint32_t kHeight = 144;

struct RateCase {
  const char* name;
  const char* device;
  OMX_VIDEO_CONTROLRATETYPE mode;
  uint32_t bitRate;
  uint32_t framesPerSecond;
};

class Rate : public testing::TestWithParam<RateCase> {};

TEST_P(Rate, IsReachedOverAStream) {
  const RateCase& rate = GetParam();
  EncoderRun run(rate.device);
  run.setSize(kWidth, kHeight, rate.framesPerSecond);
  run.setBitRate(rate.bitRate, rate.mode);
  run.start();
  const uint32_t pictures = rate.framesPerSecond * 5;
  run.encodeScene(kWidth, kHeight, pictures);
  EXPECT_EQ(run.outputs().size(), pictures) << "no mode drops pictures";
  EXPECT_NEAR(run.bits(0, pictures) / 5 / rate.bitRate, 1, 0.05);
}

INSTANTIATE_TEST_SUITE_P(
    Encoder, Rate,
    testing::Values(
        RateCase{"Variable", "omap4", OMX_Video_ControlRateVariable, 200000, 30},
        RateCase{"Constant", "msm8960", OMX_Video_ControlRateConstant, 300000, 15},
        RateCase{"VariableSkipping", "msm8960", OMX_Video_ControlRateVariableSkipFrames, 400000, 24},
        RateCase{"ConstantSkipping", "msm7x30", OMX_Video_ControlRateConstantSkipFrames, 150000, 10}),
    [](const auto& test) { return test.param.name; });

TEST(Encoder, StepsToANewBitRateWithinASecond) {
  constexpr uint32_t kRate = 30;
  EncoderRun run("msm8960");
  run.setSize(kWidth, kHeight, kRate);
  run.setBitRate(200000);
  run.start();
  run.encodeScene(kWidth, kHeight, 3 * kRate);
  size_t begin = run.outputs().size();
  for (const uint32_t bitRate : {600000U, 150000U, 300000U}) {
    ASSERT_EQ(run.changeBitRate(bitRate), android::OK);
    run.encodeScene(kWidth, kHeight, 3 * kRate);
    EXPECT_NEAR(run.bits(begin + kRate, kRate) / bitRate, 1, 0.2) << bitRate << ", the next second";
    EXPECT_NEAR(run.bits(begin, 3 * kRate) / 3 / bitRate, 1, 0.15) << bitRate << ", on the whole";
    begin = run.outputs().size();
  }
  EXPECT_EQ(run.keyFrames(), (std::vector<size_t>{0, 30, 60, 90, 120, 150, 180, 210, 240, 270, 300, 330}))
      << "only those that are due";
}

TEST(Encoder, KeepsTheBitRateWhenTheFrameRateChanges) {
  for (const char* device : {"msm8960", "omap4"}) {
    EncoderRun run(device);
    run.setSize(kWidth, kHeight, 30);
    run.setBitRate(240000);
    ASSERT_EQ(run.setAvc([](auto& avc) { avc.nPFrames = 0xFFFF; }), android::OK);
    run.start();
    run.encodeScene(kWidth, kHeight, 60);
    for (const uint32_t framesPerSecond : {10U, 25U}) {
      const size_t begin = run.outputs().size();
      ASSERT_EQ(run.changeFrameRate(framesPerSecond), android::OK);
      run.encodeScene(kWidth, kHeight, 4 * framesPerSecond);
      EXPECT_NEAR(run.bits(begin, 4 * framesPerSecond) / 4 / 240000, 1, 0.15)
          << device << " " << framesPerSecond;
    }
    EXPECT_EQ(run.keyFrames(), std::vector<size_t>{0});
  }
}

TEST(Encoder, KeepsTheQuantizerWhereThereIsNoRate) {
  double last = 1e9;
  for (const uint32_t quantizer : {20U, 30U, 40U}) {
    EncoderRun run("msm8960");
    run.setSize(96, 80);
    run.setBitRate(0, OMX_Video_ControlRateDisable);
    auto record = makeRecord<OMX_VIDEO_PARAM_QUANTIZATIONTYPE>(mediaserver::kOutputPort);
    record.nQpI = quantizer;
    record.nQpP = quantizer;
    ASSERT_EQ(run.set(OMX_IndexParamVideoQuantization, record), android::OK);
    run.start();
    run.encodeScene(96, 80, 5);
    ASSERT_EQ(run.changeBitRate(100), android::OK);
    run.encodeScene(96, 80, 5);
    EXPECT_LT(run.bits(0, 10), last / 2) << quantizer;
    EXPECT_NEAR(run.bits(5, 5) / run.bits(1, 4), 1.25, 0.5) << "a bit rate means nothing here";
    last = run.bits(0, 10);
  }
}

}  // namespace
}  // namespace componenttest
