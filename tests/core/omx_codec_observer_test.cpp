#include "core/omx_codec_observer.h"

#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <string>
#include <thread>
#include <vector>

#include <binder/MemoryHeapBase.h>

#include "tests/core/log_lines.h"

namespace {

using android::omx_message;
using android::sp;

// Notes what it is told; a test can keep a delivery inside.
class Delegate final : public OmxCodecObserverDelegate {
 public:
  void setObserver(sp<OmxCodecObserver> given) override { observer = given; }
  void setMPmemInfo(sp<android::IMemoryHeap> given) override {
    heap = given;
    referencesToHeap = given != nullptr ? given->getStrongCount() : 0;
  }
  void onOmxObserverEvent(const omx_message& message) override { note("event", message); }
  void onOmxObserverFillBufferDone(const omx_message& message) override { note("filled", message); }
  void onOmxObserverEmptyBufferDone(const omx_message& message) override { note("emptied", message); }

  // From now on a delivery stays inside until letGo().
  void keepDeliveries() { _kept = _gate.get_future(); }
  void letGo() { _gate.set_value(); }
  void waitForDelivery() { _entered.get_future().wait(); }

  sp<OmxCodecObserver> observer;
  sp<android::IMemoryHeap> heap;
  int32_t referencesToHeap = 0;
  std::vector<std::string> calls;
  std::vector<const omx_message*> messages;
  std::atomic<bool> left{false};

 private:
  void note(const char* call, const omx_message& message) {
    calls.emplace_back(call);
    messages.push_back(&message);
    if (!_kept.valid()) return;
    _entered.set_value();
    _kept.wait();
    left = true;
  }

  std::promise<void> _gate;
  std::future<void> _kept;
  std::promise<void> _entered;
};

omx_message messageOfType(unsigned type) {
  omx_message message{};
  message.type = static_cast<decltype(message.type)>(type);
  return message;
}

class OmxCodecObserverTest : public ::testing::Test {
 protected:
  const sp<OmxCodecObserver> _observer = new OmxCodecObserver;
  Delegate _delegate;
  omxhost::LogCapture _log;
};

TEST_F(OmxCodecObserverTest, HandsItselfToItsDelegate) {
  const auto references = _observer->getStrongCount();
  _observer->setDelegate(&_delegate);
  EXPECT_EQ(_delegate.observer.get(), _observer.get());
  EXPECT_EQ(_observer->getStrongCount(), references + 1);
}

TEST_F(OmxCodecObserverTest, DispatchesMessagesByTheirType) {
  _observer->setDelegate(&_delegate);
  const omx_message messages[] = {messageOfType(omx_message::EVENT),
                                  messageOfType(omx_message::EMPTY_BUFFER_DONE),
                                  messageOfType(omx_message::FILL_BUFFER_DONE)};
  for (const omx_message& message : messages) _observer->onMessage(message);
  EXPECT_EQ(_delegate.calls, (std::vector<std::string>{"event", "emptied", "filled"}));
  EXPECT_EQ(_delegate.messages, (std::vector{&messages[0], &messages[1], &messages[2]}));
  EXPECT_TRUE(_log.lines().empty());
}

TEST_F(OmxCodecObserverTest, LogsATypeThatItDoesNotKnow) {
  _observer->setDelegate(&_delegate);
  for (const unsigned type : {3u, 0xffffffffu}) {
    _log.clear();
    _observer->onMessage(messageOfType(type));
    EXPECT_EQ(omxtest::logLines(_log),
              omxtest::LogLines{"E OMXINTERFACE - OnMessage :: default called, message not handled\n"});
  }
  EXPECT_TRUE(_delegate.calls.empty());
}

TEST_F(OmxCodecObserverTest, PassesTheComponentsHeapOn) {
  _observer->setDelegate(&_delegate);
  const sp<android::IMemoryHeap> heap = new android::MemoryHeapBase(4096);
  _observer->registerBuffers(heap);
  EXPECT_EQ(_delegate.heap.get(), heap.get());
  EXPECT_GE(_delegate.referencesToHeap, 2);  // a reference of its own for as long as the call lasts
}

TEST_F(OmxCodecObserverTest, DropsWhatComesWithoutADelegate) {
  const auto deliverAll = [this] {
    for (const unsigned type : {0u, 1u, 2u}) _observer->onMessage(messageOfType(type));
    _observer->registerBuffers(new android::MemoryHeapBase(4096));
  };
  deliverAll();
  _observer->setDelegate(&_delegate);
  _observer->detach();
  deliverAll();  // the server sends these late
  EXPECT_TRUE(_delegate.calls.empty());
  EXPECT_TRUE(_delegate.heap == nullptr);
  EXPECT_TRUE(_log.lines().empty());
  _observer->detach();  // a second one has nothing left to do
}

TEST_F(OmxCodecObserverTest, LetsADeliveryLeaveBeforeItIsDetached) {
  _observer->setDelegate(&_delegate);
  _delegate.keepDeliveries();
  std::thread delivery([this] { _observer->onMessage(messageOfType(0)); });
  _delegate.waitForDelivery();
  std::thread opener([this] {
    // Once the heap is not passed on any more, detach() has begun.
    const sp<android::IMemoryHeap> heap = new android::MemoryHeapBase(4096);
    do {
      _delegate.heap.clear();
      _observer->registerBuffers(heap);
      std::this_thread::yield();
    } while (_delegate.heap != nullptr);
    _delegate.letGo();
  });
  _observer->detach();
  EXPECT_TRUE(_delegate.left);  // else the session would be freed under the delivery
  opener.join();
  delivery.join();
}

TEST_F(OmxCodecObserverTest, OutlivesItsDelegate) {
  {
    Delegate gone;
    _observer->setDelegate(&gone);
    _observer->detach();
    gone.observer.clear();
  }
  _observer->onMessage(messageOfType(omx_message::FILL_BUFFER_DONE));
  EXPECT_EQ(_observer->getStrongCount(), 1);
}

}  // namespace
