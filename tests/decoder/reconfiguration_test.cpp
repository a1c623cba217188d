// New output settings: the old buffers for new ones, whatever else goes on meanwhile; and the moments at
// which the session's threads meet then, each brought about on purpose.
#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kLargerBytes = 320 * 240 * 3 / 2;

class NewSettingsTest : public DecoderSessionTest {
 protected:
  // Gives the old buffers back with the disable, the new ones with the enable, and fills them.
  static Trace exchange(size_t first, size_t freed, size_t made, OMX_U32 bytes) {
    const auto place = [](size_t index) { return "out" + std::to_string(index); };
    Trace calls{"sendCommand disable 1", "getParameter definition of port 1"};
    for (size_t i = freed; i-- > 0;) calls.push_back("freeBuffer 1 " + place(first + i));
    calls.emplace_back("sendCommand enable 1");
    calls.emplace_back("getParameter definition of port 1");
    for (size_t i = 0; i < made; ++i) {
      calls.push_back("allocateBufferWithBackup " + place(first + freed + i) + " of " +
                      std::to_string(bytes));
    }
    for (size_t i = 0; i < made; ++i) calls.push_back("fillBuffer " + place(first + freed + i));
    return calls;
  }
  static Trace exchangeTwice(OMX_U32 bytes, OMX_U32 thenBytes) {
    Trace calls = exchange(0, kOutputBuffers, kOutputBuffers, bytes);
    const Trace more = exchange(kOutputBuffers, kOutputBuffers, kOutputBuffers, thenBytes);
    calls.insert(calls.end(), more.begin(), more.end());
    return calls;
  }
  OmxFrameSize outputSize() {
    const SessionState::Lock held(_session->_state->lock);
    return _session->_portFrameSize[1];
  }
  void expectDelivered(const std::string& text, OMX_U32 width) {
    feedThrough(text);
    EXPECT_EQ(pictures().back().output.bytes, text);
    EXPECT_EQ(pictures().back().info.width, width);
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
  // Until the port has come back that many times, with all its buffers at the component.
  void requireReconfigured(size_t times = 1) {
    require(messages().waitForDelivered(commandComplete(OMX_CommandPortEnable), times), "the port's return");
    waitForEvents();
    waitForBusy(1, kOutputBuffers);
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
  void requireTearingDown() {
    requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
  }
};

TEST_F(NewSettingsTest, ExchangeTheBuffers) {
  startDecoder();
  size_t first = 0;
  size_t former = kOutputBuffers;
  size_t fills = kOutputBuffers;
  for (const OMX_U32 count : {5u, 12u}) {
    SCOPED_TRACE(count);
    const size_t before = omx().count();
    script().announce([=](mediaserver::PortDefinition& port) {
      port.nBufferCountActual = count;
      port.nBufferSize = 150000 + count;
      port.format.video.nFrameWidth = 320 + count;
      port.format.video.nFrameHeight = 240;
    });
    fills += count;
    waitForFills(fills);
    waitForEvents();
    EXPECT_EQ(trace(before), exchange(first, former, count, 150000 + count));
    EXPECT_FALSE(_session->_portReconfiguring);
    EXPECT_EQ(outputSize().width, static_cast<int>(320 + count));
    EXPECT_EQ(outputSize().height, 240);
    expectDelivered("a picture", 320 + count);
    first += former;
    former = count;
    waitForFills(++fills);
  }
  EXPECT_EQ(log(), LogLines{});
  endOfStream();
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
}

TEST_F(NewSettingsTest, KeepTheFormerSizeWhenTheNewOneIsNotTold) {
  startDecoder();
  omx().fail(Method::GetParameter);
  const OmxFrameSize former = outputSize();
  // The component is quicker than the call that disables the port: a wait for the next buffer would not end.
  omx().after(Method::SendCommand, [this](const Call& call) {
    if (call.command == OMX_CommandPortDisable) waitForBusy(1, 0);
  });
  script().announce(320, 240);
  waitForFills(2 * kOutputBuffers);
  EXPECT_EQ(outputSize().width, former.width);
  expectDelivered("a picture", 320);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(NewSettingsTest, AreCarriedOutOneAfterTheOther) {
  startDecoder();
  size_t before = omx().count();
  script().announce(320, 240);
  script().announce(640, 480);
  waitForFills(3 * kOutputBuffers);
  EXPECT_EQ(trace(before), exchangeTwice(kLargerBytes, 640 * 480 * 3 / 2));
  expectDelivered("a picture", 640);
  destroy();
  // While the first ones wait for the buffers; while the port is being enabled. Handled at once, the second
  // would disable a port whose enable is under way; dropped, the pictures would come in buffers of the wrong
  // size. One more round does for two announcements.
  for (const Match& held : {fillBufferDone(), commandComplete(OMX_CommandPortEnable)}) {
    omx().clearCalls();
    startDecoder();
    before = omx().count();
    messages().hold(held);
    script().announce(320, 240);
    require(messages().waitForHeld(1), "what is held");
    deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
    deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
    letMessagesCome();
    waitForFills(3 * kOutputBuffers);
    EXPECT_EQ(trace(before), exchangeTwice(kLargerBytes, kLargerBytes));
    expectDelivered("a picture", 320);
    destroy();
  }
  EXPECT_EQ(_server.leaks(), "");
}

TEST_F(NewSettingsTest, DoNotHoldUpTheEndBehindThem) {
  startDecoder();
  script().holdOutput();
  ASSERT_EQ(feed("the last picture of the old size"), 0);
  requireEventually([this] { return script().waiting() == 1; }, "the picture");
  script().announce(320, 240);
  ASSERT_EQ(feed("the only one of the new size"), 0);
  ASSERT_EQ(beginEndOfInput().result(), 0);
  script().passOutput();
  EXPECT_EQ(deInit(), OMXI_OK);
  ASSERT_EQ(pictures().size(), 2u);
  EXPECT_EQ(pictures()[0].info.width, 176u);
  EXPECT_EQ(pictures()[1].info.width, 320u);
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
}

TEST_F(NewSettingsTest, WaitForThePicturesOfTheOldSize) {
  // All buffers are back, but the last ones are queued behind a slow callback. Freeing the port empties that
  // queue: the pictures would be lost, and with the last of them the end of the stream. Another event
  // that comes meanwhile does not block the thread that brings the buffers; its turn comes afterwards.
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
  require(messages().waitForDelivered(eventIs(OMX_EventBufferFlag)), "the end mark's event");
  waitForEvents();
  _log.clear();
  announceAndDisable();
  deliverEvent(OMX_EventBufferFlag, 1, 16);
  requireEventually([this] { return _session->portBuffersHaveBeenReturned(1); }, "the buffers");
  requireAsleepForBuffers();
  EXPECT_EQ(freed(), 0u);
  EXPECT_EQ(log(), LogLines{});
  gate.open();
  require(messages().waitForDelivered(commandComplete(OMX_CommandPortEnable), 1), "the port's return");
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"first", "second", "last"}));
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
  EXPECT_EQ(sortedLog(), sorted({"E Unknown Event (4, 1, 16)", kDecoderOver}));
}

TEST_F(NewSettingsTest, WaitForARefillThatIsUnderWay) {
  // The output thread has found the port as it was and is about to give a buffer back when the change comes.
  // Freed in that moment the component would get a buffer that is gone; and when the component refuses it,
  // as it must, somebody has to wake the event thread, which waits for just that buffer.
  startDecoder();
  Gate& gate = newGate();
  omx().before(Method::FillBuffer, [&](const Call&) { gate.pass(); });
  ASSERT_EQ(feed("picture"), 0);
  gate.waitForArrival();
  announceAndDisable();
  waitForBusy(1, 1);
  requireAsleepForBuffers();
  EXPECT_EQ(freed(), 0u);
  gate.open();
  requireReconfigured();
  EXPECT_EQ(freed(), kOutputBuffers);
  EXPECT_EQ(log(), LogLines{std::string("E OMXINTERFACE - fillBuffer failed w/ error ") + kRefusedHex});
}

TEST_F(NewSettingsTest, LetNobodyFindARecordInBetween) {
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
    waitForBusy(0, 0);
  };
  script().onInput([](const Packet&) { return std::vector<Packet>(); });
  omx().before(Method::FreeBuffer, disturb);
  omx().before(Method::AllocateBufferWithBackup, disturb);
  script().announce(352, 288);
  requireReconfigured();
  EXPECT_EQ(omx().count(Method::FillBuffer), 2 * kOutputBuffers);
  EXPECT_FALSE(_session->_endOfOutputReached);
  EXPECT_EQ(pictures().size(), 0u);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(NewSettingsTest, DoNotWaitForAnOutputThreadThatHasEnded) {
  // What is queued after the end of the stream is delivered by nobody: a reconfiguration that waited for it
  // would wait for ever.
  startDecoder();
  endOfOutput();
  waitForOutputThreadToEnd();
  componentProduces("behind the end");
  require(messages().waitForDelivered(fillBufferDone(), 2), "the picture");
  script().announce(352, 288);
  requireReconfigured();
  EXPECT_EQ(pictures().size(), 0u);
}

TEST_F(NewSettingsTest, DoNotWaitForTheBuffersOfAFailedComponent) {
  // It never returns them. The error event waits behind the change that waits for them; and then deInit()
  // waits for them, or destruction ends its wait.
  for (const bool destroyed : {false, true}) {
    startDecoder();
    omx().clearCalls();
    messages().hold(fillBufferDone());
    announceAndDisable();
    waitForSleeper(&SessionState::outputReturnWaiters);
    if (destroyed) {
      destroy();
      EXPECT_EQ(trace().back(), "freeNode");
    } else {
      deliverEvent(OMX_EventError, 0x80001009, 0);
      waitForEvents();
      EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
      Later<int> ending = beginDeInit();
      waitForSleeper(&SessionState::outputReturnWaiters);
      EXPECT_EQ(freed(), 0u);  // it may still be writing into them
      letMessagesCome();
      EXPECT_EQ(ending.result(), OMXI_ERR_EVENT_ERROR);
      EXPECT_EQ(freed(), kInputBuffers + kOutputBuffers);
      destroy();
    }
    messages().passAll();
  }
}

TEST_F(NewSettingsTest, AndDeInitAreBothWokenByTheBuffers) {
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
  letMessagesCome();
  EXPECT_EQ(ending.result(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(freed(), kInputBuffers + kOutputBuffers);
  EXPECT_EQ(commands().back(), "sendCommand state 1");
}

TEST_F(NewSettingsTest, FinishAStepOfCallsBeforeDeInitGoesOn) {
  // The enable has gone out and the new buffers are being made when deInit() comes. A command to go Idle in
  // the middle would have the component take buffers in a state in which it takes none, and deInit() would
  // free a table that is being filled. Or the event thread is in the middle of freeing the port when
  // deInit(), which has seen all buffers back, comes to free it too.
  for (const Method method : {Method::AllocateBufferWithBackup, Method::FreeBuffer}) {
    const bool enabled = method == Method::AllocateBufferWithBackup;
    startDecoder();
    endOfOutput();
    omx().clearCalls();
    Gate& gate = newGate();
    omx().before(method, [&](const Call&) { gate.pass(); });
    script().announce(352, 288);
    gate.waitForArrival();
    Later<int> ending = beginDeInit();
    requireTearingDown();
    EXPECT_EQ(commands().size(), enabled ? 2u : 1u);
    gate.open();
    EXPECT_EQ(ending.result(), OMXI_OK);
    EXPECT_EQ(freed(), kInputBuffers + (enabled ? 2 : 1) * kOutputBuffers);
    Trace expected{"sendCommand disable 1", "sendCommand state 2", "sendCommand state 1"};
    if (enabled) expected.insert(expected.begin() + 1, "sendCommand enable 1");
    EXPECT_EQ(commands(), expected);
    destroy();
    omx().before(method, nullptr);
  }
}

TEST_F(NewSettingsTest, BeginNoFurtherStepOnceDeInitHasBegun) {
  // The disable completes after deInit() has begun. An enable now would follow the command to go Idle, and
  // the port would get buffers that deInit() does not free.
  startDecoder();
  endOfOutput();
  messages().hold(commandComplete(OMX_CommandPortDisable));
  script().announce(352, 288);
  require(messages().waitForHeld(1), "the completed disable");
  omx().clearCalls();
  messages().hold(commandComplete(OMX_CommandStateSet, OMX_StateIdle));
  Later<int> ending = beginDeInit();
  require(messages().waitForHeld(2), "the component's way to Idle");
  EXPECT_TRUE(messages().release(0));
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);  // nor a new reconfiguration
  waitForEvents();
  EXPECT_TRUE(messages().release(0));
  EXPECT_EQ(ending.result(), OMXI_OK);
  EXPECT_EQ(commands(), (Trace{"sendCommand state 2", "sendCommand state 1"}));
  messages().passAll();
}

TEST_F(NewSettingsTest, ThatCompleteBehindDeInitsCommandAreNoFailure) {
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
    letMessagesCome();
    require(messages().waitForDelivered(commandComplete(command), 1), "the completion");
    waitForEvents();
    gate.open();
    EXPECT_EQ(ending.result(), OMXI_OK);
    destroy();
    omx().before(Method::SendCommand, nullptr);
  }
}

TEST_F(NewSettingsTest, FinishTheCallThatTheyAreInBeforeTheSessionIsDestroyed) {
  for (const Method method : {Method::SendCommand, Method::FreeBuffer, Method::AllocateBufferWithBackup}) {
    startDecoder();
    Gate& gate = newGate();
    omx().before(method, [&](const Call&) { gate.pass(); });
    script().announce(352, 288);
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    gate.open();
    destroyed.result();
    omx().before(method, nullptr);
    EXPECT_EQ(trace().back(), "freeNode");
    messages().forgetFreedNodes();
  }
}

}  // namespace
}  // namespace omxtest
