// Destruction while others are inside. Each of these would hang, or go on in freed memory, if it did not end
// every wait, let everyone leave, and only then free anything.
#include <atomic>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

class DestructionTest : public SessionTest {
 protected:
  // The node is given back when everything else is over.
  void expectNodeFreedLast() {
    EXPECT_EQ(trace().back(), "freeNode");
    messages().passAll();
    messages().releaseAll();
  }
};

TEST_F(DestructionTest, EndsAnInitThatWaitsForAState) {
  for (const OMX_U32 state : {OMX_StateIdle, OMX_StateExecuting}) {
    messages().hold(commandComplete(OMX_CommandStateSet, state));
    connect();
    Later<int> starting = beginInit();
    require(messages().waitForHeld(1), "the completion of the state");
    waitForSleeper(&SessionState::stateWaiters);
    Later<bool> destroyed = beginDestroy();
    EXPECT_EQ(starting.result(),
              state == OMX_StateIdle ? OMXI_ERR_SEND_COMMAND_STATE : OMXI_ERR_SET_EXECUTION_STATE);
    destroyed.result();
    expectNodeFreedLast();
  }
}

TEST_F(DestructionTest, LetsAnInitFinishTheCallThatItIsIn) {
  for (const Method method : {Method::SendCommand, Method::UseBuffer, Method::FillBuffer}) {
    Gate& gate = newGate();
    connect();
    omx().before(method, [&](const Call&) { gate.pass(); });
    Later<int> starting = beginInit();
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    EXPECT_FALSE(destroyed.isDone());
    gate.open();
    const int result = starting.result();
    EXPECT_EQ(result, method == Method::FillBuffer ? OMXI_OK : OMXI_ERR_SEND_COMMAND_STATE);
    destroyed.result();
    omx().before(method, nullptr);
    expectNodeFreedLast();
  }
}

TEST_F(DestructionTest, EndsADeInitWhereverItWaits) {
  struct Wait {
    const char* name;
    bool ended;  // the end of output has been reached
    int failure;
    Match held;
    int SessionState::*waiters;
    int result;
  };
  const Wait waits[] = {
      {"end of output", false, 0, nullptr, &SessionState::endOfOutputWaiters, OMXI_ERR_SEND_COMMAND_STATE},
      {"Idle", true, 0, commandComplete(OMX_CommandStateSet, OMX_StateIdle), &SessionState::stateWaiters,
       OMXI_ERR_SEND_COMMAND_STATE},
      {"Idle after a failure", false, OMXI_ERR_EVENT_ERROR,
       commandComplete(OMX_CommandStateSet, OMX_StateIdle), &SessionState::stateWaiters,
       OMXI_ERR_EVENT_ERROR},
      {"output buffers", true, 0, fillBufferDone(), &SessionState::outputReturnWaiters,
       OMXI_ERR_SEND_COMMAND_STATE},
      {"output buffers after a failure", false, OMXI_ERR_APPLICATION, fillBufferDone(),
       &SessionState::outputReturnWaiters, OMXI_ERR_APPLICATION},
      {"Loaded", true, 0, commandComplete(OMX_CommandStateSet, OMX_StateLoaded), &SessionState::stateWaiters,
       OMXI_ERR_SEND_COMMAND_STATE},
  };
  for (const Wait& wait : waits) {
    SCOPED_TRACE(wait.name);
    start();
    if (wait.ended) endOfStream();
    if (wait.failure != 0) _session->setThreadError(wait.failure);
    if (wait.held) messages().hold(wait.held);
    Later<int> ending = beginDeInit();
    if (wait.held) require(messages().waitForHeld(1), "the message that is waited for");
    waitForSleeper(wait.waiters);
    Later<bool> destroyed = beginDestroy();
    EXPECT_EQ(ending.result(), wait.result);
    destroyed.result();
    expectNodeFreedLast();
    messages().forgetFreedNodes();
  }
}

TEST_F(DestructionTest, EndsTheWaitForTheEndMarksBuffer) {
  start();
  script().holdInput();
  for (size_t i = 0; i < kInputs; ++i) ASSERT_EQ(feed("held"), 0);
  Later<int> first = beginEndOfInput();
  Later<int> second = beginEndOfInput();
  waitForSleeper(&SessionState::inputFreeWaiters, 2);
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::endOfOutputWaiters);
  Later<bool> destroyed = beginDestroy();  // all three at once
  EXPECT_EQ(first.result(), -2);
  EXPECT_EQ(second.result(), -2);
  EXPECT_EQ(ending.result(), OMXI_ERR_SEND_COMMAND_STATE);
  destroyed.result();
  expectNodeFreedLast();
}

TEST_F(DestructionTest, WaitsForCallbacksInProgress) {
  for (const bool output : {true, false}) {
    Gate& gate = newGate();
    std::atomic<bool> left{false};
    const auto stay = [&] {
      gate.pass();
      left = true;
      return 0;
    };
    start();
    if (output) _application.onOutput([&](const Output&) { return stay(); });
    if (!output) _application.onInput([&] { stay(); });
    bool leftBeforeTheNode = false;
    omx().before(Method::FreeNode, [&](const Call&) { leftBeforeTheNode = left; });
    ASSERT_EQ(feed("x"), 0);
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    EXPECT_FALSE(destroyed.isDone());
    gate.open();
    destroyed.result();
    EXPECT_TRUE(leftBeforeTheNode);
    _application.onOutput(nullptr);
    _application.onInput(nullptr);
  }
}

TEST_F(DestructionTest, WaitsForEveryOperationInProgress) {
  // One operation of each kind is in the middle of its call to the component.
  const struct {
    const char* name;
    Method method;
    std::function<int(OmxInterface&)> operation;
    int result;
  } operations[] = {
      {"send", Method::EmptyBuffer,
       [](OmxInterface& session) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {"end of input", Method::EmptyBuffer,
       [](OmxInterface& session) { return session.sendEndOfInputFlag(0); }, 0},
      {"geometry", Method::GetParameter,
       [](OmxInterface& session) { return session.setupPortParameters(0, 176, 144, 0); },
       OMXI_ERR_SET_PORT_DEFINITION},
      {"fill", Method::FillBuffer,
       [this](OmxInterface& session) {
         session.returnIomxOutputBuffer(_application.outputs().back().bufferId);
         return 0;
       },
       0},
      {"deInit", Method::SendCommand, [](OmxInterface& session) { return session.deInit(); },
       OMXI_ERR_APPLICATION},
  };
  for (const auto& each : operations) {
    SCOPED_TRACE(each.name);
    Gate& gate = newGate();
    start();
    _application.onOutput([](const Output&) { return 1; });
    feedThrough("kept");
    if (each.method == Method::SendCommand) _session->setThreadError(OMXI_ERR_APPLICATION);
    omx().before(each.method, [&](const Call&) { gate.pass(); });
    Later<int> operation(each.name, [&, session = _session.get()] { return each.operation(*session); });
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    EXPECT_FALSE(destroyed.isDone());
    gate.open();
    EXPECT_EQ(operation.result(), each.result);
    destroyed.result();
    omx().before(each.method, nullptr);
    expectNodeFreedLast();
  }
}

TEST_F(DestructionTest, EndsASessionInTheMiddleOfItsTraffic) {
  for (int round = 0; round < 20; ++round) {
    start();
    for (int i = 0; i <= round; ++i) {
      componentProduces("output");
      static_cast<void>(feed("input"));
    }
    destroy();
    EXPECT_EQ(trace().back(), "freeNode");
    messages().forgetFreedNodes();
    omx().clearCalls();
  }
}

}  // namespace
}  // namespace omxtest
