// Output buffers on their round, and the output thread.
#include <binder/MemoryHeapBase.h>

#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using Texts = std::vector<std::string>;

class OutputTest : public SessionTest {
 protected:
  // The application keeps every buffer, or stops at a gate in the callback.
  void keepBuffers() {
    _application.onOutput([](const Output&) { return 1; });
  }
  Gate& stopInCallback() {
    Gate& gate = newGate();
    _application.onOutput([&](const Output&) {
      gate.pass();
      return 0;
    });
    return gate;
  }
  size_t fills() { return omx().count(Method::FillBuffer); }
};

TEST_F(OutputTest, DeliversWhatTheComponentMakesInOrder) {
  start();
  for (int i = 0; i < 20; ++i) {
    componentProduces("output " + std::to_string(i), (OMX_TICKS{1} << 32) + 1000 + i,
                      OMX_BUFFERFLAG_ENDOFFRAME);
  }
  _application.waitForOutputs(20);
  const std::vector<Output> outputs = _application.outputs();
  for (size_t i = 0; i < outputs.size(); ++i) {
    EXPECT_EQ(outputs[i].bytes, "output " + std::to_string(i));
    EXPECT_EQ(outputs[i].timestamp, 1000 + i);  // the low half
    EXPECT_EQ(outputs[i].first, _session.get());
    EXPECT_EQ(outputs[i].bufferId, bufferId(1, i % kOutputs));  // each went back and came again
    EXPECT_EQ(outputs[i].data, outputRecord(i % kOutputs)->data);
  }
  waitForBusy(1, kOutputs);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(OutputTest, StartsAtTheBuffersBeginningAndEndsWithItWhateverTheRangeSays) {
  start();
  Packet shifted("..shifted");
  shifted.offset = 2;
  for (const OMX_U32 length : {3u, 65537u, 0xffffffffu}) {
    shifted.lengthToTell = length;
    script().produce(shifted);
  }
  _application.waitForOutputs(3);
  EXPECT_EQ(_application.outputs()[0].data, outputRecord(0)->data);
  EXPECT_EQ(_application.outputs()[0].length, 3u);
  EXPECT_EQ(_application.outputs()[2].length, 65536u);
  EXPECT_EQ(log(), (LogLines{"E OMXINTERFACE - Output of 65537 bytes cut to the buffer's 65536",
                             "E OMXINTERFACE - Output of 4294967295 bytes cut to the buffer's 65536"}));
}

TEST_F(OutputTest, RecordsAFailureWhenOutputIsLost) {
  // Lost in silence, the end of a stream would leave deInit() waiting for it.
  start();
  const faults::Fault failed(faults::Failing::NothrowNew, sizeof(SimpleNode));
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_ERR_ALLOCATE_MEMORY);
  EXPECT_TRUE(failed.happened());
}

TEST_F(OutputTest, GivesOnlyTheIdWhenTheComponentHasAHeapOfItsOwn) {
  start(Kind::Decoder);
  _session->setMPmemInfo(new android::MemoryHeapBase(4096));
  feedThrough("picture");
  const Output output = _application.outputs()[0];
  EXPECT_EQ(output.data, nullptr);
  EXPECT_EQ(output.length, 7u);
  EXPECT_EQ(output.bufferId, bufferId(1, 0));
}

TEST_F(OutputTest, LeavesABufferWithTheApplicationUntilItComesBack) {
  start();
  _application.onOutput([](const Output& output) { return output.bytes == "keep" ? 5 : 0; });
  feedThrough("keep");
  feedThrough("pass");
  waitForFills(kOutputs + 1);
  void* const kept = _application.outputs()[0].bufferId;
  EXPECT_EQ(busyCount(1), kOutputs - 1);
  for (void* id : {static_cast<void*>(nullptr), static_cast<void*>(this), bufferId(0, 0), bufferId(1, 1)}) {
    _session->returnIomxOutputBuffer(id);  // unknown, an input buffer, or one that is not ours
    deliver(makeFillBufferDone(id == bufferId(1, 1) ? kept : id, 0xffffffff, OMX_BUFFERFLAG_EOS));  // forged
  }
  EXPECT_EQ(outputRecord(0)->rangeLength, 4u);
  EXPECT_FALSE(outputRecord(0)->eos);
  EXPECT_EQ(fills(), kOutputs + 1);
  _session->returnIomxOutputBuffer(kept);
  EXPECT_EQ(trace().back(), "fillBuffer out0");
  EXPECT_EQ(busyCount(1), kOutputs);
  _session->returnIomxOutputBuffer(kept);  // the component has it by now
  EXPECT_EQ(fills(), kOutputs + 2);
  feedThrough("more");
  EXPECT_EQ(_application.outputTexts(), (Texts{"keep", "pass", "more"}));
  EXPECT_FALSE(_session->_endOfOutputReached);
}

TEST_F(OutputTest, DoesNotGiveBackWhatStillWaitsForDelivery) {
  start();
  Gate& gate = stopInCallback();
  componentProduces("first");
  gate.waitForArrival();
  componentProduces("second");
  waitForBusy(1, kOutputs - 2);
  _session->returnIomxOutputBuffer(bufferId(1, 1));  // an application out of step; the picture stays
  EXPECT_EQ(fills(), kOutputs);
  gate.open();
  _application.waitForOutputs(2);
  EXPECT_EQ(_application.outputTexts(), (Texts{"first", "second"}));
}

TEST_F(OutputTest, DeliversAnEndedStreamsLastBufferAndStops) {
  for (const Kind kind : {Kind::Encoder, Kind::Decoder}) {
    for (const int kept : {0, 1}) {
      _log.clear();
      start(kind);
      _application.onOutput([&](const Output&) { return kept; });
      const size_t before = fills();
      const size_t delivered = _application.outputs().size();
      componentProduces("the end", 77, OMX_BUFFERFLAG_EOS | OMX_BUFFERFLAG_ENDOFFRAME);
      waitForOutputThreadToEnd();
      EXPECT_TRUE(_session->_endOfOutputReached);
      EXPECT_EQ(valueOf(_session->_semEndOfOutput), 1);
      EXPECT_EQ(log(), LogLines{kind == Kind::Encoder ? kEncoderOver : kDecoderOver});
      EXPECT_EQ(fills(), before);  // it does not go back
      componentProduces("nobody is there");
      requireEventually([this] { return valueOf(_session->_semOutputDataReady) > 0; }, "a filled buffer");
      EXPECT_EQ(_application.outputs().size(), delivered + 1);
      EXPECT_EQ(_application.outputs().back().bytes, "the end");
      destroy();
    }
  }
}

TEST_F(OutputTest, DeliversNothingThatComesAfterTheEnd) {
  // A component on its way to Idle gives its empty buffers back; whether the application saw them would
  // depend on how long its callback takes.
  start();
  Gate& gate = stopInCallback();
  componentProduces("before");
  gate.waitForArrival();
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  waitForBusy(1, kOutputs - 2);
  Gate& last = stopInCallback();
  gate.open();
  last.waitForArrival();
  componentProduces("after");
  require(messages().waitForDelivered(fillBufferDone(), 3), "the buffer behind the end");
  last.open();
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), (Texts{"before", "the end"}));
}

TEST_F(OutputTest, StopsAfterThePassThatFindsAFailure) {
  start();
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(log(), LogLines{});  // the failure alone does not wake the thread
  componentProduces("last");
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), Texts{"last"});
  EXPECT_EQ(fills(), kOutputs + 1);  // that pass was a whole one
  EXPECT_EQ(log(), LogLines{kEncoderOver});
}

TEST_F(OutputTest, ParksBuffersOnceTheEndOfInputIsPending) {
  start();
  feedThrough("before");
  waitForFills(kOutputs + 1);
  script().holdInput();
  ASSERT_EQ(beginEndOfInput().result(), 0);
  componentProduces("during");
  _application.waitForOutputs(2);
  componentProduces("more");  // the pass of "during" is over when this comes
  _application.waitForOutputs(3);
  script().passInput();
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), (Texts{"before", "during", "more", ""}));
  EXPECT_EQ(fills(), kOutputs + 1);
  EXPECT_EQ(busyCount(1), kOutputs - 3);
}

TEST_F(OutputTest, CallsNobodyByItself) {
  // The base form of the delivery, as the encoder uses it.
  construct();
  EXPECT_EQ(_session->callOutputCallbackFunction(this, 3, this, 4), 0);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);  // there is nothing to fill
  _application.attach(*_session);
  _application.onOutput([](const Output&) { return 9; });
  char text[] = "abc";
  EXPECT_EQ(_session->callOutputCallbackFunction(text, 3, this, 4), 9);
  const Output output = _application.outputs()[0];
  EXPECT_EQ(output.first, _session.get());
  EXPECT_EQ(output.bytes, "abc");
  EXPECT_EQ(output.bufferId, this);
  EXPECT_EQ(output.timestamp, 4u);
  _session->onEvent(OMX_EventError, 1, 2);  // does nothing
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(OutputTest, FillsOnlyWhileTheComponentExecutes) {
  start();
  deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StatePause);
  feedThrough("a");
  feedThrough("b");  // the pass of "a" is over
  EXPECT_EQ(fills(), kOutputs);
  deliverEvent(OMX_EventCmdComplete, OMX_CommandStateSet, OMX_StateExecuting);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);  // picks the parked ones up
  EXPECT_EQ(busyCount(1), kOutputs);
}

TEST_F(OutputTest, FillsACleanRecordUnlessThePortIsReconfigured) {
  start();
  keepBuffers();
  feedThrough("kept");
  EXPECT_EQ(outputRecord(0)->outputData, outputRecord(0)->data);
  outputRecord(0)->eos = true;
  _session->_portReconfiguring = true;
  EXPECT_EQ(_session->fillOutputBuffer(outputRecord(0)), OMXI_OK);
  EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
  _session->returnIomxOutputBuffer(bufferId(1, 0));
  EXPECT_EQ(fills(), kOutputs);
  EXPECT_FALSE(outputRecord(0)->busy);
  _session->_portReconfiguring = false;
  EXPECT_EQ(_session->fillOutputBuffer(outputRecord(0)), OMXI_OK);
  EXPECT_EQ(fills(), kOutputs + 1);
  EXPECT_EQ(outputRecord(0)->outputData, nullptr);
  EXPECT_EQ(outputRecord(0)->rangeLength, 0u);
  EXPECT_FALSE(outputRecord(0)->eos);
  EXPECT_TRUE(outputRecord(0)->busy);
}

TEST_F(OutputTest, FillsNoRecordThatIsNotItsOwn) {
  start();
  BufferInfo foreign;
  for (BufferInfo* strange : {static_cast<BufferInfo*>(nullptr), &foreign, outputRecord(kOutputs - 1) + 1,
                              &_session->_portBuffers[0].editItemAt(0)}) {
    EXPECT_EQ(_session->fillOutputBuffer(strange), OMXI_ERR_FILL_BUFFER);
    EXPECT_NE(log().back().find("is no output buffer of this session"), std::string::npos);
  }
  EXPECT_EQ(fills(), kOutputs);
}

TEST_F(OutputTest, TellsWhoeverWaitsForTheOutputBuffers) {
  for (const bool reconfiguring : {true, false}) {
    start();
    keepBuffers();
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
