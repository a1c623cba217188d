#include "core/omx_codec_observer.h"

#include "core/log.h"

// One call into the delegate. Holds detach() up as long as it lives; without a delegate it is empty.
class OmxCodecObserver::Delivery {
 public:
  explicit Delivery(OmxCodecObserver& observer) : _observer(observer), _delegate(nullptr) {
    const std::lock_guard<std::mutex> held(_observer._gate);
    _delegate = _observer._delegate;
    if (_delegate != nullptr) ++_observer._deliveries;
  }
  ~Delivery() {
    if (_delegate == nullptr) return;
    const std::lock_guard<std::mutex> held(_observer._gate);
    if (--_observer._deliveries == 0) _observer._left.notify_all();
  }
  Delivery(const Delivery&) = delete;
  Delivery& operator=(const Delivery&) = delete;

  OmxCodecObserverDelegate* delegate() const { return _delegate; }

 private:
  OmxCodecObserver& _observer;
  OmxCodecObserverDelegate* _delegate;
};

OmxCodecObserver::OmxCodecObserver() : _delegate(nullptr), _deliveries(0) {}

OmxCodecObserver::~OmxCodecObserver() = default;

void OmxCodecObserver::setDelegate(OmxCodecObserverDelegate* delegate) {
  {
    const std::lock_guard<std::mutex> held(_gate);
    _delegate = delegate;
  }
  delegate->setObserver(android::sp<OmxCodecObserver>(this));
}

void OmxCodecObserver::detach() {
  std::unique_lock<std::mutex> held(_gate);
  _delegate = nullptr;
  _left.wait(held, [this] { return _deliveries == 0; });
}

void OmxCodecObserver::onMessage(const android::omx_message& message) {
  const Delivery delivery(*this);
  OmxCodecObserverDelegate* delegate = delivery.delegate();
  switch (message.type) {
    case android::omx_message::EVENT:
      if (delegate != nullptr) delegate->onOmxObserverEvent(message);
      return;
    case android::omx_message::EMPTY_BUFFER_DONE:
      if (delegate != nullptr) delegate->onOmxObserverEmptyBufferDone(message);
      return;
    case android::omx_message::FILL_BUFFER_DONE:
      if (delegate != nullptr) delegate->onOmxObserverFillBufferDone(message);
      return;
  }
  logError("OMXINTERFACE - OnMessage :: default called, message not handled\n");
}

void OmxCodecObserver::registerBuffers(const android::sp<android::IMemoryHeap>& heap) {
  const Delivery delivery(*this);
  if (delivery.delegate() != nullptr) delivery.delegate()->setMPmemInfo(heap);
}
