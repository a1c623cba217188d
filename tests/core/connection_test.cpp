// The way to the media server, the node and the wrapper, and the end of a session that got no further.
#include <cutils/properties.h>
#include <omxhost/services.h>

#include "platform/qcom_board_platform_wrapper.h"
#include "tests/core/faults.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr const char* kEncoderName = "OMX.qcom.video.encoder.avc";
constexpr const char* kDecoderName = "OMX.qcom.video.decoder.avc";
constexpr const char* kNoService = "E OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE";
constexpr const char* kNoOmx = "E OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE";

constexpr auto kNull = faults::FailedAllocation::Form::ReturnsNull;
constexpr auto kThrows = faults::FailedAllocation::Form::Throws;

using ConnectionTest = SessionTest;

TEST_F(ConnectionTest, BeginsWithEverythingAtRest) {
  OmxInterface session;
  EXPECT_TRUE(session._portBuffers[0].isEmpty() && session._portBuffers[1].isEmpty());
  EXPECT_EQ(session._componentName, nullptr);
  EXPECT_EQ(session._portBufferMode[0], 0);
  EXPECT_EQ(session._portBufferMode[1], 0);
  EXPECT_EQ(session._threadError, OMXI_OK);
  EXPECT_FALSE(session._inputClosed || session._endOfOutputReached || session._deinitDone ||
               session._portReconfiguring || session._endOfInputPending || session._isEncoder);
  EXPECT_NE(session._queueOutputData, nullptr);
  EXPECT_TRUE(session._omx == nullptr && session._observer == nullptr && session._mpMemHeap == nullptr);
  EXPECT_EQ(session._node, nullptr);
  EXPECT_EQ(session._outputConvertBuffer, nullptr);
  EXPECT_EQ(session._omxState, 0);
  EXPECT_EQ(session._portFrameSize[1].width + session._portFrameSize[1].height, 0);
  EXPECT_EQ(session._platformWrapper, nullptr);
  for (sem_t* semaphore :
       {&session._semStateChanged, &session._semEventQueued, &session._semReserved3,
        &session._semOutputDataReady, &session._semInputBuffersReturned, &session._semOutputBuffersReturned,
        &session._semEndOfOutput, &session._semInputBufferFree, &session._semReserved9}) {
    EXPECT_EQ(valueOf(*semaphore), 0);
  }
}

TEST_F(ConnectionTest, LivesWithoutItsOutputQueue) {
  {
    const faults::FailedAllocation failed(sizeof(SimpleQueue));
    construct();
    EXPECT_TRUE(failed.happened());
  }
  EXPECT_EQ(log(), LogLines{"E new memory _queueOutputData fail in OmxInterface::OmxInterface() ! "});
  ASSERT_EQ(_session->setupIOMXConnections(), OMXI_OK);
  _application.attach(*_session);
  ASSERT_EQ(init(), OMXI_OK);
  ASSERT_EQ(feed("lost"), 0);
  EXPECT_EQ(deInit(), OMXI_ERR_ALLOCATE_MEMORY);  // recorded, as nobody will deliver the end of the stream
  for (const Output& output : _application.outputs()) EXPECT_EQ(output.length, 0u);
}

TEST_F(ConnectionTest, AsksForIomxOnce) {
  construct();
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_MEDIA_PLAYER_SERVICE);
  EXPECT_EQ(log(), LogLines{kNoService});
  _log.clear();
  _server.serveWithoutOmx();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_ERR_IOMX);
  EXPECT_EQ(log(), LogLines{kNoOmx});
  _log.clear();
  _server.unregister();
  _server.serve();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);
  EXPECT_EQ(_session->_omx.get(), &omx());
  _server.unregister();
  EXPECT_EQ(_session->acquireOmxFromMediaPlayer(), OMXI_OK);  // nobody is asked again
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(ConnectionTest, FindsComponentsByTheirExactName) {
  construct();
  for (const char* name : {kEncoderName, kDecoderName}) {
    EXPECT_EQ(_session->queryForOmxComponent(name), OMXI_OK);
  }
  EXPECT_EQ(log(), LogLines{});
  for (const std::string name : {"omx.qcom.video.encoder.avc", "OMX.qcom.video.encoder.av",
                                 "OMX.qcom.video.encoder.avc ", "OMX.qcom.video.encoder.avcx", ""}) {
    _log.clear();
    EXPECT_EQ(_session->queryForOmxComponent(name.c_str()), OMXI_ERR_NODE_NOT_FOUND);
    EXPECT_EQ(log(), LogLines{"E OMXINTERFACE: CODEC NOT FOUND: " + name});
  }
  _log.clear();
  EXPECT_EQ(_session->queryForOmxComponent(nullptr), OMXI_ERR_NODE_NOT_FOUND);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE: CODEC NOT FOUND: (null)"});

  _log.clear();
  omx().fail(Method::ListNodes);  // an empty list says enough
  EXPECT_EQ(_session->queryForOmxComponent(kEncoderName), OMXI_ERR_NODE_NOT_FOUND);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE: CODEC NOT FOUND: OMX.qcom.video.encoder.avc"});
}

TEST_F(ConnectionTest, TellsWhetherAComponentCanBeHad) {
  int result = -1;
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kDecoderName, result), 1);
  EXPECT_EQ(result, OMXI_OK);
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kDecoderName), 1);
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired("unknown", result), 0);
  EXPECT_EQ(result, OMXI_ERR_NODE_NOT_FOUND);
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired("unknown"), 0);
  EXPECT_EQ(trace(), (Trace{"listNodes", "listNodes", "listNodes", "listNodes"}));

  _log.clear();
  _server.unregister();
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kDecoderName, result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);  // whatever keeps IOMX away
  _server.serveWithoutOmx();
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kDecoderName, result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);
  EXPECT_EQ(log(), (LogLines{kNoService, kNoOmx}));
}

TEST_F(ConnectionTest, AllocatesThePlatformsComponent) {
  for (const Kind kind : {Kind::Encoder, Kind::Decoder}) {
    const size_t before = omx().count();
    construct(kind);
    _session->_componentName = "never consulted";
    ASSERT_EQ(_session->setupIOMXConnections(), OMXI_OK);
    EXPECT_TRUE(omxhost::isThreadPoolStarted());
    EXPECT_NE(_session->_node, nullptr);
    EXPECT_NE(_session->_platformWrapper, nullptr);
    EXPECT_EQ(_session->_portBufferMode[kOmxInputPort], 1);
    EXPECT_EQ(_session->_portBufferMode[kOmxOutputPort], kind == Kind::Encoder ? 1 : 0);
    destroy();
    EXPECT_EQ(trace(before),
              (Trace{"listNodes",
                     std::string("allocateNode ") + (kind == Kind::Encoder ? kEncoderName : kDecoderName),
                     "freeNode"}));
  }
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(ConnectionTest, LetsGoOfItsObserverAtItsEnd) {
  connect();
  const android::sp<OmxCodecObserver> observer = _session->_observer;
  destroy();
  messages().forgetFreedNodes();
  EXPECT_EQ(observer->getStrongCount(), 1);
}

struct FailureCase {
  const char* name;
  std::function<void(ScriptedMediaServer&)> prepare;
  size_t failedAllocation;  // bytes; 0: none
  faults::FailedAllocation::Form form;
  int result;
  LogLines log;
  Trace calls;  // with those of destruction
};

std::ostream& operator<<(std::ostream& stream, const FailureCase& each) {
  return stream << each.name;
}

class SetupFailureTest : public SessionTest, public ::testing::WithParamInterface<FailureCase> {};

TEST_P(SetupFailureTest, LeavesTheRestToDestruction) {
  const FailureCase& expected = GetParam();
  expected.prepare(_server);
  construct();
  {
    const faults::FailedAllocation failed(expected.failedAllocation, expected.form);
    EXPECT_EQ(_session->setupIOMXConnections(), expected.result);
    EXPECT_TRUE(failed.happened());
  }
  EXPECT_EQ(_session->_platformWrapper, nullptr);
  destroy();
  EXPECT_EQ(log(), expected.log);
  EXPECT_EQ(trace(), expected.calls);
}

void nothing(ScriptedMediaServer& /*server*/) {}

INSTANTIATE_TEST_SUITE_P(
    Reasons, SetupFailureTest,
    ::testing::Values(
        FailureCase{"no service",
                    [](ScriptedMediaServer& server) { server.unregister(); },
                    0,
                    kNull,
                    OMXI_ERR_IOMX,
                    {kNoService},
                    {}},
        FailureCase{"no IOMX",
                    [](ScriptedMediaServer& server) {
                      server.unregister();
                      server.serveWithoutOmx();
                    },
                    0,
                    kNull,
                    OMXI_ERR_IOMX,
                    {kNoOmx},
                    {}},
        FailureCase{"component not listed",
                    [](ScriptedMediaServer&) { property_set("ro.board.platform", "omap4430"); },
                    0,
                    kNull,
                    OMXI_ERR_NODE_NOT_FOUND,
                    {"E OMXINTERFACE: CODEC NOT FOUND: OMX.TI.DUCATI1.VIDEO.H264E"},
                    {"listNodes"}},
        FailureCase{"no memory for the observer",
                    nothing,
                    sizeof(OmxCodecObserver),
                    kThrows,
                    OMXI_ERR_CREATE_OBSERVER,
                    {},
                    {"listNodes"}},
        FailureCase{"node refused",
                    [](ScriptedMediaServer& server) { server.omx().fail(Method::AllocateNode, 1, -19); },
                    0,
                    kNull,
                    OMXI_ERR_ALLOCATE_COMPONENT,
                    {"E OMXINTERFACE - Could not allocate node: OMX.qcom.video.encoder.avc -- error -19"},
                    {"listNodes", "allocateNode OMX.qcom.video.encoder.avc failed"}},
        FailureCase{"no memory for the wrapper",
                    nothing,
                    sizeof(CQcomBoardPlatformWrapper),
                    kNull,
                    OMXI_ERR_NO_PLATFORM_WRAPPER,
                    {},
                    {"listNodes", "allocateNode OMX.qcom.video.encoder.avc", "freeNode"}},
        FailureCase{"platform without components",
                    [](ScriptedMediaServer&) { property_set("ro.board.platform", "exynos4"); },
                    0,
                    kNull,
                    OMXI_ERR_NO_PLATFORM_WRAPPER,
                    {},
                    {}},
        FailureCase{"platform without components or service",
                    [](ScriptedMediaServer& server) {
                      property_set("ro.board.platform", "exynos4");
                      server.unregister();
                    },
                    0,
                    kNull,
                    OMXI_ERR_IOMX,
                    {kNoService},
                    {}}));

TEST_F(ConnectionTest, ReportsWhatItCannotDoWithoutAConnection) {
  construct();
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(_session->allocateBuffersOnPort(0), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(deInit(), OMXI_ERR_SEND_COMMAND_STATE);
}

TEST_F(ConnectionTest, HearsNothingThroughAnObserverThatWasReplaced) {
  // The node still calls back through the first one when the session goes.
  connect();
  const android::sp<OmxCodecObserver> replacement = new OmxCodecObserver;
  _session->setObserver(replacement);
  void* const node = _session->_node;
  destroy();
  ASSERT_TRUE(messages().forge(node, makeEvent(OMX_EventError, 1, 2)));
  require(messages().waitForDelivered(anyEvent(), 1), "the late message");
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(ConnectionTest, IsNotThereWithoutMemory) {
  int result = 0;
  const faults::FailedAllocation failed(sizeof(SessionState), kThrows);
  EXPECT_EQ(OmxInterface::OmxComponentCanBeAcquired(kDecoderName, result), 0);
  EXPECT_EQ(result, OMXI_ERR_IOMX);
  EXPECT_TRUE(failed.happened());
}

TEST_F(ConnectionTest, IsDestroyedAlthoughTheServerKeepsItsNode) {
  connect();
  omx().fail(Method::FreeNode);
  destroy();
  EXPECT_EQ(log(), LogLines{});
}

}  // namespace
}  // namespace omxtest
