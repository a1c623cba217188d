// An encoding session without settings, without memory, and with settings in progress at its end.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "core/session_state.h"
#include "tests/core/faults.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/support/eventually.h"

namespace {

using namespace omxtest;

TEST(EncoderCreation, LeavesAnUnconnectedSessionWhereThereAreNoSettings) {
  ScriptedMediaServer server("msm8960");
  OmxInterfaceEncoder* session = nullptr;
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  ASSERT_NE(session, nullptr);
  EXPECT_TRUE(session->isEncoder());
  EXPECT_EQ(server.omx().count(), 0U);

  // Without a connection everything fails as if refused, and nothing crashes.
  webrtc::VideoCodec codec = settings();
  EXPECT_EQ(session->configureEncoder(&codec), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(session->updateBitRate(1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->updateAVCIntraPeriod(1), OMXI_ERR_SET_INTRA_PERIOD);
  EXPECT_EQ(session->requestIFrame(), OMXI_ERR_REQUEST_IFRAME);
  EXPECT_EQ(session->setupRateControl(1, 1), OMXI_ERR_GET_BITRATE);
  EXPECT_EQ(session->setupPortBitRate(1, 1), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(session->setupAvcSettings(&codec.codecSpecific.H264), OMXI_ERR_GET_AVC_PARAMS);
  const unsigned char frame[6] = {};
  EXPECT_EQ(session->sendDataFrame(frame, 2, 2, 0), 0) << "no buffer: the frame is dropped";
  EXPECT_EQ(session->setupIOMXConnections(), 0);
  EXPECT_EQ(session->configureEncoder(nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  delete session;
}

TEST(EncoderCreation, FailsWithoutMemory) {
  ScriptedMediaServer server("msm8960");
  for (const auto& [function, size] : {std::pair(faults::Failing::NothrowNew, sizeof(OmxInterfaceEncoder)),
                                       std::pair(faults::Failing::New, sizeof(SessionState))}) {
    webrtc::VideoCodec codec = settings();
    int unused = 0;
    auto* session = reinterpret_cast<OmxInterfaceEncoder*>(&unused);
    const faults::Fault failed(function, size);
    EXPECT_EQ(OmxInterfaceEncoder::Create(&session, &codec), OMXI_ERR_CREATE_INTERFACE);
    EXPECT_TRUE(failed.happened());
    EXPECT_EQ(session, nullptr);
  }
}

TEST(RunningEncoder, IsDestroyedOnlyAfterASettingInProgress) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  ASSERT_EQ(rig.session->init(), 0);
  SessionState& state = *rig.session->_state;
  std::atomic<bool> inside{false};
  rig.server.omx().before(Method::SetConfig, [&](const Call&) {
    inside = true;
    EXPECT_TRUE(eventually([&] {
      const SessionState::Lock held(state.lock);
      return state.ending;
    }));
    EXPECT_EQ(rig.server.omx().count(Method::FreeNode), 0U);
  });
  std::thread setter([session = rig.session.get()] { EXPECT_EQ(session->requestIFrame(), 0); });
  EXPECT_TRUE(eventually([&] { return inside.load(); }));
  rig.session.reset();
  setter.join();
  EXPECT_EQ(rig.server.omx().count(Method::FreeNode), 1U);
}

}  // namespace
