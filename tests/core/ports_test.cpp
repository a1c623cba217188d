// Port definitions, and the buffer pool: made, counted and freed.
#include <limits.h>
#include <unistd.h>

#include <binder/MemoryHeapBase.h>

#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using mediaserver::PortDefinition;

class PortsTest : public SessionTest {
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

TEST_F(PortsTest, PrintsAPortForDiagnosisAndKeepsItsFrameRate) {
  connect();
  EXPECT_EQ(_session->setupPortParameters(0, 320, 240, 30), OMXI_OK);
  EXPECT_EQ(_session->setupPortParameters(0, 322, 242, -1), OMXI_OK);
  EXPECT_EQ(omx().calls().back().as<PortDefinition>()->format.video.xFramerate, 30u << 16);
  EXPECT_EQ(_session->debugPortParameters(0), OMXI_OK);
  EXPECT_EQ(log().size(), 13u);
  EXPECT_EQ(log()[5], "E     nBufferSize member is 116886\n");
}

TEST_F(PortsTest, MakesBuffersInEachModeAndKeepsARecordOfThem) {
  using Method::AllocateBuffer, Method::AllocateBufferWithBackup, Method::UseBuffer;
  const std::tuple<int, bool, Method> cases[] = {{0, false, AllocateBufferWithBackup},
                                                 {0, true, AllocateBuffer},
                                                 {1, false, UseBuffer},
                                                 {1, true, UseBuffer}};
  connectTowardsIdle(3, 1000);
  for (const auto& [mode, heap, method] : cases) {
    _session->setMPmemInfo(heap ? new android::MemoryHeapBase(4096) : nullptr);
    _session->setPortBufferModes(mode, mode);
    omx().clearCalls();
    ASSERT_EQ(_session->allocateBuffersOnPort(1), OMXI_OK);
    const std::vector<Call> calls = omx().calls(method);
    ASSERT_EQ(calls.size(), 3u);
    for (size_t i = 0; i < 3; ++i) {
      const BufferInfo& record = records(1)[i];
      EXPECT_EQ(record.bufferId, calls[i].buffer);
      EXPECT_EQ(record.length, 1000u);
      EXPECT_NE(record.data, nullptr);
      ASSERT_EQ(record.memory == nullptr, method == AllocateBuffer);
      EXPECT_TRUE(record.memory == nullptr || record.data == record.memory->pointer());
    }
    EXPECT_EQ(_session->freeBuffersOnPort(1), android::OK);
  }
  char name[PATH_MAX] = {};
  const auto file = "/proc/self/fd/" + std::to_string(_session->_memoryDealer[1]->getMemoryHeap()->heapID());
  ASSERT_GT(readlink(file.c_str(), name, sizeof(name) - 1), 0);
  EXPECT_NE(std::string(name).find("QCOMXWrapper"), std::string::npos) << name;
}

TEST_F(PortsTest, BoundsTheNumberOfBuffersAndOfPorts) {
  const struct {
    int port;
    OMX_U32 count;
    int result;
  } cases[] = {{0, 0, 0}, {0, 10000, 0}, {0, 10001, 13}, {1, 0xffffffff, 13}, {2, 1, 13}, {-1, 1, 13}};
  connect();
  _session->setPortBufferModes(7, 7);  // makes no calls
  for (const auto& [port, count, result] : cases) {
    PortDefinition answer{};
    answer.nPortIndex = static_cast<OMX_U32>(port);
    answer.nBufferCountActual = count;
    answer.nBufferSize = 32;
    script().answer(OMX_IndexParamPortDefinition, answer);
    EXPECT_EQ(_session->allocateBuffersOnPort(port), result) << port << " " << count;
    EXPECT_EQ(records(0).size(), result == 0 ? count : 0);
    const bool exists = port == 0 || port == 1;
    EXPECT_EQ(_session->freeBuffersOnPort(static_cast<unsigned long>(port)) != android::BAD_INDEX, exists);
  }
}

TEST_F(PortsTest, FreesEveryBufferWhateverTheComponentSays) {
  connectTowardsIdle(3, 4096);
  {
    const faults::Fault failed(faults::Failing::NothrowNew, 3 * sizeof(BufferInfo));
    EXPECT_EQ(_session->allocateBuffersOnPort(0), OMXI_ERR_ALLOCATE_MEMORY);
    EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - No memory for 3 buffer records of port 0"});
  }
  ASSERT_EQ(_session->allocateBuffersOnPort(0), OMXI_OK);
  const android::sp<android::IMemory> block = records(0)[0].memory;  // somebody else's reference
  omx().fail(Method::FreeBuffer, 1, -101);
  omx().fail(Method::FreeBuffer, 2, -102);
  EXPECT_EQ(_session->freeBuffersOnPort(0), -102);  // the last one
  EXPECT_TRUE(records(0).isEmpty());
  EXPECT_EQ(omx().count(Method::FreeBuffer), 3u);
  EXPECT_NE(_session->_memoryDealer[0]->allocate(3 * 4096), nullptr);  // client memory waits for nobody
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  // No path of the session's own leads there: somebody adds records while the port is freed.
  for (const Call& call : omx().calls(Method::UseBuffer)) omx().freeBuffer(_session->_node, 0, call.buffer);
  ASSERT_EQ(_session->allocateBuffersOnPort(0), OMXI_OK);
  omx().before(Method::FreeBuffer,
               [this](const Call&) { _session->_portBuffers[0].push_back(BufferInfo()); });
  static_cast<void>(_session->freeBuffersOnPort(0));
  EXPECT_EQ(log().back(), "E Buffer not empty after deallocated.\n");
  EXPECT_EQ(_session->threadError(), OMXI_ERR_BUFFER_NOT_EMPTIED);
}

TEST_F(PortsTest, DropsUndeliveredOutputWithItsBuffers) {
  start();
  Gate& gate = newGate();
  _application.onOutput([&](const Output&) {
    gate.pass();
    return 1;  // nothing goes back to the component
  });
  componentProduces("delivered");
  gate.waitForArrival();
  for (const char* text : {"dropped", "dropped too"}) componentProduces(text);
  waitForBusy(1, kOutputs - 3);
  // Waits for the callback that is using a buffer.
  Later<int> done("freeBuffersOnPort()", [this] { return _session->freeBuffersOnPort(1); });
  requireUnderLock([](SessionState& state) { return state.ports[1].freeing; }, "the port's release");
  EXPECT_FALSE(eventually([&] { return done.isDone(); }, std::chrono::milliseconds(50)));
  gate.open();
  done.result();
  feed("more");  // wakes the output thread once more
  destroy();
  EXPECT_EQ(_application.outputTexts(), std::vector<std::string>{"delivered"});
}

}  // namespace
}  // namespace omxtest
