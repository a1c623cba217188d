// The way of one raw frame into the component: its layout, what is refused, and what happens after the end.
#include <future>

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
      {0, 144, "E OMXINTERFACE - Frame of 0x144 at "},
      {-176, -144, "E OMXINTERFACE - Frame of -176x-144 at "},
      {INT32_MIN, 1, "E OMXINTERFACE - Frame of -2147483648x1 at "},
      {25345, 1, "E OMXINTERFACE - Frame of 25345x1 does not fit an input buffer of 38016 bytes"},
      {INT32_MAX, INT32_MAX, "E OMXINTERFACE - Frame of 2147483647x2147483647 does not fit "},
      // Products that are small, negative or zero in 32 bits.
      {65536, 65536, "E OMXINTERFACE - Frame of 65536x65536 does not fit "},
      {46341, 46341, "E OMXINTERFACE - Frame of 46341x46341 does not fit "},
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

}  // namespace
}  // namespace omxtest
