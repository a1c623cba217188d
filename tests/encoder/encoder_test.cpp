// Encoders without settings, the records that one writes by itself, and the way of one raw frame into the
// component: its layout, what is refused, and what happens after the end.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

class EncoderTest : public SessionTest {
 protected:
  explicit EncoderTest(const char* device = "msm8960") : SessionTest(device) {}

  // A session that runs, with input buffers of `capacity` bytes, and a frame of that size.
  void startEncoder(OMX_U32 capacity) {
    _frame.resize(capacity + 1);
    for (size_t i = 0; i < _frame.size(); ++i) _frame[i] = static_cast<uint8_t>(1 + i % 251);  // never 0
    script().editPort(0, [=](auto& definition) { definition.nBufferSize = capacity; });
    ASSERT_EQ(createEncoder(), 0);
    ASSERT_EQ(init(), 0);
    _log.clear();
  }
  int send(int width = 176, int height = 144, int timestamp = 0) {
    return encoder().sendDataFrame(_frame.data(), width, height, timestamp);
  }

  std::vector<uint8_t> _frame;
};

// One device, where the chroma lies elsewhere than behind the luma; and one where it does not.
struct Layout {
  int width;
  int height;
  size_t luma;
  size_t chromaOffset;
  size_t chroma;
};

class FrameLayouts : public EncoderTest, public ::testing::WithParamInterface<const char*> {
 protected:
  FrameLayouts() : EncoderTest(GetParam()) {}
};

TEST_P(FrameLayouts, PlaceTheChromaWhereTheHardwareLooksForIt) {
  const bool aligned = GetParam() == std::string("msm8x60");
  const Layout layouts[] = {{176, 144, 25344, aligned ? 26624u : 25344u, 12672},
                            {64, 32, 2048, 2048, 1024},
                            {3, 3, 9, aligned ? 2048u : 9u, 4}};
  for (const auto& [width, height, luma, chromaOffset, chroma] : layouts) {
    const size_t length = chromaOffset + chroma;
    startEncoder(static_cast<OMX_U32>(length + 100));
    auto* const memory = static_cast<uint8_t*>(_session->_portBuffers[0][0].data);
    memset(memory, 0xEE, length + 100);  // what an earlier frame left
    ASSERT_EQ(send(width, height, -7), 0);
    const Call sent = omx().calls(Method::EmptyBuffer).at(0);
    EXPECT_EQ(sent.length, length);
    EXPECT_EQ(sent.timestamp, -7);
    std::vector<uint8_t> expected(length, 0);
    memcpy(expected.data(), _frame.data(), luma);
    memcpy(expected.data() + chromaOffset, _frame.data() + luma, chroma);
    waitForBusy(0, 0);
    EXPECT_EQ(script().inputs().back().bytes, expected) << width;
    EXPECT_EQ(memory[length], 0xEE) << "nothing behind the frame is written";
  }
}

INSTANTIATE_TEST_SUITE_P(Devices, FrameLayouts, ::testing::Values("msm8x60", "msm7x30", "omap4"));

TEST_F(EncoderTest, RefusesAFrameThatDoesNotFitAndKeepsTheBufferFree) {
  startEncoder(38016);
  // Among them products that are small or zero in 32 bits.
  for (const auto& [width, height] : {std::pair(INT32_MAX, INT32_MAX), {65536, 65536}, {25345, 1}}) {
    EXPECT_EQ(send(width, height), -1) << width;
    EXPECT_EQ(busyCount(0), 0u);
  }
  EXPECT_EQ(log().back(), "E OMXINTERFACE - Frame of 25345x1 does not fit an input buffer of 38016 bytes");
  EXPECT_EQ(send(-176, 144), -1);
  EXPECT_TRUE(log().back().starts_with("E OMXINTERFACE - Frame of -176x144 at "));
  EXPECT_EQ(encoder().sendDataFrame(nullptr, 176, 144, 0), -1);
  EXPECT_EQ(omx().count(Method::EmptyBuffer), 0U);

  script().holdInput();
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(send(), OMXI_ERR_EVENT_ERROR);  // it is sent all the same
  EXPECT_EQ(omx().count(Method::EmptyBuffer), 1U);
  _session->_threadError = OMXI_OK;
  for (size_t i = 0; i < 4; ++i) EXPECT_EQ(send(), 0);  // the last is dropped: no buffer is free
  EXPECT_EQ(omx().count(Method::EmptyBuffer), 4U);
  _session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(send(), OMXI_ERR_EVENT_ERROR);
}

TEST_F(EncoderTest, KeepsTryingAfterTheEndUntilAFailureOrTheSessionsEnd) {
  for (const bool failing : {true, false}) {
    startEncoder(38016);
    EXPECT_EQ(_session->sendEndOfInputFlag(0), 0);
    Later feeder("sendDataFrame()",
                 [this, session = &encoder()] { return session->sendDataFrame(_frame.data(), 176, 144, 0); });
    EXPECT_TRUE(_log.waitFor("OMXINTERFACE - Client Shutting Down: Input Data ignored"));
    EXPECT_FALSE(feeder.isDone());
    if (failing) _session->setThreadError(OMXI_ERR_BUFFER_NOT_FOUND);
    // It would hold up the release of its port if it kept that in use.
    EXPECT_EQ(deInit(), failing ? OMXI_ERR_BUFFER_NOT_FOUND : 0);
    destroy();
    EXPECT_EQ(feeder.result(), failing ? OMXI_ERR_BUFFER_NOT_FOUND : -1);
  }
}

TEST_F(EncoderTest, IsLeftUnconnectedWithoutSettings) {
  OmxInterfaceEncoder* session = nullptr;
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  ASSERT_NE(session, nullptr);
  _session.reset(session);
  EXPECT_EQ(omx().count(), 0u);
  // Everything fails as if refused, and nothing crashes.
  EXPECT_EQ(session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->updateAVCIntraPeriod(1), OMXI_ERR_SET_INTRA_PERIOD);
  EXPECT_EQ(session->requestIFrame(), OMXI_ERR_REQUEST_IFRAME);
  destroy();
}

TEST_F(EncoderTest, WritesOneRecordForEachUpdate) {
  ASSERT_EQ(createEncoder(), 0);
  const auto expectWritten = [&](const Words& record, size_t calls) {
    EXPECT_EQ(settingCalls().size(), calls);
    EXPECT_EQ(words(settingCalls().back().record), record);
    omx().clearCalls();
  };
  omx().clearCalls();
  EXPECT_EQ(encoder().updateBitRate(300000), 0);
  EXPECT_EQ(words(settingCalls()[0].record)[2], 0u);  // asked of the input, set on the output
  expectWritten({16, kVersion, 1, 300000}, 2);
  EXPECT_EQ(encoder().updateAVCIntraPeriod(INT32_MIN), 0);
  expectWritten({20, kVersion, 1, 0x80000000, 0x7FFFFFFF}, 1);
  EXPECT_EQ(encoder().requestIFrame(), 0);
  expectWritten({16, kVersion, 1, 1}, 1);
  EXPECT_EQ(encoder().setupRateControl(2, -1), 0);
  expectWritten({20, kVersion, 1, 2, 0xFFFFFFFF}, 2);
}

}  // namespace
}  // namespace omxtest
