// The media interfaces' names.
#include <stddef.h>

#include <media/IMediaPlayerService.h>
#include <media/IOMX.h>

namespace android {

// Messages cross as bytes. Numbers are for 32-bit pointers, as on the devices, and for 64-bit ones.
constexpr size_t bytes(size_t pointers32, size_t pointers64) {
  return sizeof(void*) == 4 ? pointers32 : pointers64;
}
using Event = decltype(omx_message::u.event_data);
using Filled = decltype(omx_message::u.extended_buffer_data);
static_assert(sizeof(omx_message) == bytes(40, 64));
static_assert(offsetof(omx_message, node) == bytes(4, 8) && offsetof(omx_message, u) == bytes(8, 16));
static_assert(offsetof(Event, data1) == 4 && offsetof(Event, data2) == 8);
static_assert(offsetof(Filled, range_offset) == bytes(4, 8) && offsetof(Filled, flags) == bytes(12, 16));
static_assert(offsetof(Filled, timestamp) == bytes(16, 24));
static_assert(offsetof(Filled, platform_private) == bytes(24, 32) &&
              offsetof(Filled, data_ptr) == bytes(28, 40));

IMPLEMENT_META_INTERFACE(OMX, "android.hardware.IOMX");
IMPLEMENT_META_INTERFACE(OMXObserver, "android.hardware.IOMXObserver");
IMPLEMENT_META_INTERFACE(MediaPlayerService, "android.media.IMediaPlayerService");

BnOMX::BnOMX() = default;
BnOMX::~BnOMX() = default;

BnOMXObserver::BnOMXObserver() = default;
BnOMXObserver::~BnOMXObserver() = default;

BnMediaPlayerService::BnMediaPlayerService() = default;
BnMediaPlayerService::~BnMediaPlayerService() = default;

}  // namespace android
