// Random calls, sound ones and nonsense, on one node and from several threads. Whatever is called: every
// buffer comes back at most once for each time it was sent and never after it was freed, nothing is left
// over, and the node still does its work or goes.

#include <atomic>
#include <map>
#include <random>
#include <thread>

#include "tests/mediaserver/node_fixture.h"
#include "tests/support/eventually.h"

namespace omxtest {
namespace {

using android::omx_message;

// Keeps account of one node's buffers: what the node was given must balance with what it gives back.
class AccountingObserver : public android::BnOMXObserver {
 public:
  using BufferId = android::IOMX::buffer_id;

  void onMessage(const omx_message& message) override {
    std::lock_guard<std::mutex> lock(_mutex);
    if (message.type == omx_message::EMPTY_BUFFER_DONE) back(message.u.buffer_data.buffer);
    if (message.type == omx_message::FILL_BUFFER_DONE) back(message.u.extended_buffer_data.buffer);
    if (errorIs(OMX_ErrorNotImplemented)(message)) ++marks;
  }

  // Before the call, as the answer may overtake it; taken back when the call fails.
  void sent(BufferId buffer, int times) {
    std::lock_guard<std::mutex> lock(_mutex);
    _out[buffer] += times;
  }

  std::atomic<int> marks{0};  // commands to mark that were answered

 private:
  void back(BufferId buffer) { EXPECT_GE(--_out[buffer], 0) << "came back more often than it was sent"; }

  std::mutex _mutex;
  std::map<BufferId, int> _out;
};

class RandomCalls : public NodeTest {
 protected:
  using NodeId = android::IOMX::node_id;
  using BufferId = android::IOMX::buffer_id;

  // Buffer ids that any thread may use, in any way.
  class Ids {
   public:
    void add(BufferId id) {
      std::lock_guard<std::mutex> lock(_mutex);
      _ids.push_back(id);
    }
    BufferId any(unsigned choice) {
      std::lock_guard<std::mutex> lock(_mutex);
      if (_ids.empty() || choice % 16 == 0) return reinterpret_cast<BufferId>(uintptr_t{choice});
      return _ids[choice % _ids.size()];
    }

   private:
    std::mutex _mutex;
    std::vector<BufferId> _ids;
  };

  // Callers that never wait would keep the component from its turn.
  void letItWork(NodeId node, AccountingObserver* account) {
    const int before = account->marks;
    OMX_STATETYPE state{};
    if (server->sendCommand(node, OMX_CommandMarkBuffer, 0) != android::OK) return;
    EXPECT_TRUE(
        eventually([&] { return account->marks > before || server->getState(node, &state) != android::OK; }));
  }

  void call(NodeId node, AccountingObserver* account, Ids* ids, std::minstd_rand* random) {
    const auto pick = [&](unsigned limit) { return static_cast<unsigned>((*random)() >> 4) % limit; };
    const OMX_U32 port = pick(20) == 0 ? pick(1000) : pick(kPortCount);
    switch (pick(40)) {
      case 0:
        // Not Invalid, which would end the node's life; and not often far away from Executing.
        server->sendCommand(node, OMX_CommandStateSet,
                            static_cast<OMX_S32>(pick(8) == 0 ? 1 + pick(5) : 2 + pick(2)));
        break;
      case 1:
        if (pick(3) != 0) break;
        server->sendCommand(node, static_cast<OMX_COMMANDTYPE>(1 + pick(5)), static_cast<OMX_S32>(port));
        break;
      case 2:
        if (pick(4) == 0) decoder.announce(8 + pick(8), 4);
        break;
      case 3:
        server->sendCommand(node, OMX_CommandPortEnable, -1);
        break;
      case 4:
      case 5: {
        BufferId id = nullptr;
        void* data = nullptr;
        if (server->allocateBuffer(node, port, 40 + pick(100), &id, &data) == android::OK) ids->add(id);
        break;
      }
      case 6:
        server->freeBuffer(node, port, ids->any(pick(1000)));
        break;
      case 7: {
        PortDefinition definition{};
        definition.nPortIndex = port;
        server->getParameter(node, OMX_IndexParamPortDefinition, &definition, sizeof(definition));
        definition.nBufferCountActual = 1 + pick(3);
        server->setParameter(node, OMX_IndexParamPortDefinition, &definition, sizeof(definition) - pick(2));
        break;
      }
      default: {
        const BufferId id = ids->any(pick(1000));
        account->sent(id, 1);
        const OMX_U32 flags = pick(10) == 0 ? OMX_BUFFERFLAG_EOS : 0;
        const bool sent =
            pick(2) == 0 ? server->fillBuffer(node, id) == android::OK
                         : server->emptyBuffer(node, id, pick(8), pick(64), flags, pick(99)) == android::OK;
        if (!sent) account->sent(id, -1);
        break;
      }
    }
  }
};

TEST_F(RandomCalls, FromSeveralThreadsKeepTheBooksInOrder) {
  constexpr int kRounds = 30;
  constexpr int kThreads = 3;
  constexpr int kCalls = 400;
  for (int round = 0; round < kRounds; ++round) {
    SCOPED_TRACE(round);
    const android::sp<AccountingObserver> account = new AccountingObserver;
    NodeId node = nullptr;
    ASSERT_EQ(server->allocateNode(kDecoder, account, &node), android::OK);
    Ids ids;
    for (const BufferId id : execute(node)) ids.add(id);
    std::atomic<int> made{0};
    std::vector<std::thread> threads;
    for (int thread = 0; thread < kThreads; ++thread) {
      threads.emplace_back([&, seed = static_cast<unsigned>(round * kThreads + thread + 1)] {
        std::minstd_rand random(seed);
        for (int i = 0; i < kCalls; ++i, ++made) {
          call(node, account.get(), &ids, &random);
          if (i % 10 == 0) letItWork(node, account.get());
        }
      });
    }
    // Half of the nodes are freed under the callers' feet.
    const int enough = kThreads * kCalls * (round % 2 == 0 ? round : kRounds) / kRounds;
    EXPECT_TRUE(eventually([&] { return made >= enough; }));
    if (round % 2 != 0) {
      for (std::thread& thread : threads) thread.join();
      threads.clear();
    }
    EXPECT_EQ(server->freeNode(node), android::OK);
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(decoder.liveCodecs(), 0u);
    EXPECT_EQ(decoder.starts(), decoder.stops());
  }
  EXPECT_GT(decoder.inputCount(), 0u) << "chance led to refusals only";
}

}  // namespace
}  // namespace omxtest
