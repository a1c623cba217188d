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
enum class Missing {
  Nothing,
  Server,
  Omx,
  Component,
  Node,
  Definition,
  Size,
  Rates,
  Avc,
  MetaData,
  Settings
};

void arrange(ScriptedMediaServer& server, Missing what) {
  RecordingOmx& omx = server.omx();
  if (what == Missing::Server) server.unregister();
  if (what == Missing::Omx) server.serveWithoutOmx();
  if (what == Missing::Component) omx.fail(Method::ListNodes);
  if (what == Missing::Node) omx.fail(Method::AllocateNode);
  if (what == Missing::Rates) omx.fail(Method::GetParameter, 5);
  if (what == Missing::Avc) omx.fail(Method::GetParameter, 3);
  if (what == Missing::MetaData) omx.fail(Method::StoreMetaDataInBuffers);
  if (what == Missing::Definition) omx.fail(Method::GetParameter);
  if (what == Missing::Size) omx.fail(Method::SetParameter, 2);  // the first one is the picture order
}

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
  arrange(server, failure.missing);
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
  if (failure.missing >= Missing::Rates && failure.missing <= Missing::MetaData) {
    lines.emplace_back("E OMXINTERFACE - [ENC] Init: failed to setup params!");
  }
  lines.push_back(std::string("E OMXINTERFACE - ERROR creating ") +
                  (failure.encoder ? "encoder: " : "decoder: ") + std::to_string(failure.code) + " (" +
                  resultDescription(failure.code) + ")");
  EXPECT_EQ(logLines(log), lines);
  EXPECT_EQ(server.leaks(), "");
}

const std::string kNoServer = "OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
const std::string kNoOmx = "OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE";
const std::string kNotFound = "OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.decoder.avc";
const std::string kNoNode = "OMXINTERFACE - Could not allocate node: OMX.qcom.video.";
const std::string kNotSet = "OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -2147483648\n";
const std::string kNoRates = "OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: -2147483648";
const std::string kNoAvc = "OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: -2147483648";

INSTANTIATE_TEST_SUITE_P(Decoder, FailureTest,
                         ::testing::Values(Failure{"msm8960", false, Missing::Server, 3, kNoServer},
                                           Failure{"msm8960", false, Missing::Omx, 3, kNoOmx},
                                           Failure{"msm8960", false, Missing::Component, 6, kNotFound},
                                           Failure{"msm8960", false, Missing::Node, 4,
                                                   kNoNode + "decoder.avc -- error -2147483648"},
                                           Failure{"msm8960", false, Missing::Definition, 13, ""},
                                           Failure{"msm8960", false, Missing::Size, 14, kNotSet},
                                           Failure{"exynos4", false, Missing::Nothing, 36, ""}));

INSTANTIATE_TEST_SUITE_P(Encoder, FailureTest,
                         ::testing::Values(Failure{"msm8960", true, Missing::Server, 3, kNoServer},
                                           Failure{"msm8960", true, Missing::Node, 4,
                                                   kNoNode + "encoder.avc -- error -2147483648"},
                                           Failure{"msm8960", true, Missing::Rates, 17, kNoRates},
                                           Failure{"msm8960", true, Missing::Avc, 34, kNoAvc},
                                           Failure{"omap4", true, Missing::MetaData, -1,
                                                   "Storing meta data in video buffers is not supported"},
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
