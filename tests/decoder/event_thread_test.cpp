// What the event thread does about each event, what it does when that fails, and how it ends.
#include <atomic>

#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"
#include "tests/decoder/semaphore_hook.h"

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
  void letExecute() {
    messages().passAll();
    messages().releaseAll();
  }
  void waitForEndOfEventThread() {
    requireEventually([this] { return !eventThreadRuns(); }, "the event thread's end");
  }
  bool eventThreadRuns() {
    const SessionState::Lock held(_session->_state->lock);
    return _session->_state->eventThread.running;
  }
  // The output thread's last line comes whenever it comes.
  LogLines errors() const {
    LogLines lines = log();
    std::erase(lines, kDecoderOver);
    return lines;
  }
};

TEST_F(EventThreadTest, SaysWhichEventsItDoesNotKnow) {
  const struct {
    OMX_U32 event;
    OMX_U32 data1;
    OMX_U32 data2;
    const char* line;
  } events[] = {{OMX_EventMark, 0, 0, "E Unknown Event (2, 0, 0)"},
                {OMX_EventBufferFlag, 1, 16, "E Unknown Event (4, 1, 16)"},
                {OMX_EventResourcesAcquired, 0x80000000, 0xFFFFFFFF, "E Unknown Event (5, -2147483648, -1)"},
                {0x7F000001, 7, 8, "E Unknown Event (2130706433, 7, 8)"}};
  startDecoder();
  const size_t before = omx().count();
  LogLines expected;
  for (const auto& each : events) {
    handleEvent(static_cast<OMX_EVENTTYPE>(each.event), each.data1, each.data2);
    expected.emplace_back(each.line);
  }
  EXPECT_EQ(log(), expected);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(EventThreadTest, IgnoresNewSettingsBeforeItExecutes) {
  create();
  Later<int> starting = beginToIdle();
  const size_t before = omx().count();
  handleEvent(OMX_EventPortSettingsChanged, 1, 0);
  handleEvent(OMX_EventPortSettingsChanged, 0, 0);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(log(), LogLines{});
  EXPECT_FALSE(_session->_portReconfiguring);
  letExecute();
  EXPECT_EQ(starting.result(), OMXI_OK);
  feedThrough("delivered");
}

TEST_F(EventThreadTest, RefusesNewSettingsOfTheInput) {
  startDecoder();
  const size_t before = omx().count();
  for (const OMX_U32 port : {0u, 2u}) handleEvent(OMX_EventPortSettingsChanged, port, 0);
  const LogLines expected(2, "E ERROR: PORT SETTING CHANGED - being called on INPUT PORT \n");
  EXPECT_EQ(log(), expected);
  EXPECT_EQ(omx().count(), before);
  EXPECT_FALSE(_session->_portReconfiguring);
}

TEST_F(EventThreadTest, ARefusedDisableLeavesTheOutputDraining) {
  startDecoder();
  omx().fail(Method::SendCommand);
  handleEvent(OMX_EventPortSettingsChanged, 1, 0);
  EXPECT_EQ(
      log(),
      LogLines{std::string("E ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error ") +
               kRefusedText + "\n"});
  EXPECT_TRUE(_session->_portReconfiguring);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  componentProduces("delivered");
  componentProduces("also");
  waitForPictures(2);
  endOfStream();
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputBuffers);  // nothing went back
}

TEST_F(EventThreadTest, TheNextAnnouncementTriesARefusedDisableAgain) {
  startDecoder();
  omx().fail(Method::SendCommand);
  script().announce(320, 240);
  require(omx().waitForCalls(Method::SendCommand, 3), "the disable");
  waitForEvents();
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
    const size_t callbacks = _application.inputCallbacks();
    handleEvent(OMX_EventCmdComplete, command, 1);
    EXPECT_EQ(log(), LogLines{"E Incorrect State Reached: 2\n"});
    EXPECT_EQ(_session->threadError(), OMXI_ERR_INCORRECT_STATE);
    EXPECT_EQ(_application.inputCallbacks(), callbacks + 1);
    EXPECT_EQ(omx().count(), before);
    waitForEndOfEventThread();
    letExecute();
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

TEST_F(EventThreadTest, OtherCompletionsAreNoneOfItsBusiness) {
  startDecoder();
  const size_t before = omx().count();
  for (const OMX_COMMANDTYPE command : {OMX_CommandFlush, OMX_CommandMarkBuffer}) {
    handleEvent(OMX_EventCmdComplete, command, 1);
  }
  handleEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StateExecuting);
  EXPECT_EQ(decoder().onCommandComplete(OMX_CommandStateSet, OMX_StateIdle), 0);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(log(), LogLines{});
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(EventThreadTest, AnErrorEventEndsTheSession) {
  startDecoder();
  handleEvent(OMX_EventError, 0x80001009, 3);
  EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
  EXPECT_TRUE(_session->_endOfOutputReached);
  EXPECT_EQ(_application.inputCallbacks(), 1u);
  waitForEndOfEventThread();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);  // and waits for no end of stream
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  EXPECT_EQ(errors(), LogLines{"E OMXINTERFACE - Event error = -2147479543(0x80001009), data2 3 \n"});
}

// --- Reconfigurations that fail half way ---

struct Breakdown {
  const char* name;
  Method method;
  size_t number;  // of its calls from the announcement on
  int code;
  std::string line;
  size_t outputsLeft;  // records
};

std::ostream& operator<<(std::ostream& stream, const Breakdown& breakdown) {
  return stream << breakdown.name;
}

class BreakdownTest : public EventThreadTest, public ::testing::WithParamInterface<Breakdown> {};

TEST_P(BreakdownTest, IsRecorded) {
  startDecoder();
  omx().fail(GetParam().method, GetParam().number);
  script().announce(320, 240);
  _application.waitForInputCallbacks(1);
  EXPECT_EQ(_session->threadError(), GetParam().code);
  waitForEndOfEventThread();
  EXPECT_EQ(errors(), LogLines{GetParam().line});
  EXPECT_EQ(_session->_portBuffers[1].size(), GetParam().outputsLeft);
  EXPECT_EQ(omx().outstandingBuffers(), kInputBuffers + GetParam().outputsLeft);
  EXPECT_EQ(deInit(), GetParam().code);
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputBuffers);
}

INSTANTIATE_TEST_SUITE_P(
    Reconfiguration, BreakdownTest,
    ::testing::Values(
        Breakdown{"Enable", Method::SendCommand, 2, OMXI_ERR_SEND_COMMAND_STATE,
                  std::string("E Unable to send command state enabling port: error ") + kRefusedText + "\n",
                  0},
        Breakdown{
            "Definition", Method::GetParameter, 2, OMXI_ERR_GET_PORT_DEFINITION,
            std::string("E OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: ") + kRefusedText,
            0},
        Breakdown{
            "ThirdBuffer", Method::AllocateBufferWithBackup, 3, OMXI_ERR_ALLOCATE_MEMORY,
            "E OMXINTERFACE - Could not allocate memory: port 1 buffer 2 error -2147483648(0x80000000)\n",
            2}),
    [](const auto& test) { return std::string(test.param.name); });

// --- Memory and threads ---

TEST_F(EventThreadTest, AnEventWithoutMemoryIsLostWithALine) {
  startDecoder();
  const faults::FailedAllocation failed(sizeof(android::omx_message));
  handleEvent(OMX_EventBufferFlag, 1, 1);
  EXPECT_TRUE(failed.happened());
  handleEvent(OMX_EventBufferFlag, 2, 2);
  EXPECT_EQ(log(),
            (LogLines{"E OmxInterfaceDecoder::onOmxObserverEvent(const omx_message &message),Malloc null",
                      "E Unknown Event (4, 2, 2)"}));
}

TEST_F(EventThreadTest, DoesNotStartWithoutAnEventThread) {
  create();
  const size_t before = omx().count();
  {
    const faults::FailedThread failed;
    EXPECT_EQ(_session->init(), OMXI_ERR_CREATE_EVENT_THREAD);
    EXPECT_TRUE(failed.happened());
  }
  {
    const faults::FailedThread failed(2);
    EXPECT_EQ(_session->init(), OMXI_ERR_CREATE_OUTPUT_THREAD);
    EXPECT_TRUE(failed.happened());
  }
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(log(), LogLines{});
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
  const SemaphoreHook hook(_session->_semEventQueued, [&](SemaphoreCall call) {
    if (call != SemaphoreCall::Wait) return;
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
  const SemaphoreHook hook(_session->_semEventQueued, [&, session = &decoder()](SemaphoreCall call) {
    if (call == SemaphoreCall::Post && session->_eventThreadWaiting && !stopped.exchange(true)) gate.pass();
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
  EXPECT_FALSE(destroyed.isDone());
  gate.open();
  destroyed.result();
  EXPECT_EQ(sortedLog(), sorted({queueGone(290), kDecoderOver}));
}

TEST_F(EventThreadTest, EndsQuietlyOnceTheSessionIsOver) {
  startDecoder();
  finishStream();
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
  EXPECT_EQ(sortedLog(), sorted({kEndEvent, kDecoderOver}));
}

}  // namespace
}  // namespace omxtest
