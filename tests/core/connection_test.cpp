// The way to the media server, the node and the wrapper; the observer, and the end of a session.
#include <binder/MemoryHeapBase.h>
#include <cutils/properties.h>
#include <omxhost/services.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using faults::Failing;

constexpr const char* kEncoderName = "OMX.qcom.video.encoder.avc";
constexpr const char* kNoService = "E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
constexpr const char* kNoOmx = "E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE";
const std::string kNotFound = "E OMXINTERFACE: CODEC NOT FOUND: ";

using ConnectionTest = SessionTest;

TEST_F(ConnectionTest, BeginsWithEverythingAtRest) {
  OmxInterface session;
  EXPECT_TRUE(session._componentName == nullptr && session._node == nullptr && session._omx == nullptr);
  EXPECT_TRUE(session._observer == nullptr && session._mpMemHeap == nullptr);
  EXPECT_TRUE(session._outputConvertBuffer == nullptr && session._platformWrapper == nullptr);
  EXPECT_FALSE(session._inputClosed || session._endOfOutputReached || session._deinitDone ||
               session._portReconfiguring || session._endOfInputPending || session._isEncoder);
  EXPECT_EQ(session._threadError + session._omxState + session._portFrameSize[1].width, 0);
  for (sem_t* semaphore = &session._semStateChanged; semaphore <= &session._semReserved9; ++semaphore) {
    EXPECT_EQ(valueOf(*semaphore), 0);
  }
}

TEST_F(ConnectionTest, LivesWithoutItsOutputQueue) {
  {
    const faults::Fault failed(Failing::NothrowNew, sizeof(SimpleQueue));
    construct();
  }
  EXPECT_EQ(log(), LogLines{"E new memory _queueOutputData fail in OmxInterface::OmxInterface() ! "});
  ASSERT_EQ(_session->setupIOMXConnections(), OMXI_OK);
  _application.attach(*_session);
  ASSERT_EQ(init(), OMXI_OK);
  ASSERT_EQ(feed("lost"), 0);
  EXPECT_EQ(deInit(), OMXI_ERR_ALLOCATE_MEMORY);  // recorded, as nobody will deliver the end of the stream
  EXPECT_TRUE(_application.outputs().empty());
}

TEST_F(ConnectionTest, AsksForIomxOnce) {
  construct();
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_MEDIA_PLAYER_SERVICE);
  _server.serveWithoutOmx();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_IOMX);
  EXPECT_EQ(log(), (LogLines{kNoService, kNoOmx}));
  _server.unregister();
  _server.serve();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);
  EXPECT_EQ(_session->_omx.get(), &omx());
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);  // nobody is asked again
}

TEST_F(ConnectionTest, TellsWhetherAComponentCanBeHadByItsExactName) {
  int result = -1;
  for (const char* name : {kEncoderName, "OMX.qcom.video.decoder.avc"}) {
    EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(name, result), 1);
    EXPECT_EQ(result, OMXI_OK);
  }
  EXPECT_EQ(trace(), (Trace{"listNodes", "listNodes"}));
  for (const char* name : {"omx.qcom.video.encoder.avc", "OMX.qcom.video.encoder.av",
                           "OMX.qcom.video.encoder.avcx", "", static_cast<const char*>(nullptr)}) {
    _log.clear();
    EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(name), 0);
    EXPECT_EQ(log(), LogLines{kNotFound + (name != nullptr ? name : "(null)")});
  }
  omx().fail(Method::ListNodes);  // an empty list says enough
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kEncoderName, result), 0);
  EXPECT_EQ(result, OMXI_ERR_NODE_NOT_FOUND);
  {
    const faults::Fault failed(Failing::New, sizeof(SessionState));
    EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kEncoderName, result), 0);
    EXPECT_EQ(result, OMXI_ERR_IOMX);
  }
  _server.unregister();
  result = 0;
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kEncoderName, result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);  // whatever keeps IOMX away
}

struct SetupFailure {
  const char* platform;  // null: the posed one
  bool served;
  Failing fault;
  size_t failing;  // the number of the fault; 0: none
  int result;
  LogLines log;
  Trace calls;  // with those of destruction
};

class SetupFailureTest : public SessionTest, public ::testing::WithParamInterface<SetupFailure> {};

TEST_P(SetupFailureTest, LeavesTheRestToDestruction) {
  const SetupFailure& expected = GetParam();
  if (expected.platform != nullptr) property_set("ro.board.platform", expected.platform);
  if (!expected.served) _server.unregister();
  construct();
  {
    const faults::Fault failed(expected.fault, expected.failing);
    EXPECT_EQ(_session->setupIOMXConnections(), expected.result);
    EXPECT_TRUE(failed.happened());
  }
  EXPECT_TRUE(omxhost::isThreadPoolStarted());
  EXPECT_EQ(_session->_platformWrapper, nullptr);
  destroy();
  EXPECT_EQ(log(), expected.log);
  EXPECT_EQ(trace(), expected.calls);
}

const std::string kAllocate = std::string("allocateNode ") + kEncoderName;
const LogLines kNone;

INSTANTIATE_TEST_SUITE_P(
    Reasons, SetupFailureTest,
    ::testing::Values(
        SetupFailure{nullptr, false, Failing::New, 0, 3, {kNoService}, {}},
        SetupFailure{
            "omap4430", true, Failing::New, 0, 6, {kNotFound + "OMX.TI.DUCATI1.VIDEO.H264E"}, {"listNodes"}},
        SetupFailure{nullptr, true, Failing::New, sizeof(OmxCodecObserver), 5, kNone, {"listNodes"}},
        SetupFailure{nullptr,
                     true,
                     Failing::NothrowNew,
                     sizeof(CQcomBoardPlatformWrapper),
                     36,
                     kNone,
                     {"listNodes", kAllocate, "freeNode"}},
        SetupFailure{"exynos4", true, Failing::New, 0, 36, kNone, {}},
        SetupFailure{"exynos4", false, Failing::New, 0, 3, {kNoService}, {}}));

TEST_F(ConnectionTest, ReportsWhatItCannotDoWithoutAConnection) {
  construct();
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(_session->allocateBuffersOnPort(0), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
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
  destroy();
  messages().forgetFreedNodes();
  observer->registerBuffers(heap);  // nobody is there
  EXPECT_EQ(heap->getStrongCount(), 1);
  EXPECT_EQ(observer->getStrongCount(), 1);
}

TEST_F(ConnectionTest, HearsNothingThroughAnObserverThatWasReplaced) {
  // The node still calls back through the first one when the session goes; nor does its server let it go.
  connect();
  _session->setObserver(new OmxCodecObserver);
  void* const node = _session->_node;
  omx().fail(Method::FreeNode);
  destroy();
  ASSERT_TRUE(messages().forge(node, makeEvent(OMX_EventError, 1, 2)));
  require(messages().waitForDelivered(anyEvent(), 1), "the late message");
  EXPECT_EQ(log(), LogLines{});
}

}  // namespace
}  // namespace omxtest
