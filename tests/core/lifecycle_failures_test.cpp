// init() and deInit() when a call fails: what is returned and logged, what is left behind, and how it goes
// on.
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr const char* kOutputThreadOver = "W OMXINTERFACE - ===DataOutputThread over! enc thread!\n";

using LifecycleFailureTest = SessionTest;

struct InitFailure {
  const char* name;
  Method method;
  size_t nth;
  int result;
  LogLines log;
  size_t inputRecords;  // that stay
  size_t outputRecords;
  size_t callsInAll;  // of that init()
};

std::ostream& operator<<(std::ostream& stream, const InitFailure& each) {
  return stream << each.name;
}

class InitFailureTest : public SessionTest, public ::testing::WithParamInterface<InitFailure> {};

TEST_P(InitFailureTest, StopsAndLeavesWhatWasDone) {
  const InitFailure& expected = GetParam();
  connect();
  const size_t before = omx().count();
  omx().fail(expected.method, expected.nth);
  EXPECT_EQ(init(), expected.result);
  EXPECT_EQ(log(), expected.log);
  EXPECT_EQ(omx().count() - before, expected.callsInAll) << omx().describeCalls();
  EXPECT_EQ(_session->_portBuffers[kOmxInputPort].size(), expected.inputRecords);
  EXPECT_EQ(_session->_portBuffers[kOmxOutputPort].size(), expected.outputRecords);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  // The output thread waits on, and destruction ends it.
  destroy();
  EXPECT_EQ(log().back(), kOutputThreadOver);
}

INSTANTIATE_TEST_SUITE_P(
    Calls, InitFailureTest,
    ::testing::Values(
        InitFailure{"Idle", Method::SendCommand, 1, OMXI_ERR_SEND_COMMAND_STATE, {}, 0, 0, 1},
        InitFailure{"input definition",
                    Method::GetParameter,
                    1,
                    OMXI_ERR_GET_PORT_DEFINITION,
                    {"E OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: -2147483648"},
                    0,
                    0,
                    2},
        InitFailure{
            "third input buffer",
            Method::UseBuffer,
            3,
            OMXI_ERR_ALLOCATE_MEMORY,
            {"E OMXINTERFACE - Could not allocate memory: port 0 buffer 2 error -2147483648(0x80000000)\n"},
            2,
            0,
            5},
        InitFailure{"output definition",
                    Method::GetParameter,
                    2,
                    OMXI_ERR_GET_PORT_DEFINITION,
                    {"E OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: -2147483648"},
                    4,
                    0,
                    7},
        InitFailure{
            "second output buffer",
            Method::UseBuffer,
            6,
            OMXI_ERR_ALLOCATE_MEMORY,
            {"E OMXINTERFACE - Could not allocate memory: port 1 buffer 1 error -2147483648(0x80000000)\n"},
            4,
            1,
            9},
        InitFailure{"Executing", Method::SendCommand, 2, OMXI_ERR_SET_EXECUTION_STATE, {}, 4, 6, 14},
        InitFailure{"third fill",
                    Method::FillBuffer,
                    3,
                    OMXI_ERR_FILL_BUFFER,
                    {"E OMXINTERFACE - fillBuffer failed w/ error 0x80000000"},
                    4,
                    6,
                    17}));

TEST_F(LifecycleFailureTest, DoesNotStartWithoutAnOutputThread) {
  connect();
  const size_t before = omx().count();
  {
    const faults::FailedThread failed;
    EXPECT_EQ(_session->init(), OMXI_ERR_CREATE_OUTPUT_THREAD);
  }
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(log(), LogLines{});
  EXPECT_EQ(init(), OMXI_OK);  // the next attempt makes one
  feedThrough("delivered");
}

TEST_F(LifecycleFailureTest, StartsAgainWithTheThreadOfAFailedStart) {
  connect();
  omx().fail(Method::SendCommand, 1);
  ASSERT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  const pthread_t thread = _session->_outputThread;
  EXPECT_EQ(init(), OMXI_OK);
  EXPECT_TRUE(pthread_equal(thread, _session->_outputThread));
  feedThrough("delivered");
}

TEST_F(LifecycleFailureTest, LeavesEverythingWhenIdleIsRefused) {
  start();
  endOfStream();
  omx().fail(Method::SendCommand, 1);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(log().back(), std::string("E Error Sending Idle State: ") + kRefusedText + "\n");
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  EXPECT_NE(_session->_platformWrapper, nullptr);
  EXPECT_FALSE(_session->_deinitDone);
  EXPECT_EQ(deInit(), OMXI_OK);  // it can be tried again
}

TEST_F(LifecycleFailureTest, LeavesTheBuffersWhenLoadedIsRefused) {
  start();
  endOfStream();
  omx().fail(Method::SendCommand, 2);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  EXPECT_EQ(log().back(), std::string("E OMXINTERFACE - Error Sending Loaded State: ") + kRefusedText + "\n");
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  EXPECT_NE(_session->_platformWrapper, nullptr);
  const size_t before = omx().count();
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(trace(before)[0], "sendCommand state 1");  // the component is in Idle already
}

TEST_F(LifecycleFailureTest, GoesBackFromIdleWhenExecutingWasRefused) {
  connect();
  omx().fail(Method::SendCommand, 2);
  ASSERT_EQ(init(), OMXI_ERR_SET_EXECUTION_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);  // no output ends this session
  const size_t before = omx().count();
  EXPECT_EQ(deInit(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(trace(before)[0], "sendCommand state 1");
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputs + kOutputs);
}

TEST_F(LifecycleFailureTest, IgnoresBuffersThatTheComponentDoesNotFree) {
  start();
  endOfStream();
  omx().failWhere([](const Call& call) { return call.method == Method::FreeBuffer && call.port == 1; });
  // Loaded is reached when the node has no buffers left, which here it has.
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::stateWaiters);
  requireEventually([this]() -> bool { return _session->_deinitDone; }, "the buffers' release");
  EXPECT_TRUE(_session->_portBuffers[0].isEmpty() && _session->_portBuffers[1].isEmpty());
  deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StateLoaded);
  EXPECT_EQ(ending.result(), OMXI_OK);
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), kOutputs);
}

}  // namespace
}  // namespace omxtest
