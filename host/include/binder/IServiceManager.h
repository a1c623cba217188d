// IServiceManager: finds services by name. Any thread may call it.
#pragma once

#include <binder/IInterface.h>
#include <utils/Vector.h>

namespace android {

class IServiceManager : public IInterface {
 public:
  DECLARE_META_INTERFACE(ServiceManager);

  // Null where no service has that name. On this port both answer at once; looking up "media.player"
  // may load the media server first (see omxhost/services.h).
  virtual sp<IBinder> getService(const String16& name) const = 0;
  virtual sp<IBinder> checkService(const String16& name) const = 0;

  // Replaces a service of the same name. BAD_VALUE for a null service or an empty name.
  virtual status_t addService(const String16& name, const sp<IBinder>& service) = 0;

  // The names, sorted.
  virtual Vector<String16> listServices() = 0;
};

sp<IServiceManager> defaultServiceManager();

template <typename INTERFACE>
status_t getService(const String16& name, sp<INTERFACE>* outService) {
  const sp<IServiceManager> manager = defaultServiceManager();
  if (manager == nullptr) return NAME_NOT_FOUND;
  *outService = interface_cast<INTERFACE>(manager->getService(name));
  return *outService != nullptr ? OK : NAME_NOT_FOUND;
}

}  // namespace android
