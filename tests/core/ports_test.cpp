// Port definitions: what is asked for, set and printed.
#include <string.h>

#include "core/omx_record.h"
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
    const auto empty = makeOmxRecord<PortDefinition>(static_cast<OMX_U32>(each.port));
    EXPECT_EQ(memcmp(&asked, &empty, sizeof(asked)), 0);
    EXPECT_EQ(asked.nVersion.nVersion, 0x101u);
    EXPECT_EQ(asked.nPortIndex, static_cast<OMX_U32>(each.port));
    ASSERT_EQ(omx().count(), 2u);
    PortDefinition expected = definition(omx().calls()[0]);
    expected.format.video.nFrameWidth = 320;
    expected.format.video.nFrameHeight = 240;
    expected.format.video.xFramerate = each.expectedRate;
    expected.format.video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;
    const PortDefinition sent = definition(omx().calls()[1]);
    EXPECT_EQ(memcmp(&sent, &expected, sizeof(sent)), 0);
  }
  EXPECT_EQ(_session->_portFrameSize[0].width, 320);
  EXPECT_EQ(_session->_portFrameSize[1].height, 240);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(PortsTest, PrintsAPortForDiagnosis) {
  connect();
  PortDefinition shown{};
  shown.nPortIndex = 1;
  shown.nBufferCountActual = 11;
  shown.nBufferCountMin = 12;
  shown.nBufferSize = 13;
  shown.nBufferAlignment = 0xffffffff;  // as the devices' 32-bit long shows it
  shown.bEnabled = OMX_TRUE;
  shown.eDir = OMX_DirOutput;
  shown.eDomain = OMX_PortDomainVideo;
  script().answer(OMX_IndexParamPortDefinition, shown);
  ::testing::internal::CaptureStdout();
  EXPECT_EQ(_session->debugPortParameters(1), OMXI_OK);
  const std::string printed = ::testing::internal::GetCapturedStdout();
  LogLines logged{"E OMX_PARAM_PORTDEFINITION structure:\n"};
  for (const std::string& line :
       LogLines{"nSize member is " + std::to_string(sizeof(shown)), "nPortIndex number is 1",
                "nBufferCountActual member is 11", "nBufferCountMin member is 12", "nBufferSize member is 13",
                "nBufferAlignment member is -1", "bEnabled member is 1", "bPopulated member is 0",
                "bBuffersContiguous member is 0", "nVersion  member is 257", "eDir member is 1",
                "eDomain member is 1"}) {
    logged.push_back("E     " + line + "\n");
  }
  EXPECT_EQ(log(), logged);
  std::string standardOutput;
  for (const std::string& line : logged) standardOutput += line.substr(2);
  EXPECT_EQ(printed, standardOutput);

  _log.clear();
  omx().fail(Method::GetParameter);
  EXPECT_EQ(_session->debugPortParameters(0), OMXI_ERR_GET_PORT_DEFINITION);
  EXPECT_EQ(log(), LogLines{"E Could not get port definition for port index 0\n"});
}

}  // namespace
}  // namespace omxtest
