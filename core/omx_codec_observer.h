// The binder object through which the media server calls back, and the interface behind which it
// finds the session. The server holds a reference from node allocation until the node is freed and
// may deliver a late message even after that, so the observer can outlive the session: detach()
// cuts the two apart.
#pragma once

#include <condition_variable>
#include <mutex>

#include <binder/IMemory.h>
#include <media/IOMX.h>
#include <utils/RefBase.h>

#include "omxbridge/export.h"

class OmxCodecObserver;

// What an observer tells the session. All but setObserver run on the delivery (binder) thread.
// Kept: binaries call these by their order.
class OMXBRIDGE_EXPORT OmxCodecObserverDelegate {
 public:
  virtual ~OmxCodecObserverDelegate() = default;
  virtual void setObserver(android::sp<OmxCodecObserver> observer) = 0;
  virtual void setMPmemInfo(android::sp<android::IMemoryHeap> heap) = 0;
  virtual void onOmxObserverEvent(const android::omx_message& message) = 0;
  virtual void onOmxObserverFillBufferDone(const android::omx_message& message) = 0;
  virtual void onOmxObserverEmptyBufferDone(const android::omx_message& message) = 0;
};

class OMXBRIDGE_EXPORT OmxCodecObserver : public android::BnOMXObserver {
 public:
  OmxCodecObserver();
  ~OmxCodecObserver() override;

  // Stores the delegate (not owned) and hands it a strong reference to this observer. Called once,
  // by the session, before the node is allocated; the observer must be held by a strong pointer.
  void setDelegate(OmxCodecObserverDelegate* delegate);

  // Drops every message from now on and waits until a delivery in progress has left the delegate.
  // Not to be called from a delivery. May be called any number of times.
  void detach();

  // Hands one message to the delegate by its type; a type it does not know is logged and dropped.
  void onMessage(const android::omx_message& message) override;

  // Hands the heap that the component allocates from to the delegate.
  virtual void registerBuffers(const android::sp<android::IMemoryHeap>& heap);

 private:
  class Delivery;

  OmxCodecObserverDelegate* _delegate;  // guarded by _gate
  std::mutex _gate;
  std::condition_variable _left;
  int _deliveries;  // inside the delegate at the moment; guarded by _gate
};
