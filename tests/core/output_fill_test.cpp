// Output buffers on their way to the component.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

class OutputFillTest : public SessionTest {
 protected:
  BufferInfo* record(size_t index) { return &_session->_portBuffers[kOmxOutputPort].editItemAt(index); }
};

TEST_F(OutputFillTest, FillsOnlyWhileTheComponentExecutes) {
  start();
  deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StatePause);
  feedThrough("a");
  feedThrough("b");  // the pass of "a" is over
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs);
  deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StateExecuting);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);  // picks the parked ones up
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs);
}

TEST_F(OutputFillTest, FillsNothingWhileThePortIsReconfigured) {
  start();
  _application.onOutput([](const Output&) { return 1; });
  feedThrough("kept");
  void* const kept = _application.outputs()[0].bufferId;
  _session->_portReconfiguring = true;
  EXPECT_EQ(_session->fillOutputBuffer(record(0)), OMXI_OK);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
  _session->returnIomxOutputBuffer(kept);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs);
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 1);
  _session->_portReconfiguring = false;
  EXPECT_EQ(_session->fillOutputBuffer(record(0)), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 1);
}

TEST_F(OutputFillTest, ClearsARecordBeforeItIsFilled) {
  start();
  _application.onOutput([](const Output&) { return 1; });
  feedThrough("kept");
  EXPECT_EQ(record(0)->outputData, record(0)->data);
  EXPECT_EQ(record(0)->rangeLength, 4u);
  record(0)->eos = true;
  EXPECT_EQ(_session->fillOutputBuffer(record(0)), OMXI_OK);
  EXPECT_EQ(record(0)->outputData, nullptr);
  EXPECT_EQ(record(0)->rangeLength, 0u);
  EXPECT_FALSE(record(0)->eos);
  EXPECT_TRUE(record(0)->busy);
}

TEST_F(OutputFillTest, TakesABufferBackThatTheComponentRefuses) {
  start();
  _application.onOutput([](const Output&) { return 1; });
  for (const char* text : {"a", "b", "c"}) feedThrough(text);
  const std::string line = std::string("E OMXINTERFACE - fillBuffer failed w/ error ") + kRefusedHex;
  omx().fail(Method::FillBuffer);
  EXPECT_EQ(_session->fillOutputBuffer(record(0)), OMXI_ERR_FILL_BUFFER);
  EXPECT_FALSE(record(0)->busy);
  EXPECT_EQ(log(), LogLines{line});
  const size_t before = omx().count();
  omx().fail(Method::FillBuffer, 2);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_ERR_FILL_BUFFER);
  EXPECT_EQ(trace(before), (Trace{"fillBuffer out0", "fillBuffer out1 failed"}));  // and no further
  EXPECT_EQ(log(), (LogLines{line, line}));
  EXPECT_FALSE(record(1)->busy);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
}

TEST_F(OutputFillTest, GoesOnWhenARefillIsRefused) {
  start();
  omx().fail(Method::FillBuffer);
  feedThrough("lost on its way back");
  requireEventually([this] { return omx().failures() == 1; }, "the refused refill");
  feedThrough("delivered");
  require(omx().waitForCalls(Method::FillBuffer, kOutputs + 2), "the output buffers' way to the component");
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 1);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(OutputFillTest, RefusesARecordThatIsNoneOfItsOwn) {
  start();
  BufferInfo foreign;
  for (BufferInfo* strange : {static_cast<BufferInfo*>(nullptr), &foreign, record(kOutputs - 1) + 1,
                              &_session->_portBuffers[0].editItemAt(0)}) {
    _log.clear();
    EXPECT_EQ(_session->fillOutputBuffer(strange), OMXI_ERR_FILL_BUFFER);
    EXPECT_EQ(log().size(), 1u);
    EXPECT_NE(log()[0].find("is no output buffer of this session"), std::string::npos) << log()[0];
  }
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs);
}

TEST_F(OutputFillTest, HasNothingToFillWithoutBuffers) {
  connect();
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), 0u);
}

TEST_F(OutputFillTest, TellsWhoeverWaitsForTheOutputBuffers) {
  for (const bool reconfiguring : {true, false}) {
    start();
    _application.onOutput([](const Output&) { return 1; });
    for (size_t i = 0; i + 1 < kOutputs; ++i) feedThrough("kept");
    EXPECT_EQ(valueOf(_session->_semOutputBuffersReturned), 0);
    (reconfiguring ? _session->_portReconfiguring : _session->_endOfOutputReached) = true;
    deliver(makeFillBufferDone(this, 0));
    EXPECT_EQ(valueOf(_session->_semOutputBuffersReturned), 0);  // one is still out
    deliver(makeFillBufferDone(bufferId(1, kOutputs - 1), 1));
    EXPECT_GE(valueOf(_session->_semOutputBuffersReturned), 1);
    destroy();
  }
}

}  // namespace
}  // namespace omxtest
