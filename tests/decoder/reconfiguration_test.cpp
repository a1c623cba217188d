// New output settings: the old buffers for new ones, whatever else goes on meanwhile; and the moments at
// which the session's threads meet then, each brought about on purpose, also at the session's end.
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kLargerBytes = 320 * 240 * 3 / 2;

class NewSettingsTest : public DecoderSessionTest {
 protected:
  // Gives the old buffers back with the disable, the new ones with the enable, and fills them.
  static Trace exchange(size_t first, size_t freed, size_t made, OMX_U32 bytes) {
    const auto place = [](size_t index) { return "out" + std::to_string(index); };
    const std::string make = "allocateBufferWithBackup ";
    Trace calls{"sendCommand disable 1", "getParameter 2000001 port 1"};
    for (size_t i = first + freed; i-- > first;) calls.push_back("freeBuffer 1 " + place(i));
    calls.insert(calls.end(), {"sendCommand enable 1", "getParameter 2000001 port 1"});
    const size_t end = first + freed + made;
    for (size_t i = end - made; i < end; ++i)
      calls.push_back(make + place(i) + " of " + std::to_string(bytes));
    for (size_t i = end - made; i < end; ++i) calls.push_back("fillBuffer " + place(i));
    return calls;
  }
  // The calls since `before` are two exchanges of all buffers.
  void expectTwoExchanges(size_t before, OMX_U32 thenBytes) {
    waitForFills(3 * kOutputBuffers);
    Trace calls = exchange(0, kOutputBuffers, kOutputBuffers, kLargerBytes);
    const Trace second = exchange(kOutputBuffers, kOutputBuffers, kOutputBuffers, thenBytes);
    calls.insert(calls.end(), second.begin(), second.end());
    EXPECT_EQ(trace(before), calls);
  }
  void expectDelivered(const std::string& text, OMX_U32 width) {
    feedThrough(text);
    EXPECT_EQ(_application.outputs().back().bytes, text);
    EXPECT_EQ(_application.outputs().back().info.width, width);
  }
};

TEST_F(NewSettingsTest, ExchangeTheBuffers) {
  startDecoder();
  size_t first = 0;
  size_t former = kOutputBuffers;
  size_t fills = kOutputBuffers;
  for (const OMX_U32 count : {5u, 12u}) {
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
    EXPECT_EQ(_session->_portFrameSize[1].width, static_cast<int>(320 + count));
    EXPECT_EQ(_session->_portFrameSize[1].height, 240);
    expectDelivered("a picture", 320 + count);
    first += former;
    former = count;
    waitForFills(++fills);
  }
  EXPECT_EQ(log(), LogLines{});
  endOfStream();
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
}

TEST_F(NewSettingsTest, AreCarriedOutOneAfterTheOther) {
  startDecoder();
  // The component is quicker than the call that disables the port: a wait for the next buffer would not
  // end.
  omx().after(Method::SendCommand, [this](const Call& call) {
    if (call.command == OMX_CommandPortDisable) waitForBusy(1, 0);
  });
  size_t before = omx().count();
  script().announce(320, 240);
  script().announce(640, 480);
  expectTwoExchanges(before, 640 * 480 * 3 / 2);
  expectDelivered("a picture", 640);
  omx().after(Method::SendCommand, nullptr);
  destroy();
  // While the first ones wait for the buffers; while the port is being enabled. One more round does for two.
  for (const Match& held : {fillBufferDone(), commandComplete(OMX_CommandPortEnable)}) {
    omx().clearCalls();
    startDecoder();
    before = omx().count();
    messages().hold(held);
    script().announce(320, 240);
    require(messages().waitForHeld(1), "what is held");
    deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
    deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
    messages().passAll();
    expectTwoExchanges(before, kLargerBytes);
    expectDelivered("a picture", 320);
    destroy();
  }
}

TEST_F(NewSettingsTest, WaitForThePicturesOfTheOldSize) {
  // Freeing the port empties the queue behind a slow callback, with the end of the stream in it. Another
  // event that comes meanwhile does not block the thread that brings the buffers.
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
  waitForSleeper(&SessionState::outputReturnWaiters);
  EXPECT_EQ(freed(), 0u);
  EXPECT_EQ(log(), LogLines{});
  gate.open();
  require(messages().waitForDelivered(commandComplete(OMX_CommandPortEnable)), "the port's return");
  waitForEvents();  // the new buffers have been sent, before the component goes idle and refuses them
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"first", "second", "last"}));
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
  EXPECT_TRUE(_log.waitFor("Unknown Event (4, 1, 16)"));
  EXPECT_EQ(log().size(), 2u);  // with the output thread's end
}

// --- The end of the session in the middle of them ---

using SettingsEndTest = DecoderSessionTest;

TEST_F(SettingsEndTest, AndDeInitAreBothWokenByTheBuffersAlsoOfAFailedComponent) {
  // There is one post when the last one comes: whoever took it and went would leave the other asleep. And
  // both free the port: each buffer may be freed once only. A failed component's buffers, which may never
  // come, only deInit() waits for.
  for (const bool failed : {false, true}) {
    startDecoder();
    omx().clearCalls();
    messages().hold(fillBufferDone());
    announceAndDisable();
    waitForSleeper(&SessionState::outputReturnWaiters);
    if (failed) {
      handleEvent(OMX_EventError, 0x80001009, 0);
    } else {
      _session->setThreadError(OMXI_ERR_EVENT_ERROR);
    }
    Later ending = beginDeInit();
    waitForSleeper(&SessionState::outputReturnWaiters, failed ? 1 : 2);
    EXPECT_EQ(freed(), 0u);  // it may still be writing into them
    messages().passAll();
    EXPECT_EQ(ending.result(), OMXI_ERR_EVENT_ERROR);
    EXPECT_EQ(freed(), kInputs + kOutputBuffers);
    EXPECT_EQ(commands().back(), "sendCommand state 1");
    destroy();
  }
}

TEST_F(SettingsEndTest, FinishAStepOfCallsBeforeDeInitGoesOn) {
  // A command to go Idle while the new buffers are made or filled would have the component take buffers in a
  // state in which it takes none; and deInit() must not free the port while the event thread does.
  for (const Method method : {Method::AllocateBufferWithBackup, Method::FillBuffer, Method::FreeBuffer}) {
    const bool enabled = method != Method::FreeBuffer;
    startDecoder();
    endOfOutput();
    omx().clearCalls();
    Gate& gate = newGate();
    omx().before(method, [&](const Call&) { gate.pass(); });
    script().announce(352, 288);
    gate.waitForArrival();
    Later ending = beginDeInit();
    requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
    EXPECT_EQ(commands().size(), enabled ? 2u : 1u);
    gate.open();
    EXPECT_EQ(ending.result(), OMXI_OK);
    EXPECT_EQ(freed(), kInputs + (enabled ? 2 : 1) * kOutputBuffers);
    Trace expected{"sendCommand disable 1", "sendCommand state 2", "sendCommand state 1"};
    if (enabled) expected.insert(expected.begin() + 1, "sendCommand enable 1");
    EXPECT_EQ(commands(), expected);
    for (const std::string& line : log()) EXPECT_EQ(line.find("fillBuffer failed"), line.npos) << line;
    destroy();
    omx().before(method, nullptr);
  }
}

TEST_F(SettingsEndTest, BeginNoFurtherStepOnceDeInitHasBegun) {
  // An enable now would follow the command to go Idle, and deInit() would not free the port's new buffers.
  // What completes in Idle is no failure, although that is the wrong state for it at any other moment.
  for (const OMX_COMMANDTYPE command : {OMX_CommandPortDisable, OMX_CommandPortEnable}) {
    startDecoder();
    endOfOutput();
    messages().hold(commandComplete(command));
    script().announce(352, 288);
    require(messages().waitForHeld(1), "the completion");
    omx().clearCalls();
    messages().hold(commandComplete(OMX_CommandStateSet));
    Later ending = beginDeInit();
    require(messages().waitForHeld(2), "the component's way to Idle");
    EXPECT_TRUE(messages().release(1));
    require(messages().waitForHeld(2), "the component's way to Loaded");
    EXPECT_TRUE(messages().release(0));
    waitForEvents();
    messages().passAll();
    EXPECT_EQ(ending.result(), OMXI_OK);
    EXPECT_EQ(commands(), (Trace{"sendCommand state 2", "sendCommand state 1"}));
    destroy();
  }
}

}  // namespace
}  // namespace omxtest
