// Sessions run from plain C, as an application would; and the public records as a C compiler sees them.
#pragma once

#include <stddef.h>

// Each size and offset that C and C++ have to agree on. The including file says what VideoCodec and kin are.
// clang-format off
#define RECORD_LAYOUT { \
    sizeof(VideoCodecH264), offsetof(VideoCodecH264, unused0), offsetof(VideoCodecH264, profile), \
    offsetof(VideoCodecH264, keyFrameInterval), offsetof(VideoCodecH264, unused1), \
    offsetof(VideoCodecH264, referenceFrames), offsetof(VideoCodecH264, entropyCoding), \
    offsetof(VideoCodecH264, transform8x8), sizeof(VideoCodec), offsetof(VideoCodec, codecType), \
    offsetof(VideoCodec, payloadName), offsetof(VideoCodec, payloadType), offsetof(VideoCodec, width), \
    offsetof(VideoCodec, height), offsetof(VideoCodec, startBitrate), offsetof(VideoCodec, maxBitrate), \
    offsetof(VideoCodec, minBitrate), offsetof(VideoCodec, maxFramerate), offsetof(VideoCodec, codecSpecific), \
    sizeof(DECODEDDATAINFO), offsetof(DECODEDDATAINFO, width), offsetof(DECODEDDATAINFO, height), \
    offsetof(DECODEDDATAINFO, dataType), offsetof(DECODEDDATAINFO, cropWidth), \
    offsetof(DECODEDDATAINFO, cropHeight), offsetof(DECODEDDATAINFO, cropLeft), \
    offsetof(DECODEDDATAINFO, cropTop), sizeof(CONFIGTYPE), sizeof(OmxResult)}
// clang-format on

#ifdef __cplusplus
extern "C" {
#endif

extern const size_t cRecordLayout[];
extern const size_t cRecordLayoutCount;

// Both return 0, or the line of what went wrong. The encoder sends frames of 176x144 and expects `length`
// bytes of output for each; the decoder expects pictures of the given size in pixels, of three bytes each.
int runEncoderInC(unsigned int length);
int runDecoderInC(unsigned int width, unsigned int height);

#ifdef __cplusplus
}
#endif
