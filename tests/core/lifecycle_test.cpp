// The way to the component, and what comes back through the observer; init() and deInit(): what they wait
// for, what a refused call leaves behind, and destruction while others are inside, which ends every wait,
// lets everyone leave, and only then frees anything.
#include <binder/MemoryHeapBase.h>
#include <omxhost/services.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using faults::Failing;

using LifecycleTest = SessionTest;

TEST_F(LifecycleTest, AsksForIomxOnce) {
  construct();
  // Without a connection everything fails as if refused.
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_MEDIA_PLAYER_SERVICE);
  _server.serveWithoutOmx();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_IOMX);
  _server.unregister();
  _server.serve();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);  // nobody is asked again
  EXPECT_EQ(_session->queryForOmxComponent(nullptr), OMXI_ERR_NODE_NOT_FOUND);
  EXPECT_EQ(log().back(), "E OMXINTERFACE: CODEC NOT FOUND: (null)");
  int result = 0;
  const faults::Fault failed(Failing::New, sizeof(SessionState));
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired("OMX.qcom.video.encoder.avc", result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);  // whatever keeps IOMX away
}

TEST_F(LifecycleTest, LeavesTheRestOfAFailedSetUpToDestruction) {
  const std::tuple<Failing, size_t, int> cases[] = {
      {Failing::New, sizeof(OmxCodecObserver), OMXI_ERR_CREATE_OBSERVER},
      {Failing::NothrowNew, sizeof(CQcomBoardPlatformWrapper), OMXI_ERR_NO_PLATFORM_WRAPPER}};
  for (const auto& [function, size, code] : cases) {
    construct();
    const faults::Fault failed(function, size);
    EXPECT_EQ(_session->setupIOMXConnections(), code);
    destroy();
  }
  EXPECT_TRUE(omxhost::isThreadPoolStarted());
  EXPECT_EQ(trace(),
            (Trace{"listNodes", "listNodes", "allocateNode OMX.qcom.video.encoder.avc", "freeNode"}));
}

TEST_F(LifecycleTest, PassesTheComponentsHeapOnAndLogsMessagesItDoesNotKnow) {
  connect();
  const android::sp<OmxCodecObserver> observer = _session->_observer;
  const android::sp<android::IMemoryHeap> heap = new android::MemoryHeapBase(4096);
  observer->registerBuffers(heap);
  EXPECT_EQ(_session->_mpMemHeap.get(), heap.get());
  android::omx_message unknown{};
  unknown.type = static_cast<decltype(unknown.type)>(3);
  deliver(unknown);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - OnMessage :: default called, message not handled\n"});
}

TEST_F(LifecycleTest, WaitsForEachStateThatItAsksFor) {
  connect();
  messages().hold(anyEvent());
  Later<int> starting = beginInit();
  for (const OMX_U32 state : {OMX_StateIdle, OMX_StateExecuting}) {
    require(messages().waitForHeld(1), "the completion of a state");
    waitForSleeper(&SessionState::stateWaiters);
    // A late or doubled completion of another state is not the one that is waited for.
    deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, state - 1);
    EXPECT_EQ(static_cast<OMX_U32>(_session->_omxState), state - 1);
    deliverEvent(OMX_EventCmdComplete, OMX_CommandFlush, state);
    deliverEvent(OMX_EventError, 0x80001001, 7);  // logged, no more
    requireEventually([this] { return valueOf(_session->_semStateChanged) == 0; }, "a look at the state");
    waitForSleeper(&SessionState::stateWaiters);
    EXPECT_FALSE(starting.isDone());
    EXPECT_EQ(omx().count(Method::SendCommand), state - 1);
    EXPECT_TRUE(messages().release());
  }
  EXPECT_EQ(starting.result(), OMXI_OK);
  messages().passAll();
  EXPECT_EQ(log(), LogLines(2, "E OMXINTERFACE - Event error = -2147479551(0x80001001), data2 7 \n"));
  int seen = 0;
  _application.onInput([&] { seen = _session->threadError(); });
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(seen, OMXI_ERR_EVENT_ERROR);  // it can be read when the callback comes
  _session->registerInputCallback(nullptr, nullptr);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(_application.inputCallbacks(), std::vector<void*>{_session.get()});
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
  const size_t after = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(), after);
}

TEST_F(LifecycleTest, DestructionWaitsForEveryOperationInProgress) {
  // One operation of each kind is in the middle of its call to the component.
  const struct {
    Method method;
    int (*operation)(OmxInterface& session, void* kept);
    int result;
  } operations[] = {
      {Method::UseBuffer, [](auto& session, void*) { return session.init(); }, 20},
      {Method::EmptyBuffer, [](auto& session, void*) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {Method::EmptyBuffer, [](auto& session, void*) { return session.sendEndOfInputFlag(0); }, 0},
      {Method::ListNodes, [](auto& session, void*) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {Method::GetParameter, [](auto& session, void*) { return session.setupPortParameters(0, 16, 16, 0); },
       14},
      {Method::FillBuffer, [](auto& session, void* kept) { return session.returnIomxOutputBuffer(kept), 0; },
       0},
      {Method::SendCommand, [](auto& session, void*) { return session.deInit(); }, OMXI_ERR_APPLICATION},
  };
  for (const auto& [method, call, result] : operations) {
    Gate& gate = newGate();
    void* kept = nullptr;
    connect();
    if (method != Method::UseBuffer) {
      ASSERT_EQ(init(), OMXI_OK);
      _application.onOutput([](const Output&) { return 1; });
      feedThrough("kept");
      kept = _application.outputs().back().bufferId;
    }
    if (method == Method::SendCommand) _session->setThreadError(OMXI_ERR_APPLICATION);
    omx().before(method, [&](const Call&) { gate.pass(); });
    if (method == Method::ListNodes) {  // none: the callbacks, of both kinds
      _application.onOutput([&](const Output&) { return gate.pass(), 0; });
      _application.onInput([&] { gate.pass(); });
    }
    Later<int> operation("the operation",
                         [kept, call = call, session = _session.get()] { return call(*session, kept); });
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
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
