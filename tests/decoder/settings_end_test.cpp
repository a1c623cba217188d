// New output settings, and the end of the session in the middle of them.
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

class SettingsEndTest : public DecoderSessionTest {
 protected:
  void requireTearingDown() {
    requireUnderLock([](SessionState& state) { return state.tearingDown; }, "deInit()'s first step");
  }
};

TEST_F(SettingsEndTest, DoNotWaitForTheBuffersOfAFailedComponent) {
  // It never returns them. The error event waits behind the change that waits for them; and then deInit()
  // waits for them.
  startDecoder();
  messages().hold(fillBufferDone());
  announceAndDisable();
  waitForSleeper(&SessionState::outputReturnWaiters);
  deliverEvent(OMX_EventError, 0x80001009, 0);
  waitForEvents();
  EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::outputReturnWaiters);
  EXPECT_EQ(freed(), 0u);  // it may still be writing into them
  letMessagesCome();
  EXPECT_EQ(ending.result(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(freed(), kInputBuffers + kOutputBuffers);
}

TEST_F(SettingsEndTest, AndDeInitAreBothWokenByTheBuffers) {
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

TEST_F(SettingsEndTest, FinishAStepOfCallsBeforeDeInitGoesOn) {
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

TEST_F(SettingsEndTest, BeginNoFurtherStepOnceDeInitHasBegun) {
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

TEST_F(SettingsEndTest, ThatCompleteBehindDeInitsCommandAreNoFailure) {
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

TEST_F(SettingsEndTest, ASettingAndTheWrappersEndExcludeEachOther) {
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

}  // namespace
}  // namespace omxtest
