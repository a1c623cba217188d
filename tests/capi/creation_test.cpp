// Creation through the C interface: what is set up, what is reported, and what stays of a failure; and whole
// lives of sessions driven from plain C.
#include <gtest/gtest.h>

#include <cstring>

#include "core/omx_interface.h"
#include "omxbridge/omxbridge.h"
#include "tests/capi/c_program.h"
#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

TEST(BuildTime, IsADateAndATime) {
  char month[4] = {};
  int numbers[5] = {};
  int length = 0;
  ASSERT_EQ(sscanf(g_strPrgCreatTime, "%3s %2d %4d, %2d:%2d:%2d%n", month, &numbers[0], &numbers[1],
                   &numbers[2], &numbers[3], &numbers[4], &length),
            6);
  EXPECT_EQ(static_cast<size_t>(length), strlen(g_strPrgCreatTime));
  EXPECT_NE(strstr("Jan Feb Mar Apr May Jun Jul Aug Sep Oct Nov Dec", month), nullptr);
}

struct Generation {
  const char* device;
  OMX_U32 width;  // of a decoder's input
  OMX_U32 height;
  unsigned int frameBytes;  // of an encoder's input
  bool native;              // delivers pictures as the component made them
};

void PrintTo(const Generation& generation, std::ostream* stream) {
  *stream << generation.device;
}

class GenerationTest : public ::testing::TestWithParam<Generation> {};

TEST_P(GenerationTest, RunsFromPlainC) {
  const Generation& generation = GetParam();
  ScriptedMediaServer server(generation.device);
  server.encoder().editPort(0, [&](auto& definition) { definition.nBufferSize = generation.frameBytes; });
  // The scripted component puts out what it took in.
  EXPECT_EQ(runEncoderInC(generation.frameBytes), 0) << "the line of c_program.c that failed";
  if (generation.native) {
    EXPECT_EQ(runDecoderInC(generation.width, generation.height), 0) << "the line of c_program.c that failed";
  }
  EXPECT_EQ(server.omx().buffersFreedWithNode(), 0U);
  int result = -1;
  void* decoder = decoder_create(&result, "a name that does not matter");
  EXPECT_EQ(result, 0);
  ASSERT_NE(decoder, nullptr);
  const Call call = server.omx().calls(Method::SetParameter).back();  // the last that creation writes
  EXPECT_EQ(call.index, OMX_IndexParamPortDefinition);
  const auto definition = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
  EXPECT_EQ(definition->nPortIndex, 0U);
  EXPECT_EQ(definition->format.video.nFrameWidth, generation.width);
  EXPECT_EQ(definition->format.video.nFrameHeight, generation.height);
  EXPECT_EQ(definition->format.video.xFramerate, 24U << 16);
  EXPECT_STREQ(static_cast<OmxInterface*>(decoder)->_componentName, "a name that does not matter");
  EXPECT_EQ(omx_interface_destroy(decoder), 0);
}

INSTANTIATE_TEST_SUITE_P(Devices, GenerationTest,
                         ::testing::Values(Generation{"msm7x30", 640, 480, 38016, true},
                                           Generation{"msm8x55", 640, 480, 38016, true},
                                           Generation{"msm8x60", 1920, 1088, 39296, false},
                                           Generation{"msm8960", 1920, 1088, 38016, true},
                                           Generation{"msm-unknown", 1920, 1088, 38016, true},
                                           Generation{"omap4", 1920, 1088, 38016, false}));

// What is missing or refused.
enum class Missing { Nothing, Server, Omx, Settings };

struct Failure {
  const char* device;
  bool encoder;
  Missing missing;
  int code;
  std::string line;  // in front of the last ones; empty: none
};

class FailureTest : public ::testing::TestWithParam<Failure> {};

TEST_P(FailureTest, IsReportedAndLeavesNothing) {
  const Failure& failure = GetParam();
  omxhost::LogCapture log;
  ScriptedMediaServer server(failure.device);
  if (failure.missing == Missing::Server) server.unregister();
  if (failure.missing == Missing::Omx) server.serveWithoutOmx();
  int result = -77;
  webrtc::VideoCodec codec = settings();
  webrtc::VideoCodec* const given = failure.missing != Missing::Settings ? &codec : nullptr;
  EXPECT_EQ(failure.encoder ? encoder_create(&result, given) : decoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, failure.code);
  LogLines lines;
  if (failure.encoder) {
    lines.push_back(std::string("4/zol-video enter hardCodec encoder_create: build time:") +
                    g_strPrgCreatTime + " ");
  }
  if (!failure.line.empty()) lines.push_back("E " + failure.line);
  lines.push_back(std::string("E OMXINTERFACE - ERROR creating ") +
                  (failure.encoder ? "encoder: " : "decoder: ") + std::to_string(failure.code) + " (" +
                  resultDescription(failure.code) + ")");
  EXPECT_EQ(logLines(log), lines);
  EXPECT_EQ(server.leaks(), "");
}

const std::string kNoServer = "OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
const std::string kNoOmx = "OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE";

INSTANTIATE_TEST_SUITE_P(Reasons, FailureTest,
                         ::testing::Values(Failure{"msm8960", false, Missing::Server, 3, kNoServer},
                                           Failure{"msm8960", false, Missing::Omx, 3, kNoOmx},
                                           Failure{"exynos4", false, Missing::Nothing, 36, ""},
                                           Failure{"msm8960", true, Missing::Server, 3, kNoServer},
                                           Failure{"msm8960", true, Missing::Settings, 28, ""}));

TEST(Create, WorksWithoutAPlaceForTheResult) {
  ScriptedMediaServer server("msm8960");
  webrtc::VideoCodec codec = settings();
  for (void* session : {encoder_create(nullptr, &codec), decoder_create(nullptr, nullptr)}) {
    EXPECT_NE(session, nullptr);
    omx_interface_destroy(session);
  }
  EXPECT_EQ(encoder_create(nullptr, nullptr), nullptr);
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder.avc"), 1);
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder"), 0);
}

}  // namespace
