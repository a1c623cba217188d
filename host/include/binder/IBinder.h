// IBinder: the identity behind an interface, what the service manager stores and hands out.
// On this port every object lives in the calling process, so there are no transactions and no proxies. An
// object dies when nobody holds it any more: what the end of a client's process is on the devices.
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

  class DeathRecipient : public virtual RefBase {
   public:
    // Runs on the thread that let go of the object, which cannot be promoted any more.
    virtual void binderDied(const wp<IBinder>& who) = 0;
  };

  // Tells the recipient, which is not kept alive for it, once of the object's death. Any thread.
  virtual status_t linkToDeath(const sp<DeathRecipient>& recipient, void* cookie = nullptr,
                               uint32_t flags = 0) = 0;
  // Takes back one link with the same recipient and cookie; NAME_NOT_FOUND where there is none. Says in `out`
  // whose it was.
  virtual status_t unlinkToDeath(const wp<DeathRecipient>& recipient, void* cookie = nullptr,
                                 uint32_t flags = 0, wp<DeathRecipient>* out = nullptr) = 0;

 protected:
  IBinder();
  ~IBinder() override;
};

}  // namespace android
