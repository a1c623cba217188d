// Each function of the C interface: its guard, and that it reaches the operation it names.
#include <gtest/gtest.h>

#include <atomic>

#include "core/omx_interface.h"
#include "omxbridge/omxbridge.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/support/eventually.h"

namespace {

using namespace omxtest;

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
  const auto lastWritten = [&] { return server.omx().calls(Method::SetParameter).back(); };
  EXPECT_EQ(omx_interface_get_buffer_number(handle), 4);
  EXPECT_EQ(omx_decoder_set_input_compression_format(handle, 1), 0);
  EXPECT_EQ(lastWritten().as<OMX_PARAM_PORTDEFINITIONTYPE>()->format.video.eCompressionFormat,
            OMX_VIDEO_CodingMPEG4);
  EXPECT_EQ(omx_decoder_set_input_packing_format(handle, 2), 0);
  EXPECT_EQ(words(lastWritten().record), (Words{24, kVersion, 0, 0, 0, 1}));
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
