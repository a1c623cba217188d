// Output buffers on their round, and the output thread.
#include <binder/MemoryHeapBase.h>

#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr const char* kEncoderOver = "W OMXINTERFACE - ===DataOutputThread over! enc thread!\n";
constexpr const char* kDecoderOver = "W OMXINTERFACE - ===DataOutputThread over! dec thread!\n";

class OutputTest : public SessionTest {
 protected:
  BufferInfo* record(size_t index) { return &_session->_portBuffers[kOmxOutputPort].editItemAt(index); }
  bool isOutputThreadRunning() {
    const SessionState::Lock held(_session->_state->lock);
    return _session->_state->outputThread.running;
  }
  void waitForOutputThreadToEnd() {
    requireEventually([this] { return !isOutputThreadRunning(); }, "the end of the output thread");
  }
  void waitForBusy(size_t count) {
    requireEventually([&] { return busyCount(kOmxOutputPort) == count; }, "the output buffers");
  }
  void waitForFills(size_t count) {
    require(omx().waitForCalls(Method::FillBuffer, count), "the output buffers' way to the component");
  }
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
    EXPECT_EQ(outputs[i].length, outputs[i].bytes.size());
    EXPECT_EQ(outputs[i].timestamp, 1000 + i);  // the low half
    EXPECT_EQ(outputs[i].first, _session.get());
    EXPECT_EQ(outputs[i].bufferId, bufferId(1, i % kOutputs));  // each went back and came again
    EXPECT_EQ(outputs[i].data, record(i % kOutputs)->data);
  }
  waitForBusy(kOutputs);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(OutputTest, StartsAtTheBuffersBeginningWhateverTheRangeSays) {
  start();
  Packet shifted("..shifted");
  shifted.offset = 2;
  shifted.lengthToTell = 3;
  script().produce(shifted);
  _application.waitForOutputs(1);
  EXPECT_EQ(_application.outputs()[0].data, record(0)->data);
  EXPECT_EQ(_application.outputs()[0].length, 3u);
}

TEST_F(OutputTest, CutsALengthThatABufferDoesNotHold) {
  start();
  Packet longer("longer than it is");
  longer.lengthToTell = 65537;
  script().produce(longer);
  Packet endless("endless");
  endless.lengthToTell = 0xffffffff;
  script().produce(endless);
  _application.waitForOutputs(2);
  for (const Output& output : _application.outputs()) EXPECT_EQ(output.length, 65536u);
  EXPECT_EQ(log(), (LogLines{"E OMXINTERFACE - Output of 65537 bytes cut to the buffer's 65536",
                             "E OMXINTERFACE - Output of 4294967295 bytes cut to the buffer's 65536"}));
}

TEST_F(OutputTest, RecordsAFailureWhenOutputIsLost) {
  // Lost in silence, the end of a stream would leave deInit() waiting for it.
  start();
  const faults::FailedAllocation failed(sizeof(SimpleNode));
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

TEST_F(OutputTest, RecyclesEverythingWithoutAnOutputCallback) {
  start();
  _session->registerOutputCallback(nullptr, nullptr);
  const size_t before = omx().count(Method::FillBuffer);
  for (size_t i = 0; i < 3 * kOutputs; ++i) componentProduces("nobody looks");
  waitForFills(before + 3 * kOutputs);
  EXPECT_TRUE(_application.outputs().empty());
}

TEST_F(OutputTest, LeavesABufferWithTheApplicationUntilItComesBack) {
  start();
  _application.onOutput([](const Output& output) { return output.bytes == "keep" ? 5 : 0; });
  feedThrough("keep");
  feedThrough("pass");
  waitForFills(kOutputs + 1);
  void* const kept = _application.outputs()[0].bufferId;
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 1);
  for (void* id : {static_cast<void*>(nullptr), static_cast<void*>(this), bufferId(0, 0), bufferId(1, 1)}) {
    _session->returnIomxOutputBuffer(id);  // unknown, an input buffer, or one that is not ours
  }
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 1);
  _session->returnIomxOutputBuffer(kept);
  EXPECT_EQ(trace().back(), "fillBuffer out0");
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs);
  _session->returnIomxOutputBuffer(kept);  // the component has it by now
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 2);
}

TEST_F(OutputTest, DoesNotGiveBackWhatStillWaitsForDelivery) {
  start();
  Gate& gate = newGate();
  _application.onOutput([&](const Output&) {
    gate.pass();
    return 0;
  });
  componentProduces("first");
  gate.waitForArrival();
  componentProduces("second");
  waitForBusy(kOutputs - 2);
  _session->returnIomxOutputBuffer(bufferId(1, 1));  // an application out of step; the picture stays
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs);
  gate.open();
  _application.waitForOutputs(2);
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"first", "second"}));
}

TEST_F(OutputTest, DeliversAnEndedStreamsLastBufferAndStops) {
  for (const Kind kind : {Kind::Encoder, Kind::Decoder}) {
    for (const int kept : {0, 1}) {
      _log.clear();
      start(kind);
      _application.onOutput([&](const Output&) { return kept; });
      const size_t fills = omx().count(Method::FillBuffer);
      const size_t delivered = _application.outputs().size();
      componentProduces("the end", 77, OMX_BUFFERFLAG_EOS | OMX_BUFFERFLAG_ENDOFFRAME);
      waitForOutputThreadToEnd();
      EXPECT_EQ(_application.outputs().size(), delivered + 1);
      EXPECT_EQ(_application.outputs().back().bytes, "the end");
      EXPECT_TRUE(_session->_endOfOutputReached);
      EXPECT_EQ(valueOf(_session->_semEndOfOutput), 1);
      EXPECT_EQ(log(), LogLines{kind == Kind::Encoder ? kEncoderOver : kDecoderOver});
      EXPECT_EQ(omx().count(Method::FillBuffer), fills);  // it does not go back
      componentProduces("nobody is there", 0);
      requireEventually([this] { return valueOf(_session->_semOutputDataReady) > 0; }, "a filled buffer");
      EXPECT_EQ(_application.outputs().size(), delivered + 1);
      destroy();
    }
  }
}

TEST_F(OutputTest, DeliversNothingThatComesAfterTheEnd) {
  // A component on its way to Idle gives its empty buffers back; whether the application saw them would
  // depend on how long its callback takes.
  start();
  Gate& gate = newGate();
  _application.onOutput([&](const Output&) {
    gate.pass();
    return 0;
  });
  componentProduces("before");
  gate.waitForArrival();
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  waitForBusy(kOutputs - 2);
  Gate& last = newGate();
  _application.onOutput([&](const Output&) {
    last.pass();
    return 0;
  });
  gate.open();
  last.waitForArrival();
  componentProduces("after");
  require(messages().waitForDelivered(fillBufferDone(), 3), "the buffer behind the end");
  last.open();
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"before", "the end"}));
}

TEST_F(OutputTest, StopsAfterThePassThatFindsAFailure) {
  start();
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_TRUE(isOutputThreadRunning());  // the failure alone does not wake it
  componentProduces("last");
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), std::vector<std::string>{"last"});
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 1);  // that pass was a whole one
  EXPECT_EQ(log(), LogLines{kEncoderOver});
}

TEST_F(OutputTest, ParksBuffersOnceTheEndOfInputIsPending) {
  start();
  feedThrough("before");
  waitForFills(kOutputs + 1);
  script().holdOutput();
  ASSERT_EQ(feed("during"), 0);
  ASSERT_EQ(beginEndOfInput().result(), 0);
  script().passOutput();
  waitForOutputThreadToEnd();
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"before", "during", ""}));
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 1);
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 2);
}

TEST_F(OutputTest, CallsNobodyByItself) {
  // The base form of the delivery, as the encoder uses it.
  construct();
  EXPECT_EQ(_session->callOutputCallbackFunction(this, 3, this, 4), 0);
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

}  // namespace
}  // namespace omxtest
