// Result codes of the codec bridge and their descriptions. For C and C++.
//
// 0 is success. The input operations (reserving and sending buffers, end of input) use 0, -1 and -2
// instead; see their own documentation.
#pragma once

#include <stdint.h>

#include "omxbridge/export.h"

#ifdef __cplusplus
extern "C" {
#endif

// A signed 32-bit result code: one of the values below.
typedef int32_t OmxResult;

enum OmxResultCode {
  OMXI_OK = 0,
  OMXI_ERR_MEDIA_PLAYER_SERVICE = 1,
  OMXI_ERR_CREATE_INTERFACE = 2,
  OMXI_ERR_IOMX = 3,
  OMXI_ERR_ALLOCATE_COMPONENT = 4,
  OMXI_ERR_CREATE_OBSERVER = 5,
  OMXI_ERR_NODE_NOT_FOUND = 6,
  OMXI_ERR_BUFFERS_NOT_REGISTERED = 7,
  OMXI_ERR_FILL_BUFFER = 8,
  OMXI_ERR_PORT_SETTING = 9,
  OMXI_ERR_INVALID_STATE = 10,
  OMXI_ERR_INCORRECT_STATE = 11,
  OMXI_ERR_NOT_EXECUTING = 12,
  OMXI_ERR_GET_PORT_DEFINITION = 13,
  OMXI_ERR_SET_PORT_DEFINITION = 14,
  OMXI_ERR_ALLOCATE_MEMORY = 15,
  OMXI_ERR_REQUEST_IFRAME = 16,
  OMXI_ERR_GET_BITRATE = 17,
  OMXI_ERR_SET_BITRATE = 18,
  OMXI_ERR_SET_CODEC_CONFIG = 19,
  OMXI_ERR_SEND_COMMAND_STATE = 20,
  OMXI_ERR_SET_EXECUTION_STATE = 21,
  OMXI_ERR_CREATE_EVENT_THREAD = 22,
  OMXI_ERR_CREATE_OUTPUT_THREAD = 23,
  OMXI_ERR_BUFFER_NOT_FOUND = 24,
  OMXI_ERR_BUFFER_ALREADY_OWNED = 25,
  OMXI_ERR_BUFFER_NOT_EMPTIED = 26,
  OMXI_ERR_EVENT_ERROR = 27,
  OMXI_ERR_INVALID_ENCODING_PARAMS = 28,
  OMXI_ERR_SURFACE_RENDERER = 29,
  OMXI_ERR_PICTURE_ORDER = 30,
  OMXI_ERR_PACKING_FORMAT = 31,
  OMXI_ERR_APPLICATION = 32,

  // Kept: the codes from here on have no description of their own; applications know them by number.
  OMXI_ERR_SET_CONFIG = 33,
  OMXI_ERR_GET_AVC_PARAMS = 34,
  OMXI_ERR_SET_AVC_PARAMS = 35,
  OMXI_ERR_NO_PLATFORM_WRAPPER = 36,
  OMXI_ERR_SET_INTRA_PERIOD = 37
};

// Describes a result code in English. Codes 0 to 32 have texts of their own; every other value,
// negative ones included, gives "Could not define result\n" (the only text that ends in a newline).
// The string is constant and is never freed. Any thread; never fails.
OMXBRIDGE_EXPORT const char* resultDescription(int code);

#ifdef __cplusplus
}
#endif
