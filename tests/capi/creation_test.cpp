// Creation through the C interface: what is set up, what is reported, and what stays of a failure; and whole
// lives of sessions driven from plain C.
#include <gtest/gtest.h>

#include <cstring>
#include <functional>

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

// What is missing or refused, and what is said of it in front of the last line.
struct Failure {
  bool encoder;
  std::function<void(RecordingOmx& omx, ScriptedMediaServer& server)> arrange;
  int code;
  LogLines lines;
  bool noSettings = false;
};

void expectReportedAndNothingLeft(const char* device, const std::vector<Failure>& failures) {
  for (const Failure& failure : failures) {
    SCOPED_TRACE(failure.code);
    const omxhost::LogCapture log;
    ScriptedMediaServer server(device);
    failure.arrange(server.omx(), server);
    int result = -77;
    webrtc::VideoCodec codec = settings();
    void* const session = failure.encoder ? encoder_create(&result, failure.noSettings ? nullptr : &codec)
                                          : decoder_create(&result, nullptr);
    EXPECT_EQ(session, nullptr);
    EXPECT_EQ(result, failure.code);
    LogLines lines;
    if (failure.encoder) {
      lines.push_back(std::string("4/zol-video enter hardCodec encoder_create: build time:") +
                      g_strPrgCreatTime + " ");
    }
    for (const std::string& line : failure.lines) lines.push_back("E " + line);
    lines.push_back(std::string("E OMXINTERFACE - ERROR creating ") +
                    (failure.encoder ? "encoder: " : "decoder: ") + std::to_string(failure.code) + " (" +
                    resultDescription(failure.code) + ")");
    EXPECT_EQ(logLines(log), lines);
    EXPECT_EQ(server.leaks(), "");
  }
}

const std::string kNoServer = "OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
const std::string kNoOmx = "OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE";
const std::string kNotFound = "OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.decoder.avc";
const std::string kNoNode = "OMXINTERFACE - Could not allocate node: OMX.qcom.video.";
const std::string kNotSet = "OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -2147483648\n";
const std::string kNoRates = "OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: -2147483648";
const std::string kNoAvc = "OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: -2147483648";
const std::string kNoMetaData = "Storing meta data in video buffers is not supported";
const std::string kNoSetup = "OMXINTERFACE - [ENC] Init: failed to setup params!";

TEST(Creation, ReportsWhatFailsAndLeavesNothing) {
  const auto noServer = [](auto&, auto& server) { server.unregister(); };
  const auto noNode = [](auto& omx, auto&) { omx.fail(Method::AllocateNode); };
  expectReportedAndNothingLeft(
      "msm8960",
      {{false, noServer, 3, {kNoServer}},
       {false, [](auto&, auto& server) { server.serveWithoutOmx(); }, 3, {kNoOmx}},
       {false, [](auto& omx, auto&) { omx.fail(Method::ListNodes); }, 6, {kNotFound}},
       {false, noNode, 4, {kNoNode + "decoder.avc -- error -2147483648"}},
       {false, [](auto& omx, auto&) { omx.fail(Method::GetParameter); }, 13, {}},
       // The first one is the picture order.
       {false, [](auto& omx, auto&) { omx.fail(Method::SetParameter, 2); }, 14, {kNotSet}},
       {true, noServer, 3, {kNoServer}},
       {true, noNode, 4, {kNoNode + "encoder.avc -- error -2147483648"}},
       {true, [](auto& omx, auto&) { omx.fail(Method::GetParameter, 5); }, 17, {kNoRates, kNoSetup}},
       {true, [](auto& omx, auto&) { omx.fail(Method::GetParameter, 3); }, 34, {kNoAvc, kNoSetup}},
       {true, [](auto&, auto&) {}, 28, {}, true}});
}

// Each of these devices in a process of its own.
TEST(Creation, FailsWithoutComponents) {
  expectReportedAndNothingLeft("exynos4", {{false, [](auto&, auto&) {}, 36, {}}});
}

TEST(Creation, FailsWhereMetaDataIsRefused) {
  const auto refuse = [](auto& omx, auto&) { omx.fail(Method::StoreMetaDataInBuffers); };
  expectReportedAndNothingLeft("omap4", {{true, refuse, -1, {kNoMetaData, kNoSetup}}});
}

TEST(Creation, WorksWithoutAPlaceForTheResult) {
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
