// What the event thread does about each event, what it does when that fails, and how it ends.
#include <atomic>

#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr const char* kDestructorPosts =
    "E OmxInterfaceDecoder::~OmxInterfaceDecoder semaphorePost line:46  \n";

std::string queueGone(int line) {
  return "E OmxInterfaceDecoder::EventMonitorThread ! _queueThreadMessages==NULL !line:" +
         std::to_string(line) + "  \n";
}

class EventThreadTest : public DecoderSessionTest {
 protected:
  // To Idle, and no further before the result is released.
  Later<int> beginToIdle() {
    messages().hold(commandComplete(OMX_CommandStateSet, OMX_StateExecuting));
    Later<int> starting = beginInit();
    require(messages().waitForHeld(1), "the completion of Executing");
    waitForSleeper(&SessionState::stateWaiters);
    return starting;
  }
  // The output thread's last line comes whenever it comes.
  LogLines errors() const {
    LogLines lines = log();
    std::erase(lines, kDecoderOver);
    return lines;
  }
};

TEST_F(EventThreadTest, SaysWhichEventsItDoesNotHandle) {
  struct {
    OMX_U32 event;
    OMX_U32 data1;
    OMX_U32 data2;
    const char* line;  // null: none
  } const events[] = {
      {OMX_EventMark, 0, 0, "E Unknown Event (2, 0, 0)"},
      {OMX_EventResourcesAcquired, 0x80000000, 0xFFFFFFFF, "E Unknown Event (5, -2147483648, -1)"},
      {0x7F000001, 7, 8, "E Unknown Event (2130706433, 7, 8)"},
      {OMX_EventPortSettingsChanged, 0, 0, "E ERROR: PORT SETTING CHANGED - being called on INPUT PORT \n"},
      {OMX_EventPortSettingsChanged, 2, 0, "E ERROR: PORT SETTING CHANGED - being called on INPUT PORT \n"},
      {OMX_EventCmdComplete, OMX_CommandFlush, 1, nullptr},
      {OMX_EventCmdComplete, OMX_CommandMarkBuffer, 1, nullptr},
      {OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StateExecuting, nullptr}};
  startDecoder();
  const size_t before = omx().count();
  LogLines expected;
  for (const auto& each : events) {
    handleEvent(static_cast<OMX_EVENTTYPE>(each.event), each.data1, each.data2);
    if (each.line != nullptr) expected.emplace_back(each.line);
  }
  EXPECT_EQ(log(), expected);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  EXPECT_FALSE(_session->_portReconfiguring);
  const faults::Fault failed(faults::Failing::NothrowNew, sizeof(android::omx_message));
  handleEvent(OMX_EventBufferFlag, 1, 1);
  handleEvent(OMX_EventBufferFlag, 2, 2);
  expected.emplace_back("E OmxInterfaceDecoder::onOmxObserverEvent(const omx_message &message),Malloc null");
  expected.emplace_back("E Unknown Event (4, 2, 2)");
  EXPECT_EQ(log(), expected);
}

TEST_F(EventThreadTest, ARefusedDisableLeavesTheOutputDrainingUntilTheNextAnnouncement) {
  startDecoder();
  omx().fail(Method::SendCommand);
  script().announce(320, 240);
  require(omx().waitForCalls(Method::SendCommand, 3), "the disable");
  waitForEvents();
  EXPECT_TRUE(_session->_portReconfiguring);
  handleEvent(OMX_EventPortSettingsChanged, 1, 0);
  waitForFills(2 * kOutputBuffers);
  EXPECT_FALSE(_session->_portReconfiguring);
  feedThrough("delivered");
  EXPECT_EQ(pictures().back().info.width, 320u);
}

TEST_F(EventThreadTest, PortCompletionsInAWrongStateAreFailures) {
  for (const OMX_COMMANDTYPE command : {OMX_CommandPortDisable, OMX_CommandPortEnable}) {
    _log.clear();
    create();
    Later<int> starting = beginToIdle();
    const size_t before = omx().count();
    const size_t told = _application.inputCallbacks().size();
    handleEvent(OMX_EventPortSettingsChanged, 1, 0);  // ignored before it executes
    EXPECT_EQ(log(), LogLines{});
    handleEvent(OMX_EventCmdComplete, command, 1);
    EXPECT_EQ(_session->threadError(), OMXI_ERR_INCORRECT_STATE);
    EXPECT_EQ(_application.inputCallbacks().size(), told + 1);
    EXPECT_EQ(omx().count(), before);
    EXPECT_FALSE(_session->_portReconfiguring);
    waitForEndOfEventThread();
    letMessagesCome();
    EXPECT_EQ(starting.result(), OMXI_OK);
    EXPECT_EQ(deInit(), OMXI_ERR_INCORRECT_STATE);
    destroy();
    EXPECT_EQ(errors(), LogLines{"E Incorrect State Reached: 2\n"});
  }
}

TEST_F(EventThreadTest, ACompletedDisableAfterAFailureChangesNothing) {
  startDecoder();
  _session->setThreadError(OMXI_ERR_APPLICATION);
  const size_t before = omx().count();
  handleEvent(OMX_EventCmdComplete, OMX_CommandPortDisable, 1);
  waitForEndOfEventThread();
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(_session->threadError(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(errors(), LogLines{});
}

TEST_F(EventThreadTest, AnErrorEventEndsTheSession) {
  startDecoder();
  handleEvent(OMX_EventError, 0x80001009, 3);
  EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
  EXPECT_TRUE(_session->_endOfOutputReached);
  EXPECT_EQ(_application.inputCallbacks().size(), 1u);
  waitForEndOfEventThread();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);  // and waits for no end of stream
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  EXPECT_EQ(errors(), LogLines{"E OMXINTERFACE - Event error = -2147479543(0x80001009), data2 3 \n"});
}

TEST_F(EventThreadTest, StartsAgainWithTheThreadOfAFailedStart) {
  create();
  {
    const faults::Fault failed(faults::Failing::Thread, 2);
    EXPECT_EQ(_session->init(), OMXI_ERR_CREATE_OUTPUT_THREAD);
  }
  const pthread_t thread = decoder()._eventThread;
  EXPECT_EQ(init(), OMXI_OK);
  EXPECT_TRUE(pthread_equal(thread, decoder()._eventThread));
  feedThrough("delivered");
}

TEST_F(EventThreadTest, WithoutAQueueTheThreadEndsAndPicturesStillCome) {
  create();
  delete decoder()._queueThreadMessages;
  decoder()._queueThreadMessages = nullptr;  // as when there was no memory for it
  EXPECT_EQ(init(), OMXI_OK);
  waitForEndOfEventThread();
  deliverEvent(OMX_EventBufferFlag, 1, 1);
  feedThrough("delivered");
  EXPECT_EQ(log(), LogLines{queueGone(290)});
}

// --- The end of the thread ---

TEST_F(EventThreadTest, AThreadThatWaitsForEventsFindsItsQueueGone) {
  create();
  Gate& gate = newGate();
  Gate waits;
  // Events would make it wait more than once: the start is held before the first.
  omx().before(Method::SendCommand, [&](const Call&) { gate.pass(); });
  const faults::SemaphoreHook hook(_session->_semEventQueued, [&](faults::SemaphoreCall call) {
    if (call != faults::SemaphoreCall::Wait) return;
    waits.open();
    waits.pass();
  });
  Later<int> starting = beginInit();
  gate.waitForArrival();
  waits.waitForArrival();
  Later<bool> destroyed = beginDestroyOfBusySession();
  gate.open();
  destroyed.result();
  EXPECT_EQ(starting.result(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(sortedLog(), sorted({queueGone(305), kDecoderOver}));
}

TEST_F(EventThreadTest, TheDestructorWakesAThreadInTheMiddleOfItsWakeUp) {
  startDecoder();
  Gate& gate = newGate();
  std::atomic<bool> stopped{false};
  // At the post between the two waits.
  const faults::SemaphoreHook hook(
      _session->_semEventQueued, [&, session = &decoder()](faults::SemaphoreCall call) {
        if (call == faults::SemaphoreCall::Post && session->_eventThreadWaiting && !stopped.exchange(true))
          gate.pass();
      });
  deliverEvent(OMX_EventBufferFlag, 1, 1);
  gate.waitForArrival();
  Later<bool> destroyed = beginDestroyOfBusySession();
  gate.open();
  destroyed.result();
  EXPECT_EQ(sortedLog(), sorted({kDestructorPosts, queueGone(305), kDecoderOver}));
}

TEST_F(EventThreadTest, AThreadThatHandlesAnEventFindsItsQueueGoneAfterwards) {
  startDecoder();
  Gate& gate = newGate();
  omx().before(Method::SendCommand, [&](const Call&) { gate.pass(); });
  script().announce(320, 240);
  gate.waitForArrival();
  Later<bool> destroyed = beginDestroyOfBusySession();
  gate.open();
  destroyed.result();
  EXPECT_EQ(sortedLog(), sorted({queueGone(290), kDecoderOver}));
}

TEST_F(EventThreadTest, ThreadsThatStartAfterTheEndHasBegunEndToo) {
  // A second init() is about to start threads when destruction has woken and ended those of the first one.
  // The new ones must look for themselves: nobody will wake them again.
  create();
  omx().fail(Method::SendCommand);
  ASSERT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  deliverEvent(OMX_EventError, 1, 2);
  waitForEndOfEventThread();
  Gate& gate = newGate();
  const faults::ThreadHook hook(&OmxInterfaceDecoder::EventMonitorThread, [&] { gate.pass(); });
  Later<int> second = beginInit();
  gate.waitForArrival();
  SessionState& state = *_session->_state;
  Later<bool> destroyed = beginDestroyOfBusySession();
  requireEventually(
      [&] {
        const SessionState::Lock held(state.lock);
        return !state.outputThread.running;
      },
      "the output thread's end");
  gate.open();
  EXPECT_NE(second.result(), OMXI_OK);
  destroyed.result();
}

}  // namespace
}  // namespace omxtest
