// Creation through the C interface: what is set up, what is reported, and what stays of a failure; and whole
// lives of sessions driven from plain C.
#include <gtest/gtest.h>

#include <cstring>

#include "core/omx_interface.h"
#include "omxbridge/omxbridge.h"
#include "tests/capi/c_program.h"
#include "tests/core/log_lines.h"
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

// A wrong width is that of a definition which is refused; 0: every definition.
void refuseDefinitions(ScriptedMediaServer& server, Method method, OMX_U32 width) {
  server.omx().failWhere([=](const Call& call) {
    const auto definition = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
    return call.method == method && call.index == OMX_IndexParamPortDefinition &&
           (width == 0 || definition->format.video.nFrameWidth == width);
  });
}

using Arrange = void (*)(ScriptedMediaServer& server);

constexpr Arrange kNothing = [](ScriptedMediaServer&) {};
constexpr Arrange kNoServer = [](ScriptedMediaServer& server) { server.unregister(); };
constexpr Arrange kNoOmx = [](ScriptedMediaServer& server) { server.serveWithoutOmx(); };
constexpr Arrange kNoComponent = [](ScriptedMediaServer& server) { server.omx().fail(Method::ListNodes); };
constexpr Arrange kNoNode = [](ScriptedMediaServer& server) { server.omx().fail(Method::AllocateNode); };
constexpr Arrange kNotTold = [](ScriptedMediaServer& server) {
  refuseDefinitions(server, Method::GetParameter, 0);
};
constexpr Arrange kNotSized = [](ScriptedMediaServer& server) {
  refuseDefinitions(server, Method::SetParameter, 1920);
};
constexpr Arrange kNoRates = [](ScriptedMediaServer& server) { server.omx().fail(Method::GetParameter, 5); };
constexpr Arrange kNoAvc = [](ScriptedMediaServer& server) { server.omx().fail(Method::GetParameter, 3); };
constexpr Arrange kNoMetaData = [](ScriptedMediaServer& server) {
  server.omx().fail(Method::StoreMetaDataInBuffers);
};

struct Failure {
  const char* device;
  bool encoder;
  bool settings;  // are given
  Arrange arrange;
  int code;
  const char* description;
  LogLines lines;  // all but the encoder's first and the last
};

class FailureTest : public ::testing::TestWithParam<Failure> {};

TEST_P(FailureTest, IsReportedAndLeavesNothing) {
  const Failure& failure = GetParam();
  omxhost::LogCapture log;
  ScriptedMediaServer server(failure.device);
  failure.arrange(server);
  int result = -77;
  webrtc::VideoCodec codec = settings();
  webrtc::VideoCodec* const given = failure.settings ? &codec : nullptr;
  EXPECT_EQ(failure.encoder ? encoder_create(&result, given) : decoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, failure.code);
  LogLines lines = failure.lines;
  if (failure.encoder) {
    lines.insert(lines.begin(), std::string("4/zol-video enter hardCodec encoder_create: build time:") +
                                    g_strPrgCreatTime + " ");
  }
  lines.push_back(std::string("E OMXINTERFACE - ERROR creating ") +
                  (failure.encoder ? "encoder: " : "decoder: ") + std::to_string(failure.code) + " (" +
                  failure.description + ")");
  EXPECT_EQ(logLines(log), lines);
  EXPECT_EQ(server.leaks(), "");
}

constexpr const char* kNoDescription = "Could not define result\n";
constexpr const char* kIomx = "Could not Acquire iOMX Interface";
constexpr const char* kNoServerLine = "E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
constexpr const char* kNotConfigured = "E OMXINTERFACE - [ENC] Init: failed to setup params!";
std::string nodeLine(const char* codec) {
  return std::string("E OMXINTERFACE - Could not allocate node: OMX.qcom.video.") + codec +
         ".avc -- error -2147483648";
}

INSTANTIATE_TEST_SUITE_P(
    Decoder, FailureTest,
    ::testing::Values(
        Failure{"msm8960", false, false, kNoServer, 3, kIomx, {kNoServerLine}},
        Failure{"msm8960",
                false,
                false,
                kNoOmx,
                3,
                kIomx,
                {"E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE"}},
        Failure{"msm8960",
                false,
                false,
                kNoComponent,
                6,
                "OMX Component Node Not Found.",
                {"E OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.decoder.avc"}},
        Failure{"msm8960",
                false,
                false,
                kNoNode,
                4,
                "Could not Allocate OpenMax Component",
                {nodeLine("decoder")}},
        Failure{"msm8960", false, false, kNotTold, 13, "Could not get port definition", {}},
        Failure{"msm8960",
                false,
                false,
                kNotSized,
                14,
                "Could not set port definition",
                {"E OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -2147483648\n"}},
        Failure{"exynos4", false, false, kNothing, 36, kNoDescription, {}}));

INSTANTIATE_TEST_SUITE_P(
    Encoder, FailureTest,
    ::testing::Values(
        Failure{"msm8960", true, true, kNoServer, 3, kIomx, {kNoServerLine}},
        Failure{
            "msm8960", true, true, kNoNode, 4, "Could not Allocate OpenMax Component", {nodeLine("encoder")}},
        Failure{
            "msm8960",
            true,
            true,
            kNoRates,
            17,
            "Could not get Bitrate Parameters",
            {"E OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: -2147483648", kNotConfigured}},
        Failure{"msm8960",
                true,
                true,
                kNoAvc,
                34,
                kNoDescription,
                {"E OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: -2147483648", kNotConfigured}},
        Failure{"omap4",
                true,
                true,
                kNoMetaData,
                -1,
                kNoDescription,
                {"E Storing meta data in video buffers is not supported", kNotConfigured}},
        Failure{"msm8960", true, false, kNothing, 28, "Invalid Encoding Parameters submitted.", {}}));

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
