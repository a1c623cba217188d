// Moments at which the threads of a decoding session meet during a reconfiguration of its output port, each
// brought about on purpose.
#include "core/session_state.h"
#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

class DecoderInterleavingTest : public DecoderSessionTest {
 protected:
  // The end of a stream comes out of a component that goes on executing.
  void endOfOutput() {
    componentProduces("", 0, OMX_BUFFERFLAG_EOS);
    requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
  }
  // New settings, told by the test at the moment of its choice, and the session's answer: the command to
  // disable the port has gone out.
  void announceAndDisable() {
    deliverEvent(OMX_EventPortSettingsChanged, kOmxOutputPort, 0);
    requireEventually([this] { return sent(OMX_CommandPortDisable) > 0; }, "the command to disable the port");
  }
  size_t sent(OMX_COMMANDTYPE command) {
    size_t count = 0;
    for (const Call& call : omx().calls(Method::SendCommand)) count += call.command == command ? 1 : 0;
    return count;
  }
  // Until the port has come back that many times, with all its buffers at the component.
  void requireReconfigured(size_t times = 1) {
    require(messages().waitForDelivered(commandComplete(OMX_CommandPortEnable), times),
            "the port's return from its reconfiguration");
    waitForEvents();
    requireEventually([this] { return busyCount(kOmxOutputPort) == kOutputBuffers; }, "the new buffers");
  }
  // The event thread has looked at every wake-up so far, and sleeps.
  void requireAsleepForBuffers() {
    requireEventually(
        [this] {
          // The lock only once it is worth it: a test that keeps asking keeps the event thread from it.
          if (valueOf(_session->_semOutputBuffersReturned) != 0) return false;
          const SessionState::Lock held(_session->_state->lock);
          return _session->_state->outputReturnWaiters == 1;
        },
        "an event thread that waits for the output buffers");
  }
  template <typename Condition>
  void requireUnderLock(Condition condition, const char* what) {
    requireEventually(
        [&] {
          const SessionState::Lock held(_session->_state->lock);
          return condition(*_session->_state);
        },
        what);
  }
  std::vector<std::string> pictureTexts() const {
    std::vector<std::string> texts;
    for (const Picture& picture : pictures()) texts.push_back(picture.output.bytes);
    return texts;
  }
};

TEST_F(DecoderInterleavingTest, AnotherEventDoesNotBlockTheThreadThatBringsTheBuffers) {
  // The event thread waits for the buffers while the delivery thread queues another event. If queueing had
  // to wait for the event in progress, the buffers behind it would never come.
  startDecoder();
  messages().hold(fillBufferDone());
  announceAndDisable();
  waitForSleeper(&SessionState::outputReturnWaiters);
  deliverEvent(OMX_EventBufferFlag, 1, 16);
  EXPECT_EQ(log(), LogLines{});  // its turn comes afterwards
  messages().passAll();
  messages().releaseAll();
  requireReconfigured();
  EXPECT_EQ(log(), LogLines{"E Unknown Event (4, 1, 16)"});
}

TEST_F(DecoderInterleavingTest, SettingsThatChangeAgainMeanwhileAreCarriedOutAfterwards) {
  // Handled at once, the second change would disable a port whose enable is under way; dropped, the pictures
  // would come in buffers of the wrong size.
  startDecoder();
  const auto commands = [this] {
    std::vector<std::string> lines;
    for (const std::string& line : trace()) {
      if (line.find("able 1") != line.npos) lines.push_back(line);
    }
    return lines;
  };
  Gate& gate = newGate();
  omx().before(Method::AllocateBufferWithBackup, [&](const Call&) { gate.pass(); });
  script().announce(352, 288);
  gate.waitForArrival();
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);  // one more round does for both
  gate.open();
  requireReconfigured(2);
  EXPECT_EQ(commands(), (Trace{"sendCommand disable 1", "sendCommand enable 1", "sendCommand disable 1",
                               "sendCommand enable 1"}));
  EXPECT_EQ(omx().count(Method::FreeBuffer), 2 * kOutputBuffers);
  feedThrough("picture");
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(DecoderInterleavingTest, ARefillThatIsUnderWayKeepsItsBuffer) {
  // The output thread has found the port as it was and is about to give a buffer back when the change comes.
  // Freed in that moment the component would get a buffer that is gone; and when the component refuses it,
  // as it must, somebody has to wake the event thread, which waits for just that buffer.
  startDecoder();
  Gate& gate = newGate();
  omx().before(Method::FillBuffer, [&](const Call&) { gate.pass(); });
  ASSERT_EQ(feed("picture"), 0);
  gate.waitForArrival();
  announceAndDisable();
  requireEventually([this] { return busyCount(kOmxOutputPort) == 1; }, "the other buffers");
  requireAsleepForBuffers();
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  gate.open();
  requireReconfigured();
  EXPECT_EQ(omx().count(Method::FreeBuffer), kOutputBuffers);
  EXPECT_EQ(log(), LogLines{std::string("E OMXINTERFACE - fillBuffer failed w/ error ") + kRefusedHex});
}

TEST_F(DecoderInterleavingTest, NobodyFindsARecordOfThePortInBetween) {
  // While the event thread frees and makes the buffers, record by record, the application gives buffers back
  // and the server repeats itself. Whoever used a record on its way out, or one that the enable has not come
  // to yet, would use freed memory or hand the component a buffer too early.
  startDecoder();
  std::vector<void*> ids;
  for (size_t i = 0; i < kOutputBuffers; ++i) ids.push_back(bufferId(1, i));
  const auto disturb = [&](const Call&) {
    for (void* id : ids) {
      _session->returnIomxOutputBuffer(id);
      deliver(makeFillBufferDone(id, 1, OMX_BUFFERFLAG_EOS));
    }
    EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
    EXPECT_EQ(feed(""), 0);  // the input port goes on
    requireEventually([this] { return busyCount(kOmxInputPort) == 0; }, "the input buffer");
  };
  script().onInput([](const Packet&) { return std::vector<Packet>(); });
  omx().before(Method::FreeBuffer, disturb);
  omx().before(Method::AllocateBufferWithBackup, disturb);
  const size_t fills = omx().count(Method::FillBuffer);
  script().announce(352, 288);
  requireReconfigured();
  EXPECT_EQ(omx().count(Method::FillBuffer), fills + kOutputBuffers);
  EXPECT_FALSE(_session->_endOfOutputReached);
  EXPECT_EQ(pictures().size(), 0u);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(DecoderInterleavingTest, ThePicturesOfTheOldSizeAreDeliveredBeforeTheirBuffersGo) {
  // All buffers are back, but the last ones are queued behind a slow callback. Freeing the port empties that
  // queue: the pictures would be lost, and with the last of them the end of the stream.
  startDecoder();
  Gate& gate = newGate();
  _application.onOutput([&](const Output& output) {
    if (output.bytes == "first") gate.pass();
    return 0;
  });
  componentProduces("first");
  gate.waitForArrival();
  componentProduces("second");
  componentProduces("last", 0, OMX_BUFFERFLAG_EOS);
  require(messages().waitForDelivered(fillBufferDone(), 3), "the pictures");
  announceAndDisable();
  requireEventually([this] { return _session->portBuffersHaveBeenReturned(1); }, "the buffers");
  requireAsleepForBuffers();
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  gate.open();
  require(messages().waitForDelivered(commandComplete(OMX_CommandPortEnable), 1), "the port's return");
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"first", "second", "last"}));
  EXPECT_TRUE(_session->_endOfOutputReached);
  EXPECT_EQ(deInit(), OMXI_OK);
}

TEST_F(DecoderInterleavingTest, NobodyWaitsForAnOutputThreadThatHasEnded) {
  // What is queued after the end of the stream is delivered by nobody: a reconfiguration that waited for it
  // would wait for ever.
  startDecoder();
  endOfOutput();
  requireUnderLock([](SessionState& state) { return !state.outputThread.running; },
                   "the output thread's end");
  componentProduces("behind the end");
  require(messages().waitForDelivered(fillBufferDone(), 2), "the picture");
  script().announce(352, 288);
  requireReconfigured();
  EXPECT_EQ(pictures().size(), 0u);
}

TEST_F(DecoderInterleavingTest, BothThatWaitForTheBuffersAreWoken) {
  // The event thread waits for the buffers, and then deInit() does too. There is one post when the last one
  // comes: whoever took it and went would leave the other asleep. And both free the port: each buffer may be
  // freed once only.
  startDecoder();
  messages().hold(fillBufferDone());
  announceAndDisable();
  waitForSleeper(&SessionState::outputReturnWaiters, 1);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::outputReturnWaiters, 2);
  messages().passAll();
  messages().releaseAll();
  EXPECT_EQ(ending.result(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputBuffers + kOutputBuffers);
  EXPECT_EQ(sent(OMX_CommandPortEnable), 0u);
}

TEST_F(DecoderInterleavingTest, DeInitLetsAStepOfCallsFinish) {
  // The enable has gone out and the new buffers are being made when deInit() comes. A command to go Idle in
  // the middle would have the component take buffers in a state in which it takes none, and deInit() would
  // free a table that is being filled.
  startDecoder();
  endOfOutput();
  Gate& gate = newGate();
  omx().before(Method::AllocateBufferWithBackup, [&](const Call&) { gate.pass(); });
  script().announce(352, 288);
  gate.waitForArrival();
  Later<int> ending = beginDeInit();
  requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
  EXPECT_EQ(sent(OMX_CommandStateSet), 2u);  // those of init()
  gate.open();
  EXPECT_EQ(ending.result(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputBuffers + 2 * kOutputBuffers);
  std::vector<std::string> order;
  for (const std::string& line : trace()) {
    if (line.find("sendCommand") == 0) order.push_back(line);
  }
  EXPECT_EQ(order, (Trace{"sendCommand state 2", "sendCommand state 3", "sendCommand disable 1",
                          "sendCommand enable 1", "sendCommand state 2", "sendCommand state 1"}));
}

TEST_F(DecoderInterleavingTest, DeInitLetsNoFurtherStepBegin) {
  // The disable completes after deInit() has begun. An enable now would follow the command to go Idle, and
  // the port would get buffers that deInit() does not free.
  startDecoder();
  endOfOutput();
  messages().hold(commandComplete(OMX_CommandPortDisable));
  script().announce(352, 288);
  require(messages().waitForHeld(1), "the completed disable");
  messages().hold(commandComplete(OMX_CommandStateSet, OMX_StateIdle));
  Later<int> ending = beginDeInit();
  require(messages().waitForHeld(2), "the component's way to Idle");
  EXPECT_TRUE(messages().release(0));
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);  // nor a new reconfiguration
  waitForEvents();
  EXPECT_EQ(sent(OMX_CommandPortEnable), 0u);
  EXPECT_EQ(sent(OMX_CommandPortDisable), 1u);
  EXPECT_TRUE(messages().release(0));
  EXPECT_EQ(ending.result(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputBuffers + kOutputBuffers);
  messages().passAll();
}

TEST_F(DecoderInterleavingTest, WhatCompletesBehindDeInitsCommandIsNoFailure) {
  // The component is in Idle already when the event thread comes to a completed disable or enable. In any
  // other moment that would be the wrong state for it; here it would make a session that ended well fail.
  for (const OMX_COMMANDTYPE command : {OMX_CommandPortDisable, OMX_CommandPortEnable}) {
    startDecoder();
    endOfOutput();
    messages().hold(commandComplete(command));
    script().announce(352, 288);
    require(messages().waitForHeld(1), "the completion");
    Gate& gate = newGate();
    omx().before(Method::SendCommand, [&](const Call& call) {
      if (call.param == OMX_StateLoaded && call.command == OMX_CommandStateSet) gate.pass();
    });
    Later<int> ending = beginDeInit();
    gate.waitForArrival();
    EXPECT_EQ(_session->_omxState, OMX_StateIdle);
    messages().passAll();
    messages().releaseAll();
    require(messages().waitForDelivered(commandComplete(command), 1), "the completion");
    waitForEvents();
    gate.open();
    EXPECT_EQ(ending.result(), OMXI_OK);
    destroy();
    omx().before(Method::SendCommand, nullptr);
  }
}

TEST_F(DecoderInterleavingTest, DeInitFreesAfterTheEventInProgressHasReturned) {
  // The event thread is in the middle of freeing the port when deInit(), which has seen all buffers back,
  // comes to free it too.
  startDecoder();
  endOfOutput();
  Gate& gate = newGate();
  omx().before(Method::FreeBuffer, [&](const Call&) { gate.pass(); });
  script().announce(352, 288);
  gate.waitForArrival();
  Later<int> ending = beginDeInit();
  requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
  gate.open();
  EXPECT_EQ(ending.result(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputBuffers + kOutputBuffers);
  EXPECT_EQ(sent(OMX_CommandPortEnable), 0u);
}

TEST_F(DecoderInterleavingTest, AFailedComponentsBuffersAreNotWaitedFor) {
  // It never returns them. The error event waits behind the change that waits for them.
  startDecoder();
  messages().hold(fillBufferDone());
  announceAndDisable();
  waitForSleeper(&SessionState::outputReturnWaiters);
  deliverEvent(OMX_EventError, 0x80001009, 0);
  waitForEvents();
  EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);  // it may still be writing into them
  messages().passAll();
  messages().releaseAll();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
}

TEST_F(DecoderInterleavingTest, ASettingAndTheWrappersEndExcludeEachOther) {
  // A setting is on its way to the component when deInit() comes to delete the wrapper: deleted now, it
  // would be used after its end. Whoever comes later is told that there is none.
  startDecoder();
  endOfOutput();
  Gate& gate = newGate();
  omx().before(Method::SetParameter, [&](const Call&) { gate.pass(); });
  Later<int> setting("setPictureOrder()", [this] { return decoder().setPictureOrder(0); });
  gate.waitForArrival();
  Later<int> ending = beginDeInit();
  requireUnderLock([this](SessionState&) { return _session->_platformWrapper == nullptr; },
                   "the wrapper's removal");
  EXPECT_FALSE(ending.isDone());
  EXPECT_EQ(decoder().setPictureOrder(1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(decoder().setInputPackingFormat(1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(decoder().setOutputColorFormat(0), OMXI_ERR_NO_PLATFORM_WRAPPER);
  gate.open();
  EXPECT_NE(setting.result(), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(ending.result(), OMXI_OK);
}

// --- Destruction
// --------------------------------------------------------------------------------------------- Each of these
// would hang, or go on in freed memory, if destruction did not end every wait, let everyone leave, and only
// then free anything.

using DecoderDestructionTest = DecoderInterleavingTest;

TEST_F(DecoderDestructionTest, EndsAReconfigurationThatWaitsForItsBuffers) {
  startDecoder();
  messages().hold(fillBufferDone());
  announceAndDisable();
  waitForSleeper(&SessionState::outputReturnWaiters);
  destroy();
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  EXPECT_EQ(trace().back(), "freeNode");
  messages().releaseAll();  // late
}

TEST_F(DecoderDestructionTest, LetsAReconfigurationFinishTheCallThatItIsIn) {
  for (const Method method : {Method::SendCommand, Method::FreeBuffer, Method::AllocateBufferWithBackup}) {
    startDecoder();
    Gate& gate = newGate();
    omx().before(method, [&](const Call&) { gate.pass(); });
    script().announce(352, 288);
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    EXPECT_FALSE(destroyed.isDone());
    gate.open();
    destroyed.result();
    omx().before(method, nullptr);
    EXPECT_EQ(trace().back(), "freeNode");
    messages().forgetFreedNodes();
  }
}

TEST_F(DecoderDestructionTest, ReachesAThreadThatIsStartedMeanwhile) {
  // A second init() is about to start threads when destruction has woken and ended those of the first one.
  // The new ones must look for themselves: nobody will wake them again.
  create();
  omx().fail(Method::SendCommand);
  ASSERT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  deliverEvent(OMX_EventError, 1, 2);
  requireUnderLock([](SessionState& state) { return !state.eventThread.running; }, "the event thread's end");
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
