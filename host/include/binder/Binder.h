// BBinder: a binder object of this process.
#pragma once

#include <mutex>
#include <vector>

#include <binder/IBinder.h>

namespace android {

class BBinder : public IBinder {
 public:
  const String16& getInterfaceDescriptor() const override;
  bool isBinderAlive() const override;
  status_t pingBinder() override;
  BBinder* localBinder() override;
  status_t linkToDeath(const sp<DeathRecipient>& recipient, void* cookie, uint32_t flags) override;
  status_t unlinkToDeath(const wp<DeathRecipient>& recipient, void* cookie, uint32_t flags,
                         wp<DeathRecipient>* out) override;

 protected:
  BBinder();
  ~BBinder() override;
  // Who overrides it calls this one, or nobody hears of the death.
  void onLastStrongRef(const void* id) override;

 private:
  struct Obituary {
    wp<DeathRecipient> recipient;
    void* cookie;
  };

  std::mutex _obituariesMutex;  // guards the next; not held while a recipient is called
  std::vector<Obituary> _obituaries;
};

}  // namespace android
