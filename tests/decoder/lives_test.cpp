// Decoders on every hardware generation: their whole life call by call, and what they can do without.
#include "platform/hardware_version.h"
#include "tests/decoder/decoder_session.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

const Trace kPictureOrder{"setParameter 0x7f000010 size 16"};
const Trace kTiSettings{"getParameter 0x06000001 size 28",   "getParameter 0x06000001 size 28",
                        "setParameter 0x06000001 size 28",   "getParameter definition of port 0",
                        "setParameter definition of port 0", "getParameter definition of port 1",
                        "setParameter definition of port 1"};
const LogLines kOrderRefused{std::string("E OMXINTERFACE: Set Decode Order Failed: ") + kRefusedText};
constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";
constexpr const char* kTiDecoder = "OMX.TI.DUCATI1.VIDEO.DECODER==";
constexpr const char* kTiLine = "E g_hwVersion::OMAP4\n";

struct Life {
  const char* device;
  int version;
  int dataType;
  Trace settings;     // made at creation
  LogLines refusals;  // when all of these are refused
};

void PrintTo(const Life& life, std::ostream* stream) {
  *stream << life.device;
}

class LifeTest : public DecoderSessionTest, public ::testing::WithParamInterface<Life> {
 protected:
  static constexpr size_t kPictures = 3;

  LifeTest() : DecoderSessionTest(GetParam().device) {
    // A tiled picture fits.
    script().editPort(1, [](mediaserver::PortDefinition& port) { port.nBufferSize = 65536; });
  }

  static bool isTi() { return GetParam().version == HW_VERSION_OMAP4; }

  // One access unit in, its picture out, and everything back where it was.
  void decodeOne(int timestamp) {
    const size_t fills = omx().count(Method::FillBuffer);
    ASSERT_EQ(feed("access unit", timestamp), 0);
    waitForFills(fills + 1);
    waitForBusy(0, 0);
  }

  static Trace wholeLife() {
    const std::string definition = " definition of port ";
    Trace calls{"listNodes", std::string("allocateNode ") + (isTi() ? kTiDecoder : kQcomDecoder)};
    const auto append = [&calls](const Trace& more) { calls.insert(calls.end(), more.begin(), more.end()); };
    append(GetParam().settings);
    append({"getParameter definition of port 0 size word 0", "setParameter definition of port 0 size word 0",
            "getParameter" + definition + "0", "setParameter" + definition + "0", "sendCommand state 2",
            "getParameter" + definition + "0"});
    for (size_t i = 0; i < kInputBuffers; ++i) {
      calls.push_back((isTi() ? "allocateBufferWithBackup in" : "useBuffer in") + std::to_string(i) +
                      " of 65536");
    }
    calls.push_back("getParameter" + definition + "1");
    for (size_t i = 0; i < kOutputBuffers; ++i) {
      calls.push_back("allocateBufferWithBackup out" + std::to_string(i) + " of 65536");
    }
    calls.emplace_back("sendCommand state 3");
    for (size_t i = 0; i < kOutputBuffers; ++i) calls.push_back("fillBuffer out" + std::to_string(i));
    for (size_t i = 0; i < kPictures; ++i) {
      append({"emptyBuffer in0 0+11 flags 0x0 time " + std::to_string(100 + i),
              "getParameter" + definition + "1"});
      if (isTi()) calls.emplace_back("getConfig");
      calls.push_back("fillBuffer out" + std::to_string(i));
    }
    append({"emptyBuffer in0 0+0 flags 0x1 time 200", "sendCommand state 2", "sendCommand state 1"});
    for (size_t i = kOutputBuffers; i-- > 0;) calls.push_back("freeBuffer 1 out" + std::to_string(i));
    for (size_t i = kInputBuffers; i-- > 0;) calls.push_back("freeBuffer 0 in" + std::to_string(i));
    calls.emplace_back("freeNode");
    return calls;
  }
};

TEST_P(LifeTest, TakesTheseCalls) {
  ASSERT_EQ(getHardwareBaseVersion(), GetParam().version);
  create("a name that nobody looks at");
  EXPECT_STREQ(_session->_componentName, "a name that nobody looks at");
  EXPECT_FALSE(_session->isEncoder());
  EXPECT_EQ(log(), isTi() ? LogLines{kTiLine} : LogLines{});
  _log.clear();
  if (!isTi()) {
    EXPECT_EQ(words(omx().calls(Method::SetParameter)[0].record), (Words{16, 0, 0, 2}));
  }
  EXPECT_EQ(decoder().setInputCompressionFormat(0), 0);
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_OK);
  EXPECT_EQ(init(), OMXI_OK);
  const android::Vector<BufferInfo> outputs = _session->_portBuffers[1];
  for (size_t i = 0; i < kPictures; ++i) decodeOne(static_cast<int>(100 + i));
  finishStream(200);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(decoder().setPictureOrder(1), OMXI_ERR_NO_PLATFORM_WRAPPER);  // it has gone
  destroy();

  EXPECT_EQ(trace(), wholeLife());
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  ASSERT_EQ(pictures().size(), kPictures);
  for (size_t i = 0; i < kPictures; ++i) {
    const auto [output, info] = pictures()[i];
    const bool converted = info.dataType == DECODED_DATA_RGB565;
    EXPECT_EQ(info.dataType, GetParam().dataType);
    EXPECT_EQ(info.width, 176u);
    EXPECT_EQ(info.height, 144u);
    EXPECT_EQ(output.timestamp, 100 + i);
    EXPECT_EQ(output.bufferId, outputs[i].bufferId);
    EXPECT_EQ(output.data == outputs[i].data, !converted);
    EXPECT_EQ(output.length, converted ? 50688u : 11u);
    EXPECT_TRUE(converted || output.bytes == "access unit");
  }
  EXPECT_EQ(_application.inputCallbacks().size(), kPictures + 1);
  EXPECT_EQ(sortedLog(), sorted({kEndEvent, kDecoderOver}));
}

TEST_P(LifeTest, DoesNotNeedItsSettings) {
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
    EveryVersion, LifeTest,
    ::testing::Values(
        Life{"msm-unknown", HW_VERSION_UNKNOWN, DECODED_DATA_NATIVE, kPictureOrder, kOrderRefused},
        Life{"msm8960", HW_VERSION_QCOM_OTHER, DECODED_DATA_NATIVE, kPictureOrder, kOrderRefused},
        Life{"msm7x30", HW_VERSION_MSM7X30, DECODED_DATA_NATIVE, kPictureOrder, kOrderRefused},
        Life{"msm8x55", HW_VERSION_MSM8X55, DECODED_DATA_NATIVE, kPictureOrder, kOrderRefused},
        Life{"msm8x60",
             HW_VERSION_MSM8X60,
             DECODED_DATA_RGB565,
             {kPictureOrder[0], "setParameter 0x7f000002 size 24"},
             {kOrderRefused[0], std::string("E OMXINTERFACE - Could not set input frame packing format (") +
                                    kRefusedText + ")"}},
        Life{"omap4",
             HW_VERSION_OMAP4,
             DECODED_DATA_CROPPED,
             kTiSettings,
             {kTiLine, std::string("E get OMX_IndexParamVideoPortFormat OutPort Error:") + kRefusedText}}));

}  // namespace
}  // namespace omxtest
