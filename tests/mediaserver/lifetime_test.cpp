// Nodes come and go: freed from any state, by anybody and at any moment; ids that are wrong harm nobody.

#include <atomic>
#include <thread>

#include <omxhost/log.h>

#include "tests/mediaserver/node_fixture.h"
#include "tests/support/eventually.h"

namespace omxtest {
namespace {

using NodeId = android::IOMX::node_id;
using BufferId = android::IOMX::buffer_id;
constexpr auto kAllPorts = static_cast<OMX_S32>(OMX_ALL);

// Counts what arrives, can stop a delivery, and can free its node from inside one.
class SlowObserver : public android::BnOMXObserver {
 public:
  void onMessage(const android::omx_message& message) override {
    ++begun;
    EXPECT_TRUE(eventually([this] { return goOn.load(); }));
    EXPECT_TRUE(freeing == nullptr || freeing->freeNode(message.node) == android::OK);
    ++ended;
  }
  std::atomic<int> begun{0};
  std::atomic<int> ended{0};
  std::atomic<bool> goOn{false};
  android::sp<android::IOMX> freeing;
};

class Lifetime : public NodeTest {
 protected:
  // Calls with these ids and otherwise sound arguments: none may succeed.
  void expectRefused(NodeId node, BufferId buffer) {
    BufferId given = &given;
    void* data = &data;
    EXPECT_EQ(server->sendCommand(node, OMX_CommandFlush, 0), kUnknownError);
    EXPECT_EQ(server->allocateBuffer(node, 0, 4096, &given, &data), kUnknownError);
    EXPECT_TRUE(given == nullptr && data == nullptr);
    EXPECT_EQ(server->freeBuffer(node, kOutputPort, buffer), kUnknownError);
    EXPECT_EQ(server->fillBuffer(node, buffer), kUnknownError);
    EXPECT_EQ(server->emptyBuffer(node, buffer, 0, 0, 0, 0), kUnknownError);
    EXPECT_EQ(server->freeNode(node), kUnknownError);
  }
};

TEST_F(Lifetime, WrongNamesIdsAndArgumentsAreRefused) {
  const android::sp<CollectingObserver> observer = new CollectingObserver;
  for (const char* name : {"Decoder", "decode", static_cast<const char*>(nullptr), kDecoder}) {
    NodeId none = this;
    EXPECT_EQ(server->allocateNode(name, name != kDecoder ? observer : nullptr, &none), kUnknownError);
    EXPECT_EQ(none, nullptr);
  }
  EXPECT_EQ(decoder.liveCodecs(), 0u);

  const auto node = running();
  const auto other = running(kEncoder);
  const BufferId buffer = node->buffers(kOutputPort)[0].id;
  std::atomic<int> anything{0};
  expectRefused(nullptr, buffer);
  expectRefused(&anything, buffer);  // an address: nothing may look behind it
  // A buffer of somebody else.
  EXPECT_EQ(server->freeBuffer(other->node(), kOutputPort, buffer), kUnknownError);
  EXPECT_EQ(server->fillBuffer(other->node(), buffer), kUnknownError);
  EXPECT_EQ(server->emptyBuffer(other->node(), node->buffers(kInputPort)[0].id, 0, 0, 0, 0), kUnknownError);
  const NodeId freed = node->node();
  EXPECT_EQ(node->free(), android::OK);
  expectRefused(freed, buffer);
}

// A client that ends without a word: its nodes go, whatever they were doing, and nobody else's.
TEST_F(Lifetime, NodesGoWithTheClientThatLetsGoOfItsObserver) {
  const auto other = running(kEncoder);
  const omxhost::LogCapture log;
  android::sp<SlowObserver> observer = new SlowObserver;
  NodeId nodes[2] = {};
  BufferId buffer = nullptr;
  void* data = nullptr;
  for (NodeId& node : nodes) {
    ASSERT_EQ(server->allocateNode(kDecoder, observer, &node), android::OK);
    server->sendCommand(node, OMX_CommandStateSet, OMX_StateIdle);
    for (OMX_U32 i = 0; i < 4; ++i) {
      EXPECT_EQ(server->allocateBuffer(node, i % kPortCount, 64, &buffer, &data), android::OK);
    }
    server->sendCommand(node, OMX_CommandStateSet, OMX_StateExecuting);
  }
  ASSERT_TRUE(eventually([&] { return observer->begun == 2; }));
  EXPECT_EQ(server->nodeCount(), 3u);
  // Now the deliveries are the last that hold it, and one of them lets go last.
  SlowObserver* const delivering = observer.get();  // alive until it may go on
  observer.clear();
  delivering->goOn = true;
  EXPECT_TRUE(eventually([&] { return log.count("its client has gone away") == 2; }));
  EXPECT_EQ(server->nodeCount(), 1u);
  EXPECT_TRUE(eventually([&] { return decoder.liveCodecs() == 0; }));
  for (const NodeId node : nodes) EXPECT_EQ(server->freeNode(node), kUnknownError);
  EXPECT_EQ(decoder.starts(), decoder.stops());
  other->empty(0, "unharmed");
  other->expect(fillBufferDone());
}

TEST_F(Lifetime, NothingIsDeliveredOnceFreeNodeHasReturnedAndSlownessIsNobodyElsesTrouble) {
  const android::sp<SlowObserver> observer = new SlowObserver;
  NodeId node = nullptr;
  ASSERT_EQ(server->allocateNode(kDecoder, observer, &node), android::OK);
  for (int i = 0; i < 5; ++i) server->sendCommand(node, OMX_CommandFlush, kAllPorts);
  ASSERT_TRUE(eventually([&] { return observer->begun == 1; }));
  const auto other = running();
  other->empty(0, "passes");
  other->expect(fillBufferDone());
  std::atomic<bool> returned{false};
  std::thread freeing([&] {
    EXPECT_EQ(server->freeNode(node), android::OK);
    returned = true;
  });
  // The id is gone at once, though the delivery in progress is waited for.
  OMX_STATETYPE state{};
  EXPECT_TRUE(eventually([&] { return server->getState(node, &state) != android::OK; }));
  EXPECT_FALSE(returned);
  observer->goOn = true;
  freeing.join();
  EXPECT_EQ(observer->begun, observer->ended);
  EXPECT_EQ(observer->getStrongCount(), 1) << "nobody is left who could call";

  // A node that is freed from inside its own delivery.
  observer->freeing = server;
  ASSERT_EQ(server->allocateNode(kDecoder, observer, &node), android::OK);
  const int ended = observer->ended;
  server->sendCommand(node, OMX_CommandFlush, kAllPorts);
  EXPECT_TRUE(eventually([&] { return observer->ended > ended && observer->getStrongCount() == 1; }));
  EXPECT_EQ(server->nodeCount(), 1u);
  observer->freeing = nullptr;
}

}  // namespace
}  // namespace omxtest
