// The way to the component, and what comes back through the observer; init() and deInit(): what they wait
// for, what a refusal leaves behind, and destruction while others are inside, which ends every wait, lets
// everyone leave, and only then frees anything.
#include <omxhost/services.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using faults::Failing;

class LifecycleTest : public SessionTest {
 protected:
  // The session as such, with an encoder's component and no way to it.
  void construct() {
    _session = std::make_unique<OmxInterface>();
    _session->_isEncoder = true;
  }
};

TEST_F(LifecycleTest, LeavesTheRestOfAFailedSetUpToDestruction) {
  const std::tuple<Failing, size_t, int> cases[] = {
      {Failing::Memory, sizeof(CQcomBoardPlatformWrapper), OMXI_ERR_NO_PLATFORM_WRAPPER},
      {Failing::Thread, 1, OMXI_ERR_ALLOCATE_COMPONENT}};  // of the node
  for (const auto& [function, number, code] : cases) {
    construct();
    const faults::Fault failed(function, number);
    EXPECT_EQ(_session->setupIOMXConnections(), code);
    destroy();
  }
  EXPECT_TRUE(omxhost::isThreadPoolStarted());
  EXPECT_EQ(trace(), (Trace{"listNodes", "allocateNode OMX.qcom.video.encoder.avc", "freeNode", "listNodes",
                            "allocateNode OMX.qcom.video.encoder.avc failed"}));
  for (const size_t thread : {1u, 2u}) {
    ASSERT_EQ(createDecoder(), OMXI_OK);
    const faults::Fault failed(Failing::Thread, thread);
    EXPECT_EQ(_session->init(), thread == 1 ? OMXI_ERR_CREATE_EVENT_THREAD : OMXI_ERR_CREATE_OUTPUT_THREAD);
    destroy();
  }
}

TEST_F(LifecycleTest, WaitsForEachStateThatItAsksFor) {
  ASSERT_EQ(createEncoder(), OMXI_OK);
  messages().hold(anyEvent());
  Later starting = beginInit();
  for (const OMX_U32 state : {OMX_StateIdle, OMX_StateExecuting}) {
    require(messages().waitForHeld(1), "the completion of a state");
    waitForSleeper(&SessionState::stateWaiters);
    // A late or doubled completion of another state is not the one that is waited for.
    deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, state - 1);
    EXPECT_EQ(static_cast<OMX_U32>(_session->_omxState), state - 1);
    deliverEvent(OMX_EventCmdComplete, OMX_CommandFlush, state);
    deliverEvent(OMX_EventError, 0x80001001, 7);  // logged, no more
    requireEventually([this] { return isIdle(_session->_semStateChanged); }, "a look at the state");
    waitForSleeper(&SessionState::stateWaiters);
    EXPECT_FALSE(starting.isDone());
    EXPECT_EQ(omx().count(Method::SendCommand), state - 1);
    EXPECT_TRUE(messages().release());
  }
  EXPECT_EQ(starting.result(), OMXI_OK);
  EXPECT_EQ(log(), LogLines(2, "E OMXINTERFACE - Event error = -2147479551(0x80001001), data2 7 \n"));
  android::omx_message unknown{};
  unknown.type = static_cast<decltype(unknown.type)>(3);
  deliver(unknown);
  EXPECT_EQ(log().back(), "E OMXINTERFACE - OnMessage :: default called, message not handled\n");
}

TEST_F(LifecycleTest, CanBeTakenDownAgainAfterARefusal) {
  start();
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);  // recorded, so nobody waits for the end of output
  omx().fail(Method::SendCommand, 1);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(trace().back(), "sendCommand state 2 failed");
  omx().fail(Method::SendCommand, 2);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  size_t before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(trace(before)[0], "sendCommand state 1");  // the component is in Idle already
  before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(), before);
}

TEST_F(LifecycleTest, DestructionWaitsForAnOperationInProgress) {
  for (const Method method : {Method::UseBuffer, Method::EmptyBuffer}) {
    Gate& gate = newGate();
    ASSERT_EQ(createEncoder(), OMXI_OK);
    ASSERT_TRUE(method == Method::UseBuffer || init() == OMXI_OK);
    omx().before(method, [&](const Call&) { gate.pass(); });
    Later operation("the operation", [method, session = _session.get()] {
      return method == Method::UseBuffer ? session->init() : session->sendInputData(nullptr, 0, 0);
    });
    gate.waitForArrival();
    SessionState& state = *_session->_state;
    Later destroyed = beginDestroy();
    requireUnderLock(
        state, [](SessionState& busy) { return busy.ending; }, "the destruction");
    EXPECT_FALSE(destroyed.isDone());
    gate.open();
    EXPECT_EQ(operation.result(), method == Method::UseBuffer ? OMXI_ERR_SEND_COMMAND_STATE : OMXI_OK);
    destroyed.result();
    EXPECT_EQ(trace().back(), "freeNode");
  }
}

}  // namespace
}  // namespace omxtest
