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

TEST_F(DestructionTest, EndsADeInitWithTheFailureThatWasRecorded) {
  const std::pair<Match, int SessionState::*> waits[] = {
      {commandComplete(OMX_CommandStateSet, OMX_StateIdle), &SessionState::stateWaiters},
      {fillBufferDone(), &SessionState::outputReturnWaiters}};
  for (const auto& [held, waiters] : waits) {
    start();
    _session->setThreadError(OMXI_ERR_APPLICATION);
    messages().hold(held);
    Later<int> ending = beginDeInit();
    waitForSleeper(waiters);
    Later<bool> destroyed = beginDestroy();
    EXPECT_EQ(ending.result(), OMXI_ERR_APPLICATION);
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
