// What binaries count on without a name: the order of virtual operations and of data members, and the
// layout of records.
#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>

#include "core/buffer_info.h"
#include "core/omx_codec_observer.h"
#include "core/omx_interface.h"
#include "decoder/omx_interface_decoder.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/omxbridge.h"
#include "platform/board_platform_wrapper.h"

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

// The slot of a virtual operation, from how pointers to members are represented; -1 for one that is not
// virtual.
template <typename Function, typename Class>
int slot(Function Class::*operation) {
  ptrdiff_t words[2];
  static_assert(sizeof(operation) == sizeof(words));
  memcpy(words, &operation, sizeof(words));
#if defined(__arm__) || defined(__aarch64__)
  const bool isVirtual = (words[1] & 1) != 0;
  const ptrdiff_t offset = words[0];
#else
  const bool isVirtual = (words[0] & 1) != 0;
  const ptrdiff_t offset = words[0] - 1;
#endif
  return isVirtual ? static_cast<int>(offset / static_cast<ptrdiff_t>(sizeof(void*))) : -1;
}

// The slots of these, one after the other, begin with `first`.
template <typename... Operations>
void expectSlots(int first, Operations... operations) {
  for (const int found : {slot(operations)...}) EXPECT_EQ(found, first++);
}

TEST(VirtualSlots, AreWhereBinariesCallThem) {
  using Base = OmxInterface;
  using Decoder = OmxInterfaceDecoder;
  using Wrapper = CBoardPlatformWrapper;
  // 0 and 1 are the destructor's two forms.
  expectSlots(2, &Base::setObserver, &Base::setMPmemInfo, &Base::onOmxObserverEvent,
              &Base::onOmxObserverFillBufferDone, &Base::onOmxObserverEmptyBufferDone, &Base::onEvent,
              &Base::init, &Base::deInit, &Base::callOutputCallbackFunction);
  expectSlots(6, &OmxCodecObserverDelegate::onOmxObserverEmptyBufferDone);
  expectSlots(4, &Decoder::onOmxObserverEvent);
  expectSlots(10, &Decoder::callOutputCallbackFunction);
  expectSlots(-1, &Base::setupIOMXConnections);
  expectSlots(0, &Wrapper::configureEncoder, &Wrapper::setConfig, &Wrapper::setPictureOrder,
              &Wrapper::setInputPackingFormat, &Wrapper::setOutputColorFormat);
}

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
