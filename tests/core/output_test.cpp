// Output buffers on their round, and the output thread.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using Texts = std::vector<std::string>;

class OutputTest : public SessionTest {
 protected:
  size_t fills() { return omx().count(Method::FillBuffer); }
};

TEST_F(OutputTest, DeliversWhatTheComponentMakesInOrder) {
  start();
  for (int i = 0; i < 20; ++i) {
    componentProduces("output " + std::to_string(i), (OMX_TICKS{1} << 32) + 1000 + i);
  }
  _application.waitForOutputs(20);
  std::vector<Output> outputs = _application.outputs();
  for (size_t i = 0; i < outputs.size(); ++i) {
    EXPECT_EQ(outputs[i].bytes, "output " + std::to_string(i));
    EXPECT_EQ(outputs[i].timestamp, 1000 + i);  // the low half
    EXPECT_EQ(outputs[i].first, _session.get());
    EXPECT_EQ(outputs[i].bufferId, bufferId(1, i % kOutputs));  // each went back and came again
  }
  // Delivery starts at the buffer's beginning and ends with it, whatever the range says.
  Packet shifted("..shifted");
  shifted.offset = 2;
  for (const OMX_U32 length : {3u, 0xffffffffu}) {
    shifted.lengthToTell = length;
    script().produce(shifted);
  }
  _application.waitForOutputs(22);
  outputs = _application.outputs();
  EXPECT_EQ(outputs[20].data, outputRecord(20 % kOutputs)->data);
  EXPECT_EQ(outputs[20].length, 3u);
  EXPECT_EQ(outputs[21].length, 65536u);
  EXPECT_TRUE(_log.waitFor("OMXINTERFACE - Output of 4294967295 bytes cut to the buffer's 65536"));
}

TEST_F(OutputTest, LeavesABufferWithTheApplicationUntilItComesBack) {
  start();
  _application.onOutput([](const Output& output) { return output.bytes == "keep" ? 5 : 0; });
  feedThrough("keep");
  void* const kept = _application.outputs()[0].bufferId;
  EXPECT_EQ(busyCount(1), kOutputs - 1);
  for (void* id : {static_cast<void*>(nullptr), static_cast<void*>(this), bufferId(0, 0), bufferId(1, 1)}) {
    _session->returnIomxOutputBuffer(id);  // unknown, an input buffer, or one that is not ours
    deliver(makeFillBufferDone(id == bufferId(1, 1) ? kept : id, 0xffffffff, OMX_BUFFERFLAG_EOS));  // forged
  }
  EXPECT_EQ(outputRecord(0)->rangeLength, 4u);
  EXPECT_FALSE(outputRecord(0)->eos);
  _session->_portReconfiguring = true;
  EXPECT_EQ(_session->fillOutputBuffer(outputRecord(0)), OMXI_OK);
  _session->_portReconfiguring = false;
  EXPECT_EQ(_session->fillOutputBuffer(outputRecord(kOutputs - 1) + 1), OMXI_ERR_FILL_BUFFER);
  EXPECT_NE(log().back().find("is no output buffer of this session"), std::string::npos);
  EXPECT_EQ(fills(), kOutputs);
  outputRecord(0)->eos = true;
  _session->returnIomxOutputBuffer(kept);
  EXPECT_EQ(outputRecord(0)->outputData, nullptr);  // a clean record goes
  EXPECT_EQ(outputRecord(0)->rangeLength, 0u);
  EXPECT_FALSE(outputRecord(0)->eos);
  _session->returnIomxOutputBuffer(kept);  // the component has it by now
  EXPECT_EQ(fills(), kOutputs + 1);
  feedThrough("more");
  EXPECT_EQ(_application.outputTexts(), (Texts{"keep", "more"}));
}

TEST_F(OutputTest, DeliversNothingThatComesAfterTheEnd) {
  // A component on its way to Idle gives its empty buffers back; whether the application saw them would
  // depend on how long its callback takes, which no message waits for.
  start();
  Gate& gate = newGate();
  Gate& last = newGate();
  _application.onOutput([&](const Output& output) {
    (output.bytes == "before" ? gate : last).pass();
    return 0;
  });
  componentProduces("before");
  gate.waitForArrival();
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  require(messages().waitForDelivered(fillBufferDone(), 2), "the end");
  _session->returnIomxOutputBuffer(bufferId(1, 1));  // an application out of step; the picture stays
  gate.open();
  last.waitForArrival();
  componentProduces("after");
  require(messages().waitForDelivered(fillBufferDone(), 3), "the buffer behind the end");
  last.open();
  waitForOutputThreadToEnd();
  EXPECT_EQ(fills(), kOutputs + 1);  // only the first goes back
  EXPECT_EQ(_application.outputTexts(), (Texts{"before", "the end"}));
  EXPECT_EQ(log(), LogLines{"W OMXINTERFACE - ===DataOutputThread over! enc thread!\n"});
}

TEST_F(OutputTest, ABufferGivenBackInsideItsCallbackGoesBackOnceAndHasBeenReadBefore) {
  // A second fillBuffer would send the component a buffer that it has; and with the buffer the record's end
  // mark is cleared: looked at afterwards it would be gone, and the stream would never end.
  start();
  _application.onOutput([this](const Output& output) {
    _session->returnIomxOutputBuffer(output.bufferId);
    return 0;
  });
  for (const char* text : {"a", "b", "c"}) feedThrough(text);
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(fills(), kOutputs + 4);
}

}  // namespace
}  // namespace omxtest
