// BBinder: a binder object of this process.
#pragma once

#include <binder/IBinder.h>

namespace android {

class BBinder : public IBinder {
 public:
  const String16& getInterfaceDescriptor() const override;
  bool isBinderAlive() const override;
  status_t pingBinder() override;
  BBinder* localBinder() override;

 protected:
  BBinder();
  ~BBinder() override;
};

}  // namespace android
