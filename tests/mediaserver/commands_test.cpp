// Commands and states: what is legal, when it completes, and what is heard.

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

using Commands = NodeTest;

TEST_F(Commands, EveryPairOfStatesIsLegalOrRefused) {
  constexpr OMX_STATETYPE kStates[] = {OMX_StateLoaded, OMX_StateIdle, OMX_StateExecuting, OMX_StatePause,
                                       OMX_StateWaitForResources};
  // Rows: from; columns: to. 's' the same state, 'y' legal at once, 'c' legal when the client has given or
  // freed the buffers, '-' refused.
  constexpr const char* kTable[] = {"sc--y", "csyy-", "-ysy-", "-yys-", "y---s"};
  for (size_t from = 0; from < std::size(kStates); ++from) {
    for (size_t to = 0; to < std::size(kStates); ++to) {
      SCOPED_TRACE(::testing::Message() << kStates[from] << " to " << kStates[to]);
      const auto node = client();
      reach(node.get(), kStates[from]);
      EXPECT_EQ(node->command(OMX_CommandStateSet, kStates[to]), android::OK);
      const char expected = kTable[from][to];
      if (expected == 's' || expected == '-') {
        node->expect(errorIs(expected == 's' ? OMX_ErrorSameState : OMX_ErrorIncorrectStateTransition));
        EXPECT_EQ(node->state(), kStates[from]);
        continue;
      }
      for (OMX_U32 port = 0; expected == 'c' && port < kPortCount; ++port) {
        EXPECT_EQ(node->messages().count(anyEvent()), 0u);
        EXPECT_EQ(node->state(), kStates[from]);
        if (kStates[to] == OMX_StateIdle) {
          node->populate(port);
        } else {
          node->freeBuffers(port);
        }
      }
      node->expectComplete(OMX_CommandStateSet, kStates[to]);
      EXPECT_EQ(node->state(), kStates[to]);
      EXPECT_EQ(node->messages().count(anyMessage()), 1u);
    }
  }
}

TEST_F(Commands, InvalidEndsTheNodeFromEveryStateExceptForFreeing) {
  for (const OMX_STATETYPE from : {OMX_StateLoaded, OMX_StateIdle, OMX_StateExecuting, OMX_StatePause}) {
    const auto node = client();
    reach(node.get(), from);
    EXPECT_EQ(node->command(OMX_CommandStateSet, OMX_StateInvalid), android::OK);
    node->expect(errorIs(OMX_ErrorInvalidState));
    EXPECT_EQ(node->state(), OMX_StateInvalid);
    EXPECT_EQ(node->command(OMX_CommandStateSet, OMX_StateLoaded), kUnknownError);
    PortDefinition record{};
    EXPECT_EQ(server->getParameter(node->node(), OMX_IndexParamPortDefinition, &record, sizeof(record)),
              kUnknownError);
    node->freeBuffers(kInputPort);
    EXPECT_EQ(node->free(), android::OK);
  }
  EXPECT_EQ(decoder.starts(), decoder.stops());
}

TEST_F(Commands, StatesCommandedInARowAreReachedInThatOrderAndAWayToIdleCanBeGivenUp) {
  const auto node = client();
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  ASSERT_EQ(node->give(kInputPort), android::OK);
  node->command(OMX_CommandStateSet, OMX_StateLoaded);
  EXPECT_EQ(node->give(kInputPort), kUnknownError);
  settle(node.get());
  EXPECT_EQ(node->messages().count(commandComplete(OMX_CommandStateSet)), 0u);
  node->freeBuffers(kInputPort);
  node->expectComplete(OMX_CommandStateSet, OMX_StateLoaded);
  EXPECT_EQ(node->messages().count(errorIs(OMX_ErrorPortUnpopulated)), 0u);

  node->messages().clear();
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  node->command(OMX_CommandStateSet, OMX_StateExecuting);
  for (OMX_U32 port = 0; port < kPortCount; ++port) node->populate(port);
  node->expectComplete(OMX_CommandStateSet, OMX_StateExecuting);
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  node->command(OMX_CommandStateSet, OMX_StateLoaded);
  for (OMX_U32 port = 0; port < kPortCount; ++port) node->freeBuffers(port);
  node->expectComplete(OMX_CommandStateSet, OMX_StateLoaded);
  EXPECT_EQ(node->heard(),
            (Words{"complete state 2", "complete state 3", "complete state 2", "complete state 1"}));
}

TEST_F(Commands, ACodecThatDoesNotStartKeepsTheNodeInIdle) {
  const auto node = client();
  node->toIdle();
  decoder.failStart(OMX_ErrorInsufficientResources);
  node->command(OMX_CommandStateSet, OMX_StateExecuting);
  node->command(OMX_CommandStateSet, OMX_StatePause);  // led on from Executing; now from Idle
  node->expect(errorIs(OMX_ErrorInsufficientResources), 2);
  EXPECT_EQ(node->state(), OMX_StateIdle);
  decoder.failStart(OMX_ErrorNone);
  node->command(OMX_CommandStateSet, OMX_StateExecuting);
  node->expectComplete(OMX_CommandStateSet, OMX_StateExecuting);
}

TEST_F(Commands, MistakesInCommandsAreErrorsAsEventsOrAtOnce) {
  const auto node = client();
  for (const OMX_COMMANDTYPE command :
       {OMX_CommandFlush, OMX_CommandPortDisable, OMX_CommandPortEnable, OMX_CommandMarkBuffer}) {
    node->messages().clear();
    EXPECT_EQ(node->command(command, 2), android::OK);
    node->expect(errorIs(OMX_ErrorBadPortIndex));
  }
  EXPECT_EQ(node->command(OMX_CommandStateSet, 77), android::OK);
  node->expect(errorIs(OMX_ErrorIncorrectStateTransition));
  EXPECT_EQ(node->command(static_cast<OMX_COMMANDTYPE>(5), 0), kUnknownError);
  EXPECT_EQ(node->state(), OMX_StateLoaded);
}

TEST_F(Commands, FlushReturnsWhatThePortHoldsBeforeItCompletes) {
  const struct {
    OMX_U32 port;
    Words heard;
  } cases[] = {
      {kInputPort, {"emptied", "emptied", "complete flush 0"}},
      {kOutputPort, {"filled", "filled", "complete flush 1"}},
      {OMX_ALL, {"emptied", "emptied", "complete flush 0", "filled", "filled", "complete flush 1"}},
  };
  for (const auto& test : cases) {
    SCOPED_TRACE(test.port);
    decoder.holdInput();
    const auto node = running();
    node->empty(0, "a");
    node->empty(1, "b");
    EXPECT_EQ(node->command(OMX_CommandFlush, test.port), android::OK);
    node->expect(commandComplete(OMX_CommandFlush), test.port == OMX_ALL ? 2 : 1);
    EXPECT_EQ(node->heard(), test.heard);
    for (const Packet& output : node->outputs()) EXPECT_TRUE(output.bytes.empty());
    // What came back can be sent again.
    EXPECT_EQ(node->empty(0, "c"), okIf(test.port != kOutputPort));
    EXPECT_EQ(node->fill(0), okIf(test.port != kInputPort));
    decoder.passInput();
  }
}

TEST_F(Commands, LeavingExecutingReturnsEveryBufferBeforeIdleIsReported) {
  for (const bool paused : {false, true}) {
    decoder.holdInput();
    const auto node = running();
    if (paused) {
      node->command(OMX_CommandStateSet, OMX_StatePause);
      node->expectComplete(OMX_CommandStateSet, OMX_StatePause);
      node->messages().clear();
    }
    node->empty(0, "a");
    node->executingToIdle();
    EXPECT_EQ(node->heard(), (Words{"emptied", "filled", "filled", "complete state 2"}));
    EXPECT_EQ(decoder.inputCount(), 0u);
    decoder.passInput();
  }
}

}  // namespace
}  // namespace omxtest
