// The buffer pool: made, counted and freed.
#include <limits.h>
#include <unistd.h>

#include <binder/MemoryHeapBase.h>

#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using mediaserver::PortDefinition;

class BuffersTest : public SessionTest {
 protected:
  // Connected, with ports of `count` buffers of `size` bytes, and the component on its way to Idle, where
  // it takes buffers.
  void connectTowardsIdle(OMX_U32 count, OMX_U32 size) {
    for (const OMX_U32 port : {0u, 1u}) {
      script().editPort(port, [&](PortDefinition& definition) {
        definition.nBufferCountActual = count;
        definition.nBufferSize = size;
      });
    }
    connect();
    // What the component thinks of the moments at which a test frees buffers.
    messages().setFilter([](const auto& message) { return anyEvent()(message) ? Fate::Drop : Fate::Pass; });
    ASSERT_EQ(omx().sendCommand(_session->_node, OMX_CommandStateSet, OMX_StateIdle), android::OK);
  }

  const android::Vector<BufferInfo>& records(int port) const { return _session->_portBuffers[port]; }
};

TEST_F(BuffersTest, MakesBuffersInEachModeAndKeepsARecordOfThem) {
  const struct {
    int mode;
    bool heap;
    const char* call;  // empty: none
  } cases[] = {{0, false, "allocateBufferWithBackup"},
               {0, true, "allocateBuffer"},
               {1, false, "useBuffer"},
               {1, true, "useBuffer"},
               {7, false, ""}};
  connectTowardsIdle(3, 1000);
  for (const auto& each : cases) {
    SCOPED_TRACE(std::to_string(each.mode) + (each.heap ? " with a heap" : ""));
    _session->setMPmemInfo(each.heap ? new android::MemoryHeapBase(4096) : nullptr);
    _session->setPortBufferModes(each.mode, each.mode);
    omx().clearCalls();
    ASSERT_EQ(_session->allocateBuffersOnPort(1), OMXI_OK);
    const std::vector<Call> calls = omx().calls();
    const bool calling = each.call[0] != '\0';
    ASSERT_EQ(calls.size(), calling ? 4u : 1u);
    ASSERT_EQ(records(1).size(), 3u);
    for (size_t i = 0; i < 3; ++i) {
      const BufferInfo& record = records(1)[i];
      EXPECT_EQ(record.bufferId, calling ? calls[i + 1].buffer : nullptr);
      if (calling) {
        EXPECT_STREQ(name(calls[i + 1].method), each.call);
      }
      if (calling) {
        EXPECT_EQ(calls[i + 1].port, 1u);
      }
      EXPECT_FALSE(record.busy);
      EXPECT_EQ(record.length, 1000u);
      EXPECT_NE(record.data, nullptr);
      if (each.mode == 0 && each.heap) {
        EXPECT_TRUE(record.memory == nullptr);
        continue;
      }
      ASSERT_TRUE(record.memory != nullptr);
      EXPECT_EQ(record.data, record.memory->pointer());
      EXPECT_EQ(record.memory->size(), 1000u);
      EXPECT_EQ(record.memory->offset(), static_cast<ssize_t>(i * 1024));
    }
    EXPECT_EQ(_session->freeBuffersOnPort(1), calling ? android::status_t{android::OK} : kRefused);
    EXPECT_TRUE(records(1).isEmpty());
  }
  const auto heap = _session->_memoryDealer[1]->getMemoryHeap();
  EXPECT_EQ(heap->virtualSize(), 4096u);
  char name[PATH_MAX] = {};
  ASSERT_GT(readlink(("/proc/self/fd/" + std::to_string(heap->heapID())).c_str(), name, sizeof(name) - 1), 0);
  EXPECT_NE(std::string(name).find("QCOMXWrapper"), std::string::npos) << name;
}

TEST_F(BuffersTest, BoundsTheNumberOfBuffersAndOfPorts) {
  const struct {
    int port;
    OMX_U32 count;
    int status;  // of the definition, in the line; 1: no line
  } cases[] = {{0, 0, 1}, {0, 10000, 1}, {0, 10001, 0}, {1, 0xffffffff, 0}, {2, 1, -75}, {-1, 1, -75}};
  connect();
  _session->setPortBufferModes(7, 7);  // the component need not hold them
  for (const auto& each : cases) {
    SCOPED_TRACE(std::to_string(each.port) + " " + std::to_string(each.count));
    _log.clear();
    PortDefinition answer{};
    answer.nPortIndex = static_cast<OMX_U32>(each.port);
    answer.nBufferCountActual = each.count;
    answer.nBufferSize = 32;
    script().answer(OMX_IndexParamPortDefinition, answer);
    EXPECT_EQ(_session->allocateBuffersOnPort(each.port),
              each.status == 1 ? OMXI_OK : OMXI_ERR_GET_PORT_DEFINITION);
    const LogLines refusal{"E OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: " +
                           std::to_string(each.status)};
    EXPECT_EQ(log(), each.status == 1 ? LogLines{} : refusal);
    if (each.status == 1) {
      EXPECT_EQ(records(0).size(), each.count);
    }
    EXPECT_EQ(_session->freeBuffersOnPort(static_cast<unsigned long>(each.port)) == android::BAD_INDEX,
              each.status == -75);
    EXPECT_TRUE(_session->portBuffersHaveBeenReturned(each.port));
  }
}

TEST_F(BuffersTest, MakesNoRecordsWithoutMemory) {
  connectTowardsIdle(5, 1000);
  const faults::Fault failed(faults::Failing::NothrowNew, 5 * sizeof(BufferInfo));
  EXPECT_EQ(_session->allocateBuffersOnPort(0), OMXI_ERR_ALLOCATE_MEMORY);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - No memory for 5 buffer records of port 0"});
  EXPECT_TRUE(records(0).isEmpty());
  const faults::Fault other(faults::Failing::New, sizeof(android::MemoryDealer));
  EXPECT_EQ(_session->allocateBuffersOnPort(0), OMXI_ERR_ALLOCATE_MEMORY);
}

TEST_F(BuffersTest, FreesEveryBufferWhateverTheComponentSays) {
  const struct {
    std::vector<size_t> failing;  // the n-th freeBuffer
    android::status_t result;
  } cases[] = {{{}, android::OK}, {{1}, -101}, {{1, 3}, -103}, {{1, 2, 3}, -103}};
  for (const auto& each : cases) {
    connectTowardsIdle(3, 32);
    ASSERT_EQ(_session->allocateBuffersOnPort(0), OMXI_OK);
    omx().clearCalls();
    std::vector<void*> ids;
    for (const size_t place : {2u, 1u, 0u}) ids.push_back(bufferId(0, place));
    for (const size_t nth : each.failing) {
      omx().fail(Method::FreeBuffer, nth, -100 - static_cast<android::status_t>(nth));
    }
    EXPECT_EQ(_session->freeBuffersOnPort(0), each.result);
    EXPECT_TRUE(records(0).isEmpty());
    std::vector<void*> freed;
    for (const Call& call : omx().calls(Method::FreeBuffer)) freed.push_back(call.buffer);
    EXPECT_EQ(freed, ids);
    EXPECT_EQ(log(), LogLines{});
    EXPECT_EQ(_session->threadError(), OMXI_OK);
    destroy();
  }
}

TEST_F(BuffersTest, GivesClientMemoryBackToItsDealer) {
  connectTowardsIdle(1, 4096);
  for (const int mode : {1, 0}) {
    _session->setPortBufferModes(mode, mode);
    ASSERT_EQ(_session->allocateBuffersOnPort(0), OMXI_OK);
    const android::sp<android::IMemory> block = records(0)[0].memory;  // somebody else's reference
    const android::sp<android::MemoryDealer> dealer = _session->_memoryDealer[0];
    ASSERT_EQ(_session->freeBuffersOnPort(0), android::OK);
    // Only mode 1 does not wait for the last reference.
    EXPECT_EQ(dealer->allocate(4096) != nullptr, mode == 1);
  }
}

TEST_F(BuffersTest, RecordsAFailureWhenBuffersRemain) {
  connectTowardsIdle(2, 32);
  ASSERT_EQ(_session->allocateBuffersOnPort(0), OMXI_OK);
  // No path of the session's own leads there: somebody adds records while the port is freed.
  omx().before(Method::FreeBuffer,
               [this](const Call&) { _session->_portBuffers[0].push_back(BufferInfo()); });
  static_cast<void>(_session->freeBuffersOnPort(0));
  EXPECT_EQ(log(), LogLines{"E Buffer not empty after deallocated.\n"});
  EXPECT_EQ(_session->threadError(), OMXI_ERR_BUFFER_NOT_EMPTIED);
  EXPECT_EQ(_application.inputCallbacks().size(), 1u);
  EXPECT_EQ(records(0).size(), 2u);
}

TEST_F(BuffersTest, DropsUndeliveredOutputWithItsBuffers) {
  for (const bool freeing : {false, true}) {
    start();
    Gate& gate = newGate();
    _application.onOutput([&](const Output&) {
      gate.pass();
      return 1;  // nothing goes back to the component
    });
    const size_t before = _application.outputs().size();
    componentProduces("delivered");
    gate.waitForArrival();
    for (const char* text : {"dropped", "dropped too"}) componentProduces(text);
    waitForBusy(1, kOutputs - 3);
    if (freeing) {
      // Waits for the callback, so the queue is emptied on another thread.
      Later<int> done("freeBuffersOnPort()", [this] { return _session->freeBuffersOnPort(1); });
      requireUnderLock([](SessionState& state) { return state.ports[1].freeing; }, "the port's release");
      EXPECT_FALSE(eventually([&] { return done.isDone(); }, std::chrono::milliseconds(50)));
      gate.open();
      done.result();
    } else {
      static_cast<void>(_session->allocateBuffersOnPort(1));  // refused, but the queue goes first
      gate.open();
    }
    feed("more");  // wakes the output thread once more
    destroy();
    EXPECT_EQ(_application.outputs()[before].bytes, "delivered");
    for (const std::string& text : _application.outputTexts()) EXPECT_EQ(text.find("dropped"), text.npos);
    messages().forgetFreedNodes();
  }
}

}  // namespace
}  // namespace omxtest
