// Port definitions, and the buffer pool: made, counted and freed.
#include <binder/MemoryHeapBase.h>
#include <omxhost/faults.h>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using mediaserver::PortDefinition;

class PortsTest : public SessionTest {
 protected:
  // With an output port of three buffers, and the component on its way to Idle, where it takes buffers.
  void connectTowardsIdle() {
    script().editPort(1, [](PortDefinition& definition) {
      definition.nBufferCountActual = 3;
      definition.nBufferSize = 1000;
    });
    ASSERT_EQ(createEncoder(), OMXI_OK);
    // What the component thinks of the moments at which a test frees buffers.
    messages().setFilter([](const auto& message) { return anyEvent()(message) ? Fate::Drop : Fate::Pass; });
    ASSERT_EQ(omx().sendCommand(_session->_node, OMX_CommandStateSet, OMX_StateIdle), android::OK);
  }

  const android::Vector<BufferInfo>& records(int port) const { return _session->_portBuffers[port]; }
};

TEST_F(PortsTest, PrintsAPortForDiagnosisAndKeepsItsFrameRate) {
  ASSERT_EQ(createEncoder(), OMXI_OK);
  EXPECT_EQ(_session->setupPortParameters(0, 322, 242, -1), OMXI_OK);
  EXPECT_EQ(omx().calls().back().as<PortDefinition>()->format.video.xFramerate, 30u << 16);
  EXPECT_EQ(_session->debugPortParameters(0), OMXI_OK);
  EXPECT_EQ(log()[5], "E     nBufferSize member is 116886\n");
}

TEST_F(PortsTest, MakesBuffersInEachModeAndKeepsARecordOfThem) {
  using Method::AllocateBuffer, Method::AllocateBufferWithBackup, Method::UseBuffer;
  const std::tuple<int, bool, Method> cases[] = {
      {0, false, AllocateBufferWithBackup}, {0, true, AllocateBuffer}, {1, true, UseBuffer}};
  connectTowardsIdle();
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
}

TEST_F(PortsTest, BoundsTheNumberOfBuffersAndOfPorts) {
  const struct {
    int port;
    OMX_U32 count;
    int result;
  } cases[] = {{0, 0, 0}, {0, 10000, 0}, {0, 10001, 13}, {1, 0xffffffff, 13}, {2, 1, 13}, {-1, 1, 13}};
  ASSERT_EQ(createEncoder(), OMXI_OK);
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

TEST_F(PortsTest, ARefusalKeepsTheBuffersMade) {
  connectTowardsIdle();
  omxhost::failMemoryBlock(3);
  EXPECT_EQ(_session->allocateBuffersOnPort(1), OMXI_ERR_ALLOCATE_MEMORY);
  omxhost::failMemoryBlock(0);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - Memory dealer allocation failed for port 1 buffer 2\n"});
  EXPECT_EQ(records(1).size(), 2u);
  EXPECT_EQ(_session->freeBuffersOnPort(1), android::OK);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 2u);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(PortsTest, LetsNobodyFindARecordOnItsWayOut) {
  // Whoever used one would use freed memory, or hand the component a buffer that is gone.
  start();
  _application.onOutput([](const Output&) { return 1; });
  feedThrough("kept");
  void* const kept = bufferId(1, 0);
  void* handle = nullptr;
  void* data = nullptr;
  ASSERT_EQ(_session->reserveInputBuffer(&handle, &data), 0);
  bool input = false;
  omx().before(Method::FreeBuffer, [&](const Call&) {
    _session->returnIomxOutputBuffer(kept);
    if (!input) return;
    EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
    EXPECT_EQ(feed("x"), -1);
  });
  _session->freeBuffersOnPort(1);
  input = true;
  _session->freeBuffersOnPort(0);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs);
  EXPECT_EQ(omx().count(Method::EmptyBuffer), 1u);
}

}  // namespace
}  // namespace omxtest
