// Encoders without settings, the records that one writes by itself, and the way of one raw frame into the
// component: its layout, what is refused, and what happens after the end.
#include <future>

#include "core/session_state.h"
#include "tests/core/faults.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

// A session that runs on `device`, with input buffers of `capacity` bytes, and a frame of its size.
struct RunningRig : EncoderRig {
  RunningRig(const char* device, OMX_U32 capacity) : EncoderRig(device), frame(capacity + 1) {
    for (size_t i = 0; i < frame.size(); ++i) frame[i] = static_cast<uint8_t>(1 + i % 251);  // never 0
    server.encoder().editPort(0, [=](auto& definition) { definition.nBufferSize = capacity; });
    EXPECT_EQ(create(), 0);
    EXPECT_EQ(session->init(), 0);
    log.clear();
  }
  int send() { return session->sendDataFrame(frame.data(), 176, 144, 0); }

  std::vector<uint8_t> frame;
};

struct Layout {
  const char* device;
  int width;
  int height;
  size_t luma;
  size_t chromaOffset;
  size_t chroma;
};

void PrintTo(const Layout& layout, std::ostream* stream) {
  *stream << layout.device << " " << layout.width << "x" << layout.height;
}

class FrameLayouts : public ::testing::TestWithParam<Layout> {};

TEST_P(FrameLayouts, PlaceTheChromaWhereTheHardwareLooksForIt) {
  const auto& [device, width, height, luma, chromaOffset, chroma] = GetParam();
  const size_t length = chromaOffset + chroma;
  RunningRig rig(device, static_cast<OMX_U32>(length + 100));
  auto* const memory = static_cast<uint8_t*>(rig.session->_portBuffers[kOmxInputPort][0].data);
  memset(memory, 0xEE, length + 100);  // what an earlier frame left
  ASSERT_EQ(rig.session->sendDataFrame(rig.frame.data(), width, height, -7), 0);
  const Call sent = rig.server.omx().calls(Method::EmptyBuffer).at(0);
  EXPECT_EQ(sent.length, length);
  EXPECT_EQ(sent.timestamp, -7);
  std::vector<uint8_t> expected(length, 0);
  memcpy(expected.data(), rig.frame.data(), luma);
  memcpy(expected.data() + chromaOffset, rig.frame.data() + luma, chroma);
  ASSERT_TRUE(rig.server.encoder().waitForInputs(1));
  EXPECT_EQ(rig.server.encoder().inputs()[0].bytes, expected);
  EXPECT_EQ(memory[length], 0xEE) << "nothing behind the frame is written";
}

INSTANTIATE_TEST_SUITE_P(Devices, FrameLayouts,
                         ::testing::Values(Layout{"msm8x60", 176, 144, 25344, 26624, 12672},
                                           Layout{"msm8x60", 64, 32, 2048, 2048, 1024},  // already aligned
                                           Layout{"msm8x60", 3, 3, 9, 2048, 4},
                                           Layout{"msm8960", 1, 1, 1, 1, 0}));

TEST(SendDataFrame, RefusesWhatDoesNotFitAndKeepsTheBufferFree) {
  RunningRig rig("msm8960", 38016);
  const struct {
    int width;
    int height;
    const char* line;
  } refusals[] = {
      {-176, 144, "E OMXINTERFACE - Frame of -176x144 at "},
      {25345, 1, "E OMXINTERFACE - Frame of 25345x1 does not fit an input buffer of 38016 bytes"},
      {INT32_MAX, INT32_MAX, "E OMXINTERFACE - Frame of 2147483647x2147483647 does not fit "},
      // Products that are small, negative or zero in 32 bits.
      {65536, 65536, "E OMXINTERFACE - Frame of 65536x65536 does not fit "},
  };
  for (const auto& [width, height, line] : refusals) {
    rig.log.clear();
    EXPECT_EQ(rig.session->sendDataFrame(rig.frame.data(), width, height, 0), -1) << line;
    EXPECT_EQ(logLines(rig.log).at(0).substr(0, strlen(line)), line);
    EXPECT_TRUE(rig.session->portBuffersHaveBeenReturned(kOmxInputPort));
  }
  EXPECT_EQ(rig.session->sendDataFrame(nullptr, 176, 144, 0), -1);
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 0U);

  rig.server.encoder().holdInput();
  rig.session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(rig.send(), OMXI_ERR_EVENT_ERROR);  // it is sent all the same
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 1U);
  rig.session->_threadError = OMXI_OK;
  for (size_t i = 0; i < 4; ++i) EXPECT_EQ(rig.send(), 0);  // the last is dropped: no buffer is free
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 4U);
  rig.session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(rig.send(), OMXI_ERR_EVENT_ERROR);
}

TEST(SendDataFrame, KeepsTryingAfterTheEndUntilAFailureOrTheSessionsEnd) {
  for (const bool failing : {true, false}) {
    RunningRig rig("msm8960", 38016);
    EXPECT_EQ(rig.session->sendEndOfInputFlag(0), 0);
    std::future<int> feeder = std::async(std::launch::async, [&, session = rig.session.get()] {
      return session->sendDataFrame(rig.frame.data(), 176, 144, 0);
    });
    EXPECT_TRUE(rig.log.waitFor("OMXINTERFACE - Client Shutting Down: Input Data ignored"));
    EXPECT_EQ(feeder.wait_for(std::chrono::seconds(0)), std::future_status::timeout);
    if (failing) rig.session->setThreadError(OMXI_ERR_BUFFER_NOT_FOUND);
    // It would hold up the release of its port if it kept that in use.
    EXPECT_EQ(rig.session->deInit(), failing ? OMXI_ERR_BUFFER_NOT_FOUND : 0);
    rig.session.reset();
    EXPECT_EQ(feeder.get(), failing ? OMXI_ERR_BUFFER_NOT_FOUND : -1);
  }
}

TEST(EncoderCreation, LeavesAnUnconnectedSessionWithoutSettings) {
  ScriptedMediaServer server("msm8960");
  OmxInterfaceEncoder* session = nullptr;
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  ASSERT_NE(session, nullptr);
  EXPECT_EQ(server.omx().count(), 0u);
  // Everything fails as if refused, and nothing crashes.
  EXPECT_EQ(session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->updateAVCIntraPeriod(1), OMXI_ERR_SET_INTRA_PERIOD);
  EXPECT_EQ(session->requestIFrame(), OMXI_ERR_REQUEST_IFRAME);
  EXPECT_EQ(session->setupIOMXConnections(), 0);
  EXPECT_EQ(session->configureEncoder(nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  server.omx().fail(Method::SetConfig);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_SET_BITRATE);
  delete session;
  webrtc::VideoCodec codec = settings();
  const faults::Fault failed(faults::Failing::New, sizeof(SessionState));
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, &codec), OMXI_ERR_CREATE_INTERFACE);
  EXPECT_EQ(session, nullptr);
}

TEST(EncoderUpdates, WriteOneRecordEach) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  const auto expectWritten = [&](const Words& record, size_t calls) {
    EXPECT_EQ(rig.settingCalls().size(), calls);
    EXPECT_EQ(words(rig.settingCalls().back().record), record);
    rig.server.omx().clearCalls();
  };
  rig.server.omx().clearCalls();
  EXPECT_EQ(rig.session->updateBitRate(300000), 0);
  EXPECT_EQ(words(rig.settingCalls()[0].record)[2], 0u);  // asked of the input, set on the output
  expectWritten({16, kVersion, 1, 300000}, 2);
  EXPECT_EQ(rig.session->updateAVCIntraPeriod(30), 0);
  expectWritten({20, kVersion, 1, 30, 29}, 1);
  EXPECT_EQ(rig.session->updateAVCIntraPeriod(INT32_MIN), 0);
  expectWritten({20, kVersion, 1, 0x80000000, 0x7FFFFFFF}, 1);
  EXPECT_EQ(rig.session->requestIFrame(), 0);
  expectWritten({16, kVersion, 1, 1}, 1);
  EXPECT_EQ(rig.session->setupRateControl(2, -1), 0);
  expectWritten({20, kVersion, 1, 2, 0xFFFFFFFF}, 2);
}

}  // namespace
}  // namespace omxtest
