// The service "media.player": the way to the media server's IOMX.
// Any thread may call it. Keeps the IOMX alive; a null one is handed out as such.
#pragma once

#include <media/IMediaPlayerService.h>
#include <media/IOMX.h>

namespace mediaserver {

inline constexpr const char* kServiceName = "media.player";

class MediaPlayerService : public android::BnMediaPlayerService {
 public:
  explicit MediaPlayerService(const android::sp<android::IOMX>& omx) : _omx(omx) {}

  android::sp<android::IOMX> getOMX() override { return _omx; }

 private:
  const android::sp<android::IOMX> _omx;
};

}  // namespace mediaserver
