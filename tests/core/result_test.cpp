#include "omxbridge/result.h"

#include <gtest/gtest.h>
#include <limits.h>

namespace {

TEST(Result, DescribesEachCodeByTheTextThatApplicationsPrint) {
  const struct {
    int code;
    const char* text;
  } cases[] = {
      {OMXI_OK, "No errors."},
      {OMXI_ERR_MEDIA_PLAYER_SERVICE, "Could not Acquire Media Player Service"},
      {OMXI_ERR_CREATE_INTERFACE, "Could not Create OmxInterface"},
      {OMXI_ERR_IOMX, "Could not Acquire iOMX Interface"},
      {OMXI_ERR_ALLOCATE_COMPONENT, "Could not Allocate OpenMax Component"},
      {OMXI_ERR_CREATE_OBSERVER, "Could not Create OmxCodecObserver"},
      {OMXI_ERR_NODE_NOT_FOUND, "OMX Component Node Not Found."},
      {OMXI_ERR_BUFFERS_NOT_REGISTERED, "Buffers not registered by OMX component.  Pmem not available."},
      {OMXI_ERR_FILL_BUFFER, "Error filling buffer."},
      {OMXI_ERR_PORT_SETTING, "Failed changing port setting."},
      {OMXI_ERR_INVALID_STATE, "Interface entered an invalid state."},
      {OMXI_ERR_INCORRECT_STATE, "Interface found to be in the incorrect state."},
      {OMXI_ERR_NOT_EXECUTING, "OMX State was found to be not executing."},
      {OMXI_ERR_GET_PORT_DEFINITION, "Could not get port definition"},
      {OMXI_ERR_SET_PORT_DEFINITION, "Could not set port definition"},
      {OMXI_ERR_ALLOCATE_MEMORY, "Could not allocate memory"},
      {OMXI_ERR_REQUEST_IFRAME, "Could not request IFrame."},
      {OMXI_ERR_GET_BITRATE, "Could not get Bitrate Parameters"},
      {OMXI_ERR_SET_BITRATE, "Could not set Bitrate Parameters"},
      {OMXI_ERR_SET_CODEC_CONFIG, "Could not set Codec Configuration"},
      {OMXI_ERR_SEND_COMMAND_STATE, "Could not send Command State"},
      {OMXI_ERR_SET_EXECUTION_STATE, "Could not set Execution State"},
      {OMXI_ERR_CREATE_EVENT_THREAD, "Could not create Event Thread"},
      {OMXI_ERR_CREATE_OUTPUT_THREAD, "Could not create Output Thread"},
      {OMXI_ERR_BUFFER_NOT_FOUND, "Invalid buffer passed.  Not found in buffer list."},
      {OMXI_ERR_BUFFER_ALREADY_OWNED, "Buffer already owned."},
      {OMXI_ERR_BUFFER_NOT_EMPTIED, "Buffer not emptied after deallocation."},
      {OMXI_ERR_EVENT_ERROR, "OMX Event Error received.  Check Logs for more details."},
      {OMXI_ERR_INVALID_ENCODING_PARAMS, "Invalid Encoding Parameters submitted."},
      {OMXI_ERR_SURFACE_RENDERER, "Error: Could not setup surface renderer"},
      {OMXI_ERR_PICTURE_ORDER, "Error: Could not setup decoder picture order"},
      {OMXI_ERR_PACKING_FORMAT, "Error: Could not setup frame packing format"},
      {OMXI_ERR_APPLICATION, "Application Error.  See Logs for Details"},
  };
  int next = 0;
  for (const auto& expected : cases) {
    EXPECT_EQ(expected.code, next++);
    EXPECT_STREQ(resultDescription(expected.code), expected.text);
  }
}

TEST(Result, HasOneTextForEveryOtherCode) {
  for (const int code : {33, 34, 35, 36, 37, 38, 1000, INT_MAX, -1, -2, INT_MIN}) {
    EXPECT_STREQ(resultDescription(code), "Could not define result\n") << code;
  }
}

}  // namespace
