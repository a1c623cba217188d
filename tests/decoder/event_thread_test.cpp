// What the event thread does about each event, what it does when that fails, and how it ends.
#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

using EventThreadTest = DecoderSessionTest;

TEST_F(EventThreadTest, SaysWhichEventsItDoesNotHandle) {
  startDecoder();
  const size_t before = omx().count();
  handleEvent(OMX_EventResourcesAcquired, 0x80000000, 0xFFFFFFFF);
  handleEvent(OMX_EventPortSettingsChanged, 0, 0);
  handleEvent(OMX_EventPortSettingsChanged, 2, 0);
  handleEvent(OMX_EventCmdComplete, OMX_CommandFlush, 1);
  const faults::Fault failed(faults::Failing::Memory, sizeof(android::omx_message));
  handleEvent(OMX_EventBufferFlag, 1, 1);
  handleEvent(OMX_EventBufferFlag, 2, 2);
  const std::string inputPort = "E ERROR: PORT SETTING CHANGED - being called on INPUT PORT \n";
  EXPECT_EQ(log(),
            (LogLines{"E Unknown Event (5, -2147483648, -1)", inputPort, inputPort,
                      "E OmxInterfaceDecoder::onOmxObserverEvent(const omx_message &message),Malloc null",
                      "E Unknown Event (4, 2, 2)"}));
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
  EXPECT_FALSE(_session->_portReconfiguring);
}

TEST_F(EventThreadTest, PortCompletionsInAWrongStateAreFailures) {
  for (const OMX_COMMANDTYPE command : {OMX_CommandPortDisable, OMX_CommandPortEnable}) {
    create();
    messages().hold(commandComplete(OMX_CommandStateSet, OMX_StateExecuting));
    Later starting = beginInit();
    require(messages().waitForHeld(1), "the completion of Executing");
    waitForSleeper(&SessionState::stateWaiters);
    _log.clear();
    handleEvent(OMX_EventPortSettingsChanged, 1, 0);  // ignored before it executes
    EXPECT_EQ(commands().back(), "sendCommand state 3");
    EXPECT_EQ(log(), LogLines{});
    handleEvent(OMX_EventCmdComplete, command, 1);
    EXPECT_EQ(log(), LogLines{"E Incorrect State Reached: 2\n"});
    messages().passAll();
    EXPECT_EQ(starting.result(), OMXI_OK);
    EXPECT_EQ(deInit(), OMXI_ERR_INCORRECT_STATE);
    destroy();
  }
}

TEST_F(EventThreadTest, StartsAgainWithTheThreadsOfAFailedStart) {
  create();
  omx().fail(Method::SendCommand);
  EXPECT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);
  const pthread_t thread = decoder()._eventThread;
  EXPECT_EQ(init(), OMXI_OK);
  EXPECT_TRUE(pthread_equal(thread, decoder()._eventThread));
  feedThrough("delivered");
}

}  // namespace
}  // namespace omxtest
