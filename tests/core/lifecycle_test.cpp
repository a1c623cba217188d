// init() and deInit(): the calls in their order, and what they wait for.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr const char* kOutputThreadOver = "W OMXINTERFACE - ===DataOutputThread over! enc thread!\n";

// The calls by which a component of 4 input and `outputs` output buffers gets to Executing.
Trace startingCalls(const char* inputCall, const std::string& inputSize, const char* outputCall,
                    const std::string& outputSize, size_t outputs) {
  Trace calls{"sendCommand state 2", "getParameter definition of port 0"};
  for (const char* place : {"in0", "in1", "in2", "in3"}) {
    calls.push_back(std::string(inputCall) + " " + place + " of " + inputSize);
  }
  calls.emplace_back("getParameter definition of port 1");
  for (size_t i = 0; i < outputs; ++i) {
    calls.push_back(std::string(outputCall) + " out" + std::to_string(i) + " of " + outputSize);
  }
  calls.emplace_back("sendCommand state 3");
  for (size_t i = 0; i < outputs; ++i) calls.push_back("fillBuffer out" + std::to_string(i));
  return calls;
}

class LifecycleTest : public SessionTest {
 protected:
  using SessionTest::SessionTest;

  void expectStart(Kind kind, const Trace& calls) {
    connect(kind);
    const size_t before = omx().count();
    EXPECT_EQ(init(), OMXI_OK);
    EXPECT_EQ(trace(before), calls);
    EXPECT_EQ(_session->_omxState, OMX_StateExecuting);
    EXPECT_EQ(busyCount(kOmxInputPort), 0u);
    EXPECT_EQ(busyCount(kOmxOutputPort), _session->_portBuffers[kOmxOutputPort].size());
  }
};

class TiLifecycleTest : public LifecycleTest {
 protected:
  TiLifecycleTest() : LifecycleTest("omap4") {}
};

TEST_F(LifecycleTest, StartsAQualcommEncoderWithItsOwnMemory) {
  expectStart(Kind::Encoder, startingCalls("useBuffer", "38016", "useBuffer", "65536", 6));
}

TEST_F(LifecycleTest, StartsAQualcommDecoderWithOutputOfTheComponents) {
  expectStart(Kind::Decoder, startingCalls("useBuffer", "65536", "allocateBufferWithBackup", "38016", 8));
}

TEST_F(TiLifecycleTest, StartsATiEncoderWithMemoryOfTheComponents) {
  expectStart(Kind::Encoder,
              startingCalls("allocateBufferWithBackup", "38016", "allocateBufferWithBackup", "65536", 6));
}

TEST_F(LifecycleTest, GoesBackToLoadedAndFreesEverything) {
  start();
  feedThrough("a picture", 5);
  endOfStream(6);
  const size_t before = omx().count();
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(trace().size() - before, 12u);
  EXPECT_EQ(trace(before),
            (Trace{"sendCommand state 2", "sendCommand state 1", "freeBuffer 1 out5", "freeBuffer 1 out4",
                   "freeBuffer 1 out3", "freeBuffer 1 out2", "freeBuffer 1 out1", "freeBuffer 1 out0",
                   "freeBuffer 0 in3", "freeBuffer 0 in2", "freeBuffer 0 in1", "freeBuffer 0 in0"}));
  EXPECT_EQ(_session->_omxState, OMX_StateLoaded);
  EXPECT_TRUE(_session->_deinitDone);
  EXPECT_EQ(_session->_platformWrapper, nullptr);
  const size_t ended = omx().count();
  destroy();
  EXPECT_EQ(trace(ended), Trace{"freeNode"});
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  EXPECT_EQ(log(), LogLines{kOutputThreadOver});
}

TEST_F(LifecycleTest, WaitsForTheEndOfOutputBeforeItGoesIdle) {
  start();
  script().holdOutput();
  ASSERT_EQ(beginEndOfInput().result(), 0);
  const size_t before = omx().count();
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::endOfOutputWaiters);
  EXPECT_EQ(omx().count(), before);
  script().passOutput();
  EXPECT_EQ(ending.result(), OMXI_OK);
}

TEST_F(LifecycleTest, WaitsForEachStateThatItAsksFor) {
  connect();
  messages().hold(anyEvent());
  Later<int> starting = beginInit();
  for (const OMX_U32 state : {OMX_StateIdle, OMX_StateExecuting}) {
    require(messages().waitForHeld(1), "the completion of a state");
    waitForSleeper(&SessionState::stateWaiters);
    EXPECT_EQ(omx().count(Method::SendCommand), state - 1);
    // A late or doubled completion of another state is not the one that is waited for.
    deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, state - 1);
    deliverEvent(OMX_EventCmdComplete, OMX_CommandFlush, state);
    EXPECT_FALSE(starting.isDone());
    waitForSleeper(&SessionState::stateWaiters);
    EXPECT_EQ(omx().count(Method::SendCommand), state - 1);
    EXPECT_TRUE(messages().release());
  }
  EXPECT_EQ(starting.result(), OMXI_OK);
  messages().passAll();
}

TEST_F(LifecycleTest, WaitsForTheOutputBuffersBeforeItFreesThem) {
  start();
  endOfStream();
  messages().hold(fillBufferDone());
  Later<int> ending = beginDeInit();
  require(messages().waitForHeld(kOutputs - 1), "the buffers of a component that goes Idle");
  waitForSleeper(&SessionState::outputReturnWaiters);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  messages().releaseAllReversed();
  EXPECT_EQ(ending.result(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputs + kOutputs);
}

TEST_F(LifecycleTest, ReturnsTheRecordedFailureWithoutWaitingForTheEndOfOutput) {
  start();
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(deInit(), OMXI_ERR_EVENT_ERROR);
  EXPECT_TRUE(_session->_deinitDone);
}

TEST_F(LifecycleTest, DoesNothingWhenItHasEndedBefore) {
  start();
  endOfStream();
  ASSERT_EQ(deInit(), OMXI_OK);
  const size_t before = omx().count();
  EXPECT_EQ(deInit(), OMXI_OK);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_APPLICATION);
  EXPECT_EQ(omx().count(), before);
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
  EXPECT_EQ(_application.inputCallbacks(), 1u);
  EXPECT_EQ(_application.inputSession(), _session.get());
  _session->registerInputCallback(nullptr, nullptr);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(_application.inputCallbacks(), 1u);
}

TEST_F(LifecycleTest, FollowsTheComponentsStateAndLogsItsErrors) {
  connect();
  for (const int state : {OMX_StateIdle, OMX_StateExecuting, OMX_StatePause, OMX_StateLoaded}) {
    const int posts = valueOf(_session->_semStateChanged);
    deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, static_cast<OMX_U32>(state));
    EXPECT_EQ(_session->_omxState, state);
    EXPECT_EQ(valueOf(_session->_semStateChanged), posts + 1);
  }
  const int posts = valueOf(_session->_semStateChanged);
  deliverEvent(OMX_EventCmdComplete, OMX_CommandPortDisable, 1);
  deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
  deliverEvent(OMX_EventBufferFlag, 1, 1);
  EXPECT_EQ(log(), LogLines{});
  deliverEvent(OMX_EventError, 0x80001001, 7);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - Event error = -2147479551(0x80001001), data2 7 \n"});
  EXPECT_EQ(_session->_omxState, OMX_StateLoaded);
  EXPECT_EQ(valueOf(_session->_semStateChanged), posts);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  EXPECT_EQ(_application.inputCallbacks(), 0u);
}

}  // namespace
}  // namespace omxtest
