// Messages that are doubled, forged or late.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using MessagesTest = SessionTest;

TEST_F(MessagesTest, ADoubledMessageCountsOnce) {
  // Taken twice, a filled buffer would be delivered twice and then be with the application and the
  // component at once, and a state would be thought reached before it is.
  messages().repeat(anyMessage());
  start();
  _application.onOutput([](const Output&) { return 1; });
  for (int i = 0; i < 4; ++i) {
    componentProduces("output " + std::to_string(i));
    require(messages().waitForDelivered(fillBufferDone(), static_cast<size_t>(2 * i + 2)), "the doubles");
  }
  _application.waitForOutputs(4);
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 4);
  componentProduces("", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(_application.outputs().size(), 5u);
}

TEST_F(MessagesTest, AForgedMessageChangesNothing) {
  start();
  _application.onOutput([](const Output&) { return 1; });
  feedThrough("real");
  for (void* id : {static_cast<void*>(nullptr), static_cast<void*>(this), bufferId(0, 0), bufferId(1, 0)}) {
    deliver(makeFillBufferDone(id, 0xffffffff, OMX_BUFFERFLAG_EOS));
  }
  const BufferInfo& kept = _session->_portBuffers[1][0];
  EXPECT_EQ(kept.rangeLength, 4u);
  EXPECT_FALSE(kept.eos);
  EXPECT_EQ(busyCount(kOmxOutputPort), kOutputs - 1);
  feedThrough("more");
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"real", "more"}));
  EXPECT_FALSE(_session->_endOfOutputReached);
}

TEST_F(MessagesTest, ALateMessageFindsNobody) {
  // The server delivers after freeNode() has returned; the session behind the observer is gone.
  start();
  messages().hold(anyMessage());
  componentProduces("late");
  ASSERT_EQ(feed("late"), 0);
  script().raiseError(OMX_ErrorHardware);
  require(messages().waitForHeld(4), "the messages");
  const void* const node = _session->_node;
  destroy();
  messages().passAll();
  start();  // the next session is not the one that they are for
  const size_t before = messages().deliveredCount(anyMessage());
  _log.clear();
  messages().releaseAll();
  messages().forge(const_cast<void*>(node), makeEmptyBufferDone(this));
  require(messages().waitForDelivered(anyMessage(), before + 5), "the late messages");
  EXPECT_EQ(log(), LogLines{});
  EXPECT_EQ(_application.outputs().size(), 0u);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

}  // namespace
}  // namespace omxtest
