// Commands: which states and ports they lead to, when they complete, and what is heard.

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

using Commands = NodeTest;

TEST_F(Commands, EveryPairOfStatesIsLegalOrRefused) {
  constexpr OMX_STATETYPE kStates[] = {OMX_StateLoaded,           OMX_StateIdle,
                                       OMX_StateExecuting,        OMX_StatePause,
                                       OMX_StateWaitForResources, OMX_StateInvalid};
  // Rows: from; columns: to. 's' the same state, 'y' legal at once, 'c' legal when the client has given or
  // freed the buffers, '-' refused, 'i' the end of the node.
  constexpr const char* kTable[] = {"sc--yi", "csyy-i", "-ysy-i", "-yys-i", "y---si"};
  for (size_t from = 0; from < std::size(kTable); ++from) {
    for (size_t to = 0; to < std::size(kStates); ++to) {
      SCOPED_TRACE(::testing::Message() << kStates[from] << " to " << kStates[to]);
      const auto node = client();
      reach(node.get(), kStates[from]);
      EXPECT_EQ(node->command(OMX_CommandStateSet, kStates[to]), android::OK);
      const char expected = kTable[from][to];
      if (expected == 'y' || expected == 'c') {
        for (OMX_U32 port = 0; expected == 'c' && port < kPortCount; ++port) {
          EXPECT_EQ(node->messages().count(anyEvent()), 0u);
          EXPECT_EQ(node->state(), kStates[from]);
          kStates[to] == OMX_StateIdle ? node->populate(port) : node->freeBuffers(port);
        }
        node->expectComplete(OMX_CommandStateSet, kStates[to]);
        EXPECT_EQ(node->messages().count(anyMessage()), 1u);
      } else {
        node->expect(errorIs(expected == 's'   ? OMX_ErrorSameState
                             : expected == '-' ? OMX_ErrorIncorrectStateTransition
                                               : OMX_ErrorInvalidState));
      }
      EXPECT_EQ(node->state(), expected == 's' || expected == '-' ? kStates[from] : kStates[to]);
      if (expected != 'i') continue;
      EXPECT_EQ(node->command(OMX_CommandStateSet, OMX_StateLoaded), kUnknownError);
      node->freeBuffers(kInputPort);
    }
  }
  EXPECT_EQ(decoder.starts(), decoder.stops());
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
  node->complete(OMX_CommandStateSet, OMX_StateExecuting);
}

TEST_F(Commands, FlushAndIdleReturnWhatThePortsHoldBeforeTheyComplete) {
  const struct {
    OMX_COMMANDTYPE command;
    OMX_U32 param;
    Words heard;
  } cases[] = {
      {OMX_CommandFlush, kInputPort, {"emptied", "emptied", "complete flush 0"}},
      {OMX_CommandFlush, kOutputPort, {"filled", "filled", "complete flush 1"}},
      {OMX_CommandFlush,
       OMX_ALL,
       {"emptied", "emptied", "complete flush 0", "filled", "filled", "complete flush 1"}},
      {OMX_CommandStateSet, OMX_StateIdle, {"emptied", "emptied", "filled", "filled", "complete state 2"}},
  };
  decoder.holdInput();
  for (const auto& test : cases) {
    SCOPED_TRACE(::testing::PrintToString(test.heard));
    const bool paused = test.command == OMX_CommandStateSet;
    const auto node = running();
    if (paused) node->complete(OMX_CommandStateSet, OMX_StatePause);
    node->messages().clear();
    node->empty(0, "a");
    node->empty(1, "b");
    EXPECT_EQ(node->command(test.command, test.param), android::OK);
    node->expect(commandComplete(test.command), test.param == OMX_ALL ? 2 : 1);
    EXPECT_EQ(node->heard(), test.heard);
    // What came back can be sent again.
    if (paused) node->complete(OMX_CommandStateSet, OMX_StateExecuting);
    EXPECT_EQ(node->empty(0, "c"), okIf(paused || test.param != kOutputPort));
    EXPECT_EQ(node->fill(0), okIf(paused || test.param != kInputPort));
    EXPECT_TRUE(decoder.inputs().empty());
  }
}

TEST_F(Commands, PortsAreClosedAndOpenedWhenTheirBuffersAreGoneAndThere) {
  for (const OMX_STATETYPE state : {OMX_StateIdle, OMX_StateExecuting}) {
    for (const OMX_U32 port : {kOutputPort, kInputPort}) {
      SCOPED_TRACE(::testing::Message() << "state " << state << " port " << port);
      const auto node = client();
      reach(node.get(), state);
      if (state == OMX_StateExecuting) node->fillAll();
      const auto expectWaiting = [&](OMX_COMMANDTYPE command) {
        settle(node.get());
        EXPECT_EQ(node->messages().count(commandComplete(command)), 0u);
      };
      EXPECT_EQ(node->command(OMX_CommandPortDisable, port), android::OK);
      EXPECT_EQ(node->definition(port).bEnabled, OMX_FALSE);
      if (state == OMX_StateExecuting && port == kOutputPort) node->expect(fillBufferDone(), 2);
      EXPECT_EQ(node->give(port), kUnknownError);
      node->freeBuffer(port);
      expectWaiting(OMX_CommandPortDisable);
      node->freeBuffers(port);
      node->expectComplete(OMX_CommandPortDisable, port);
      EXPECT_EQ(node->give(port), android::OK) << "in advance, on a disabled port";
      EXPECT_EQ(node->command(OMX_CommandPortEnable, port), android::OK);
      EXPECT_EQ(node->definition(port).bEnabled, OMX_TRUE);
      expectWaiting(OMX_CommandPortEnable);
      EXPECT_EQ(port == kInputPort ? node->empty(0, "") : node->fill(0), kUnknownError);
      EXPECT_EQ(node->give(port), android::OK);
      node->expectComplete(OMX_CommandPortEnable, port);
      EXPECT_EQ(node->messages().count(errorIs(OMX_ErrorPortUnpopulated)), 0u);
    }
  }
}

TEST_F(Commands, BuffersAreTakenWhereTheyAreDue) {
  const auto node = client();
  EXPECT_EQ(node->give(kInputPort), kUnknownError) << "in Loaded";
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  EXPECT_EQ(node->give(kInputPort, 63), kUnknownError) << "too small";
  EXPECT_EQ(node->give(kInputPort, 65), android::OK);
  EXPECT_EQ(node->definition(kInputPort).bPopulated, OMX_FALSE);
  EXPECT_EQ(node->give(kInputPort), android::OK);
  EXPECT_EQ(node->definition(kInputPort).bPopulated, OMX_TRUE);
  EXPECT_EQ(node->give(kInputPort), kUnknownError) << "more than the port has";
  node->populate(kOutputPort);
  node->expectComplete(OMX_CommandStateSet, OMX_StateIdle);
}

}  // namespace
}  // namespace omxtest
