// Whole lives of sessions, driven from plain C against scripted components.
#include <gtest/gtest.h>

#include <algorithm>

#include "tests/capi/c_program.h"
#include "tests/support/scripted_media_server.h"

namespace {

constexpr const char* kFailedLine = "the line of tests/capi/c_program.c that failed";

// One of each hardware version. The scripted component puts out what it took in.
struct EncoderDevice {
  const char* name;
  unsigned int frameBytes;
};

std::ostream& operator<<(std::ostream& stream, const EncoderDevice& device) {
  return stream << device.name;
}

class CEncoderProgram : public ::testing::TestWithParam<EncoderDevice> {};

TEST_P(CEncoderProgram, Runs) {
  omxtest::ScriptedMediaServer server(GetParam().name);
  server.encoder().editPort(0, [](auto& definition) { definition.nBufferSize = GetParam().frameBytes; });
  EXPECT_EQ(runEncoderInC(GetParam().frameBytes), 0) << kFailedLine;
  EXPECT_EQ(server.omx().buffersFreedWithNode(), 0U);
}

INSTANTIATE_TEST_SUITE_P(Devices, CEncoderProgram,
                         ::testing::Values(EncoderDevice{"msm-unknown", 38016},
                                           EncoderDevice{"msm8960", 38016}, EncoderDevice{"msm7x30", 38016},
                                           EncoderDevice{"msm8x55", 38016}, EncoderDevice{"msm8x60", 39296},
                                           EncoderDevice{"omap4", 38016}),
                         [](const auto& test) {
                           std::string name = test.param.name;
                           std::replace(name.begin(), name.end(), '-', '_');
                           return name;
                         });

// A device that delivers pictures as the component made them, in the size that creation asked for.
struct DecoderDevice {
  const char* name;
  unsigned int width;
  unsigned int height;
};

std::ostream& operator<<(std::ostream& stream, const DecoderDevice& device) {
  return stream << device.name;
}

class CDecoderProgram : public ::testing::TestWithParam<DecoderDevice> {};

TEST_P(CDecoderProgram, Runs) {
  omxtest::ScriptedMediaServer server(GetParam().name);
  EXPECT_EQ(runDecoderInC(GetParam().width, GetParam().height), 0) << kFailedLine;
  EXPECT_EQ(server.omx().buffersFreedWithNode(), 0U);
}

INSTANTIATE_TEST_SUITE_P(Devices, CDecoderProgram,
                         ::testing::Values(DecoderDevice{"msm7x30", 640, 480},
                                           DecoderDevice{"msm8x55", 640, 480},
                                           DecoderDevice{"msm8960", 1920, 1088}),
                         [](const auto& test) { return std::string(test.param.name); });

}  // namespace
