// Binder objects of one process: an identity and an interface, no transactions.
#include <algorithm>

#include <binder/Binder.h>
#include <binder/IInterface.h>

namespace android {

IBinder::IBinder() = default;
IBinder::~IBinder() = default;

sp<IInterface> IBinder::queryLocalInterface(const String16& /*descriptor*/) {
  return nullptr;
}
BBinder* IBinder::localBinder() {
  return nullptr;
}

BBinder::BBinder() = default;
BBinder::~BBinder() = default;

const String16& BBinder::getInterfaceDescriptor() const {
  static const String16& none = *new String16();
  return none;
}

bool BBinder::isBinderAlive() const {
  return true;
}
status_t BBinder::pingBinder() {
  return OK;
}
BBinder* BBinder::localBinder() {
  return this;
}

status_t BBinder::linkToDeath(const sp<DeathRecipient>& recipient, void* cookie, uint32_t /*flags*/) {
  if (recipient == nullptr) return BAD_VALUE;
  const std::lock_guard<std::mutex> lock(_obituariesMutex);
  _obituaries.push_back({recipient, cookie});
  return OK;
}

status_t BBinder::unlinkToDeath(const wp<DeathRecipient>& recipient, void* cookie, uint32_t /*flags*/,
                                wp<DeathRecipient>* out) {
  const std::lock_guard<std::mutex> lock(_obituariesMutex);
  const auto found = std::find_if(_obituaries.begin(), _obituaries.end(), [&](const Obituary& each) {
    return each.recipient == recipient && each.cookie == cookie;
  });
  if (found == _obituaries.end()) return NAME_NOT_FOUND;
  if (out != nullptr) *out = found->recipient;
  _obituaries.erase(found);
  return OK;
}

void BBinder::onLastStrongRef(const void* /*id*/) {
  std::vector<Obituary> obituaries;
  {
    const std::lock_guard<std::mutex> lock(_obituariesMutex);
    obituaries.swap(_obituaries);
  }
  for (const Obituary& each : obituaries) {
    const sp<DeathRecipient> recipient = each.recipient.promote();
    if (recipient != nullptr) recipient->binderDied(this);
  }
}

IInterface::IInterface() = default;
IInterface::~IInterface() = default;

sp<IBinder> IInterface::asBinder() {
  return onAsBinder();
}
sp<const IBinder> IInterface::asBinder() const {
  return const_cast<IInterface*>(this)->onAsBinder();
}

}  // namespace android
