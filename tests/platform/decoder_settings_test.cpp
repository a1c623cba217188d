// The decoder's settings that only a vendor's components know: picture order, input packing, output layout.
#include <gtest/gtest.h>

#include <memory>

#include "decoder/omx_interface_decoder.h"
#include "tests/encoder/encoder_rig.h"

namespace {

using namespace omxtest;

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

constexpr auto kTiSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);

struct DecoderRig {
  explicit DecoderRig(const char* device) : server(device) {
    server.decoder().editPort(0, [](Definition& definition) { definition.nBufferCountActual = 9; });
    OmxInterfaceDecoder* created = nullptr;
    EXPECT_EQ(OmxInterfaceDecoder::Create(&created, nullptr), 0);
    session.reset(created);
    forget();
  }
  void forget() {
    server.omx().clearCalls();
    log.clear();
  }

  omxhost::LogCapture log;
  ScriptedMediaServer server;
  std::unique_ptr<OmxInterfaceDecoder> session;
};

struct Setting {
  const char* what;
  int (OmxInterfaceDecoder::*set)(int);
  OMX_U32 index;
  struct {
    int value;
    Words record;
  } values[4];
};

const Setting kQcomSettings[] = {
    // Without a version.
    {"picture order",
     &OmxInterfaceDecoder::setPictureOrder,
     0x7F000010,
     {{0, {16, 0, 0, 1}}, {1, {16, 0, 0, 2}}, {2, {16, 0, 0, 0}}, {-1, {16, 0, 0, 0}}}},
    {"input packing",
     &OmxInterfaceDecoder::setInputPackingFormat,
     0x7F000002,
     {{1, {24, kVersion, 0, 0, 0, 3}},
      {2, {24, kVersion, 0, 0, 0, 1}},
      {0, {24, kVersion, 0, 0, 0, 0}},
      {7, {24, kVersion, 0, 0, 0, 0}}}},
};

TEST(QcomDecoderSettings, AreOneVendorRecordEach) {
  DecoderRig rig("msm8960");
  for (const Setting& setting : kQcomSettings) {
    for (const auto& each : setting.values) {
      SCOPED_TRACE(testing::Message() << setting.what << " " << each.value);
      rig.forget();
      EXPECT_EQ((*rig.session.*setting.set)(each.value), 0);
      const std::vector<Call> calls = rig.server.omx().calls();
      ASSERT_EQ(calls.size(), 1U);
      EXPECT_EQ(calls[0].method, Method::SetParameter);
      EXPECT_EQ(static_cast<OMX_U32>(calls[0].index), setting.index);
      EXPECT_EQ(calls[0].size, each.record.size() * sizeof(OMX_U32));
      EXPECT_EQ(words(calls[0].record), each.record);
      EXPECT_EQ(logLines(rig.log), LogLines());
    }
  }
  rig.forget();
  EXPECT_EQ(rig.session->setOutputColorFormat(0), 0);
  EXPECT_EQ(rig.server.omx().count(), 0U);
}

const std::vector<std::string> kTiSteps = {"getParameter 6000001 port 1", "getParameter 6000001 port 1",
                                           "setParameter 6000001 port 1", "getParameter 2000001 port 0",
                                           "setParameter 2000001 port 0", "getParameter 2000001 port 1",
                                           "setParameter 2000001 port 1"};

TEST(TiDecoderSettings, ChooseTheComponentsOwnOutputLayout) {
  DecoderRig rig("omap4");
  EXPECT_EQ(rig.session->setOutputColorFormat(5), 0);
  const std::vector<Call> calls = settingCalls(rig.server.omx());
  ASSERT_EQ(inShort(calls), kTiSteps);
  EXPECT_EQ(calls[2].record, calls[1].record) << "the second format of the list is the one looked for";
  EXPECT_EQ(calls[2].as<OMX_VIDEO_PARAM_PORTFORMATTYPE>()->eColorFormat, kTiSemiPlanar);
  EXPECT_EQ(calls[4].record, edited<Definition>(calls[3], [](Definition& definition) {
              definition.nBufferCountActual = 4;
              definition.format.video.eCompressionFormat = OMX_VIDEO_CodingAVC;
            }));
  EXPECT_EQ(calls[6].record, edited<Definition>(calls[5], [](Definition& definition) {
              definition.format.video.eCompressionFormat = OMX_VIDEO_CodingUnused;
              definition.format.video.eColorFormat = kTiSemiPlanar;
            }));
  EXPECT_EQ(logLines(rig.log), LogLines());

  rig.forget();
  EXPECT_EQ(rig.session->setPictureOrder(1), 0);
  EXPECT_EQ(rig.session->setInputPackingFormat(1), 0);
  EXPECT_EQ(rig.server.omx().count(), 0U);
}

}  // namespace
