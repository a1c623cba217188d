// IBinder: the identity behind an interface, what the service manager stores and hands out.
// On this port every object lives in the calling process: there are no transactions, no proxies and
// no deaths to be told about.
#pragma once

#include <utils/Errors.h>
#include <utils/RefBase.h>
#include <utils/String16.h>

namespace android {

class BBinder;
class IInterface;

class IBinder : public virtual RefBase {
 public:
  // The object as the interface of that name, or null if it is another one.
  virtual sp<IInterface> queryLocalInterface(const String16& descriptor);
  virtual const String16& getInterfaceDescriptor() const = 0;
  virtual bool isBinderAlive() const = 0;
  virtual status_t pingBinder() = 0;
  virtual BBinder* localBinder();

 protected:
  IBinder();
  ~IBinder() override;
};

}  // namespace android
