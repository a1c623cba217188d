// Ports: population, being disabled and enabled, and who may give and free buffers when.

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

using Ports = NodeTest;

TEST_F(Ports, OnlyEnabledPortsCountForIdleAndLoaded) {
  const auto node = client();
  node->command(OMX_CommandPortDisable, kOutputPort);
  node->expectComplete(OMX_CommandPortDisable, kOutputPort);
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  node->populate(kInputPort);
  node->expectComplete(OMX_CommandStateSet, OMX_StateIdle);
  node->command(OMX_CommandStateSet, OMX_StateLoaded);
  node->freeBuffers(kInputPort);
  node->expectComplete(OMX_CommandStateSet, OMX_StateLoaded);
}

TEST_F(Ports, DisableReturnsBuffersAndCompletesWhenTheClientHasFreedThem) {
  const struct {
    OMX_STATETYPE state;
    OMX_U32 port;
    bool held;  // by the node, when the command comes
  } cases[] = {
      {OMX_StateLoaded, kOutputPort, false},   {OMX_StateWaitForResources, kInputPort, false},
      {OMX_StateIdle, kOutputPort, false},     {OMX_StateExecuting, kOutputPort, true},
      {OMX_StateExecuting, kInputPort, false}, {OMX_StatePause, kOutputPort, true},
  };
  for (const auto& test : cases) {
    SCOPED_TRACE(::testing::Message() << "state " << test.state << " port " << test.port);
    const auto node = client();
    reach(node.get(), test.state);
    if (test.held) node->fillAll();
    EXPECT_EQ(node->command(OMX_CommandPortDisable, test.port), android::OK);
    EXPECT_EQ(node->definition(test.port).bEnabled, OMX_FALSE);
    if (test.held) node->expect(fillBufferDone(), 2);
    if (!node->buffers(test.port).empty()) {
      node->freeBuffer(test.port);
      settle(node.get());
      EXPECT_EQ(node->messages().count(commandComplete(OMX_CommandPortDisable)), 0u);
      node->freeBuffers(test.port);
    }
    node->expectComplete(OMX_CommandPortDisable, test.port);
    EXPECT_EQ(node->messages().count(errorIs(OMX_ErrorPortUnpopulated)), 0u);
  }
}

TEST_F(Ports, EnableCompletesWhenThePortHoldsItsBuffersAgain) {
  for (const OMX_STATETYPE state :
       {OMX_StateLoaded, OMX_StateIdle, OMX_StateExecuting, OMX_StatePause, OMX_StateWaitForResources}) {
    SCOPED_TRACE(state);
    const auto node = client();
    reach(node.get(), state);
    const bool loaded = node->buffers(kOutputPort).empty();
    node->command(OMX_CommandPortDisable, kOutputPort);
    node->freeBuffers(kOutputPort);
    node->expectComplete(OMX_CommandPortDisable, kOutputPort);
    node->command(OMX_CommandPortEnable, kOutputPort);
    EXPECT_EQ(node->definition(kOutputPort).bEnabled, OMX_TRUE);
    if (!loaded) {
      node->give(kOutputPort);
      settle(node.get());
      EXPECT_EQ(node->messages().count(commandComplete(OMX_CommandPortEnable)), 0u);
      EXPECT_EQ(node->fill(0), kUnknownError);
      node->give(kOutputPort);
    }
    node->expectComplete(OMX_CommandPortEnable, kOutputPort);
    if (state != OMX_StateExecuting) continue;
    node->fillAll();
    node->empty(0, "on it goes");
    node->expect(fillBufferDone());
    EXPECT_EQ(node->outputs().back().text(), "on it goes");
  }
}

TEST_F(Ports, ChangesOfOnePortAreCarriedOutOneAfterTheOther) {
  const auto node = running();
  node->command(OMX_CommandPortDisable, kOutputPort);
  node->command(OMX_CommandPortEnable, kOutputPort);
  node->command(OMX_CommandPortDisable, OMX_ALL);
  node->expect(fillBufferDone(), 2);
  node->freeBuffers(kOutputPort);
  node->expectComplete(OMX_CommandPortDisable, kOutputPort);
  settle(node.get());
  node->populate(kOutputPort);
  node->expectComplete(OMX_CommandPortEnable, kOutputPort);
  for (OMX_U32 port = 0; port < kPortCount; ++port) node->freeBuffers(port);
  node->expectComplete(OMX_CommandPortDisable, kInputPort);
  node->expect(commandComplete(OMX_CommandPortDisable, kOutputPort), 2);
  EXPECT_EQ(node->messages().count(errorIs(OMX_ErrorPortUnpopulated)), 0u);
}

TEST_F(Ports, TakeBuffersOnlyWhereTheyAreDue) {
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
  node->command(OMX_CommandPortDisable, kOutputPort);
  EXPECT_EQ(node->give(kOutputPort), kUnknownError) << "being disabled";
  node->freeBuffers(kOutputPort);
  node->expectComplete(OMX_CommandPortDisable, kOutputPort);
  EXPECT_EQ(node->give(kOutputPort), android::OK) << "in advance, on a disabled port";
}

TEST_F(Ports, AnUnexpectedFreeWorksAndIsReported) {
  const auto node = running();
  decoder.holdOutput();
  ASSERT_EQ(node->freeBuffer(kOutputPort, 0), android::OK);  // while the node holds it
  node->expect(errorIs(OMX_ErrorPortUnpopulated));
  EXPECT_EQ(node->messages().count(fillBufferDone()), 0u);
  EXPECT_EQ(node->definition(kOutputPort).bPopulated, OMX_FALSE);
  node->empty(0, "still there");
  decoder.passOutput();
  node->expect(fillBufferDone());
  EXPECT_EQ(node->outputs().front().text(), "still there");
  // On the way to Loaded, and in it, frees are due.
  node->messages().clear();
  node->executingToIdle();
  node->idleToLoaded();
  EXPECT_EQ(node->messages().count(anyEvent()), 2u);
}

}  // namespace
}  // namespace omxtest
