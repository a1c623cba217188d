// What is recorded, failed and counted is what tests will believe.

#include <future>
#include <thread>

#include <binder/IServiceManager.h>
#include <media/IMediaPlayerService.h>
#include <omxhost/device.h>
#include <omxhost/services.h>

#include "tests/mediaserver/support_fixture.h"
#include "tests/support/scripted_media_server.h"

namespace omxtest {
namespace {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;

using RecordingOmxTest = Support;

TEST_F(RecordingOmxTest, CallsAreRecordedWithTheirArgumentsAndRecords) {
  const auto node = client();
  mediaserver::PortDefinition definition = node->definition(kInputPort);
  definition.nSize = 0;
  definition.nBufferCountActual = 3;
  node->define(kInputPort, definition);
  node->toExecuting();
  node->empty(1, "abc", OMX_BUFFERFLAG_EOS, -7);
  node->expect(emptyBufferDone());

  const std::vector<Call> sets = omx->calls(Method::SetParameter);
  ASSERT_EQ(sets.size(), 1u);
  EXPECT_EQ(sets[0].size, sizeof(definition));
  EXPECT_EQ(sets[0].as<mediaserver::PortDefinition>()->nBufferCountActual, 3u);
  EXPECT_EQ(sets[0].as<mediaserver::PortDefinition>()->nSize, 0u);
  EXPECT_EQ(omx->calls(Method::GetParameter)[0].as<mediaserver::PortDefinition>()->nBufferCountActual, 2u);
  const Call empty = omx->calls(Method::EmptyBuffer).at(0);
  EXPECT_EQ(empty.node, node->node());
  EXPECT_EQ(empty.buffer, node->buffers(kInputPort)[1].id);
  EXPECT_EQ(empty.length, 3u);
  EXPECT_EQ(empty.flags, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(empty.timestamp, -7);
  EXPECT_EQ(omx->count(Method::UseBuffer), 5u);
  EXPECT_EQ(omx->calls(Method::UseBuffer)[0].blockSize, 64u);
  const std::vector<Call> commands = omx->calls(Method::SendCommand);
  ASSERT_EQ(commands.size(), 2u);
  EXPECT_EQ(commands[1].param, OMX_StateExecuting);
  EXPECT_NE(omx->describeCalls().find("emptyBuffer"), std::string::npos);
  omx->clearCalls();
  EXPECT_EQ(omx->count(), 0u);
}

TEST_F(RecordingOmxTest, TheNthCallFailsAndIsNotForwarded) {
  const auto node = client();
  OMX_STATETYPE state{};
  omx->fail(Method::GetState, 2, -5);
  EXPECT_EQ(omx->getState(node->node(), &state), android::OK);
  EXPECT_EQ(omx->getState(node->node(), &state), -5);
  EXPECT_EQ(omx->getState(node->node(), &state), android::OK);
  omx->failCall(3, -6);
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  EXPECT_EQ(omx->getState(node->node(), &state), android::OK);
  EXPECT_EQ(node->give(kInputPort, 64), -6);
  EXPECT_EQ(omx->outstandingBuffers(), 0u);
  omx->failWhere(
      [](const Call& call) { return call.method == Method::UseBuffer && call.port == kOutputPort; });
  EXPECT_EQ(node->give(kInputPort, 64), android::OK);
  EXPECT_EQ(node->give(kOutputPort, 64), RecordingOmx::kFailed);
  omx->failNothing();
  EXPECT_EQ(node->give(kOutputPort, 64), android::OK);
  EXPECT_EQ(omx->failures(), 3u);
  // A failed call is known as one, and the server never saw it.
  EXPECT_FALSE(omx->calls(Method::GetState)[1].forwarded);
  EXPECT_EQ(node->definition(kInputPort).bPopulated, OMX_FALSE);
}

TEST_F(RecordingOmxTest, HooksRunAroundACallAndMayBlockAndCall) {
  const auto node = client();
  std::promise<void> entered;
  std::promise<void> goOn;
  std::vector<std::string> order;
  omx->before(Method::SendCommand, [&](const Call& call) {
    order.push_back("before");
    OMX_STATETYPE state{};
    EXPECT_EQ(omx->getState(call.node, &state), android::OK);
    entered.set_value();
    goOn.get_future().wait();
  });
  omx->after(Method::SendCommand,
             [&](const Call& call) { order.push_back(call.status == android::OK ? "after" : "failed"); });
  std::thread caller([&] { node->command(OMX_CommandFlush, 0); });
  entered.get_future().wait();
  EXPECT_EQ(node->state(), OMX_StateLoaded);  // others go on meanwhile
  EXPECT_EQ(omx->count(Method::SendCommand), 0u);
  goOn.set_value();
  EXPECT_TRUE(omx->waitForCalls(Method::SendCommand, 1));
  caller.join();
  EXPECT_EQ(order, (std::vector<std::string>{"before", "after"}));
  omx->before(Method::SendCommand, nullptr);
  EXPECT_EQ(node->command(OMX_CommandFlush, 0), android::OK);
}

TEST_F(RecordingOmxTest, OutstandingNodesAndBuffersAreCounted) {
  auto node = client();
  node->toIdle();
  EXPECT_EQ(omx->outstandingNodes(), 1u);
  EXPECT_EQ(omx->outstandingBuffers(), 4u);
  node->freeBuffer(kInputPort);
  EXPECT_EQ(omx->outstandingBuffers(), 3u);
  omx->fail(Method::FreeNode);
  EXPECT_NE(node->free(), android::OK);
  EXPECT_EQ(omx->abandonedNodes(), 1u);
  EXPECT_EQ(omx->outstandingNodes(), 0u);
  EXPECT_EQ(server->nodeCount(), 1u);
  omx->freeAbandonedNodes();
  EXPECT_EQ(server->nodeCount(), 0u);
  node = client();
  node->toIdle();
  node->free();
  EXPECT_EQ(omx->buffersFreedWithNode(), 4u);
}

TEST(ScriptedMediaServerTest, IsFoundWhileItLivesAndPosesAsTheDevice) {
  const android::sp<android::IServiceManager> manager = android::defaultServiceManager();
  const android::String16 name("media.player");
  const bool loadedOnDemand = omxhost::setLoadOnDemand(false);
  for (const omxhost::Device& device : omxhost::devices()) {
    SCOPED_TRACE(device.name);
    {
      ScriptedMediaServer server(device.name);
      const auto service = android::interface_cast<android::IMediaPlayerService>(manager->getService(name));
      ASSERT_NE(service.get(), nullptr);
      android::List<android::IOMX::ComponentInfo> list;
      EXPECT_EQ(service->getOMX()->listNodes(&list), android::OK);
      EXPECT_EQ(list.size(), device.decoderComponent != nullptr ? 2u : 0u);
      EXPECT_EQ(server.omx().count(Method::ListNodes), 1u);
      server.serveWithoutOmx();
      const auto empty = android::interface_cast<android::IMediaPlayerService>(manager->getService(name));
      EXPECT_EQ(empty->getOMX().get(), nullptr);
      server.unregister();
      EXPECT_EQ(manager->getService(name).get(), nullptr);
      server.serve();
      if (device.decoderComponent != nullptr) {
        OmxClient client(&server.omx(), device.decoderComponent);
        EXPECT_NE(server.leaks(), "");
        EXPECT_EQ(client.free(), android::OK);
        EXPECT_EQ(server.leaks(), "");
      }
    }
    EXPECT_EQ(manager->checkService(name).get(), nullptr);
  }
  omxhost::setLoadOnDemand(loadedOnDemand);
}

}  // namespace
}  // namespace omxtest
