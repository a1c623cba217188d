// Buffers at work: bytes on their way through a component, who holds what, the end of a stream, and new
// settings in the middle of it.

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

using Buffers = NodeTest;

TEST_F(Buffers, CarryBytesFlagsAndTimeWhicheverSideAllocatedThem) {
  for (const Giving input : {Giving::Use, Giving::Backup, Giving::Allocate}) {
    for (const Giving output : {Giving::Use, Giving::Backup, Giving::Allocate}) {
      const auto node = client();
      node->setGiving(kInputPort, input);
      node->setGiving(kOutputPort, output);
      node->toExecuting();
      node->fillAll();
      EXPECT_EQ(node->empty(0, "first", OMX_BUFFERFLAG_ENDOFFRAME, -5), android::OK);
      EXPECT_EQ(node->empty(1, "second", 0, int64_t{1} << 40), android::OK);
      node->expect(fillBufferDone(), 2);
      const std::vector<Packet> outputs = node->outputs();
      EXPECT_EQ(outputs.at(0).text() + outputs.at(1).text(), "firstsecond");
      EXPECT_EQ(outputs[0].flags, OMX_BUFFERFLAG_ENDOFFRAME);
      EXPECT_TRUE(outputs[0].timestamp == -5 && outputs[1].timestamp == int64_t{1} << 40);
      node->expect(emptyBufferDone(), 2);
    }
  }
}

TEST_F(Buffers, AreReadAndWrittenInTheRangeThatIsUsedOnly) {
  const auto node = client();
  for (const OMX_U32 port : {kInputPort, kOutputPort}) node->setGiving(port, Giving::Backup);
  node->toExecuting();
  Packet made("out");
  made.offset = 5;
  decoder.onInput([made](const Packet&) { return std::vector<Packet>{made}; });
  const OmxClient::Buffer in = node->buffers(kInputPort)[0];
  const OmxClient::Buffer out = node->buffers(kOutputPort)[0];
  std::fill_n(in.data, in.size, uint8_t{'i'});
  std::fill_n(out.data, out.size, uint8_t{'.'});
  ASSERT_EQ(server->emptyBuffer(node->node(), in.id, 60, 4, 0, 9), android::OK);
  node->fill(0);
  node->expect(fillBufferDone());
  EXPECT_EQ(decoder.inputs().front().text(), "iiii");
  EXPECT_EQ(std::string(out.data, out.data + 10), ".....out..");
}

TEST_F(Buffers, OutsideTheirRangeOrTwiceOrOnTheWrongPortOrTooEarlyAreRefused) {
  decoder.holdInput();
  const auto node = client();
  node->toIdle();
  EXPECT_EQ(node->fill(0), kUnknownError);
  EXPECT_EQ(node->empty(0, ""), kUnknownError);
  node->complete(OMX_CommandStateSet, OMX_StateExecuting);
  const auto input = node->buffers(kInputPort)[0].id;
  const auto output = node->buffers(kOutputPort)[0].id;
  const auto empty = [&](auto id, OMX_U32 offset, OMX_U32 length) {
    return server->emptyBuffer(node->node(), id, offset, length, 0, 0);
  };
  EXPECT_EQ(empty(input, 65, 0), kUnknownError);
  EXPECT_EQ(empty(input, 1, 64), kUnknownError);
  EXPECT_EQ(empty(input, 2, 0xFFFFFFFF), kUnknownError);
  EXPECT_EQ(empty(output, 0, 0), kUnknownError);
  EXPECT_EQ(server->fillBuffer(node->node(), input), kUnknownError);
  EXPECT_EQ(empty(input, 64, 0), android::OK);
  EXPECT_EQ(empty(input, 0, 1), kUnknownError);
  EXPECT_EQ(server->fillBuffer(node->node(), output), android::OK);
  EXPECT_EQ(server->fillBuffer(node->node(), output), kUnknownError);
  EXPECT_EQ(server->freeBuffer(node->node(), kInputPort, output), kUnknownError);
  EXPECT_EQ(server->freeBuffer(node->node(), kOutputPort, output), android::OK);
  node->expect(errorIs(OMX_ErrorPortUnpopulated));
  EXPECT_EQ(server->freeBuffer(node->node(), kOutputPort, output), kUnknownError);
  EXPECT_EQ(node->messages().count(emptyBufferDone()) + node->messages().count(fillBufferDone()), 0u);
}

TEST_F(Buffers, EndOfStreamComesOutOnceAndLast) {
  // The last one carries the mark, on both sides. Of "b" the codec makes no output.
  decoder.onInput(
      [](const Packet& input) { return std::vector<Packet>(input.text() == "b" ? 0 : 1, input); });
  for (const Words& inputs : {Words{""}, {"a"}, {"a", ""}, {"a", "b"}}) {
    SCOPED_TRACE(::testing::PrintToString(inputs));
    const auto node = client();
    node->toExecuting();
    for (size_t i = 0; i < inputs.size(); ++i)
      node->empty(i, inputs[i], i + 1 == inputs.size() ? OMX_BUFFERFLAG_EOS : 0,
                  static_cast<OMX_TICKS>(100 + i));
    node->expect(emptyBufferDone(), inputs.size());
    EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), 0u) << "the client has the buffers";
    node->fillAll();
    node->expect(fillBufferDone(), inputs.size());
    settle(node.get());
    const std::vector<Packet> outputs = node->outputs();
    ASSERT_EQ(outputs.size(), inputs.size());
    for (size_t i = 0; i < outputs.size(); ++i) {
      EXPECT_EQ(outputs[i].text(), inputs[i] == "b" ? "" : inputs[i]);
      EXPECT_EQ(outputs[i].flags, i + 1 == outputs.size() ? OMX_BUFFERFLAG_EOS : 0u);
    }
    EXPECT_EQ(outputs.back().timestamp, static_cast<OMX_TICKS>(99 + inputs.size()));
    const Words heard = node->heard();  // at last the mark of settle()
    EXPECT_EQ(heard.at(heard.size() - 3), "flag 1 0x1") << "right before its buffer";
    EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), 1u);
  }
}

// The definition describes what the client is reading until it has read that. Then nothing else is heard
// before the client has answered.
TEST_F(Buffers, HoldNewSettingsBackWhileTheyAreRead) {
  const Match changed = eventIs(OMX_EventPortSettingsChanged);
  const Match corrupt = errorIs(OMX_ErrorStreamCorrupt);
  for (const bool freed : {false, true}) {
    const auto node = running();
    decoder.produce(Packet("being read"));
    node->expect(fillBufferDone());
    decoder.announce(320, 240);
    settle(node.get());
    EXPECT_EQ(node->messages().count(changed), 0u);
    EXPECT_EQ(node->definition(kOutputPort).format.video.nFrameWidth, 176u);
    EXPECT_EQ(freed ? node->freeBuffer(kOutputPort, 0) : node->fill(0), android::OK);
    node->expect(changed);
    EXPECT_EQ(node->definition(kOutputPort).format.video.nFrameWidth, 320u);
    decoder.raiseError(OMX_ErrorStreamCorrupt);
    settle(node.get());
    EXPECT_EQ(node->messages().count(corrupt), 0u);
    node->command(OMX_CommandPortDisable, kOutputPort);
    node->expect(corrupt);
  }
}

}  // namespace
}  // namespace omxtest
