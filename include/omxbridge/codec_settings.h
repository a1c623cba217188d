/// @file
/// The application's encoder settings. For C and C++: one text, in namespace webrtc for C++ (where
/// applications expect these records) and as plain structures for C, laid out alike in both.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
namespace webrtc {
#endif

/// Values of VideoCodec.codecType.
enum VideoCodecType {
  kVideoCodecOther = 0,  ///< not H.264
  kVideoCodecH264 = 1    ///< any other value leaves the encoder's H.264 settings as the component has them
};

/// H.264 settings.
struct VideoCodecH264 {
  uint32_t unused0[2];       ///< a place in the layout; not read
  int32_t profile;           ///< profile_idc of ITU-T H.264: 66 Baseline, 77 Main, 100 High
  int32_t keyFrameInterval;  ///< frames from one key frame to the next; 0: only the first is one
  uint32_t unused1[4];       ///< a place in the layout; not read
  uint32_t referenceFrames;  ///< number of reference frames
  uint8_t entropyCoding;     ///< not 0: CABAC, 0: CAVLC
  uint8_t transform8x8;      ///< not 0: 8x8 transform
};

/// The settings that only one codec has.
union VideoCodecSpecific {
  struct VideoCodecH264 H264;  ///< for kVideoCodecH264
};

/// What an encoder is created with.
struct VideoCodec {
  enum VideoCodecType codecType;  ///< kVideoCodecH264
  char payloadName[32];           ///< not read
  uint8_t payloadType;            ///< not read
  uint16_t width;                 ///< pixels
  uint16_t height;                ///< pixels
  uint32_t startBitrate;          ///< kilobits (1000 bits) per second
  uint32_t maxBitrate;            ///< not read
  uint32_t minBitrate;            ///< not read
  uint8_t maxFramerate;           ///< frames per second; some wrappers raise it to what their encoder can do
  union VideoCodecSpecific codecSpecific;  ///< the H.264 settings
};

#ifdef __cplusplus
}  // namespace webrtc
#endif

/// What can be changed while an encoder runs, and the unit of the value that goes with it.
typedef enum CONFIGTYPE {
  CONFIG_BITRATE = 0,           ///< bits per second
  CONFIG_FRAMERATE = 1,         ///< whole frames per second
  CONFIG_INTRA_PERIOD = 2,      ///< frames from one key frame to the next; TI encoders ignore it
  CONFIG_REQUEST_IFRAME = 3,    ///< the next frame becomes a key frame; the value is ignored
  CONFIG_ROTATION = 4,          ///< degrees
  CONFIG_TYPE_MAX = 0x7FFFFFFF  ///< none: makes the type 32 bits wide
} CONFIGTYPE;
