// The C interface. Creation: what is set up, what is reported, and what stays of a failure. Each function:
// its guard, and that it reaches the operation it names.
#include <atomic>

#include "omxbridge/omxbridge.h"
#include "tests/core/session_fixture.h"

namespace {

using namespace omxtest;

// The last that creation writes: the size that this generation's decoders begin with.
std::pair<OMX_U32, OMX_U32> inputSize(ScriptedMediaServer& server) {
  const Call call = server.omx().calls(Method::SetParameter).back();
  const auto video = call.as<OMX_PARAM_PORTDEFINITIONTYPE>()->format.video;
  EXPECT_EQ(video.xFramerate, 24U << 16);
  return {video.nFrameWidth, video.nFrameHeight};
}

TEST(Create, BeginsSmallerOnAnOlderGeneration) {
  ScriptedMediaServer server("msm7x30");
  void* const decoder = decoder_create(nullptr, "a name that does not matter");
  ASSERT_NE(decoder, nullptr);
  EXPECT_STREQ(static_cast<OmxInterface*>(decoder)->_componentName, "a name that does not matter");
  EXPECT_EQ(inputSize(server), std::pair(640U, 480U));
  EXPECT_EQ(omx_interface_destroy(decoder), 0);
}

TEST(Create, ReportsWhatFailsAndLeavesNothing) {
  omxhost::LogCapture log;
  ScriptedMediaServer server("msm8960");
  server.unregister();
  const std::string build = std::string("4/zol-video enter hardCodec encoder_create: build time:");
  int result = -77;
  webrtc::VideoCodec codec = settings();
  EXPECT_EQ(decoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, 3);
  server.serve(nullptr);
  EXPECT_EQ(encoder_create(&result, &codec), nullptr);
  EXPECT_EQ(result, 3);
  server.unregister();
  server.serve(&server.omx());
  EXPECT_EQ(encoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, 28);
  EXPECT_EQ(
      logLines(log),
      (LogLines{"E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE",
                "E OMXINTERFACE - ERROR creating decoder: 3 (Could not Acquire iOMX Interface)",
                build + g_strPrgCreatTime + " ",
                "E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE",
                "E OMXINTERFACE - ERROR creating encoder: 3 (Could not Acquire iOMX Interface)",
                build + g_strPrgCreatTime + " ",
                "E OMXINTERFACE - ERROR creating encoder: 28 (Invalid Encoding Parameters submitted.)"}));
  EXPECT_STREQ(resultDescription(0), "No errors.");
  for (const int code : {33, -1}) EXPECT_STREQ(resultDescription(code), "Could not define result\n");
  // There need not be a place for the result.
  for (void* session : {encoder_create(nullptr, &codec), decoder_create(nullptr, nullptr)}) {
    EXPECT_NE(session, nullptr);
    omx_interface_destroy(session);
  }
  EXPECT_EQ(encoder_create(nullptr, nullptr), nullptr);
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder.avc"), 1);
  EXPECT_EQ(omx_component_is_available("OMX.qcom.video.encoder"), 0);
}

TEST(Create, FindsNoComponentOnAnotherBoard) {
  ScriptedMediaServer server("exynos4");
  int result = -77;
  EXPECT_EQ(decoder_create(&result, nullptr), nullptr);
  EXPECT_EQ(result, 36);
}

TEST(Functions, RefuseANullHandle) {
  for (const int result : {omx_interface_init(nullptr), omx_interface_error(nullptr),
                           omx_interface_register_input_callback(nullptr, nullptr, nullptr),
                           omx_interface_register_output_callback(nullptr, nullptr, nullptr),
                           omx_decoder_set_input_packing_format(nullptr, 0),
                           omx_send_data_frame_to_encoder(nullptr, nullptr, 1, 1, 0)}) {
    EXPECT_EQ(result, 2);
  }
  EXPECT_EQ(omx_interface_destroy(nullptr), 0);
  EXPECT_EQ(omx_setup_input_semaphore(nullptr), 0);
  EXPECT_EQ(omx_teardown_input_semaphore(), 0);
}

TEST(Functions, ReachTheirOperations) {
  ScriptedMediaServer server("msm8960");
  void* const handle = decoder_create(nullptr, nullptr);
  ASSERT_NE(handle, nullptr);
  EXPECT_EQ(inputSize(server), std::pair(1920U, 1088U));
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
  std::vector<OMX_TICKS> sent;
  for (const Call& call : server.omx().calls(Method::EmptyBuffer)) {
    sent.insert(sent.end(), {call.length, call.flags, call.timestamp});
  }
  EXPECT_EQ(sent, (std::vector<OMX_TICKS>{4, 16, -1, 5, 0, -2, 0, 1, -3, 0, 1, -4}));

  server.decoder().raiseError(OMX_ErrorHardware);
  EXPECT_TRUE(eventually([&] { return told == &server; }));
  EXPECT_EQ(omx_interface_error(handle), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx_interface_deinit(handle), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx_interface_destroy(handle), 0);
}

}  // namespace
