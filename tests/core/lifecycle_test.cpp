// init() and deInit(): the calls in their order, what they wait for, and what a refused call leaves behind.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using LifecycleTest = SessionTest;

TEST_F(LifecycleTest, GoesToExecutingAndBackToLoadedAndFreesEverything) {
  connect();
  omx().clearCalls();
  EXPECT_EQ(init(), OMXI_OK);
  Trace calls{"sendCommand state 2", "getParameter definition of port 0"};
  for (const char* place : {"in0", "in1", "in2", "in3"}) {
    calls.push_back(std::string("useBuffer ") + place + " of 38016");
  }
  calls.emplace_back("getParameter definition of port 1");
  for (int i = 0; i < 6; ++i) calls.push_back("useBuffer out" + std::to_string(i) + " of 65536");
  calls.emplace_back("sendCommand state 3");
  for (int i = 0; i < 6; ++i) calls.push_back("fillBuffer out" + std::to_string(i));
  EXPECT_EQ(trace(), calls);
  EXPECT_EQ(_session->_omxState, OMX_StateExecuting);
  EXPECT_EQ(busyCount(0), 0u);
  EXPECT_EQ(busyCount(1), kOutputs);

  endOfStream(6);
  calls = trace();
  EXPECT_EQ(deInit(), OMXI_OK);
  for (const char* call :
       {"sendCommand state 2", "sendCommand state 1", "freeBuffer 1 out5", "freeBuffer 1 out4",
        "freeBuffer 1 out3", "freeBuffer 1 out2", "freeBuffer 1 out1", "freeBuffer 1 out0",
        "freeBuffer 0 in3", "freeBuffer 0 in2", "freeBuffer 0 in1", "freeBuffer 0 in0"}) {
    calls.emplace_back(call);
  }
  EXPECT_EQ(trace(), calls);
  EXPECT_EQ(_session->_omxState, OMX_StateLoaded);
  EXPECT_TRUE(_session->_deinitDone);
  EXPECT_EQ(_session->_platformWrapper, nullptr);
  EXPECT_EQ(deInit(), OMXI_OK);  // a second one does nothing
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(trace(), calls);
  destroy();
  calls.emplace_back("freeNode");
  EXPECT_EQ(trace(), calls);
  EXPECT_EQ(log(), LogLines{kEncoderOver});
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
    deliverEvent(OMX_EventCmdComplete, OMX_CommandFlush, state);
    requireEventually([this] { return valueOf(_session->_semStateChanged) == 0; }, "a look at the state");
    waitForSleeper(&SessionState::stateWaiters);
    EXPECT_FALSE(starting.isDone());
    EXPECT_EQ(omx().count(Method::SendCommand), state - 1);
    EXPECT_TRUE(messages().release());
  }
  EXPECT_EQ(starting.result(), OMXI_OK);
  messages().passAll();
}

TEST_F(LifecycleTest, TellsTheApplicationOfAFailure) {
  construct();
  _session->setThreadError(OMXI_ERR_FILL_BUFFER);  // nobody to tell yet
  EXPECT_EQ(_session->threadError(), OMXI_ERR_FILL_BUFFER);
  _application.attach(*_session);
  int seen = 0;
  _application.onInput([&] { seen = _session->threadError(); });
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(seen, OMXI_ERR_EVENT_ERROR);  // it can be read when the callback comes
  _session->registerInputCallback(nullptr, nullptr);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(_application.inputCallbacks(), std::vector<void*>{_session.get()});
}

TEST_F(LifecycleTest, FollowsTheComponentsStateAndLogsItsErrors) {
  connect();
  int posts = 0;
  for (const OMX_U32 state : {OMX_StateIdle, OMX_StateExecuting, OMX_StatePause, OMX_StateLoaded}) {
    deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, state);
    EXPECT_EQ(static_cast<OMX_U32>(_session->_omxState), state);
    EXPECT_EQ(valueOf(_session->_semStateChanged), ++posts);
  }
  deliverEvent(OMX_EventCmdComplete, OMX_CommandPortDisable, 1);
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
  deliverEvent(OMX_EventError, 0x80001001, 7);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - Event error = -2147479551(0x80001001), data2 7 \n"});
  EXPECT_EQ(_session->_omxState, OMX_StateLoaded);
  EXPECT_EQ(valueOf(_session->_semStateChanged), posts);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  EXPECT_TRUE(_application.inputCallbacks().empty());
}

// --- Refusals ---

TEST_F(LifecycleTest, StartsAgainWithTheThreadOfAFailedStart) {
  connect();
  omx().fail(Method::SendCommand, 1);
  ASSERT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  const pthread_t thread = _session->_outputThread;
  EXPECT_EQ(init(), OMXI_OK);
  EXPECT_TRUE(pthread_equal(thread, _session->_outputThread));
  feedThrough("delivered");
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
  EXPECT_EQ(log().back(), std::string("E Error Sending Idle State: ") + kRefusedText + "\n");
  _session->returnIomxOutputBuffer(_application.outputs()[0].bufferId);  // the component goes on
  EXPECT_EQ(trace(before), (Trace{"sendCommand state 2 failed", "fillBuffer out0"}));
  omx().fail(Method::SendCommand, 2);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(log().back(), std::string("E OMXINTERFACE - Error Sending Loaded State: ") + kRefusedText + "\n");
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  EXPECT_NE(_session->_platformWrapper, nullptr);
  EXPECT_FALSE(_session->_deinitDone);
  before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(trace(before)[0], "sendCommand state 1");  // the component is in Idle already
  EXPECT_TRUE(_session->_deinitDone);
}

TEST_F(LifecycleTest, GoesBackFromIdleWhenExecutingWasRefused) {
  connect();
  omx().fail(Method::SendCommand, 2);
  ASSERT_EQ(init(), OMXI_ERR_SET_EXECUTION_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);  // no output ends this session
  omx().clearCalls();
  EXPECT_EQ(deInit(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(trace()[0], "sendCommand state 1");
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputs + kOutputs);
}

}  // namespace
}  // namespace omxtest
