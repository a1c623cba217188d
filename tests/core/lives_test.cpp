// The whole life of a session call by call: encoders and decoders of each vendor, and decoders whose
// component's output is native, tiled, or padded.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

struct Life {
  const char* device;
  const char* component;
  const char* inputs;  // how they are made
  const char* outputs;
  size_t outputCount;
  Trace settings;  // calls at creation; a record alone is read and written
  Trace delivery;  // calls for each picture
  int dataType;    // of a decoder; -1: an encoder

  bool encoding() const { return dataType < 0; }
};

void PrintTo(const Life& life, std::ostream* stream) {
  *stream << life.device << (life.encoding() ? " encoder" : " decoder");
}

class LifeTest : public SessionTest, public ::testing::WithParamInterface<Life> {
 protected:
  static constexpr int kPictures = 2;

  LifeTest() : SessionTest(GetParam().device) {}

  void create() {
    if (GetParam().encoding()) {
      ASSERT_EQ(createEncoder(), OMXI_OK);
      return;
    }
    // A tiled picture fits.
    _server.decoder().editPort(1, [](mediaserver::PortDefinition& port) { port.nBufferSize = 65536; });
    ASSERT_EQ(createDecoder(), OMXI_OK);
    EXPECT_EQ(decoder().setInputCompressionFormat(0), 0);
    EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_OK);
  }

  static Trace wholeLife() {
    const Life& life = GetParam();
    const std::string sizes[] = {life.encoding() ? " of 38016" : " of 65536", " of 65536"};
    Trace calls{"listNodes", std::string("allocateNode ") + life.component};
    const auto append = [&calls](const Trace& more) { calls.insert(calls.end(), more.begin(), more.end()); };
    const auto each = [&calls](size_t count, const std::string& before, const std::string& after = "") {
      for (size_t i = 0; i < count; ++i) calls.push_back(before + std::to_string(i) + after);
    };
    for (const std::string& line : life.settings) {
      const bool exchange = isdigit(line[0]) != 0;
      if (exchange) calls.push_back("getParameter " + line);
      calls.push_back(exchange ? "setParameter " + line : line);
    }
    if (!life.encoding()) {
      append({"getParameter 2000001 port 0 size word 0", "setParameter 2000001 port 0 size word 0",
              "getParameter 2000001 port 0", "setParameter 2000001 port 0"});
    }
    append({"sendCommand state 2", "getParameter 2000001 port 0"});
    each(kInputs, std::string(life.inputs) + " in", sizes[0]);
    append({"getParameter 2000001 port 1"});
    each(life.outputCount, std::string(life.outputs) + " out", sizes[1]);
    append({"sendCommand state 3"});
    each(life.outputCount, "fillBuffer out");
    for (int i = 0; i < kPictures; ++i) {
      append({"emptyBuffer in0 0+11 flags 0x0 time " + std::to_string(100 + i)});
      append(life.delivery);
      append({"fillBuffer out" + std::to_string(i)});
    }
    append({"emptyBuffer in0 0+0 flags 0x1 time 200", "sendCommand state 2", "sendCommand state 1"});
    for (size_t i = life.outputCount; i-- > 0;) append({"freeBuffer 1 out" + std::to_string(i)});
    for (size_t i = kInputs; i-- > 0;) append({"freeBuffer 0 in" + std::to_string(i)});
    append({"freeNode"});
    return calls;
  }
};

TEST_P(LifeTest, TakesTheseCalls) {
  const bool isTi = GetParam().device == std::string("omap4");
  ASSERT_NO_FATAL_FAILURE(create());
  EXPECT_EQ(log(), isTi && !GetParam().encoding() ? LogLines{"E g_hwVersion::OMAP4\n"} : LogLines());
  _log.clear();
  EXPECT_EQ(init(), OMXI_OK);
  const android::Vector<BufferInfo> outputs = _session->_portBuffers[1];
  for (int i = 0; i < kPictures; ++i) {
    const size_t fills = omx().count(Method::FillBuffer);
    ASSERT_EQ(feed("access unit", 100 + i), 0);
    waitForFills(fills + 1);
    waitForBusy(0, 0);
    const Output output = _application.outputs().back();
    EXPECT_EQ(output.timestamp, static_cast<unsigned>(100 + i));
    EXPECT_EQ(output.bufferId, outputs[static_cast<size_t>(i)].bufferId);
    EXPECT_EQ(output.bytes == "access unit", GetParam().dataType != DECODED_DATA_RGB565);
    EXPECT_EQ(output.length, GetParam().dataType == DECODED_DATA_RGB565 ? 50688u : 11u);
    EXPECT_TRUE(GetParam().encoding() || output.info.dataType == GetParam().dataType);
  }
  endOfStream(200);
  if (!GetParam().encoding()) {
    EXPECT_TRUE(_log.waitFor("Unknown Event (4, 1, 1)"));  // the end mark's
  }
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(_session->_platformWrapper, nullptr);
  EXPECT_EQ(deInit(), OMXI_OK);  // does nothing
  destroy();
  EXPECT_EQ(trace(), wholeLife());
  EXPECT_EQ(log().size(), GetParam().encoding() ? 1u : 2u);  // with the output thread's end
}

const std::string kInput = "2000001 port 0";
const std::string kOutput = "2000001 port 1";
const Trace kSize{"getParameter 2000001 port 1"};
constexpr const char* kBackup = "allocateBufferWithBackup";
constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";

const Trace kOrder{"setParameter 7f000010 port 0 version 0"};
const Trace kPacking{kOrder[0], "setParameter 7f000002 port 0"};
const Trace kTiOutput{"getParameter 6000001 port 1", "6000001 port 1", kInput, kOutput};
const Trace kCrop{kSize[0], "getConfig 700000f port 1"};
// Geometry, H.264, the port's bit rate, rate control.
const Trace kQcomEncoder{kInput, kOutput, "600000d port 1", kOutput, "6000004 port 1"};
// Formats, ports, H.264, profile and level, rate control.
const Trace kTiEncoder{
    "6000001 port 0", "6000001 port 1", kInput,           kOutput,
    "600000d port 1", "6000010 port 1", "6000004 port 1", "storeMetaDataInBuffers 0 port 0"};

INSTANTIATE_TEST_SUITE_P(
    Vendors, LifeTest,
    ::testing::Values(
        Life{"msm8960", kQcomDecoder, "useBuffer", kBackup, 8, kOrder, kSize, DECODED_DATA_NATIVE},
        Life{"msm8x60", kQcomDecoder, "useBuffer", kBackup, 8, kPacking, kSize, DECODED_DATA_RGB565},
        Life{"omap4", "OMX.TI.DUCATI1.VIDEO.DECODER==", kBackup, kBackup, 8, kTiOutput, kCrop,
             DECODED_DATA_CROPPED},
        Life{"msm8960", "OMX.qcom.video.encoder.avc", "useBuffer", "useBuffer", 6, kQcomEncoder, {}, -1},
        Life{"omap4", "OMX.TI.DUCATI1.VIDEO.H264E", kBackup, kBackup, 4, kTiEncoder, {}, -1}));

}  // namespace
}  // namespace omxtest
