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

TEST(RunningEncoder, TakesSettingsFromThreeThreadsWhileFramesFlow) {
  constexpr int kFrames = 300;
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  std::atomic<unsigned int> outputs{0};
  rig.session->registerOutputCallback(
      [](void*, void*, unsigned int, void*, void* context, unsigned int timestamp) {
        EXPECT_EQ(timestamp, (*static_cast<std::atomic<unsigned int>*>(context))++);
        return 0;
      },
      &outputs);
  ASSERT_EQ(rig.session->init(), 0);
  rig.server.omx().clearCalls();

  std::atomic<bool> fed{false};
  std::atomic<int> changes{0};
  const auto changer = [&](auto change) {
    return std::thread([&, change] {
      for (unsigned int i = 1; !fed; ++i) {
        EXPECT_EQ(change(*rig.session, i), 0);
        ++changes;
      }
    });
  };
  std::thread changers[] = {
      changer([](OmxInterfaceEncoder& session, unsigned int i) {
        return session.setConfig(CONFIG_BITRATE, 100000 + i) +
               session.setConfig(CONFIG_FRAMERATE, 1 + i % 30);
      }),
      changer([](OmxInterfaceEncoder& session, unsigned int i) {
        return session.updateBitRate(100000) + session.updateAVCIntraPeriod(static_cast<int>(i % 60 + 1));
      }),
      changer([](OmxInterfaceEncoder& session, unsigned int i) {
        return session.requestIFrame() + session.setConfig(CONFIG_INTRA_PERIOD, i);
      }),
  };
  for (int i = 0; i < kFrames; ++i) {
    void* buffer = nullptr;
    void* data = nullptr;
    if (!eventually([&] { return rig.session->reserveInputBuffer(&buffer, &data) == 0; })) break;
    EXPECT_EQ(rig.session->sendInputBuffer(buffer, 1, i), 0);
  }
  EXPECT_TRUE(eventually([&] { return outputs == kFrames && changes > 0; }));
  fed = true;
  for (std::thread& thread : changers) thread.join();
  EXPECT_EQ(rig.server.omx().count(Method::SetConfig), static_cast<size_t>(changes) * 2);
  EXPECT_EQ(rig.session->sendEndOfInputFlag(kFrames), 0);
  EXPECT_EQ(rig.session->deInit(), 0);
}

// The wrapper is deleted under a setting's feet, or the session, were it not counted as in use.
TEST(RunningEncoder, LetsASettingInProgressFinishBeforeTheWrapperOrTheSessionGoes) {
  for (const bool destroyed : {false, true}) {
    EncoderRig rig("msm8960");
    ASSERT_EQ(rig.create(), 0);
    ASSERT_EQ(rig.session->init(), 0);
    ASSERT_EQ(rig.session->sendEndOfInputFlag(0), 0);
    SessionState& state = *rig.session->_state;
    std::atomic<bool> inside{false};
    std::atomic<bool> gone{false};
    rig.server.omx().before(Method::SetConfig, [&](const Call&) {
      inside = true;
      // The component is Loaded: all that deInit() has left to do is to delete the wrapper.
      EXPECT_TRUE(destroyed ? eventually([&] {
        const SessionState::Lock held(state.lock);
        return state.ending;
      })
                            : rig.server.messages().waitForDelivered(
                                  commandComplete(OMX_CommandStateSet, OMX_StateLoaded)));
      EXPECT_FALSE(gone);
    });
    std::thread setter([&, session = rig.session.get()] {
      EXPECT_EQ(destroyed ? session->requestIFrame() : session->setConfig(CONFIG_BITRATE, 1), 0);
    });
    EXPECT_TRUE(eventually([&] { return inside.load(); }));
    if (destroyed) {
      rig.session.reset();
    } else {
      EXPECT_EQ(rig.session->deInit(), 0);
    }
    gone = true;
    setter.join();
    if (!destroyed) {
      EXPECT_EQ(rig.session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
    }
    EXPECT_EQ(rig.server.omx().count(Method::SetConfig), 1U);
  }
}

}  // namespace
