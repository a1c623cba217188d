// Creation of a decoder on each device, and what can be set and asked before it starts.
#include <limits.h>
#include <string.h>

#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kVersion = 0x0101;  // 1.1.0.0
constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";
constexpr const char* kTiDecoder = "OMX.TI.DUCATI1.VIDEO.DECODER==";

struct Device {
  const char* name;
  const char* component;
  Trace settings;     // the calls behind listNodes and allocateNode
  size_t written;     // how many of them write
  LogLines log;       // when everything is taken
  LogLines refusals;  // when every setting is refused
};

std::ostream& operator<<(std::ostream& stream, const Device& device) {
  return stream << device.name;
}

const Trace kPictureOrder{"setParameter 0x7f000010 size 16"};
const LogLines kOrderRefused{std::string("E OMXINTERFACE: Set Decode Order Failed: ") + kRefusedText};

class CreationTest : public DecoderSessionTest, public ::testing::WithParamInterface<Device> {
 protected:
  CreationTest() : DecoderSessionTest(GetParam().name) {}
};

TEST_P(CreationTest, MakesTheDevicesSettings) {
  create("a name that nobody looks at");
  Trace expected{"listNodes", std::string("allocateNode ") + GetParam().component};
  expected.insert(expected.end(), GetParam().settings.begin(), GetParam().settings.end());
  EXPECT_EQ(trace(), expected);
  EXPECT_EQ(log(), GetParam().log);
  EXPECT_FALSE(_session->isEncoder());
  EXPECT_STREQ(_session->_componentName, "a name that nobody looks at");
  const std::vector<Call> written = omx().calls(Method::SetParameter);
  ASSERT_EQ(written.size(), GetParam().written);
  if (written[0].index == 0x7F000010) {
    EXPECT_EQ(words(written[0].record), (Words{16, 0, 0, 2}));
  }
  if (written.size() == 2) {
    EXPECT_EQ(words(written[1].record), (Words{24, kVersion, 0, 0, 0, 3}));
  }
}

TEST_P(CreationTest, DoesNotNeedThem) {
  omx().failWhere([](const Call& call) {
    return call.method == Method::SetParameter || call.method == Method::GetParameter;
  });
  create();
  EXPECT_EQ(log(), GetParam().refusals);
  EXPECT_EQ(_session->_componentName, nullptr);
  omx().failWhere(nullptr);
  EXPECT_EQ(init(), OMXI_OK);
}

INSTANTIATE_TEST_SUITE_P(
    Devices, CreationTest,
    ::testing::Values(
        Device{"msm-unknown", kQcomDecoder, kPictureOrder, 1, {}, kOrderRefused},
        Device{"msm8960", kQcomDecoder, kPictureOrder, 1, {}, kOrderRefused},
        Device{"msm7x30", kQcomDecoder, kPictureOrder, 1, {}, kOrderRefused},
        Device{"msm8x55", kQcomDecoder, kPictureOrder, 1, {}, kOrderRefused},
        Device{"msm8x60",
               kQcomDecoder,
               {"setParameter 0x7f000010 size 16", "setParameter 0x7f000002 size 24"},
               2,
               {},
               {kOrderRefused[0], std::string("E OMXINTERFACE - Could not set input frame packing format (") +
                                      kRefusedText + ")"}},
        Device{"omap4",
               kTiDecoder,
               {"getParameter 0x06000001 size 28", "getParameter 0x06000001 size 28",
                "setParameter 0x06000001 size 28", "getParameter definition of port 0",
                "setParameter definition of port 0", "getParameter definition of port 1",
                "setParameter definition of port 1"},
               3,
               {"E g_hwVersion::OMAP4\n"},
               {"E g_hwVersion::OMAP4\n",
                std::string("E get OMX_IndexParamVideoPortFormat OutPort Error:") + kRefusedText}}),
    [](const auto& test) {
      std::string name = test.param.name;
      name.erase(std::remove(name.begin(), name.end(), '-'), name.end());
      return name;
    });

class SettingsTest : public DecoderSessionTest {};

TEST_F(SettingsTest, AFailedCreationLeavesNoSession) {
  const struct {
    const char* what;
    std::function<void()> arrange;
    int code;
  } failures[] = {
      {"no media server", [this] { _server.unregister(); }, OMXI_ERR_IOMX},
      {"no IOMX", [this] { _server.serveWithoutOmx(); }, OMXI_ERR_IOMX},
      {"no component", [this] { omx().fail(Method::ListNodes); }, OMXI_ERR_NODE_NOT_FOUND},
      {"no node", [this] { omx().fail(Method::AllocateNode); }, OMXI_ERR_ALLOCATE_COMPONENT},
  };
  for (const auto& failure : failures) {
    SCOPED_TRACE(failure.what);
    failure.arrange();
    int other = 0;
    auto* session = reinterpret_cast<OmxInterfaceDecoder*>(&other);
    EXPECT_EQ(OmxInterfaceDecoder::Create(&session, nullptr), failure.code);
    EXPECT_EQ(session, nullptr);
    EXPECT_EQ(_server.leaks(), "");
    _server.unregister();
    _server.serve();
  }
}

TEST_F(SettingsTest, ACreationWithoutMemoryLeavesNoSession) {
  using Form = faults::FailedAllocation::Form;
  const struct {
    size_t size;
    Form form;
    int code;
  } failures[] = {{sizeof(OmxInterfaceDecoder), Form::ReturnsNull, OMXI_ERR_CREATE_INTERFACE},
                  {sizeof(SessionState), Form::Throws, OMXI_ERR_CREATE_INTERFACE},
                  {sizeof(OmxCodecObserver), Form::Throws, OMXI_ERR_CREATE_OBSERVER}};
  for (const auto& failure : failures) {
    int other = 0;
    auto* session = reinterpret_cast<OmxInterfaceDecoder*>(&other);
    const faults::FailedAllocation failed(failure.size, failure.form);
    EXPECT_EQ(OmxInterfaceDecoder::Create(&session, nullptr), failure.code);
    EXPECT_EQ(session, nullptr);
    EXPECT_TRUE(failed.happened());
  }
}

TEST_F(SettingsTest, ASessionWithoutAWrapperHasNoVendorSettings) {
  OmxInterfaceDecoder unconnected;
  EXPECT_EQ(unconnected.setPictureOrder(1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(unconnected.setInputPackingFormat(1), OMXI_ERR_NO_PLATFORM_WRAPPER);
  EXPECT_EQ(unconnected.setOutputColorFormat(0), OMXI_ERR_NO_PLATFORM_WRAPPER);
}

TEST_F(SettingsTest, TheCompressionFormatIsWrittenIntoTheComponentsDefinition) {
  constexpr auto kOwn = OMX_VIDEO_CodingMJPEG;  // none that a caller can ask for
  script().setFormats(0, {{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused},
                          {OMX_VIDEO_CodingMPEG4, OMX_COLOR_FormatUnused},
                          {OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused},
                          {OMX_VIDEO_CodingWMV, OMX_COLOR_FormatUnused},
                          {kOwn, OMX_COLOR_FormatUnused}});
  script().editPort(0, [](mediaserver::PortDefinition& port) {
    port.format.video.eCompressionFormat = kOwn;
    port.format.video.nFrameWidth = 352;
  });
  create();
  // Those that leave the component's own come first.
  const struct {
    int format;
    OMX_VIDEO_CODINGTYPE coding;
  } formats[] = {{4, kOwn},
                 {-1, kOwn},
                 {INT_MAX, kOwn},
                 {INT_MIN, kOwn},
                 {0, OMX_VIDEO_CodingAVC},
                 {1, OMX_VIDEO_CodingMPEG4},
                 {2, OMX_VIDEO_CodingH263},
                 {3, OMX_VIDEO_CodingWMV}};
  for (const auto& each : formats) {
    SCOPED_TRACE(each.format);
    omx().clearCalls();
    EXPECT_EQ(decoder().setInputCompressionFormat(each.format), 0);
    const std::vector<Call> calls = omx().calls();
    ASSERT_EQ(calls.size(), 2u);
    EXPECT_EQ(calls[0].method, Method::GetParameter);
    EXPECT_EQ(calls[1].method, Method::SetParameter);
    for (const Call& call : calls) {
      EXPECT_EQ(call.index, OMX_IndexParamPortDefinition);
      EXPECT_EQ(call.size, sizeof(OMX_PARAM_PORTDEFINITIONTYPE));
      EXPECT_EQ(words(call.record)[0], 0u) << "the size word";
      EXPECT_EQ(words(call.record)[1], kVersion);
      EXPECT_EQ(words(call.record)[2], 0u) << "the port";
    }
    auto expected = *calls[0].as<OMX_PARAM_PORTDEFINITIONTYPE>();
    EXPECT_EQ(expected.format.video.nFrameWidth, 352u);
    expected.format.video.eCompressionFormat = each.coding;
    const auto written = *calls[1].as<OMX_PARAM_PORTDEFINITIONTYPE>();
    EXPECT_EQ(memcmp(&written, &expected, sizeof(written)), 0);
  }
}

TEST_F(SettingsTest, TheCompressionFormatCanBeRefused) {
  create();
  EXPECT_EQ(decoder().setInputCompressionFormat(1), 0);
  EXPECT_EQ(log(), LogLines{});
  omx().fail(Method::GetParameter);
  omx().clearCalls();
  EXPECT_EQ(decoder().setInputCompressionFormat(0), -1);
  EXPECT_EQ(omx().count(), 1u);
  omx().fail(Method::SetParameter);
  EXPECT_EQ(decoder().setInputCompressionFormat(0), -1);
  EXPECT_EQ(log(), (LogLines{std::string("E OMXINTERFACE - Could not get parameters for Video Compression "
                                         "Format (") +
                                 kRefusedText + ")",
                             "E OMXINTERFACE - Could not set Video Compression Format"}));
}

TEST_F(SettingsTest, TheBufferCountIsTheInputPortsPresentOne) {
  script().editPort(0, [](mediaserver::PortDefinition& port) { port.nBufferCountActual = 7; });
  create();
  omx().clearCalls();
  EXPECT_EQ(decoder().getBufferNum(), 7);
  EXPECT_EQ(trace(), Trace{"getParameter definition of port 0"});
  omx().fail(Method::GetParameter);
  EXPECT_EQ(decoder().getBufferNum(), -1);
  EXPECT_EQ(log(), LogLines{std::string("E get OMX_IndexParamPortDefinition InPort Error:") + kRefusedText});
}

TEST_F(SettingsTest, TheClipTableClampsToAByteAndOutlivesItsSession) {
  create();
  EXPECT_EQ(decoder()._clipTable, nullptr);
  const unsigned char* clip = decoder().initClip();
  EXPECT_EQ(decoder()._clipTable, clip);
  EXPECT_EQ(decoder().initClip(), clip);
  destroy();
  create();
  EXPECT_EQ(decoder().initClip(), clip);
  destroy();
  for (int value = -278; value <= 535; ++value) EXPECT_EQ(clip[value], std::clamp(value, 0, 255));
}

}  // namespace
}  // namespace omxtest
