// What binaries count on without a name, checked by the compiler: the order of data members, and the layout
// of records.
#include <cstddef>

#include "core/buffer_info.h"
#include "core/omx_interface.h"
#include "decoder/omx_interface_decoder.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/omxbridge.h"

namespace {

// Offsets in classes with virtual operations: conditionally supported, and supported by both compilers.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"

template <size_t count>
constexpr bool ascending(const size_t (&offsets)[count]) {
  for (size_t i = 1; i < count; ++i) {
    if (offsets[i - 1] >= offsets[i]) return false;
  }
  return true;
}

#define AT(member) offsetof(OmxInterface, member)
// clang-format off
static_assert(ascending({
    AT(_portBuffers), AT(_componentName), AT(_portBufferMode), AT(_threadError), AT(_inputClosed),
    AT(_endOfOutputReached), AT(_deinitDone), AT(_portReconfiguring), AT(_queueOutputData), AT(_omx),
    AT(_node), AT(_observer), AT(_mpMemHeap), AT(_memoryDealer), AT(_inputCallback),
    AT(_inputCallbackContext), AT(_outputCallback), AT(_outputCallbackContext), AT(_outputConvertBuffer),
    AT(_outputConvertBufferSize), AT(_omxState), AT(_outputThread), AT(_semStateChanged),
    AT(_semEventQueued), AT(_semReserved3), AT(_semOutputDataReady), AT(_semInputBuffersReturned),
    AT(_semOutputBuffersReturned), AT(_semEndOfOutput), AT(_semInputBufferFree), AT(_semReserved9),
    AT(_portFrameSize), AT(_endOfInputPending), AT(_platformWrapper), AT(_isEncoder), AT(_state)}));
// clang-format on
// The semaphores are one behind the other, and nothing comes behind the session's own state.
static_assert(AT(_semReserved9) - AT(_semStateChanged) == 8 * sizeof(sem_t));
static_assert(AT(_state) + sizeof(void*) == sizeof(OmxInterface));
#undef AT

static_assert(
    ascending({offsetof(OmxInterfaceDecoder, _state), offsetof(OmxInterfaceDecoder, _queueThreadMessages),
               offsetof(OmxInterfaceDecoder, _eventThread), offsetof(OmxInterfaceDecoder, _clipTable),
               offsetof(OmxInterfaceDecoder, _eventThreadWaiting)}));
static_assert(sizeof(OmxInterfaceEncoder) == sizeof(OmxInterface));

static_assert(ascending({offsetof(BufferInfo, bufferId), offsetof(BufferInfo, busy),
                         offsetof(BufferInfo, memory), offsetof(BufferInfo, length),
                         offsetof(BufferInfo, data), offsetof(BufferInfo, rangeLength),
                         offsetof(BufferInfo, outputData), offsetof(BufferInfo, timestamp),
                         offsetof(BufferInfo, eos), offsetof(BufferInfo, lock)}));

#pragma GCC diagnostic pop

// Records: places that C and C++ and their readers go by.
using webrtc::VideoCodec;
using webrtc::VideoCodecH264;
static_assert(offsetof(VideoCodecH264, profile) == 8 && offsetof(VideoCodecH264, keyFrameInterval) == 12);
static_assert(offsetof(VideoCodecH264, referenceFrames) == 32);
static_assert(offsetof(VideoCodecH264, entropyCoding) == 36 && offsetof(VideoCodecH264, transform8x8) == 37);
static_assert(offsetof(VideoCodec, payloadName) == 4 && offsetof(VideoCodec, payloadType) == 36);
static_assert(offsetof(VideoCodec, width) == 38 && offsetof(VideoCodec, height) == 40);
static_assert(offsetof(VideoCodec, startBitrate) == 44 && offsetof(VideoCodec, maxFramerate) == 56);
static_assert(offsetof(VideoCodec, codecSpecific) == 60 && sizeof(DECODEDDATAINFO) == 7 * 4);

}  // namespace
