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
    letMessagesCome();
    messages().forgetFreedNodes();
  }
};

struct Wait {
  bool starting;  // in init(), or in deInit()
  bool ended;     // the end of output has been reached
  int failure;
  Match held;
  int SessionState::*waiters;
  int result;
};

TEST_F(DestructionTest, EndsAnInitOrADeInitWhereverItWaits) {
  const auto state = [](OMX_U32 which) { return commandComplete(OMX_CommandStateSet, which); };
  constexpr auto kStates = &SessionState::stateWaiters;
  constexpr auto kReturns = &SessionState::outputReturnWaiters;
  const Wait waits[] = {
      {true, false, 0, state(OMX_StateIdle), kStates, 20},
      {true, false, 0, state(OMX_StateExecuting), kStates, 21},
      {false, false, 0, nullptr, &SessionState::endOfOutputWaiters, 20},
      {false, true, 0, state(OMX_StateIdle), kStates, 20},
      {false, false, 27, state(OMX_StateIdle), kStates, 27},
      {false, true, 0, fillBufferDone(), kReturns, 20},
      {false, false, 32, fillBufferDone(), kReturns, 32},
      {false, true, 0, state(OMX_StateLoaded), kStates, 20},
  };
  for (const Wait& wait : waits) {
    SCOPED_TRACE(&wait - waits);
    connect();
    if (!wait.starting) {
      ASSERT_EQ(init(), OMXI_OK);
    }
    if (wait.ended) endOfStream();
    if (wait.failure != 0) _session->setThreadError(wait.failure);
    if (wait.held) messages().hold(wait.held);
    Later<int> call = wait.starting ? beginInit() : beginDeInit();
    if (wait.held) require(messages().waitForHeld(1), "the message that is waited for");
    waitForSleeper(wait.waiters);
    Later<bool> destroyed = beginDestroy();
    EXPECT_EQ(call.result(), wait.result);
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
    gate.open();
    EXPECT_EQ(starting.result(), method == Method::FillBuffer ? OMXI_OK : OMXI_ERR_SEND_COMMAND_STATE);
    destroyed.result();
    omx().before(method, nullptr);
    expectNodeFreedLast();
  }
}

TEST_F(DestructionTest, EndsTheWaitForTheEndMarksBuffer) {
  start();
  holdInputAllBut(0);
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
    Method method;
    std::function<int(OmxInterface&)> operation;
    int result;
  } operations[] = {
      {Method::EmptyBuffer, [](OmxInterface& session) { return session.sendInputData(nullptr, 0, 0); }, 0},
      {Method::EmptyBuffer, [](OmxInterface& session) { return session.sendEndOfInputFlag(0); }, 0},
      {Method::GetParameter,
       [](OmxInterface& session) { return session.setupPortParameters(0, 176, 144, 0); },
       OMXI_ERR_SET_PORT_DEFINITION},
      {Method::FillBuffer,
       [this](OmxInterface& session) {
         session.returnIomxOutputBuffer(_application.outputs().back().bufferId);
         return 0;
       },
       0},
      {Method::SendCommand, [](OmxInterface& session) { return session.deInit(); }, OMXI_ERR_APPLICATION},
  };
  for (const auto& each : operations) {
    SCOPED_TRACE(&each - operations);
    Gate& gate = newGate();
    start();
    _application.onOutput([](const Output&) { return 1; });
    feedThrough("kept");
    if (each.method == Method::SendCommand) _session->setThreadError(OMXI_ERR_APPLICATION);
    omx().before(each.method, [&](const Call&) { gate.pass(); });
    Later<int> operation("the operation", [&, session = _session.get()] { return each.operation(*session); });
    gate.waitForArrival();
    Later<bool> destroyed = beginDestroyOfBusySession();
    gate.open();
    EXPECT_EQ(operation.result(), each.result);
    destroyed.result();
    omx().before(each.method, nullptr);
    expectNodeFreedLast();
  }
}

}  // namespace
}  // namespace omxtest
