// Encoders without settings and without memory, and the records that one writes by itself.
#include "core/session_state.h"
#include "tests/core/faults.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

TEST(EncoderCreation, LeavesAnUnconnectedSessionWithoutSettings) {
  ScriptedMediaServer server("msm8960");
  OmxInterfaceEncoder* session = nullptr;
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  ASSERT_NE(session, nullptr);
  EXPECT_EQ(server.omx().count(), 0u);
  // Everything fails as if refused, and nothing crashes.
  webrtc::VideoCodec codec = settings();
  EXPECT_EQ(session->configureEncoder(&codec), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->updateAVCIntraPeriod(1), OMXI_ERR_SET_INTRA_PERIOD);
  EXPECT_EQ(session->requestIFrame(), OMXI_ERR_REQUEST_IFRAME);
  EXPECT_EQ(session->setupRateControl(1, 1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->setupIOMXConnections(), 0);
  EXPECT_EQ(session->configureEncoder(nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  server.omx().fail(Method::SetConfig);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_SET_BITRATE);
  delete session;
  for (const auto& [function, size] : {std::pair(faults::Failing::NothrowNew, sizeof(OmxInterfaceEncoder)),
                                       std::pair(faults::Failing::New, sizeof(SessionState))}) {
    const faults::Fault failed(function, size);
    EXPECT_EQ(OmxInterfaceEncoder::Create(&session, &codec), OMXI_ERR_CREATE_INTERFACE);
    EXPECT_EQ(session, nullptr);
  }
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
