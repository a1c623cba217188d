// The way to the component, and what comes back through the observer; init() and deInit(): what they wait
// for, what a refusal leaves behind, and destruction while others are inside, which ends every wait, lets
// everyone leave, and only then frees anything.
#include <binder/MemoryHeapBase.h>
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

TEST_F(LifecycleTest, AsksForIomxOnce) {
  construct();
  // Without a connection everything fails as if refused.
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_MEDIA_PLAYER_SERVICE);
  _server.serve(nullptr);
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_IOMX);
  EXPECT_EQ(log().back(), "E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE");
  _server.unregister();
  _server.serve(&omx());
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);  // nobody is asked again
  EXPECT_EQ(_session->queryForOmxComponent(nullptr), OMXI_ERR_NODE_NOT_FOUND);
}

TEST_F(LifecycleTest, LeavesTheRestOfAFailedSetUpToDestruction) {
  const std::tuple<Failing, size_t, int> cases[] = {
      {Failing::New, sizeof(OmxCodecObserver), OMXI_ERR_CREATE_OBSERVER},
      {Failing::NothrowNew, sizeof(CQcomBoardPlatformWrapper), OMXI_ERR_NO_PLATFORM_WRAPPER},
      {Failing::Thread, 1, OMXI_ERR_ALLOCATE_COMPONENT}};  // of the node
  for (const auto& [function, number, code] : cases) {
    construct();
    const faults::Fault failed(function, number);
    EXPECT_EQ(_session->setupIOMXConnections(), code);
    destroy();
  }
  EXPECT_TRUE(omxhost::isThreadPoolStarted());
  EXPECT_EQ(trace(), (Trace{"listNodes", "listNodes", "allocateNode OMX.qcom.video.encoder.avc", "freeNode",
                            "listNodes", "allocateNode OMX.qcom.video.encoder.avc failed"}));
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
  int seen = 0;
  _application.onInput([&] { seen = _session->threadError(); });
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(seen, OMXI_ERR_EVENT_ERROR);  // it can be read when the callback comes
  const android::sp<android::IMemoryHeap> heap = new android::MemoryHeapBase(4096);
  _session->_observer->registerBuffers(heap);
  EXPECT_EQ(_session->_mpMemHeap.get(), heap.get());
  android::omx_message unknown{};
  unknown.type = static_cast<decltype(unknown.type)>(3);
  deliver(unknown);
  EXPECT_EQ(log().back(), "E OMXINTERFACE - OnMessage :: default called, message not handled\n");
}

TEST_F(LifecycleTest, CanBeTakenDownAgainAfterARefusal) {
  start();
  _application.onOutput([](const Output&) { return 1; });
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);  // recorded, so nobody waits for the end of output
  feedThrough("kept");
  waitForOutputThreadToEnd();  // has found the failure
  size_t before = omx().count();
  omx().fail(Method::SendCommand, 1);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->returnIomxOutputBuffer(_application.outputs()[0].bufferId);  // the component goes on
  EXPECT_EQ(trace(before), (Trace{"sendCommand state 2 failed", "fillBuffer out0"}));
  omx().fail(Method::SendCommand, 2);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(trace(before)[0], "sendCommand state 1");  // the component is in Idle already
  before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(), before);
}

TEST_F(LifecycleTest, DestructionWaitsForEveryOperationInProgress) {
  // One operation of each kind is in the middle of its call to the component, or of a callback.
  const struct {
    Method method;
    std::function<int(OmxInterface& session)> operation;
    int result;
  } operations[] = {
      {Method::UseBuffer, [](auto& session) { return session.init(); }, 20},
      {Method::EmptyBuffer, [](auto& session) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {Method::EmptyBuffer, [](auto& session) { return session.sendEndOfInputFlag(0); }, 0},
      {Method::ListNodes, [](auto& session) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {Method::GetParameter, [](auto& session) { return session.setupPortParameters(0, 16, 16, 0); }, 14},
      {Method::FillBuffer,
       [this](auto& session) {
         return session.returnIomxOutputBuffer(_application.outputs().back().bufferId), 0;
       },
       0},
      {Method::SendCommand, [](auto& session) { return session.deInit(); }, OMXI_ERR_APPLICATION},
  };
  for (const auto& [method, call, result] : operations) {
    Gate& gate = newGate();
    ASSERT_EQ(createEncoder(), OMXI_OK);
    if (method != Method::UseBuffer) {
      ASSERT_EQ(init(), OMXI_OK);
      _application.onOutput([](const Output&) { return 1; });
      feedThrough("kept");
    }
    if (method == Method::SendCommand) _session->setThreadError(OMXI_ERR_APPLICATION);
    omx().before(method, [&](const Call&) { gate.pass(); });
    if (method == Method::ListNodes) {  // none: the callbacks, of both kinds
      _application.onOutput([&](const Output&) { return gate.pass(), 0; });
      _application.onInput([&] { gate.pass(); });
    }
    Later operation("the operation", [call = call, session = _session.get()] { return call(*session); });
    gate.waitForArrival();
    Later destroyed = beginDestroyOfBusySession();
    gate.open();
    EXPECT_EQ(operation.result(), result) << name(method);
    destroyed.result();
    omx().before(method, nullptr);
    _application.onInput(nullptr);
    EXPECT_EQ(trace().back(), "freeNode");
  }
}

}  // namespace
}  // namespace omxtest
