// Binder objects of one process: an identity and an interface, no transactions.
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

IInterface::IInterface() = default;
IInterface::~IInterface() = default;

sp<IBinder> IInterface::asBinder() {
  return onAsBinder();
}
sp<const IBinder> IInterface::asBinder() const {
  return const_cast<IInterface*>(this)->onAsBinder();
}

}  // namespace android
