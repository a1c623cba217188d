// Nodes come and go: freed from any state, by anybody and at any moment; ids that are wrong harm nobody.

#include <atomic>
#include <thread>

#include "tests/mediaserver/node_fixture.h"
#include "tests/support/eventually.h"

namespace omxtest {
namespace {

using android::omx_message;
using mediaserver::kInputPort;
using mediaserver::kOutputPort;

constexpr auto kAllPorts = static_cast<OMX_S32>(OMX_ALL);

class Lifetime : public NodeTest {
 protected:
  using NodeId = android::IOMX::node_id;
  using BufferId = android::IOMX::buffer_id;

  // Every call with these ids and otherwise sound arguments: none may succeed.
  void expectAllRefused(NodeId node, BufferId buffer) {
    std::vector<uint8_t> record(sizeof(mediaserver::PortDefinition));
    OMX_STATETYPE state{};
    OMX_INDEXTYPE index{};
    OMX_U32 usage = 0;
    BufferId given = &given;
    void* data = &data;
    const android::sp<android::MemoryDealer> dealer = new android::MemoryDealer(4096, "test");
    const android::sp<android::IMemory> block = dealer->allocate(4096);
    const auto port = OMX_IndexParamPortDefinition;
    const auto crop = OMX_IndexConfigCommonOutputCrop;
    EXPECT_NE(server->sendCommand(node, OMX_CommandFlush, 0), android::OK);
    EXPECT_NE(server->getParameter(node, port, record.data(), record.size()), android::OK);
    EXPECT_NE(server->setParameter(node, port, record.data(), record.size()), android::OK);
    EXPECT_NE(server->getConfig(node, crop, record.data(), record.size()), android::OK);
    EXPECT_NE(server->setConfig(node, crop, record.data(), record.size()), android::OK);
    EXPECT_NE(server->getState(node, &state), android::OK);
    EXPECT_NE(server->storeMetaDataInBuffers(node, 0, OMX_FALSE), android::OK);
    EXPECT_NE(server->enableGraphicBuffers(node, 0, OMX_FALSE), android::OK);
    EXPECT_NE(server->getGraphicBufferUsage(node, 0, &usage), android::OK);
    EXPECT_NE(server->useBuffer(node, 0, block, &given), android::OK);
    EXPECT_EQ(given, nullptr);
    EXPECT_NE(server->allocateBuffer(node, 0, 4096, &given, &data), android::OK);
    EXPECT_EQ(data, nullptr);
    EXPECT_NE(server->allocateBufferWithBackup(node, 0, block, &given), android::OK);
    EXPECT_NE(server->freeBuffer(node, 0, buffer), android::OK);
    EXPECT_NE(server->fillBuffer(node, buffer), android::OK);
    EXPECT_NE(server->emptyBuffer(node, buffer, 0, 0, 0, 0), android::OK);
    EXPECT_NE(server->getExtensionIndex(node, "x", &index), android::OK);
    EXPECT_NE(server->freeNode(node), android::OK);
  }
};

TEST_F(Lifetime, ComponentsAreListedAndAllocatedByTheirExactNames) {
  android::List<android::IOMX::ComponentInfo> list;
  list.push_back({});
  ASSERT_EQ(server->listNodes(&list), android::OK);
  ASSERT_EQ(list.size(), 2u);
  EXPECT_STREQ(list.begin()->mName.string(), kDecoder);
  EXPECT_STREQ(list.begin()->mRoles.begin()->string(), "video_decoder.avc");
  EXPECT_EQ(server->listNodes(nullptr), kUnknownError);
  EXPECT_TRUE(server->livesLocally(getpid()));

  const android::sp<CollectingObserver> observer = new CollectingObserver;
  for (const char* name : {"Decoder", "decode", "decoder ", "", static_cast<const char*>(nullptr)}) {
    NodeId node = this;
    EXPECT_EQ(server->allocateNode(name, observer, &node), kUnknownError);
    EXPECT_EQ(node, nullptr);
  }
  NodeId node = this;
  EXPECT_EQ(server->allocateNode(kDecoder, nullptr, &node), kUnknownError);
  EXPECT_EQ(node, nullptr);
  EXPECT_EQ(server->allocateNode(kDecoder, observer, nullptr), kUnknownError);
  EXPECT_EQ(decoder.liveCodecs(), 0u);
}

TEST_F(Lifetime, WrongIdsAreRefusedByEveryCall) {
  const auto node = running();
  const auto other = running(kEncoder);
  const BufferId buffer = node->buffers(kOutputPort)[0].id;
  std::atomic<int> anything{0};
  expectAllRefused(nullptr, buffer);
  expectAllRefused(&anything, buffer);  // an address: nothing may look behind it
  expectAllRefused(reinterpret_cast<NodeId>(UINTPTR_MAX), buffer);
  // A buffer of somebody else.
  EXPECT_EQ(server->freeBuffer(other->node(), kOutputPort, buffer), kUnknownError);
  EXPECT_EQ(server->fillBuffer(other->node(), buffer), kUnknownError);
  EXPECT_EQ(server->emptyBuffer(other->node(), node->buffers(kInputPort)[0].id, 0, 0, 0, 0), kUnknownError);
  const NodeId freed = node->node();
  EXPECT_EQ(node->free(), android::OK);
  expectAllRefused(freed, buffer);
}

TEST_F(Lifetime, NullArgumentsAreRefused) {
  const auto node = client();
  node->command(OMX_CommandStateSet, OMX_StateIdle);
  BufferId buffer = nullptr;
  void* data = nullptr;
  const android::sp<android::MemoryDealer> dealer = new android::MemoryDealer(64, "test");
  const android::sp<android::IMemory> block = dealer->allocate(64);
  EXPECT_EQ(server->getState(node->node(), nullptr), kUnknownError);
  EXPECT_EQ(server->useBuffer(node->node(), 0, nullptr, &buffer), kUnknownError);
  EXPECT_EQ(server->useBuffer(node->node(), 0, block, nullptr), kUnknownError);
  EXPECT_EQ(server->allocateBufferWithBackup(node->node(), 0, nullptr, &buffer), kUnknownError);
  EXPECT_EQ(server->allocateBuffer(node->node(), 0, 64, nullptr, &data), kUnknownError);
  EXPECT_EQ(server->allocateBuffer(node->node(), 0, 64, &buffer, nullptr), kUnknownError);
  EXPECT_EQ(server->allocateBuffer(node->node(), 0, SIZE_MAX, &buffer, &data), kUnknownError);
  EXPECT_EQ(server->useBuffer(node->node(), 2, block, &buffer), kUnknownError);
  EXPECT_EQ(server->getExtensionIndex(node->node(), nullptr, nullptr), kUnknownError);
}

TEST_F(Lifetime, FreeingWorksFromEveryStateWithBuffersOnEitherSide) {
  for (const OMX_STATETYPE state :
       {OMX_StateLoaded, OMX_StateIdle, OMX_StateExecuting, OMX_StatePause, OMX_StateWaitForResources}) {
    const auto node = client();
    reach(node.get(), state);
    decoder.holdInput();
    if (state == OMX_StateExecuting || state == OMX_StatePause) {
      node->fillAll();
      node->empty(0, "never seen");
    }
    EXPECT_EQ(node->free(), android::OK);
    EXPECT_EQ(decoder.liveCodecs(), 0u);
    EXPECT_EQ(decoder.starts(), decoder.stops());
    decoder.passInput();
  }
  const auto halfWay = client();
  halfWay->command(OMX_CommandStateSet, OMX_StateIdle);
  halfWay->give(kInputPort);
}

// Counts what arrives, and can stop a delivery.
class SlowObserver : public android::BnOMXObserver {
 public:
  void onMessage(const omx_message&) override {
    ++begun;
    EXPECT_TRUE(eventually([this] { return goOn.load(); }));
    ++ended;
  }
  std::atomic<int> begun{0};
  std::atomic<int> ended{0};
  std::atomic<bool> goOn{false};
};

TEST_F(Lifetime, NothingIsDeliveredOnceFreeNodeHasReturned) {
  const android::sp<SlowObserver> observer = new SlowObserver;
  NodeId node = nullptr;
  ASSERT_EQ(server->allocateNode(kDecoder, observer, &node), android::OK);
  for (int i = 0; i < 5; ++i) server->sendCommand(node, OMX_CommandFlush, kAllPorts);
  ASSERT_TRUE(eventually([&] { return observer->begun == 1; }));
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
}

TEST_F(Lifetime, ANodeCanBeFreedFromInsideItsOwnDelivery) {
  class FreeingObserver : public android::BnOMXObserver {
   public:
    void onMessage(const omx_message& message) override {
      EXPECT_EQ(server->freeNode(message.node), android::OK);
      done = true;
    }
    android::sp<mediaserver::OmxServer> server;
    std::atomic<bool> done{false};
  };
  const android::sp<FreeingObserver> observer = new FreeingObserver;
  observer->server = server;
  NodeId node = nullptr;
  ASSERT_EQ(server->allocateNode(kDecoder, observer, &node), android::OK);
  server->sendCommand(node, OMX_CommandFlush, kAllPorts);
  EXPECT_TRUE(eventually([&] { return observer->done.load(); }));
  EXPECT_EQ(server->nodeCount(), 0u);
  EXPECT_TRUE(eventually([&] { return observer->getStrongCount() == 1; }));
}

TEST_F(Lifetime, ANodeIsFreedOnceHoweverManyTry) {
  for (int round = 0; round < 20; ++round) {
    const auto node = running();
    const NodeId id = node->node();
    std::atomic<int> freed{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
      threads.emplace_back([&] { freed += server->freeNode(id) == android::OK ? 1 : 0; });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(freed, 1);
  }
}

TEST_F(Lifetime, AServerThatGoesAwayEndsItsNodes) {
  const auto node = running();
  // The client keeps the server alive; a second one is all our own.
  auto* const other = new mediaserver::OmxServer({decoder.component("other")});
  android::sp<mediaserver::OmxServer> held = other;
  const android::sp<CollectingObserver> observer = new CollectingObserver;
  NodeId id = nullptr;
  ASSERT_EQ(held->allocateNode("other", observer, &id), android::OK);
  held->sendCommand(id, OMX_CommandFlush, kAllPorts);
  EXPECT_EQ(decoder.liveCodecs(), 2u);
  held.clear();
  EXPECT_EQ(decoder.liveCodecs(), 1u);
  EXPECT_EQ(observer->getStrongCount(), 1);
}

TEST_F(Lifetime, OneClientsSlownessIsNotAnothersTrouble) {
  const android::sp<SlowObserver> slow = new SlowObserver;
  NodeId blocked = nullptr;
  ASSERT_EQ(server->allocateNode(kDecoder, slow, &blocked), android::OK);
  server->sendCommand(blocked, OMX_CommandFlush, kAllPorts);
  ASSERT_TRUE(eventually([&] { return slow->begun == 1; }));
  const auto node = running();
  node->empty(0, "passes");
  node->expect(fillBufferDone());
  // Its own calls work too.
  EXPECT_EQ(server->sendCommand(blocked, OMX_CommandFlush, kAllPorts), android::OK);
  slow->goOn = true;
  EXPECT_TRUE(eventually([&] { return slow->ended == 4; }));
  EXPECT_EQ(server->freeNode(blocked), android::OK);
}

}  // namespace
}  // namespace omxtest
