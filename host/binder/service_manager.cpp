#include <atomic>
#include <map>
#include <mutex>

#include <binder/IServiceManager.h>
#include <omxhost/services.h>

#include "host/binder/media_server_loader.h"

namespace android {

IMPLEMENT_META_INTERFACE(ServiceManager, "android.os.IServiceManager");

namespace {

class ServiceManager : public BnInterface<IServiceManager> {
 public:
  // Never destroyed: threads may still look services up while the process exits.
  static const sp<ServiceManager>& instance() {
    static const sp<ServiceManager>& manager = *new sp<ServiceManager>(new ServiceManager());
    return manager;
  }

  sp<IBinder> getService(const String16& name) const override { return checkService(name); }

  sp<IBinder> checkService(const String16& name) const override {
    sp<IBinder> service = find(name);
    if (service == nullptr && loadOnDemand && name == mediaServerName()) {
      // The lock is not held: the library registers its service from within.
      omxhost::loadMediaServer();
      service = find(name);
    }
    return service;
  }

  status_t addService(const String16& name, const sp<IBinder>& service) override {
    if (service == nullptr || name.size() == 0) return BAD_VALUE;
    sp<IBinder> replaced = service;  // Its last reference may go, so not under the lock.
    const std::lock_guard lock(_mutex);
    std::swap(_services[name], replaced);
    return OK;
  }

  Vector<String16> listServices() override {
    Vector<String16> names;
    const std::lock_guard lock(_mutex);
    for (const auto& [name, service] : _services) names.add(name);
    return names;
  }

  bool remove(const String16& name) {
    sp<IBinder> removed;
    const std::lock_guard lock(_mutex);
    const auto entry = _services.find(name);
    if (entry == _services.end()) return false;
    removed = std::move(entry->second);
    _services.erase(entry);
    return true;
  }

  std::atomic<bool> loadOnDemand{true};

 private:
  static const String16& mediaServerName() {
    static const String16& name = *new String16("media.player");
    return name;
  }

  sp<IBinder> find(const String16& name) const {
    const std::lock_guard lock(_mutex);
    const auto entry = _services.find(name);
    return entry != _services.end() ? entry->second : nullptr;
  }

  mutable std::mutex _mutex;
  std::map<String16, sp<IBinder>> _services;
};

}  // namespace

sp<IServiceManager> defaultServiceManager() {
  return ServiceManager::instance();
}

}  // namespace android

namespace omxhost {

bool removeService(const android::String16& name) {
  return android::ServiceManager::instance()->remove(name);
}

bool setLoadOnDemand(bool enabled) {
  return android::ServiceManager::instance()->loadOnDemand.exchange(enabled);
}

}  // namespace omxhost
