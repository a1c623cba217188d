// The life of a session call by call, from its start on: encoders and decoders of each vendor, and decoders
// whose component's output is native, tiled, or padded.
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

struct Life {
  const char* device;
  const char* inputs;  // how they are made
  const char* outputs;
  size_t outputCount;
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

  static Trace expectedCalls() {
    const Life& life = GetParam();
    const std::string sizes[] = {life.encoding() ? " of 38016" : " of 65536", " of 65536"};
    Trace calls;
    const auto append = [&calls](const Trace& more) { calls.insert(calls.end(), more.begin(), more.end()); };
    const auto each = [&calls](size_t count, const std::string& before, const std::string& after = "") {
      for (size_t i = 0; i < count; ++i) calls.push_back(before + std::to_string(i) + after);
    };
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
  // A tiled picture fits.
  _server.decoder().editPort(1, [](mediaserver::PortDefinition& port) { port.nBufferSize = 65536; });
  ASSERT_EQ(GetParam().encoding() ? createEncoder() : createDecoder(), OMXI_OK);
  EXPECT_EQ(log(), isTi && !GetParam().encoding() ? LogLines{"E g_hwVersion::OMAP4\n"} : LogLines());
  _log.clear();
  const size_t created = omx().count();
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
  EXPECT_EQ(trace(created), expectedCalls());
  EXPECT_EQ(log().size(), GetParam().encoding() ? 1u : 2u);  // with the output thread's end
}

const Trace kSize{"getParameter 2000001 port 1"};
const Trace kCrop{kSize[0], "getConfig 700000f port 1"};
constexpr const char* kBackup = "allocateBufferWithBackup";

INSTANTIATE_TEST_SUITE_P(
    Vendors, LifeTest,
    ::testing::Values(Life{"msm8960", "useBuffer", kBackup, 8, kSize, DECODED_DATA_NATIVE},
                      Life{"msm8x60", "useBuffer", kBackup, 8, kSize, DECODED_DATA_RGB565},
                      Life{"omap4", kBackup, kBackup, 8, kCrop, DECODED_DATA_CROPPED},
                      Life{"msm8960", "useBuffer", "useBuffer", 6, {}, -1},
                      Life{"omap4", kBackup, kBackup, 4, {}, -1}));

}  // namespace
}  // namespace omxtest
