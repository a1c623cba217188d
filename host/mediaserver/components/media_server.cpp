// The library's entry point: puts the posed device's components behind "media.player".

#include <android/log.h>
#include <binder/IServiceManager.h>
#include <omxhost/device.h>

#include "host/mediaserver/components/component_list.h"
#include "host/mediaserver/media_player_service.h"
#include "host/mediaserver/omx_server.h"

extern "C" __attribute__((visibility("default"))) void omxhost_media_server_start();

// Called once, by the first look-up of the service. Who poses as another device later keeps these components.
void omxhost_media_server_start() {
  using namespace mediaserver;
  const android::sp<android::IOMX> omx = new OmxServer(componentsOf(omxhost::posedDevice()));
  const android::sp<android::IBinder> service = new MediaPlayerService(omx);
  if (android::defaultServiceManager()->addService(android::String16(kServiceName), service) != android::OK) {
    __android_log_print(ANDROID_LOG_ERROR, "omxmediaserver", "the service %s cannot be registered",
                        kServiceName);
  }
}
