// How an encoding session comes to be, and every way in which it does not.
#include <gtest/gtest.h>

#include <cutils/properties.h>

#include "tests/core/log_lines.h"
#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

TEST(EncoderCreation, ConnectsAndConfiguresButDoesNotStart) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  EXPECT_TRUE(rig.session->isEncoder());
  EXPECT_EQ(rig.server.omx().count(Method::AllocateNode), 1U);
  EXPECT_EQ(rig.server.omx().calls(Method::AllocateNode)[0].text, "OMX.qcom.video.encoder.avc");
  EXPECT_EQ(rig.server.omx().count(Method::SendCommand), 0U);
  EXPECT_EQ(rig.session->_portBuffers[kOmxInputPort].size(), 0U);

  rig.session.reset();
  EXPECT_EQ(rig.server.omx().count(Method::FreeNode), 1U);
}

TEST(EncoderCreation, LeavesAnUnconnectedSessionWhereThereAreNoSettings) {
  ScriptedMediaServer server("msm8960");
  OmxInterfaceEncoder* session = nullptr;
  EXPECT_EQ(OmxInterfaceEncoder::Create(&session, nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
  ASSERT_NE(session, nullptr);
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
  delete session;
}

TEST(EncoderCreation, RefusesToConfigureWithoutSettings) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  EXPECT_EQ(rig.session->configureEncoder(nullptr), OMXI_ERR_INVALID_ENCODING_PARAMS);
}

struct Failure {
  const char* what;
  std::function<void(ScriptedMediaServer&)> arrange;
  int code;
  LogLines lines;
};

// One process for all: a platform that is known does not change.
TEST(EncoderCreation, FailsWithACodeAndALineAndLeavesNothing) {
  EncoderRig rig("msm8960");
  const Failure failures[] = {
      {"no media server",
       [](ScriptedMediaServer& server) { server.unregister(); },
       OMXI_ERR_IOMX,
       {"E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE"}},
      {"no IOMX",
       [](ScriptedMediaServer& server) { server.serveWithoutOmx(); },
       OMXI_ERR_IOMX,
       {"E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE"}},
      {"no component",
       [](ScriptedMediaServer& server) { server.omx().fail(Method::ListNodes); },
       OMXI_ERR_NODE_NOT_FOUND,
       {"E OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.encoder.avc"}},
      {"no node",
       [](ScriptedMediaServer& server) { server.omx().fail(Method::AllocateNode); },
       OMXI_ERR_ALLOCATE_COMPONENT,
       {"E OMXINTERFACE - Could not allocate node: OMX.qcom.video.encoder.avc -- error -2147483648"}},
  };
  for (const Failure& failure : failures) {
    SCOPED_TRACE(failure.what);
    rig.server.unregister();
    rig.server.serve();
    failure.arrange(rig.server);
    EXPECT_EQ(rig.create(), failure.code);
    EXPECT_EQ(rig.session, nullptr);
    EXPECT_EQ(logLines(rig.log), failure.lines);
    EXPECT_EQ(rig.server.leaks(), "");
  }
}

TEST(EncoderCreation, NeedsAPlatformThatHasAWrapper) {
  EncoderRig rig("exynos4");
  EXPECT_EQ(rig.create(), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(rig.session, nullptr);
  EXPECT_EQ(rig.server.omx().count(Method::AllocateNode), 0U);
}

}  // namespace
