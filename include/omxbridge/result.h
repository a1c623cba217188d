/// @file
/// Result codes of the codec bridge and their descriptions. For C and C++.
///
/// 0 is success. The input operations (reserving and sending buffers, end of input) use 0, -1 and -2
/// instead; see their own documentation.
#pragma once

#include <stdint.h>

#include "omxbridge/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/// A signed 32-bit result code: one of the values below.
typedef int32_t OmxResult;

/// The codes. Those that are not returned keep their numbers and texts.
enum OmxResultCode {
  OMXI_OK = 0,                          ///< success
  OMXI_ERR_MEDIA_PLAYER_SERVICE = 1,    ///< there is no media server
  OMXI_ERR_CREATE_INTERFACE = 2,        ///< no session: out of memory, or a null handle
  OMXI_ERR_IOMX = 3,                    ///< the media server does not give its OpenMAX interface
  OMXI_ERR_ALLOCATE_COMPONENT = 4,      ///< the media server refuses a node, all may be in use
  OMXI_ERR_CREATE_OBSERVER = 5,         ///< no observer: out of memory
  OMXI_ERR_NODE_NOT_FOUND = 6,          ///< the device has no such component
  OMXI_ERR_BUFFERS_NOT_REGISTERED = 7,  ///< not returned
  OMXI_ERR_FILL_BUFFER = 8,             ///< the component refuses an output buffer
  OMXI_ERR_PORT_SETTING = 9,            ///< not returned
  OMXI_ERR_INVALID_STATE = 10,          ///< not returned
  OMXI_ERR_INCORRECT_STATE = 11,        ///< a decoder could not exchange its output buffers
  OMXI_ERR_NOT_EXECUTING = 12,          ///< not returned
  OMXI_ERR_GET_PORT_DEFINITION = 13,    ///< the component does not describe a port
  OMXI_ERR_SET_PORT_DEFINITION = 14,    ///< the component refuses sizes or layouts of a port
  OMXI_ERR_ALLOCATE_MEMORY = 15,        ///< no memory for buffers or queues
  OMXI_ERR_REQUEST_IFRAME = 16,         ///< the component refuses a key frame (session classes only)
  OMXI_ERR_GET_BITRATE = 17,            ///< the component does not tell its bit rate
  OMXI_ERR_SET_BITRATE = 18,            ///< the component refuses the bit rate
  OMXI_ERR_SET_CODEC_CONFIG = 19,       ///< not returned
  OMXI_ERR_SEND_COMMAND_STATE = 20,     ///< a change of state was refused or ended by destruction
  OMXI_ERR_SET_EXECUTION_STATE = 21,    ///< the executing state was refused or its wait ended by destruction
  OMXI_ERR_CREATE_EVENT_THREAD = 22,    ///< no event thread
  OMXI_ERR_CREATE_OUTPUT_THREAD = 23,   ///< no output thread
  OMXI_ERR_BUFFER_NOT_FOUND = 24,       ///< the component returned a buffer that it does not have
  OMXI_ERR_BUFFER_ALREADY_OWNED = 25,   ///< not returned
  OMXI_ERR_BUFFER_NOT_EMPTIED = 26,     ///< buffers of a port could not be freed
  OMXI_ERR_EVENT_ERROR = 27,            ///< the component reported an error
  OMXI_ERR_INVALID_ENCODING_PARAMS = 28,  ///< no settings for an encoder
  OMXI_ERR_SURFACE_RENDERER = 29,         ///< not returned
  OMXI_ERR_PICTURE_ORDER = 30,   ///< the component refuses an order of pictures (session classes only)
  OMXI_ERR_PACKING_FORMAT = 31,  ///< the component refuses a packing of its input
  OMXI_ERR_APPLICATION = 32,     ///< not returned; free for applications

  // Kept: the codes from here on have no description of their own; applications know them by number.
  OMXI_ERR_SET_CONFIG = 33,           ///< the component refuses a change, or there is no such item
  OMXI_ERR_GET_AVC_PARAMS = 34,       ///< the component does not tell its H.264 settings
  OMXI_ERR_SET_AVC_PARAMS = 35,       ///< the component refuses the H.264 settings
  OMXI_ERR_NO_PLATFORM_WRAPPER = 36,  ///< an unknown platform, or settings after the end of the session
  OMXI_ERR_SET_INTRA_PERIOD = 37      ///< the component refuses a key frame distance (session classes only)
};

/// Describes a result code in English. Codes 0 to 32 have texts of their own; every other value,
/// negative ones included, gives "Could not define result\n" (the only text that ends in a newline).
/// The string is constant and is never freed. Any thread; never fails.
OMXBRIDGE_EXPORT const char* resultDescription(int code);

#ifdef __cplusplus
}
#endif
