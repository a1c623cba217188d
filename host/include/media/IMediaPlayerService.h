// IMediaPlayerService: the media server's service "media.player", as far as codecs are concerned.
#pragma once

#include <binder/IInterface.h>
#include <media/IOMX.h>

namespace android {

class IMediaPlayerService : public IInterface {
 public:
  DECLARE_META_INTERFACE(MediaPlayerService);

  virtual sp<IOMX> getOMX() = 0;
};

class BnMediaPlayerService : public BnInterface<IMediaPlayerService> {
 protected:
  BnMediaPlayerService();
  ~BnMediaPlayerService() override;
};

}  // namespace android
