// The way of one raw frame into the component: its layout, what is refused, and what happens after the end.
#include <gtest/gtest.h>

#include <atomic>
#include <future>
#include <thread>

#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

std::vector<uint8_t> frameOf(size_t bytes) {
  std::vector<uint8_t> frame(bytes);
  for (size_t i = 0; i < bytes; ++i) frame[i] = static_cast<uint8_t>(1 + i % 251);  // never 0
  return frame;
}

// A session that runs on `device`, with input buffers of `capacity` bytes that the component keeps.
struct RunningRig : EncoderRig {
  RunningRig(const char* device, OMX_U32 capacity) : EncoderRig(device) {
    server.encoder().editPort(0, [=](auto& definition) { definition.nBufferSize = capacity; });
    EXPECT_EQ(create(), 0);
    EXPECT_EQ(session->init(), 0);
    log.clear();
  }
  std::vector<uint8_t> memory(size_t buffer) {
    const auto* bytes = static_cast<const uint8_t*>(session->_portBuffers[kOmxInputPort][buffer].data);
    return {bytes, bytes + session->inputBufferCapacity()};
  }
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
  const Layout& layout = GetParam();
  const size_t length = layout.chromaOffset + layout.chroma;
  RunningRig rig(layout.device, static_cast<OMX_U32>(length + 100));
  // What an earlier frame left.
  std::vector<uint8_t> before(rig.session->inputBufferCapacity(), 0xEE);
  memcpy(rig.session->_portBuffers[kOmxInputPort][0].data, before.data(), before.size());
  const std::vector<uint8_t> frame = frameOf(layout.luma + layout.chroma);
  ASSERT_EQ(rig.session->sendDataFrame(frame.data(), layout.width, layout.height, -7), 0);

  const std::vector<Call> sent = rig.server.omx().calls(Method::EmptyBuffer);
  ASSERT_EQ(sent.size(), 1U);
  EXPECT_EQ(sent[0].offset, 0U);
  EXPECT_EQ(sent[0].length, length);
  EXPECT_EQ(sent[0].flags, OMX_BUFFERFLAG_ENDOFFRAME);
  EXPECT_EQ(sent[0].timestamp, -7);

  const auto at = [&](size_t offset) { return frame.begin() + static_cast<ptrdiff_t>(offset); };
  std::vector<uint8_t> expected(at(0), at(layout.luma));
  expected.resize(layout.chromaOffset, 0);
  expected.insert(expected.end(), at(layout.luma), at(layout.luma + layout.chroma));
  ASSERT_TRUE(rig.server.encoder().waitForInputs(1));
  EXPECT_EQ(rig.server.encoder().inputs()[0].bytes, expected);
  expected.insert(expected.end(), before.begin() + static_cast<ptrdiff_t>(length), before.end());
  EXPECT_EQ(rig.memory(0), expected) << "nothing behind the frame is written";
}

INSTANTIATE_TEST_SUITE_P(Devices, FrameLayouts,
                         ::testing::Values(Layout{"msm8x60", 176, 144, 25344, 26624, 12672},
                                           Layout{"msm8x60", 64, 32, 2048, 2048, 1024},  // already aligned
                                           Layout{"msm8x60", 3, 3, 9, 2048, 4},
                                           Layout{"msm8960", 176, 144, 25344, 25344, 12672},
                                           Layout{"msm8960", 3, 3, 9, 9, 4}, Layout{"msm8960", 1, 1, 1, 1, 0},
                                           Layout{"msm7x30", 176, 144, 25344, 25344, 12672},
                                           Layout{"omap4", 176, 144, 25344, 25344, 12672}));

TEST(SendDataFrame, RefusesWhatDoesNotFitAndKeepsTheBufferFree) {
  RunningRig rig("msm8960", 38016);
  const std::vector<uint8_t> frame = frameOf(38017);
  const std::vector<uint8_t> before = rig.memory(0);
  const struct {
    const unsigned char* frame;
    int width;
    int height;
    const char* line;
  } refusals[] = {
      {frame.data(), 0, 144, "E OMXINTERFACE - Frame of 0x144 at "},
      {frame.data(), 176, 0, "E OMXINTERFACE - Frame of 176x0 at "},
      {frame.data(), -176, -144, "E OMXINTERFACE - Frame of -176x-144 at "},
      {frame.data(), INT32_MIN, 1, "E OMXINTERFACE - Frame of -2147483648x1 at "},
      {nullptr, 176, 144, "E OMXINTERFACE - Frame of 176x144 at "},
      {frame.data(), 25345, 1,
       "E OMXINTERFACE - Frame of 25345x1 does not fit an input buffer of 38016 bytes"},
      {frame.data(), INT32_MAX, INT32_MAX, "E OMXINTERFACE - Frame of 2147483647x2147483647 does not fit "},
      // Products that are small, negative or zero in 32 bits.
      {frame.data(), 65536, 65536, "E OMXINTERFACE - Frame of 65536x65536 does not fit "},
      {frame.data(), 1 << 30, 4, "E OMXINTERFACE - Frame of 1073741824x4 does not fit "},
      {frame.data(), 46341, 46341, "E OMXINTERFACE - Frame of 46341x46341 does not fit "},
  };
  for (const auto& refusal : refusals) {
    SCOPED_TRACE(refusal.line);
    rig.log.clear();
    EXPECT_EQ(rig.session->sendDataFrame(refusal.frame, refusal.width, refusal.height, 0), -1);
    const LogLines lines = logLines(rig.log);
    ASSERT_EQ(lines.size(), 1U);
    EXPECT_EQ(lines[0].substr(0, strlen(refusal.line)), refusal.line);
    EXPECT_TRUE(rig.session->portBuffersHaveBeenReturned(kOmxInputPort));
  }
  EXPECT_EQ(rig.memory(0), before);
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 0U);

  EXPECT_EQ(rig.session->sendDataFrame(frame.data(), 176, 144, 0), 0) << "exactly the buffer's size";
}

TEST(SendDataFrame, DropsTheFrameWhenNoBufferIsFreeAndReportsFailures) {
  RunningRig rig("msm8960", 38016);
  const std::vector<uint8_t> frame = frameOf(38016);
  const auto send = [&] { return rig.session->sendDataFrame(frame.data(), 176, 144, 0); };
  rig.server.encoder().holdInput();
  rig.session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(send(), OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 1U) << "the frame is sent all the same";
  rig.session->_threadError = OMXI_OK;
  for (size_t i = 0; i < 4; ++i) EXPECT_EQ(send(), 0);
  EXPECT_EQ(rig.server.omx().count(Method::EmptyBuffer), 4U);
  rig.session->setThreadError(OMXI_ERR_EVENT_ERROR);
  EXPECT_EQ(send(), OMXI_ERR_EVENT_ERROR);
}

// A feeder that comes after the end of input and keeps trying.
struct LateFeeder {
  explicit LateFeeder(RunningRig& rig) {
    EXPECT_EQ(rig.session->sendEndOfInputFlag(0), 0);
    result = std::async(std::launch::async, [session = rig.session.get()] {
      const std::vector<uint8_t> frame = frameOf(38016);
      return session->sendDataFrame(frame.data(), 176, 144, 0);
    });
    EXPECT_TRUE(rig.log.waitFor("OMXINTERFACE - Client Shutting Down: Input Data ignored"));
  }
  std::future<int> result;
};

TEST(SendDataFrame, KeepsTryingAfterTheEndUntilAFailureIsRecorded) {
  RunningRig rig("msm8960", 38016);
  LateFeeder feeder(rig);
  EXPECT_EQ(feeder.result.wait_for(std::chrono::seconds(0)), std::future_status::timeout);
  rig.session->setThreadError(OMXI_ERR_BUFFER_NOT_FOUND);
  EXPECT_EQ(feeder.result.get(), OMXI_ERR_BUFFER_NOT_FOUND);
  EXPECT_EQ(rig.session->sendDataFrame(frameOf(38016).data(), 176, 144, 0), OMXI_ERR_BUFFER_NOT_FOUND);
}

TEST(SendDataFrame, EndsWithTheSessionAndDoesNotHoldUpATeardown) {
  RunningRig rig("msm8960", 38016);
  LateFeeder feeder(rig);  // would wait for its port's release if it kept it in use
  EXPECT_EQ(rig.session->deInit(), 0);
  rig.session.reset();
  EXPECT_EQ(feeder.result.get(), -1);
}

}  // namespace
