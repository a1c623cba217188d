// Whole lives of decoders, call by call, on every hardware generation; and a life that ends too early.
#include "platform/hardware_version.h"
#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

struct Life {
  const char* device;
  int version;
  const char* component;
  Trace settings;           // made at creation
  const char* inputBuffer;  // how buffers are made
  Trace delivery;           // what a picture takes
};

std::ostream& operator<<(std::ostream& stream, const Life& life) {
  return stream << life.device;
}

constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";
const std::string kDefinition = " definition of port ";
const Trace kPictureOrder{"setParameter 0x7f000010 size 16"};
const Trace kQuery{"getParameter" + kDefinition + "1"};

class LifeTest : public DecoderSessionTest, public ::testing::WithParamInterface<Life> {
 protected:
  static constexpr size_t kPictures = 3;
  static constexpr OMX_U32 kOutputBytes = 65536;  // a tiled picture fits

  LifeTest() : DecoderSessionTest(GetParam().device) {
    script().editPort(1, [](mediaserver::PortDefinition& port) { port.nBufferSize = kOutputBytes; });
  }

  // One access unit in, its picture out, and everything back where it was.
  void decodeOne(int timestamp) {
    const size_t fills = omx().count(Method::FillBuffer);
    ASSERT_EQ(feed("access unit", timestamp), 0);
    waitForFills(fills + 1);
    requireEventually([this] { return busyCount(kOmxInputPort) == 0; }, "the input buffer's return");
  }

  static void append(Trace* calls, const Trace& more) {
    calls->insert(calls->end(), more.begin(), more.end());
  }

  Trace wholeLife() const {
    const Life& life = GetParam();
    Trace calls{"listNodes", std::string("allocateNode ") + life.component};
    append(&calls, life.settings);
    append(&calls,
           {"getParameter definition of port 0 size word 0", "setParameter definition of port 0 size word 0",
            "getParameter" + kDefinition + "0", "setParameter" + kDefinition + "0"});
    append(&calls, {"sendCommand state 2", "getParameter" + kDefinition + "0"});
    for (size_t i = 0; i < kInputBuffers; ++i) {
      calls.push_back(std::string(life.inputBuffer) + " in" + std::to_string(i) + " of 65536");
    }
    calls.push_back("getParameter" + kDefinition + "1");
    for (size_t i = 0; i < kOutputBuffers; ++i) {
      calls.push_back("allocateBufferWithBackup out" + std::to_string(i) + " of 65536");
    }
    calls.emplace_back("sendCommand state 3");
    for (size_t i = 0; i < kOutputBuffers; ++i) calls.push_back("fillBuffer out" + std::to_string(i));
    for (size_t i = 0; i < kPictures; ++i) {
      calls.push_back("emptyBuffer in0 0+11 flags 0x0 time " + std::to_string(100 + i));
      append(&calls, life.delivery);
      calls.push_back("fillBuffer out" + std::to_string(i));
    }
    append(&calls, {"emptyBuffer in0 0+0 flags 0x1 time 200", "sendCommand state 2", "sendCommand state 1"});
    for (size_t i = kOutputBuffers; i-- > 0;) calls.push_back("freeBuffer 1 out" + std::to_string(i));
    for (size_t i = kInputBuffers; i-- > 0;) calls.push_back("freeBuffer 0 in" + std::to_string(i));
    calls.emplace_back("freeNode");
    return calls;
  }
};

TEST_P(LifeTest, TakesTheseCalls) {
  ASSERT_EQ(getHardwareBaseVersion(), GetParam().version);
  create();
  _log.clear();
  EXPECT_EQ(decoder().setInputCompressionFormat(0), 0);
  EXPECT_EQ(_session->setupPortParameters(0, 176, 144, 24), OMXI_OK);
  EXPECT_EQ(init(), OMXI_OK);
  for (size_t i = 0; i < kPictures; ++i) decodeOne(static_cast<int>(100 + i));
  finishStream(200);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(decoder().setPictureOrder(1), OMXI_ERR_NO_PLATFORM_WRAPPER);  // it has gone
  destroy();

  EXPECT_EQ(trace(), wholeLife());
  EXPECT_EQ(_server.leaks(), "");
  EXPECT_EQ(omx().buffersFreedWithNode(), 0u);
  const std::vector<Picture> delivered = pictures();
  ASSERT_EQ(delivered.size(), kPictures);
  for (size_t i = 0; i < kPictures; ++i) EXPECT_EQ(delivered[i].output.timestamp, 100 + i);
  EXPECT_EQ(_application.inputCallbacks(), kPictures + 1);
  EXPECT_EQ(sortedLog(), sorted({kEndEvent, kDecoderOver}));
}

INSTANTIATE_TEST_SUITE_P(
    EveryVersion, LifeTest,
    ::testing::Values(
        Life{"msm-unknown", HW_VERSION_UNKNOWN, kQcomDecoder, kPictureOrder, "useBuffer", kQuery},
        Life{"msm8960", HW_VERSION_QCOM_OTHER, kQcomDecoder, kPictureOrder, "useBuffer", kQuery},
        Life{"msm7x30", HW_VERSION_MSM7X30, kQcomDecoder, kPictureOrder, "useBuffer", kQuery},
        Life{"msm8x55", HW_VERSION_MSM8X55, kQcomDecoder, kPictureOrder, "useBuffer", kQuery},
        Life{"msm8x60",
             HW_VERSION_MSM8X60,
             kQcomDecoder,
             {"setParameter 0x7f000010 size 16", "setParameter 0x7f000002 size 24"},
             "useBuffer",
             kQuery},
        Life{"omap4",
             HW_VERSION_OMAP4,
             "OMX.TI.DUCATI1.VIDEO.DECODER==",
             {"getParameter 0x06000001 size 28", "getParameter 0x06000001 size 28",
              "setParameter 0x06000001 size 28", "getParameter definition of port 0",
              "setParameter definition of port 0", "getParameter definition of port 1",
              "setParameter definition of port 1"},
             "allocateBufferWithBackup",
             {kQuery[0], "getConfig"}}),
    [](const auto& test) { return "Version" + std::to_string(test.param.version); });

// --- Ends ---

// A decoder whose start can be stopped before it makes its threads.
class LateStarter : public OmxInterfaceDecoder {
 public:
  ~LateStarter() override { endSession(); }
  int init() override {
    count(1);
    if (stops) gate.pass();
    const int result = OmxInterface::init();
    count(-1);
    return result;
  }

  bool stops = false;
  Gate gate;

 private:
  // A call in progress, which destruction waits for.
  void count(int change) {
    const SessionState::Lock held(_state->lock);
    _state->calls += change;
    _state->left.notify_all();
  }
};

class EarlyEndTest : public DecoderSessionTest {};

TEST_F(EarlyEndTest, AThreadThatStartsAfterTheEndHasBegunEndsToo) {
  auto owned = std::make_unique<LateStarter>();
  LateStarter& session = *owned;
  _session = std::move(owned);
  ASSERT_EQ(session.setupIOMXConnections(), OMXI_OK);
  omx().fail(Method::SendCommand);
  ASSERT_EQ(init(), OMXI_ERR_SEND_COMMAND_STATE);  // leaves an output thread
  session.stops = true;
  Later<int> starting = beginInit();
  session.gate.waitForArrival();
  SessionState& state = *session._state;
  Later<bool> destroyed = beginDestroyOfBusySession();
  // What wakes the threads has been used up by the first one. A second one that slept would be waited for.
  requireEventually(
      [&] {
        const SessionState::Lock held(state.lock);
        return !state.outputThread.running;
      },
      "the output thread's end");
  session.gate.open();
  EXPECT_EQ(starting.result(), OMXI_ERR_SEND_COMMAND_STATE);
  destroyed.result();
  EXPECT_EQ(log(), LogLines(2, kDecoderOver));
}

}  // namespace
}  // namespace omxtest
