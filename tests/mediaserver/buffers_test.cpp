// Buffers at work: bytes on their way through a component, who holds what, and the end of a stream.

#include <atomic>

#include "tests/mediaserver/node_fixture.h"
#include "tests/support/eventually.h"

namespace omxtest {
namespace {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;

using Buffers = NodeTest;
using Words = std::vector<std::string>;

TEST_F(Buffers, CarryBytesFlagsAndTimeWhicheverSideAllocatedThem) {
  for (const Giving input : {Giving::Use, Giving::Backup, Giving::Allocate}) {
    for (const Giving output : {Giving::Use, Giving::Backup, Giving::Allocate}) {
      const auto node = client();
      node->setGiving(kInputPort, input);
      node->setGiving(kOutputPort, output);
      node->toExecuting();
      node->fillAll();
      EXPECT_EQ(node->empty(0, "first", OMX_BUFFERFLAG_ENDOFFRAME, -5), android::OK);
      EXPECT_EQ(node->empty(1, "second", OMX_BUFFERFLAG_SYNCFRAME, int64_t{1} << 40), android::OK);
      node->expect(fillBufferDone(), 2);
      const std::vector<Packet> outputs = node->outputs();
      ASSERT_EQ(outputs.size(), 2u);
      EXPECT_EQ(outputs[0].text(), "first");
      EXPECT_EQ(outputs[0].flags, OMX_BUFFERFLAG_ENDOFFRAME);
      EXPECT_EQ(outputs[0].timestamp, -5);
      EXPECT_EQ(outputs[1].text(), "second");
      EXPECT_EQ(outputs[1].timestamp, int64_t{1} << 40);
      node->expect(emptyBufferDone(), 2);
    }
  }
}

TEST_F(Buffers, WithABackupAreCopiedInTheRangeThatIsUsedOnly) {
  const auto node = client();
  node->setGiving(kInputPort, Giving::Backup);
  node->setGiving(kOutputPort, Giving::Backup);
  node->toExecuting();
  decoder.onInput([](const Packet& input) {
    Packet output("out");
    output.offset = 5;
    output.timestamp = input.timestamp;
    return std::vector<Packet>{output};
  });
  const OmxClient::Buffer in = node->buffers(kInputPort)[0];
  const OmxClient::Buffer out = node->buffers(kOutputPort)[0];
  std::fill_n(in.data, in.size, uint8_t{'i'});
  std::fill_n(out.data, out.size, uint8_t{'.'});
  node->fill(0);
  ASSERT_EQ(server->emptyBuffer(node->node(), in.id, 60, 4, 0, 9), android::OK);
  std::fill_n(in.data, in.size, uint8_t{'x'});  // the component has its copy
  node->expect(fillBufferDone());
  EXPECT_EQ(decoder.inputs().front().text(), "iiii");
  EXPECT_EQ(std::string(out.data, out.data + 10), ".....out..");
  EXPECT_EQ(node->outputs().front().offset, 5u);
}

TEST_F(Buffers, OutsideTheirRangeOrTwiceOrOnTheWrongPortAreRefused) {
  decoder.holdInput();
  const auto node = client();
  node->toExecuting();
  const auto input = node->buffers(kInputPort)[0].id;
  const auto output = node->buffers(kOutputPort)[0].id;
  struct Range {
    OMX_U32 offset;
    OMX_U32 length;
  };
  for (const Range range :
       {Range{0, 65}, Range{65, 0}, Range{1, 64}, Range{0xFFFFFFFF, 2}, Range{2, 0xFFFFFFFF}}) {
    EXPECT_EQ(server->emptyBuffer(node->node(), input, range.offset, range.length, 0, 0), kUnknownError);
  }
  EXPECT_EQ(server->emptyBuffer(node->node(), output, 0, 0, 0, 0), kUnknownError);
  EXPECT_EQ(server->fillBuffer(node->node(), input), kUnknownError);
  EXPECT_EQ(server->emptyBuffer(node->node(), input, 64, 0, 0, 0), android::OK);
  EXPECT_EQ(server->emptyBuffer(node->node(), input, 0, 1, 0, 0), kUnknownError);
  EXPECT_EQ(server->fillBuffer(node->node(), output), android::OK);
  EXPECT_EQ(server->fillBuffer(node->node(), output), kUnknownError);
  EXPECT_EQ(server->freeBuffer(node->node(), kInputPort, output), kUnknownError);
  EXPECT_EQ(server->freeBuffer(node->node(), kOutputPort, output), android::OK);
  EXPECT_EQ(server->freeBuffer(node->node(), kOutputPort, output), kUnknownError);
  EXPECT_EQ(server->fillBuffer(node->node(), output), kUnknownError);
  EXPECT_EQ(node->messages().count(emptyBufferDone()) + node->messages().count(fillBufferDone()), 0u);
}

TEST_F(Buffers, AreSentInExecutingAndPauseOnly) {
  for (const OMX_STATETYPE state : {OMX_StateIdle, OMX_StateExecuting, OMX_StatePause}) {
    const auto node = client();
    reach(node.get(), state);
    const android::status_t expected =
        state == OMX_StateIdle ? kUnknownError : android::status_t{android::OK};
    EXPECT_EQ(node->fill(0), expected) << state;
    EXPECT_EQ(node->empty(0, ""), expected) << state;
    if (state == OMX_StateExecuting) node->expect(fillBufferDone());
  }
}

TEST_F(Buffers, WaitInsideUntilTheOtherSideHasRoom) {
  decoder.setDepth(1);
  const auto node = client();
  node->toExecuting();
  node->empty(0, "a");
  node->empty(1, "b");
  node->expect(emptyBufferDone(), 1);
  settle(node.get());
  EXPECT_EQ(node->messages().count(emptyBufferDone()), 1u) << "the codec keeps one picture";
  node->fillAll();
  node->expect(fillBufferDone(), 2);
  EXPECT_EQ(node->outputs()[1].text(), "b");
}

TEST_F(Buffers, EndOfStreamComesOutOnceAndLast) {
  struct Case {
    const char* what;
    std::vector<std::string> inputs;   // the last one carries the mark
    std::vector<std::string> outputs;  // the last one carries it too
    bool dropped;                      // the codec makes no output of marked inputs
  };
  const Case cases[] = {
      {"alone", {""}, {""}, false},
      {"with data", {"a"}, {"a"}, false},
      {"behind data", {"a", ""}, {"a", ""}, false},
      {"with data that gives no picture", {"a", "b"}, {"a", ""}, true},
      {"alone, to a codec that says when it is drained", {"a", ""}, {"a", ""}, true},
  };
  for (const Case& test : cases) {
    SCOPED_TRACE(test.what);
    if (test.dropped) {
      decoder.onInput([](const Packet& input) {
        return input.flags != 0 ? std::vector<Packet>{} : std::vector<Packet>{input};
      });
    } else {
      decoder.onInput(nullptr);
    }
    const auto node = client();
    node->toExecuting();
    for (size_t i = 0; i < test.inputs.size(); ++i) {
      const bool last = i + 1 == test.inputs.size();
      node->empty(i, test.inputs[i], last ? OMX_BUFFERFLAG_EOS : 0, static_cast<OMX_TICKS>(100 + i));
    }
    node->expect(emptyBufferDone(), test.inputs.size());
    // The component gives nothing up while the client has the buffers.
    EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), 0u);
    node->fillAll();
    node->expect(fillBufferDone(), test.outputs.size());
    settle(node.get());
    const std::vector<Packet> outputs = node->outputs();
    ASSERT_EQ(outputs.size(), test.outputs.size());
    for (size_t i = 0; i < outputs.size(); ++i) {
      EXPECT_EQ(outputs[i].text(), test.outputs[i]);
      EXPECT_EQ(outputs[i].flags, i + 1 == outputs.size() ? OMX_BUFFERFLAG_EOS : 0u);
    }
    EXPECT_EQ(outputs.back().timestamp, static_cast<OMX_TICKS>(99 + test.inputs.size()));
    EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), 1u);
    // Another stream may follow.
    decoder.onInput(nullptr);
    node->messages().clear();
    if (outputs.size() == 2) node->fillAll();
    node->empty(0, "next");
    node->expect(fillBufferDone());
    EXPECT_EQ(node->outputs().front().text(), "next");
  }
}

TEST_F(Buffers, WhatFollowsTheEndWaitsUntilItIsOutOrFlushed) {
  for (const bool flushed : {false, true}) {
    const auto node = client();
    node->toExecuting();
    decoder.onInput([](const Packet& input) {
      return input.flags != 0 ? std::vector<Packet>{} : std::vector<Packet>{input};
    });
    node->empty(0, "", OMX_BUFFERFLAG_EOS);
    node->empty(1, "next stream");
    node->expect(emptyBufferDone());
    settle(node.get());
    EXPECT_EQ(node->messages().count(emptyBufferDone()), 1u);
    if (flushed) {
      node->command(OMX_CommandFlush, OMX_ALL);
      node->expectComplete(OMX_CommandFlush, kOutputPort);
      node->empty(1, "next stream");
    }
    node->fillAll();
    node->expect(fillBufferDone(), flushed ? 1 : 2);
    ASSERT_FALSE(node->outputs().empty());
    EXPECT_EQ(node->outputs().back().text(), "next stream");
    EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), flushed ? 0u : 1u);
  }
}

TEST_F(Buffers, TheEndMarkIsAnnouncedRightBeforeItsBuffer) {
  const auto node = running();
  node->empty(0, "", OMX_BUFFERFLAG_EOS);
  node->expect(fillBufferDone());
  Words heard = node->heard();
  std::erase(heard, "emptied");
  EXPECT_EQ(heard, (Words{"flag 1 0x1", "filled"}));
}

TEST_F(Buffers, FreedWhileTheCodecWorksOnThemHarmNobody) {
  const auto node = running();
  std::atomic<bool> inside{false};
  std::atomic<bool> goOn{false};
  decoder.onInput([&](const Packet& input) {
    inside = true;
    EXPECT_TRUE(eventually([&] { return goOn.load(); }));
    return std::vector<Packet>{input};
  });
  ASSERT_EQ(node->empty(0, "gone"), android::OK);
  ASSERT_TRUE(eventually([&] { return inside.load(); }));
  EXPECT_EQ(node->freeBuffer(kInputPort, 0), android::OK);
  goOn = true;
  node->expect(fillBufferDone());
  settle(node.get());
  EXPECT_EQ(node->messages().count(emptyBufferDone()), 0u) << "nobody owns it any more";
}

}  // namespace
}  // namespace omxtest
