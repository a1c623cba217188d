// The C interface. Creation: what is set up, what is reported, and what stays of a failure. Each function:
// its guard, and that it reaches the operation it names.
#include <atomic>
#include <regex>

#include "omxbridge/omxbridge.h"
#include "tests/core/session_fixture.h"

namespace {

using namespace omxtest;

TEST(BuildTime, IsADateAndATime) {
  const std::regex format("[A-Z][a-z]{2} [ 1-3][0-9] [0-9]{4}, [0-9]{2}:[0-9]{2}:[0-9]{2}");
  EXPECT_TRUE(std::regex_match(g_strPrgCreatTime, format)) << g_strPrgCreatTime;
}

struct Generation {
  const char* device;
  OMX_U32 width;  // of a decoder's input
  OMX_U32 height;
  bool native;  // delivers pictures as the component made them
};

void PrintTo(const Generation& generation, std::ostream* stream) {
  *stream << generation.device;
}

class GenerationTest : public ::testing::TestWithParam<Generation> {};

TEST_P(GenerationTest, HasDecodersOfItsOwn) {
  const Generation& generation = GetParam();
  ScriptedMediaServer server(generation.device);
  int result = -1;
  void* const decoder = decoder_create(&result, "a name that does not matter");
  EXPECT_EQ(result, 0);
  ASSERT_NE(decoder, nullptr);
  const Call call = server.omx().calls(Method::SetParameter).back();  // the last that creation writes
  EXPECT_EQ(call.index, OMX_IndexParamPortDefinition);
  const auto definition = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
  EXPECT_EQ(definition->nPortIndex, 0U);
  EXPECT_EQ(definition->format.video.nFrameWidth, generation.width);
  EXPECT_EQ(definition->format.video.nFrameHeight, generation.height);
  EXPECT_EQ(definition->format.video.xFramerate, 24U << 16);
  auto& session = *static_cast<OmxInterface*>(decoder);
  EXPECT_STREQ(session._componentName, "a name that does not matter");
  Application application;
  if (generation.native) {
    application.attach(session);
    EXPECT_EQ(omx_interface_init(decoder), 0);
    char unit[] = "abc";
    EXPECT_EQ(omx_interface_send_input_data(decoder, unit, 3, 0), 0);
    application.waitForOutputs(1);
    EXPECT_EQ(application.outputs()[0].bytes, "abc");
    EXPECT_EQ(application.outputs()[0].info.dataType, DECODED_DATA_NATIVE);
    EXPECT_EQ(application.outputs()[0].info.width, generation.width);
  }
  EXPECT_EQ(omx_interface_destroy(decoder), 0);
}

INSTANTIATE_TEST_SUITE_P(
    Devices, GenerationTest,
    ::testing::Values(Generation{"msm7x30", 640, 480, true}, Generation{"msm8x55", 640, 480, true},
                      Generation{"msm8x60", 1920, 1088, false}, Generation{"msm8960", 1920, 1088, true},
                      Generation{"msm-unknown", 1920, 1088, true}, Generation{"omap4", 1920, 1088, false}));

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

TEST(Functions, RefuseANullHandle) {
  omxhost::LogCapture log;
  void* pointer = nullptr;
  unsigned char byte = 0;
  for (const int result :
       {omx_interface_init(nullptr), omx_interface_deinit(nullptr), omx_interface_error(nullptr),
        omx_interface_register_input_callback(nullptr, nullptr, nullptr),
        omx_interface_register_output_callback(nullptr, nullptr, nullptr),
        omx_interface_get_buffer_number(nullptr),
        omx_interface_reserve_input_buffer(nullptr, &pointer, &pointer),
        omx_interface_send_input_buffer(nullptr, &byte, 1, 0),
        omx_interface_send_final_buffer(nullptr, &byte, 0),
        omx_interface_send_input_data(nullptr, &byte, 1, 0), omx_interface_send_end_of_input_flag(nullptr, 0),
        omx_decoder_set_input_compression_format(nullptr, 0),
        omx_decoder_set_input_packing_format(nullptr, 0),
        omx_interface_set_config(nullptr, CONFIG_BITRATE, 0),
        omx_send_data_frame_to_encoder(nullptr, &byte, 1, 1, 0)}) {
    EXPECT_EQ(result, 2);
  }
  EXPECT_EQ(omx_interface_destroy(nullptr), 0);
  EXPECT_EQ(omx_setup_input_semaphore(nullptr), 0);
  EXPECT_EQ(omx_teardown_input_semaphore(), 0);
  EXPECT_EQ(logLines(log), LogLines());
}

TEST(Functions, ReachTheirOperations) {
  ScriptedMediaServer server("msm8960");
  void* const handle = decoder_create(nullptr, nullptr);
  ASSERT_NE(handle, nullptr);
  EXPECT_EQ(omx_interface_get_buffer_number(handle), 4);
  static std::atomic<void*> told{nullptr};
  EXPECT_EQ(omx_interface_register_input_callback(
                handle,
                [](void* session, void* context) {
                  if (omx_interface_error(session) == OMXI_ERR_EVENT_ERROR) told = context;
                  return 0;
                },
                &server),
            0);
  server.decoder().holdInput();
  ASSERT_EQ(omx_interface_init(handle), 0);
  EXPECT_EQ(omx_interface_error(handle), 0);

  char bytes[] = "12345";
  void* buffer = nullptr;
  void* data = nullptr;
  ASSERT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), 0);
  EXPECT_EQ(omx_interface_send_input_buffer(handle, buffer, 4, -1), 0);
  EXPECT_EQ(omx_interface_send_input_data(handle, bytes, 5, -2), 0);
  ASSERT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), 0);
  EXPECT_EQ(omx_interface_send_final_buffer(handle, buffer, -3), 0);
  EXPECT_EQ(omx_interface_send_end_of_input_flag(handle, -4), 0);
  EXPECT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), -2);
  std::vector<std::vector<OMX_TICKS>> sent;
  for (const Call& call : server.omx().calls(Method::EmptyBuffer)) {
    sent.push_back({call.length, call.flags, call.timestamp});
  }
  EXPECT_EQ(sent, (std::vector<std::vector<OMX_TICKS>>{{4, 16, -1}, {5, 0, -2}, {0, 1, -3}, {0, 1, -4}}));

  server.decoder().raiseError(OMX_ErrorHardware);
  EXPECT_TRUE(eventually([&] { return told == &server; }));
  EXPECT_EQ(omx_interface_error(handle), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx_interface_deinit(handle), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx_interface_destroy(handle), 0);
}

}  // namespace
