// Messages held, dropped, repeated, forged and late.

#include <atomic>
#include <future>

#include "tests/mediaserver/support_fixture.h"
#include "tests/support/eventually.h"

namespace omxtest {
namespace {

using android::omx_message;

using MessageTapTest = Support;

TEST_F(MessageTapTest, MessagesAreHeldReorderedDroppedRepeatedAndForged) {
  const auto node = client();
  const auto flush = [&](OMX_U32 port) { EXPECT_EQ(node->command(OMX_CommandFlush, port), android::OK); };
  tap().hold(commandComplete(OMX_CommandFlush));
  flush(OMX_ALL);
  flush(0);
  ASSERT_TRUE(tap().waitForHeld(3));
  EXPECT_EQ(node->messages().count(anyMessage()), 0u);
  EXPECT_TRUE(tap().release(1));
  EXPECT_TRUE(tap().waitForDelivered(commandComplete(OMX_CommandFlush, 1)));
  EXPECT_TRUE(tap().discard(1));
  EXPECT_FALSE(tap().release(1));
  tap().releaseAll();
  node->expect(commandComplete(OMX_CommandFlush), 2);
  EXPECT_EQ(node->heard(), (std::vector<std::string>{"complete flush 1", "complete flush 0"}));

  tap().passAll();
  node->messages().clear();
  tap().drop(commandComplete(OMX_CommandFlush, 0), 1);
  tap().repeat(commandComplete(OMX_CommandFlush, 1), 1);
  flush(OMX_ALL);
  flush(OMX_ALL);
  node->expect(commandComplete(OMX_CommandFlush, 1), 3);
  EXPECT_EQ(node->messages().count(commandComplete(OMX_CommandFlush, 0)), 1u);

  node->messages().clear();
  tap().setFilter([](const omx_message&) { return Fate::Hold; });
  flush(OMX_ALL);
  ASSERT_TRUE(tap().waitForHeld(2));
  tap().releaseAllReversed();
  node->expectComplete(OMX_CommandFlush, 0);
  EXPECT_EQ(node->heard(), (std::vector<std::string>{"complete flush 1", "complete flush 0"}));

  // Filters do not concern forged messages.
  node->messages().clear();
  omx_message odd = makeFillBufferDone(&odd, 99, OMX_BUFFERFLAG_EOS, 5);
  EXPECT_TRUE(tap().forge(node->node(), odd));
  EXPECT_TRUE(tap().forge(node->node(), makeEvent(OMX_EventError, 3, 4)));
  node->expect(anyMessage(), 2);
  const omx_message heard = node->messages().all()[0];
  EXPECT_EQ(heard.node, node->node());
  EXPECT_EQ(heard.u.extended_buffer_data.buffer, static_cast<void*>(&odd));
  EXPECT_EQ(heard.u.extended_buffer_data.range_length, 99u);
  EXPECT_FALSE(tap().forge(&odd, odd));
}

TEST_F(MessageTapTest, LateMessagesArriveAfterTheNodeHasGone) {
  auto node = running();
  const auto id = node->node();
  tap().hold(anyMessage());
  node->empty(0, "late");
  ASSERT_TRUE(tap().waitForHeld(2));
  node->messages().clear();
  ASSERT_EQ(node->free(), android::OK);
  EXPECT_EQ(server->nodeCount(), 0u);
  EXPECT_EQ(node->messages().count(anyMessage()), 0u);
  tap().releaseAll();
  node->expect(anyMessage(), 2);
  EXPECT_TRUE(tap().forge(id, makeEvent(OMX_EventError, 1, 2)));
  node->expect(eventIs(OMX_EventError));
  tap().forgetFreedNodes();
  EXPECT_FALSE(tap().forge(id, makeEvent(OMX_EventError, 1, 2)));
  EXPECT_EQ(node->messages().getStrongCount(), 1);
}

TEST_F(MessageTapTest, FreeNodeDropsWhatWaitsAndWaitsForTheDeliveryInProgress) {
  class BlockingObserver : public android::BnOMXObserver {
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
  const android::sp<BlockingObserver> observer = new BlockingObserver;
  android::IOMX::node_id node = nullptr;
  ASSERT_EQ(omx->allocateNode(kDecoder, observer, &node), android::OK);
  omx->sendCommand(node, OMX_CommandFlush, -1);
  ASSERT_TRUE(eventually([&] { return observer->begun == 1; }));
  auto freed = std::async(std::launch::async, [&] { return omx->freeNode(node); });
  EXPECT_TRUE(eventually([&] { return server->nodeCount() == 0; }));
  EXPECT_EQ(omx->count(Method::FreeNode), 0u);
  observer->goOn = true;
  EXPECT_EQ(freed.get(), android::OK);
  const int seen = observer->begun;
  EXPECT_EQ(observer->ended, seen);
  // Had anything been left waiting, it would come before this one.
  EXPECT_TRUE(tap().forge(node, makeEvent(OMX_EventError, 1, 2)));
  EXPECT_TRUE(tap().waitForDelivered(eventIs(OMX_EventError)));
  EXPECT_EQ(observer->begun, seen + 1);
}

}  // namespace
}  // namespace omxtest
