// Port definitions: what is asked for, set and printed.
#include <string.h>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using mediaserver::PortDefinition;

using PortsTest = SessionTest;

PortDefinition definition(const Call& call) {
  return call.as<PortDefinition>().value_or(PortDefinition());
}

TEST_F(PortsTest, SetsAPortsGeometryAndLeavesTheRest) {
  connect();
  PortDefinition asked{};
  omx().before(Method::GetParameter, [&](const Call& call) { asked = definition(call); });
  const struct {
    int port;
    int frameRate;
    OMX_U32 expectedRate;
  } cases[] = {{0, 30, 1966080}, {0, 0, 1966080}, {0, -1, 1966080}, {1, 15, 15u << 16}};
  for (const auto& each : cases) {
    omx().clearCalls();
    EXPECT_EQ(_session->setupPortParameters(each.port, 320, 240, each.frameRate), OMXI_OK);
    const auto port = static_cast<OMX_U32>(each.port);
    PortDefinition empty{};
    empty.nSize = sizeof(empty);
    empty.nVersion.s.nVersionMajor = 1;
    empty.nVersion.s.nVersionMinor = 1;
    empty.nPortIndex = port;
    EXPECT_EQ(memcmp(&asked, &empty, sizeof(asked)), 0);

    ASSERT_EQ(omx().count(), 2u);
    PortDefinition expected = definition(omx().calls(Method::GetParameter)[0]);
    expected.format.video.nFrameWidth = 320;
    expected.format.video.nFrameHeight = 240;
    expected.format.video.xFramerate = each.expectedRate;
    expected.format.video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;
    const PortDefinition sent = definition(omx().calls(Method::SetParameter)[0]);
    EXPECT_EQ(memcmp(&sent, &expected, sizeof(sent)), 0);
    EXPECT_EQ(_session->_portFrameSize[each.port].width, 320);
    EXPECT_EQ(_session->_portFrameSize[each.port].height, 240);
  }
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(PortsTest, ReportsGeometryThatTheComponentRefuses) {
  connect();
  omx().fail(Method::GetParameter);
  EXPECT_EQ(_session->setupPortParameters(0, 640, 480, 24), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(log(), LogLines{});
  EXPECT_EQ(_session->_portFrameSize[0].width, 640);  // noted all the same
  EXPECT_EQ(_session->_portFrameSize[0].height, 480);
  EXPECT_EQ(omx().count(Method::SetParameter), 0u);
  omx().fail(Method::SetParameter, 1, -1010);
  EXPECT_EQ(_session->setupPortParameters(0, 320, 240, 24), OMXI_ERR_SET_PORT_DEFINITION);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -1010\n"});
}

TEST_F(PortsTest, PrintsAPortForDiagnosis) {
  connect();
  PortDefinition shown{};
  shown.nPortIndex = 1;
  shown.nBufferCountActual = 11;
  shown.nBufferCountMin = 12;
  shown.nBufferSize = 13;
  shown.nBufferAlignment = 14;
  shown.bEnabled = OMX_TRUE;
  shown.bPopulated = OMX_FALSE;
  shown.bBuffersContiguous = OMX_TRUE;
  shown.eDir = OMX_DirOutput;
  shown.eDomain = OMX_PortDomainVideo;
  script().answer(OMX_IndexParamPortDefinition, shown);
  ::testing::internal::CaptureStdout();
  _session->debugPortParameters(1);
  const std::string printed = ::testing::internal::GetCapturedStdout();
  const std::string lines[] = {
      "OMX_PARAM_PORTDEFINITION structure:\n",
      "    nSize member is " + std::to_string(sizeof(PortDefinition)) + "\n",
      "    nPortIndex number is 1\n",
      "    nBufferCountActual member is 11\n",
      "    nBufferCountMin member is 12\n",
      "    nBufferSize member is 13\n",
      "    nBufferAlignment member is 14\n",
      "    bEnabled member is 1\n",
      "    bPopulated member is 0\n",
      "    bBuffersContiguous member is 1\n",
      "    nVersion  member is 257\n",
      "    eDir member is 1\n",
      "    eDomain member is 1\n",
  };
  LogLines logged;
  std::string standardOutput;
  for (const std::string& line : lines) {
    logged.push_back("E " + line);
    standardOutput += line;
  }
  EXPECT_EQ(log(), logged);
  EXPECT_EQ(printed, standardOutput);

  _log.clear();
  omx().fail(Method::GetParameter);
  ::testing::internal::CaptureStdout();
  _session->debugPortParameters(0);
  EXPECT_EQ(::testing::internal::GetCapturedStdout(), "");
  EXPECT_EQ(log(), LogLines{"E Could not get port definition for port index 0\n"});
}

}  // namespace
}  // namespace omxtest
