// Settings of a running encoder, from several threads, while frames flow and while it is taken down.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "core/session_state.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/support/eventually.h"

namespace {

using namespace omxtest;

constexpr int kFrames = 300;

// Counts the output of a session and checks its order.
struct Output {
  std::atomic<int> count{0};
  std::atomic<bool> inOrder{true};

  static int callback(void* /*session*/, void* /*data*/, unsigned int /*length*/, void* /*bufferId*/,
                      void* context, unsigned int timestamp) {
    auto& self = *static_cast<Output*>(context);
    if (timestamp != static_cast<unsigned int>(self.count)) self.inOrder = false;
    ++self.count;
    return 0;
  }
};

TEST(RunningEncoder, TakesSettingsFromThreeThreadsWhileFramesFlow) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  Output output;
  rig.session->registerOutputCallback(Output::callback, &output);
  ASSERT_EQ(rig.session->init(), 0);
  rig.server.omx().clearCalls();

  std::atomic<bool> fed{false};
  std::atomic<int> changes{0};
  std::atomic<int> failures{0};
  const auto changer = [&](auto change) {
    return std::thread([&, change] {
      for (unsigned int i = 1; !fed; ++i) {
        if (change(*rig.session, i) != 0) ++failures;
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
  const std::vector<uint8_t> frame(38016, 0x55);
  for (int i = 0; i < kFrames; ++i) {
    void* buffer = nullptr;
    void* data = nullptr;
    if (!eventually([&] { return rig.session->reserveInputBuffer(&buffer, &data) == 0; })) break;
    memcpy(data, frame.data(), frame.size());
    EXPECT_EQ(rig.session->sendInputBuffer(buffer, static_cast<int>(frame.size()), i), 0);
  }
  EXPECT_TRUE(eventually([&] { return output.count == kFrames && changes > 0; }));
  fed = true;
  for (std::thread& thread : changers) thread.join();
  EXPECT_EQ(failures, 0);
  EXPECT_TRUE(output.inOrder);
  EXPECT_EQ(rig.server.omx().count(Method::SetConfig), static_cast<size_t>(changes) * 2);

  EXPECT_EQ(rig.session->sendEndOfInputFlag(kFrames), 0);
  EXPECT_EQ(rig.session->deInit(), 0);
  EXPECT_EQ(rig.session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
}

// The wrapper is deleted under a setting's feet, were it not counted as in use.
TEST(RunningEncoder, LetsASettingInProgressFinishBeforeTheWrapperGoes) {
  EncoderRig rig("msm8960");
  ASSERT_EQ(rig.create(), 0);
  ASSERT_EQ(rig.session->init(), 0);
  ASSERT_EQ(rig.session->sendEndOfInputFlag(0), 0);

  std::atomic<bool> inside{false};
  std::atomic<bool> tornDown{false};
  rig.server.omx().before(Method::SetConfig, [&](const Call&) {
    inside = true;
    // The component is Loaded: all that deInit() has left to do is to delete the wrapper.
    EXPECT_TRUE(
        rig.server.messages().waitForDelivered(commandComplete(OMX_CommandStateSet, OMX_StateLoaded)));
    EXPECT_FALSE(tornDown);
  });
  std::thread setter([&] { EXPECT_EQ(rig.session->setConfig(CONFIG_BITRATE, 1), 0); });
  EXPECT_TRUE(eventually([&] { return inside.load(); }));
  EXPECT_EQ(rig.session->deInit(), 0);
  tornDown = true;
  setter.join();
  EXPECT_EQ(rig.session->setConfig(CONFIG_BITRATE, 1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(rig.server.omx().count(Method::SetConfig), 1U);
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
  std::thread setter([&, session = rig.session.get()] { EXPECT_EQ(session->requestIFrame(), 0); });
  EXPECT_TRUE(eventually([&] { return inside.load(); }));
  rig.session.reset();
  setter.join();
  EXPECT_EQ(rig.server.omx().count(Method::FreeNode), 1U);
}

}  // namespace
