// IInterface: base of every interface that is reached through a binder object. An interface class
// declares its name with DECLARE_META_INTERFACE and defines it with IMPLEMENT_META_INTERFACE; an
// implementation derives from BnInterface<TheInterface>.
#pragma once

#include <binder/Binder.h>
#include <binder/IBinder.h>
#include <utils/RefBase.h>
#include <utils/String16.h>

namespace android {

class IInterface : public virtual RefBase {
 public:
  sp<IBinder> asBinder();
  sp<const IBinder> asBinder() const;

 protected:
  IInterface();
  ~IInterface() override;

  virtual IBinder* onAsBinder() = 0;
};

// Null for a null binder and for one that implements another interface.
template <typename INTERFACE>
sp<INTERFACE> interface_cast(const sp<IBinder>& object) {
  return INTERFACE::asInterface(object);
}

template <typename INTERFACE>
class BnInterface : public INTERFACE, public BBinder {
 public:
  sp<IInterface> queryLocalInterface(const String16& name) override {
    if (name == INTERFACE::descriptor) return static_cast<INTERFACE*>(this);
    return nullptr;
  }
  const String16& getInterfaceDescriptor() const override { return INTERFACE::getInterfaceDescriptor(); }

 protected:
  IBinder* onAsBinder() override { return this; }
};

}  // namespace android

// The name is an object that is never destroyed, so threads may still ask for interfaces while the
// process exits.
#define DECLARE_META_INTERFACE(NAME)                                                          \
  static const ::android::String16& descriptor;                                               \
  static ::android::sp<I##NAME> asInterface(const ::android::sp<::android::IBinder>& object); \
  virtual const ::android::String16& getInterfaceDescriptor() const;                          \
  I##NAME();                                                                                  \
  ~I##NAME() override

#define IMPLEMENT_META_INTERFACE(NAME, TEXT)                                                     \
  ::android::sp<I##NAME> I##NAME::asInterface(const ::android::sp<::android::IBinder>& object) { \
    if (object == nullptr) return nullptr;                                                       \
    return static_cast<I##NAME*>(object->queryLocalInterface(I##NAME::descriptor).get());        \
  }                                                                                              \
  const ::android::String16& I##NAME::getInterfaceDescriptor() const {                           \
    return I##NAME::descriptor;                                                                  \
  }                                                                                              \
  I##NAME::I##NAME() = default;                                                                  \
  I##NAME::~I##NAME() = default;                                                                 \
  const ::android::String16& I##NAME::descriptor = *new ::android::String16(TEXT)
