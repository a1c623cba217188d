// The session fixture with a decoder in it: made by Create() on a posed device, and ways to know that the
// event thread has done its work.
#pragma once

#include "tests/core/session_fixture.h"

namespace omxtest {

class DecoderSessionTest : public SessionTest {
 protected:
  static constexpr size_t kOutputBuffers = 8;  // of the scripted decoder

  explicit DecoderSessionTest(const char* device = "msm8960") : SessionTest(device) { _decoding = true; }

  void create() { ASSERT_EQ(createDecoder(), OMXI_OK); }
  // ... and brings it to Executing, until nothing goes on any more.
  void startDecoder() {
    const Match executing = commandComplete(OMX_CommandStateSet, OMX_StateExecuting);
    const size_t before = messages().deliveredCount(executing);
    ASSERT_NO_FATAL_FAILURE(create());
    ASSERT_EQ(init(), OMXI_OK);
    // init() comes back in the middle of that message.
    require(messages().waitForDelivered(executing, before + 1), "the delivery of Executing");
    waitForEvents();
  }

  // The end of a stream comes out of a component that goes on executing.
  void endOfOutput() {
    componentProduces("", 0, OMX_BUFFERFLAG_EOS);
    requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
  }
  // Sends an event of the test's making, and waits until the event thread has handled it.
  void handleEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
    deliverEvent(event, data1, data2);
    waitForEvents();
  }
  // Until the event thread has nothing to do, or has ended.
  void waitForEvents() {
    requireUnderLock(
        [this](SessionState& state) {
          if (!state.eventThread.running) return true;
          SimpleQueue& queue = *decoder()._queueThreadMessages;
          queue.lock();
          const bool empty = queue.isEmpty();
          queue.unlock();
          return empty && !state.handlingEvent;
        },
        "the end of the event thread's work");
  }
  // New settings, told by the test at the moment of its choice, and the session's answer: the command to
  // disable the port has gone out.
  void announceAndDisable() {
    deliverEvent(OMX_EventPortSettingsChanged, kOmxOutputPort, 0);
    requireEventually([this] { return !commands().empty() && commands().back() == "sendCommand disable 1"; },
                      "the disable");
  }
  Trace commands() {
    Trace lines = trace();
    std::erase_if(lines, [](const std::string& line) { return line.find("sendCommand") != 0; });
    return lines;
  }
  size_t freed() { return omx().count(Method::FreeBuffer); }
};

}  // namespace omxtest
