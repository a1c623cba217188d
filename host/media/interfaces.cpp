// The media interfaces' names.
#include <media/IMediaPlayerService.h>
#include <media/IOMX.h>

namespace android {

static_assert(sizeof(omx_message) == (sizeof(void*) == 4 ? 40 : 64));

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
