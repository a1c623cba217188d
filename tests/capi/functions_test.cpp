// Each function of the C interface: its guard, and that it reaches the operation it names.
#include <gtest/gtest.h>

#include <atomic>
#include <functional>

#include "core/omx_interface.h"
#include "omxbridge/omxbridge.h"
#include "tests/core/log_lines.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/support/eventually.h"
#include "tests/support/scripted_media_server.h"

namespace {

using namespace omxtest;

TEST(Functions, RefuseANullHandle) {
  omxhost::LogCapture log;
  void* pointer = nullptr;
  unsigned char byte = 0;
  EXPECT_EQ(omx_interface_init(nullptr), 2);
  EXPECT_EQ(omx_interface_deinit(nullptr), 2);
  EXPECT_EQ(omx_interface_destroy(nullptr), 0);
  EXPECT_EQ(omx_interface_register_input_callback(nullptr, nullptr, nullptr), 2);
  EXPECT_EQ(omx_interface_register_output_callback(nullptr, nullptr, nullptr), 2);
  EXPECT_EQ(omx_interface_error(nullptr), 2);
  EXPECT_EQ(omx_interface_get_buffer_number(nullptr), 2);
  EXPECT_EQ(omx_interface_reserve_input_buffer(nullptr, &pointer, &pointer), 2);
  EXPECT_EQ(omx_interface_send_input_buffer(nullptr, &byte, 1, 0), 2);
  EXPECT_EQ(omx_interface_send_final_buffer(nullptr, &byte, 0), 2);
  EXPECT_EQ(omx_interface_send_input_data(nullptr, &byte, 1, 0), 2);
  EXPECT_EQ(omx_interface_send_end_of_input_flag(nullptr, 0), 2);
  EXPECT_EQ(omx_decoder_set_input_compression_format(nullptr, 0), 2);
  EXPECT_EQ(omx_decoder_set_input_packing_format(nullptr, 0), 2);
  EXPECT_EQ(omx_interface_set_config(nullptr, CONFIG_BITRATE, 0), 2);
  EXPECT_EQ(omx_send_data_frame_to_encoder(nullptr, &byte, 1, 1, 0), 2);
  EXPECT_EQ(omx_setup_input_semaphore(nullptr), 0);
  EXPECT_EQ(omx_teardown_input_semaphore(), 0);
  EXPECT_EQ(logLines(log), LogLines());
}

// A decoder that runs, through the C interface alone.
class RunningDecoder : public ::testing::Test {
 protected:
  void SetUp() override {
    handle = decoder_create(nullptr, nullptr);
    ASSERT_NE(handle, nullptr);
  }
  void TearDown() override { omx_interface_destroy(handle); }

  ScriptedMediaServer server{"msm8960"};
  void* handle = nullptr;
};

TEST_F(RunningDecoder, IsSetUpThroughItsFunctions) {
  EXPECT_EQ(omx_interface_get_buffer_number(handle), 4);
  EXPECT_EQ(omx_decoder_set_input_compression_format(handle, 1), 0);
  const auto definition = server.omx().calls(Method::SetParameter).back().as<OMX_PARAM_PORTDEFINITIONTYPE>();
  EXPECT_EQ(definition->format.video.eCompressionFormat, OMX_VIDEO_CodingMPEG4);
  EXPECT_EQ(omx_decoder_set_input_packing_format(handle, 2), 0);
  EXPECT_EQ(words(server.omx().calls(Method::SetParameter).back().record), (Words{24, kVersion, 0, 0, 0, 1}));
}

TEST_F(RunningDecoder, TakesInputInEveryWay) {
  server.decoder().holdInput();
  ASSERT_EQ(omx_interface_init(handle), 0);
  char bytes[] = "12345";
  void* buffer = nullptr;
  void* data = nullptr;
  ASSERT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), 0);
  memcpy(data, bytes, 5);
  EXPECT_EQ(omx_interface_send_input_buffer(handle, buffer, 4, -1), 0);
  EXPECT_EQ(omx_interface_send_input_data(handle, bytes, 5, -2), 0);
  ASSERT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), 0);
  EXPECT_EQ(omx_interface_send_final_buffer(handle, buffer, -3), 0);
  EXPECT_EQ(omx_interface_send_end_of_input_flag(handle, -4), 0);
  EXPECT_EQ(omx_interface_reserve_input_buffer(handle, &buffer, &data), -2);

  const std::vector<Call> sent = server.omx().calls(Method::EmptyBuffer);
  ASSERT_EQ(sent.size(), 4U);
  const struct {
    OMX_U32 length;
    OMX_U32 flags;
  } expected[] = {{4, OMX_BUFFERFLAG_ENDOFFRAME}, {5, 0}, {0, OMX_BUFFERFLAG_EOS}, {0, OMX_BUFFERFLAG_EOS}};
  for (size_t i = 0; i < sent.size(); ++i) {
    EXPECT_EQ(sent[i].length, expected[i].length);
    EXPECT_EQ(sent[i].flags, expected[i].flags);
    EXPECT_EQ(sent[i].timestamp, -static_cast<OMX_TICKS>(i + 1));
  }
}

TEST_F(RunningDecoder, TellsOfAFailureThroughCallbackAndFunction) {
  static std::atomic<void*> told{nullptr};
  EXPECT_EQ(omx_interface_register_input_callback(
                handle,
                [](void* session, void* context) {
                  if (omx_interface_error(session) == OMXI_ERR_EVENT_ERROR) told = context;
                  return 0;
                },
                &server),
            0);
  ASSERT_EQ(omx_interface_init(handle), 0);
  EXPECT_EQ(omx_interface_error(handle), 0);
  server.decoder().raiseError(OMX_ErrorHardware);
  EXPECT_TRUE(eventually([&] { return told == &server; }));
  EXPECT_EQ(omx_interface_error(handle), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx_interface_deinit(handle), OMXI_ERR_EVENT_ERROR);
}

}  // namespace
