// New output settings in mid-stream: how they are announced, what waits for the client, and that no picture
// is lost.

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

class SettingsChange : public NodeTest {
 protected:
  // What a client does after the announcement, when `held` of its buffers are with the node.
  static void reallocate(OmxClient* node, size_t held) {
    const size_t before = node->messages().count(fillBufferDone());
    node->command(OMX_CommandPortDisable, kOutputPort);
    node->expect(fillBufferDone(), before + held);
    node->freeBuffers(kOutputPort);
    node->expectComplete(OMX_CommandPortDisable, kOutputPort);
    node->command(OMX_CommandPortEnable, kOutputPort);
    node->populate(kOutputPort);
    node->expectComplete(OMX_CommandPortEnable, kOutputPort);
  }

  const Match changed = eventIs(OMX_EventPortSettingsChanged);
};

// The definition describes what the client is reading until it has read that. Time alone helps with one that
// keeps its output.
TEST_F(SettingsChange, WaitsForAReaderUntilItHasSentBackFreedOrKeptWhatItReads) {
  for (const bool freed : {false, true}) {
    const auto node = running();
    decoder.produce(Packet("being read"));
    node->expect(fillBufferDone());
    decoder.announce(320, 240);
    decoder.produce(Packet("next"));
    settle(node.get());
    EXPECT_EQ(node->messages().count(changed), 0u);
    EXPECT_EQ(node->definition(kOutputPort).format.video.nFrameWidth, 176u);
    // Commands go on, and a flush leaves the reader what it has.
    node->complete(OMX_CommandFlush, kInputPort);
    EXPECT_EQ(node->messages().count(changed), 0u);
    EXPECT_EQ(freed ? node->freeBuffer(kOutputPort, 0) : node->fill(0), android::OK);
    node->expect(changed);
    EXPECT_EQ(node->definition(kOutputPort).format.video.nFrameWidth, 320u);
  }
  serve(std::chrono::milliseconds(1));
  const auto keeper = running();
  decoder.produce(Packet("kept"));
  keeper->expect(fillBufferDone());
  decoder.announce(320, 240);
  keeper->expect(changed);
  reallocate(keeper.get(), 1);
}

TEST_F(SettingsChange, IsFollowedByNoEventBeforeTheBuffersAreBack) {
  const auto node = running();
  decoder.announce(320, 240);
  node->expect(changed);
  decoder.raiseError(OMX_ErrorStreamCorrupt);
  node->empty(0, "", OMX_BUFFERFLAG_EOS);
  node->expect(emptyBufferDone());
  settle(node.get());
  EXPECT_EQ(node->messages().count(errorIs(OMX_ErrorStreamCorrupt)), 0u);
  EXPECT_EQ(node->messages().count(eventIs(OMX_EventBufferFlag)), 0u);
  node->messages().clear();
  reallocate(node.get(), 2);
  const std::string corrupt = "error 0x8000100b";
  EXPECT_EQ(node->heard(), (Words{"filled", "filled", corrupt, "complete disable 1", "complete enable 1"}));
  node->fillAll();
  node->expect(eventIs(OMX_EventBufferFlag));
}

}  // namespace
}  // namespace omxtest
