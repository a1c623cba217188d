// New output settings: the old buffers for new ones, whatever else goes on meanwhile.
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kLargerBytes = 320 * 240 * 3 / 2;

class NewSettingsTest : public DecoderSessionTest {
 protected:
  // Gives the old buffers back with the disable, the new ones with the enable, and fills them.
  static Trace exchange(size_t first, size_t freed, size_t made, OMX_U32 bytes) {
    Trace calls{"sendCommand disable 1", "getParameter definition of port 1"};
    for (size_t i = freed; i-- > 0;) calls.push_back("freeBuffer 1 " + place(first + i));
    calls.emplace_back("sendCommand enable 1");
    calls.emplace_back("getParameter definition of port 1");
    for (size_t i = 0; i < made; ++i) {
      calls.push_back("allocateBufferWithBackup " + place(first + freed + i) + " of " +
                      std::to_string(bytes));
    }
    for (size_t i = 0; i < made; ++i) calls.push_back("fillBuffer " + place(first + freed + i));
    return calls;
  }
  static Trace join(Trace left, const Trace& right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
  }
  static std::string place(size_t index) { return "out" + std::to_string(index); }

  OmxFrameSize outputSize() {
    const SessionState::Lock held(_session->_state->lock);
    return _session->_portFrameSize[1];
  }
  void expectOutputSize(int width, int height) {
    EXPECT_EQ(outputSize().width, width);
    EXPECT_EQ(outputSize().height, height);
  }
  void expectDelivered(const std::string& text, OMX_U32 width) {
    feedThrough(text);
    waitForPictures(_application.outputs().size());
    EXPECT_EQ(pictures().back().output.bytes, text);
    EXPECT_EQ(pictures().back().info.width, width);
  }
};

TEST_F(NewSettingsTest, ExchangesTheBuffers) {
  startDecoder();
  size_t first = 0;
  size_t former = kOutputBuffers;
  size_t fills = kOutputBuffers;
  for (const OMX_U32 count : {5u, 12u, 8u}) {
    SCOPED_TRACE(count);
    const size_t before = omx().count();
    const OMX_U32 width = 320 + 16 * count;
    script().announce([=](mediaserver::PortDefinition& port) {
      port.nBufferCountActual = count;
      port.nBufferSize = 150000 + count;
      port.format.video.nFrameWidth = width;
      port.format.video.nFrameHeight = 240;
    });
    fills += count;
    waitForFills(fills);
    waitForEvents();
    EXPECT_EQ(trace(before), exchange(first, former, count, 150000 + count));
    EXPECT_EQ(omx().outstandingBuffers(), kInputBuffers + count);
    EXPECT_EQ(_session->_portBuffers[1].size(), count);
    EXPECT_FALSE(_session->_portReconfiguring);
    expectOutputSize(static_cast<int>(width), 240);
    expectDelivered("a picture", width);
    first += former;
    former = count;
    waitForFills(++fills);
  }
  EXPECT_EQ(log(), LogLines{});
  endOfStream();
  EXPECT_EQ(deInit(), OMXI_OK);
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
}

TEST_F(NewSettingsTest, KeepsTheFormerSizeWhenTheNewOneIsNotTold) {
  startDecoder();
  omx().fail(Method::GetParameter);
  const OmxFrameSize former = outputSize();
  script().announce(320, 240);
  waitForFills(2 * kOutputBuffers);
  expectOutputSize(former.width, former.height);
  expectDelivered("a picture", 320);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(NewSettingsTest, DoesNotMissBuffersThatAreBackBeforeItWaits) {
  startDecoder();
  // The component is quicker than the call that disables the port. A wait for the next buffer would not end.
  omx().after(Method::SendCommand, [this](const Call& call) {
    if (call.command != OMX_CommandPortDisable) return;
    requireEventually([this] { return busyCount(kOmxOutputPort) == 0; }, "the buffers' return");
  });
  script().announce(320, 240);
  waitForFills(2 * kOutputBuffers);
  expectDelivered("a picture", 320);
}

TEST_F(NewSettingsTest, DoesNotFreeAPictureThatIsNotDelivered) {
  startDecoder();
  Gate& gate = newGate();
  _application.onOutput([&](const Output&) {
    gate.pass();
    return 0;
  });
  componentProduces("first");
  gate.waitForArrival();
  componentProduces("second");
  componentProduces("third");
  script().announce(320, 240);
  waitForSleeper(&SessionState::outputReturnWaiters);
  requireEventually([this] { return busyCount(kOmxOutputPort) == 0; }, "the buffers' return");
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  gate.open();
  waitForFills(2 * kOutputBuffers);
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"first", "second", "third"}));
  EXPECT_EQ(omx().count(Method::FreeBuffer), kOutputBuffers);
}

TEST_F(NewSettingsTest, CarriesOutOneAnnouncementAfterTheOther) {
  startDecoder();
  const size_t before = omx().count();
  script().announce(320, 240);
  script().announce(640, 480);
  waitForFills(3 * kOutputBuffers);
  EXPECT_EQ(trace(before), join(exchange(0, kOutputBuffers, kOutputBuffers, kLargerBytes),
                                exchange(kOutputBuffers, kOutputBuffers, kOutputBuffers, 640 * 480 * 3 / 2)));
  expectOutputSize(640, 480);
  expectDelivered("a picture", 640);
}

TEST_F(NewSettingsTest, CarriesOutAnAnnouncementThatComesInTheMiddleOfAnotherOne) {
  // While it waits for the buffers; while the port is being enabled.
  for (const Match& held : {fillBufferDone(), commandComplete(OMX_CommandPortEnable)}) {
    startDecoder();
    const size_t before = omx().count();
    const size_t fills = omx().count(Method::FillBuffer);
    messages().hold(held);
    script().announce(320, 240);
    require(messages().waitForHeld(1), "what is held");
    deliverEvent(OMX_EventPortSettingsChanged, 1, 0);
    messages().passAll();
    messages().releaseAll();
    waitForFills(fills + 2 * kOutputBuffers);
    // The second one begins with the port back and its buffers filled.
    EXPECT_EQ(trace(before), join(exchange(0, kOutputBuffers, kOutputBuffers, kLargerBytes),
                                  exchange(kOutputBuffers, kOutputBuffers, kOutputBuffers, kLargerBytes)));
    expectDelivered("a picture", 320);
    destroy();
    EXPECT_EQ(_server.leaks(), "");
  }
}

TEST_F(NewSettingsTest, AnAnnouncementBeforeTheEndDoesNotHoldItUp) {
  startDecoder();
  script().holdOutput();
  ASSERT_EQ(feed("the last picture of the old size"), 0);
  requireEventually([this] { return script().waiting() == 1; }, "the picture");
  script().announce(320, 240);
  ASSERT_EQ(feed("the only one of the new size"), 0);
  ASSERT_EQ(beginEndOfInput().result(), 0);
  script().passOutput();
  EXPECT_EQ(deInit(), OMXI_OK);
  ASSERT_EQ(pictures().size(), 2u);
  EXPECT_EQ(pictures()[0].info.width, 176u);
  EXPECT_EQ(pictures()[1].info.width, 320u);
  EXPECT_EQ(pictures()[1].output.bytes, "the only one of the new size");
  destroy();
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
}

TEST_F(NewSettingsTest, AComponentThatFailsInTheMiddleEndsTheSession) {
  startDecoder();
  messages().hold(fillBufferDone());  // it gives nothing back
  script().announce(320, 240);
  waitForSleeper(&SessionState::outputReturnWaiters);
  deliverEvent(OMX_EventError, 0x80001009, 0);
  _application.waitForInputCallbacks(1);
  EXPECT_EQ(_session->threadError(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);  // they are still the component's
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::outputReturnWaiters);
  EXPECT_EQ(omx().count(Method::FreeBuffer), 0u);
  messages().passAll();
  messages().releaseAll();
  EXPECT_EQ(ending.result(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(omx().count(Method::FreeBuffer), kInputBuffers + kOutputBuffers);
}

}  // namespace
}  // namespace omxtest
