// New output settings, and the end of the session in the middle of them.
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

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
    Later<int> ending = beginDeInit();
    waitForSleeper(&SessionState::outputReturnWaiters, failed ? 1 : 2);
    EXPECT_EQ(freed(), 0u);  // it may still be writing into them
    letMessagesCome();
    EXPECT_EQ(ending.result(), OMXI_ERR_EVENT_ERROR);
    EXPECT_EQ(freed(), kInputBuffers + kOutputBuffers);
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
    Later<int> ending = beginDeInit();
    requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
    EXPECT_EQ(commands().size(), enabled ? 2u : 1u);
    gate.open();
    EXPECT_EQ(ending.result(), OMXI_OK);
    EXPECT_EQ(freed(), kInputBuffers + (enabled ? 2 : 1) * kOutputBuffers);
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

TEST_F(SettingsEndTest, ThatCompleteBehindDeInitsCommandAreNoFailure) {
  // The component is in Idle already: in any other moment the wrong state for such a completion.
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

TEST_F(SettingsEndTest, ASettingAndTheWrappersEndExcludeEachOther) {
  // Deleted now, the wrapper would be used after its end. Whoever comes later is told that there is none.
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
  gate.open();
  EXPECT_NE(setting.result(), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(ending.result(), OMXI_OK);
}

}  // namespace
}  // namespace omxtest
