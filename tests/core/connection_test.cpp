// The way to the media server, the node and the wrapper, and the observer through which the node calls
// back.
#include <binder/MemoryHeapBase.h>
#include <omxhost/services.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using faults::Failing;

using ConnectionTest = SessionTest;

TEST_F(ConnectionTest, AsksForIomxOnce) {
  construct();
  // Without a connection everything fails as if refused.
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_MEDIA_PLAYER_SERVICE);
  _server.serveWithoutOmx();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_IOMX);
  _server.unregister();
  _server.serve();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);  // nobody is asked again
  EXPECT_EQ(_session->queryForOmxComponent(nullptr), OMXI_ERR_NODE_NOT_FOUND);
  EXPECT_EQ(log().back(), "E OMXINTERFACE: CODEC NOT FOUND: (null)");
  int result = 0;
  const faults::Fault failed(Failing::New, sizeof(SessionState));
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired("OMX.qcom.video.encoder.avc", result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);  // whatever keeps IOMX away
}

TEST_F(ConnectionTest, LeavesTheRestOfAFailedSetUpToDestruction) {
  const std::tuple<Failing, size_t, int> cases[] = {
      {Failing::New, sizeof(OmxCodecObserver), OMXI_ERR_CREATE_OBSERVER},
      {Failing::NothrowNew, sizeof(CQcomBoardPlatformWrapper), OMXI_ERR_NO_PLATFORM_WRAPPER}};
  for (const auto& [function, size, code] : cases) {
    construct();
    const faults::Fault failed(function, size);
    EXPECT_EQ(_session->setupIOMXConnections(), code);
    destroy();
  }
  EXPECT_TRUE(omxhost::isThreadPoolStarted());
  EXPECT_EQ(trace(),
            (Trace{"listNodes", "listNodes", "allocateNode OMX.qcom.video.encoder.avc", "freeNode"}));
}

TEST_F(ConnectionTest, PassesTheComponentsHeapOnAndLogsMessagesItDoesNotKnow) {
  connect();
  const android::sp<OmxCodecObserver> observer = _session->_observer;
  const android::sp<android::IMemoryHeap> heap = new android::MemoryHeapBase(4096);
  observer->registerBuffers(heap);
  EXPECT_EQ(_session->_mpMemHeap.get(), heap.get());
  android::omx_message unknown{};
  unknown.type = static_cast<decltype(unknown.type)>(3);
  deliver(unknown);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - OnMessage :: default called, message not handled\n"});
}

}  // namespace
}  // namespace omxtest
