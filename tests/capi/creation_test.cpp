// Creation through the C interface: what is set up, what is reported, and what stays of a failure.
#include <gtest/gtest.h>

#include <cstring>

#include "core/omx_interface.h"
#include "omxbridge/omxbridge.h"
#include "tests/core/log_lines.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/support/scripted_media_server.h"

namespace {

using namespace omxtest;

std::string creationLine() {
  return std::string("4/zol-video enter hardCodec encoder_create: build time:") + g_strPrgCreatTime + " ";
}

TEST(BuildTime, IsADateAndATime) {
  char month[4] = {};
  int day = 0;
  int year = 0;
  int time[3] = {};
  int length = 0;
  ASSERT_EQ(sscanf(g_strPrgCreatTime, "%3s %2d %4d, %2d:%2d:%2d%n", month, &day, &year, &time[0], &time[1],
                   &time[2], &length),
            6);
  EXPECT_EQ(static_cast<size_t>(length), strlen(g_strPrgCreatTime));
  EXPECT_EQ(length, 21);
  EXPECT_NE(strstr("Jan Feb Mar Apr May Jun Jul Aug Sep Oct Nov Dec", month), nullptr);
}

struct InputSize {
  const char* device;
  OMX_U32 width;
  OMX_U32 height;
};

std::ostream& operator<<(std::ostream& stream, const InputSize& size) {
  return stream << size.device;
}

class DecoderInput : public ::testing::TestWithParam<InputSize> {};

TEST_P(DecoderInput, IsSizedForTheGeneration) {
  ScriptedMediaServer server(GetParam().device);
  int result = -1;
  void* decoder = decoder_create(&result, "a name that does not matter");
  ASSERT_NE(decoder, nullptr);
  EXPECT_EQ(result, 0);
  // The last that creation writes.
  const Call call = server.omx().calls(Method::SetParameter).back();
  EXPECT_EQ(call.index, OMX_IndexParamPortDefinition);
  const auto definition = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
  ASSERT_TRUE(definition.has_value());
  EXPECT_EQ(definition->nPortIndex, 0U);
  EXPECT_EQ(definition->format.video.nFrameWidth, GetParam().width);
  EXPECT_EQ(definition->format.video.nFrameHeight, GetParam().height);
  EXPECT_EQ(definition->format.video.xFramerate, 24U << 16);
  EXPECT_STREQ(static_cast<OmxInterface*>(decoder)->_componentName, "a name that does not matter");
  EXPECT_EQ(omx_interface_destroy(decoder), 0);
}

INSTANTIATE_TEST_SUITE_P(Generations, DecoderInput,
                         ::testing::Values(InputSize{"msm7x30", 640, 480}, InputSize{"msm8x55", 640, 480},
                                           InputSize{"msm8x60", 1920, 1088}, InputSize{"msm8960", 1920, 1088},
                                           InputSize{"msm-unknown", 1920, 1088},
                                           InputSize{"omap4", 1920, 1088}));

struct Failure {
  const char* what;
  std::function<void(ScriptedMediaServer&)> arrange;
  int code;
  LogLines lines;  // all but the encoder's first
};

void expectFailures(const char* device, bool encoder, std::initializer_list<Failure> failures) {
  omxhost::LogCapture log;
  ScriptedMediaServer server(device);
  for (const Failure& failure : failures) {
    SCOPED_TRACE(failure.what);
    failure.arrange(server);
    log.clear();
    int result = -77;
    webrtc::VideoCodec codec = settings();
    EXPECT_EQ(encoder ? encoder_create(&result, &codec) : decoder_create(&result, nullptr), nullptr);
    EXPECT_EQ(result, failure.code);
    LogLines lines = logLines(log);
    if (encoder) {
      ASSERT_FALSE(lines.empty());
      EXPECT_EQ(lines.front(), creationLine());
      lines.erase(lines.begin());
    }
    EXPECT_EQ(lines, failure.lines);
    EXPECT_EQ(server.leaks(), "");
    server.omx().failNothing();
    server.unregister();
    server.serve();
  }
}

// Refuses to tell a port's definition, or to take one of that width.
void refuseDefinitions(ScriptedMediaServer& server, Method method, OMX_U32 width = 0) {
  server.omx().failWhere([=](const Call& call) {
    if (call.method != method || call.index != OMX_IndexParamPortDefinition) return false;
    const auto definition = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
    return width == 0 || (definition.has_value() && definition->format.video.nFrameWidth == width);
  });
}

TEST(DecoderCreate, ReportsWhatFailed) {
  expectFailures(
      "msm8960", false,
      {{"no media server",
        [](ScriptedMediaServer& server) { server.unregister(); },
        3,
        {"E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE",
         "E OMXINTERFACE - ERROR creating decoder: 3 (Could not Acquire iOMX Interface)"}},
       {"no IOMX",
        [](ScriptedMediaServer& server) { server.serveWithoutOmx(); },
        3,
        {"E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE",
         "E OMXINTERFACE - ERROR creating decoder: 3 (Could not Acquire iOMX Interface)"}},
       {"no component",
        [](ScriptedMediaServer& server) { server.omx().fail(Method::ListNodes); },
        6,
        {"E OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.decoder.avc",
         "E OMXINTERFACE - ERROR creating decoder: 6 (OMX Component Node Not Found.)"}},
       {"no node",
        [](ScriptedMediaServer& server) { server.omx().fail(Method::AllocateNode); },
        4,
        {"E OMXINTERFACE - Could not allocate node: OMX.qcom.video.decoder.avc -- error -2147483648",
         "E OMXINTERFACE - ERROR creating decoder: 4 (Could not Allocate OpenMax Component)"}},
       {"no definition of the input",
        [](ScriptedMediaServer& server) { refuseDefinitions(server, Method::GetParameter); },
        13,
        {"E OMXINTERFACE - ERROR creating decoder: 13 (Could not get port definition)"}},
       {"input not sized",
        [](ScriptedMediaServer& server) { refuseDefinitions(server, Method::SetParameter, 1920); },
        14,
        {"E OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -2147483648\n",
         "E OMXINTERFACE - ERROR creating decoder: 14 (Could not set port definition)"}}});
}

TEST(DecoderCreate, NeedsASupportedPlatform) {
  expectFailures("exynos4", false,
                 {{"no wrapper",
                   [](ScriptedMediaServer& /*server*/) {},
                   36,
                   {"E OMXINTERFACE - ERROR creating decoder: 36 (Could not define result\n)"}}});
}

TEST(EncoderCreate, ReportsWhatFailed) {
  const std::string kNotConfigured = "E OMXINTERFACE - [ENC] Init: failed to setup params!";
  expectFailures(
      "msm8960", true,
      {{"no media server",
        [](ScriptedMediaServer& server) { server.unregister(); },
        3,
        {"E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE",
         "E OMXINTERFACE - ERROR creating encoder: 3 (Could not Acquire iOMX Interface)"}},
       {"no node",
        [](ScriptedMediaServer& server) { server.omx().fail(Method::AllocateNode); },
        4,
        {"E OMXINTERFACE - Could not allocate node: OMX.qcom.video.encoder.avc -- error -2147483648",
         "E OMXINTERFACE - ERROR creating encoder: 4 (Could not Allocate OpenMax Component)"}},
       {"not configured, a code with a description",
        [](ScriptedMediaServer& server) { server.omx().fail(Method::GetParameter, 5); },
        17,
        {"E OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: -2147483648", kNotConfigured,
         "E OMXINTERFACE - ERROR creating encoder: 17 (Could not get Bitrate Parameters)"}},
       {"not configured, a code without",
        [](ScriptedMediaServer& server) { server.omx().fail(Method::GetParameter, 3); },
        34,
        {"E OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: -2147483648", kNotConfigured,
         "E OMXINTERFACE - ERROR creating encoder: 34 (Could not define result\n)"}}});
}

TEST(EncoderCreate, ReportsATiRefusalAsMinusOne) {
  expectFailures("omap4", true,
                 {{"no metadata setting",
                   [](ScriptedMediaServer& server) { server.omx().fail(Method::StoreMetaDataInBuffers); },
                   -1,
                   {"E Storing meta data in video buffers is not supported",
                    "E OMXINTERFACE - [ENC] Init: failed to setup params!",
                    "E OMXINTERFACE - ERROR creating encoder: -1 (Could not define result\n)"}}});
}

TEST(EncoderCreate, RefusesNoSettingsAndLeavesNothing) {
  omxhost::LogCapture log;
  ScriptedMediaServer server("msm8960");
  int result = -77;
  EXPECT_EQ(encoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, 28);
  EXPECT_EQ(
      logLines(log),
      (LogLines{creationLine(),
                "E OMXINTERFACE - ERROR creating encoder: 28 (Invalid Encoding Parameters submitted.)"}));
}

TEST(Create, WorksWithoutAPlaceForTheResult) {
  ScriptedMediaServer server("msm8960");
  webrtc::VideoCodec codec = settings();
  void* encoder = encoder_create(nullptr, &codec);
  void* decoder = decoder_create(nullptr, nullptr);
  EXPECT_NE(encoder, nullptr);
  EXPECT_NE(decoder, nullptr);
  omx_interface_destroy(encoder);
  omx_interface_destroy(decoder);
  EXPECT_EQ(encoder_create(nullptr, nullptr), nullptr);
}

TEST(Components, AreAvailableByTheirWholeName) {
  ScriptedMediaServer server("msm8960");
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder.avc"), 1);
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder"), 0);
  EXPECT_EQ(omx_component_is_available("omx.qcom.video.encoder.avc"), 0);
  EXPECT_EQ(omx_component_is_available(""), 0);
  server.unregister();
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder.avc"), 0);
}

}  // namespace
