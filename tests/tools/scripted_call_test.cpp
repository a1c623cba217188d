// The pipeline of a call between components that do what the test says: their encoder puts a slice header
// before the raw picture, their decoder takes it off again.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>

#include <omxhost/log.h>

#include "tests/support/scripted_media_server.h"
#include "tests/tools/temporary_directory.h"
#include "tools/commands/call.h"
#include "tools/commands/decode.h"

namespace {

using namespace tool;
using omxtest::Packet;
using tooltest::contentOf;
using tooltest::TemporaryDirectory;

constexpr Size kSize{64, 48};
constexpr std::string_view kSliceHeader{"\0\0\0\1\x65\x88", 6};
constexpr std::string_view kParameters{"\0\0\0\1\x67\x42\0\x1F\0\0\0\1\x68\1", 14};

// Gray pictures, one after the other, until it is told to end.
class GraySource : public FrameSource {
 public:
  explicit GraySource(uint64_t count, FrameRate rate = {30, 1}) : _count(count), _traits{.rate = rate} {}

  Size size() const override { return kSize; }
  const VideoTraits& traits() const override { return _traits; }
  std::optional<uint64_t> frameCount() const override { return _count; }
  Result<bool> next(Picture& picture) override {
    if (_read == _count) return false;
    picture.resize(kSize);
    std::fill(picture.bytes.begin(), picture.bytes.end(), static_cast<uint8_t>(_read++));
    if (onRead) onRead(_read);
    return true;
  }

  std::function<void(uint64_t read)> onRead;

 private:
  const uint64_t _count;
  const VideoTraits _traits;
  uint64_t _read = 0;
};

// msm8x55 is the device with the smallest decoder buffers of plain layout.
struct CallRig {
  CallRig() {
    server.encoder().onInput([](const Packet& input) { return std::vector<Packet>{coded(input)}; });
    server.decoder().onInput([](const Packet& input) { return std::vector<Packet>{decoded(input)}; });
    // The decoder's pictures stay small, whatever size a session sets up.
    server.decoder().editPort(mediaserver::kOutputPort, [](auto& port) {
      port.format.video.nFrameWidth = static_cast<OMX_U32>(kSize.width);
      port.format.video.nFrameHeight = static_cast<OMX_U32>(kSize.height);
    });
  }

  static Packet coded(const Packet& input) {
    const std::string header(input.bytes.empty() ? std::string_view() : kSliceHeader);
    return Packet(header + input.text(), input.timestamp, input.flags);
  }
  static Packet decoded(const Packet& input) {
    const std::string text = input.text();
    const size_t picture = std::min(text.size(), pictureBytes(kSize));
    return Packet(text.substr(text.size() - picture), input.timestamp, input.flags);
  }

  Result<CallReport> run(GraySource& source) { return runCall(settings, source, enough); }
  // For calls that have to end well.
  CallFigures figures(GraySource& source) {
    const auto report = run(source);
    if (report.ok()) return report.value().figures;
    ADD_FAILURE() << report.failure().text;
    return {};
  }

  omxhost::LogCapture log;
  omxtest::ScriptedMediaServer server{"msm8x55"};
  const TemporaryDirectory directory;
  CallSettings settings;
  std::stop_source enough;
};

TEST(ScriptedCall, CountsWhatTheEncoderDropsAndStillEnds) {
  CallRig rig;
  rig.server.encoder().onInput([](const Packet& input) {
    const bool isDropped = !input.bytes.empty() && input.bytes[0] % 5 == 4;  // by its gray; the last one too
    return isDropped ? std::vector<Packet>() : std::vector<Packet>{CallRig::coded(input)};
  });
  GraySource source(20, FrameRate{1, 300});  // 100 minutes; 32 bits hold 71 minutes of time stamps
  const CallFigures figures = rig.figures(source);
  EXPECT_EQ(figures.framesIn, 20U);
  EXPECT_EQ(figures.framesEncoded, 16U);
  EXPECT_EQ(figures.framesDecoded, 16U);
  EXPECT_EQ(figures.framesDropped(), 4U);
  EXPECT_EQ(figures.framesOutOfOrder, 0U);
  EXPECT_EQ(figures.psnr, 100) << "compared with another picture than its own";
}

TEST(ScriptedCall, SendsParametersThatComeAloneWithTheNextPicture) {
  CallRig rig;
  rig.settings.streamPath = rig.directory.file("coded.264");
  rig.server.encoder().onInput([](const Packet& input) {
    std::vector<Packet> outputs{CallRig::coded(input)};
    if (input.timestamp == 0) outputs.emplace(outputs.begin(), kParameters, 0, OMX_BUFFERFLAG_CODECCONFIG);
    return outputs;
  });
  GraySource source(5);
  const auto report = rig.run(source);
  ASSERT_TRUE(report.ok()) << report.failure().text;
  EXPECT_EQ(report.value().figures.framesDecoded, 5U);
  ASSERT_TRUE(report.value().sequence);
  EXPECT_EQ(toText(*report.value().sequence), "Baseline, level 3.1");
  EXPECT_EQ(rig.server.decoder().inputs().front().bytes.size(),
            kParameters.size() + kSliceHeader.size() + pictureBytes(kSize));
  EXPECT_EQ(contentOf(rig.settings.streamPath).size(), report.value().figures.streamBytes);
}

TEST(ScriptedCall, DropsInRealTimeWhatFindsNoFreeBuffer) {
  CallRig rig;
  rig.settings.sender.realTime = true;
  rig.server.encoder().holdInput();
  GraySource source(30, FrameRate{1000, 1});
  source.onRead = [&rig](uint64_t read) {
    if (read == 20) rig.server.encoder().passInput();
  };
  const CallFigures figures = rig.figures(source);
  EXPECT_EQ(figures.framesIn, 30U);
  EXPECT_GE(figures.framesDropped(), 10U);
  EXPECT_GE(figures.framesDecoded, 4U) << "what was in the buffers";
  EXPECT_EQ(figures.framesDecoded + figures.framesDropped(), 30U);
  EXPECT_EQ(figures.framesOutOfOrder, 0U);
  EXPECT_EQ(figures.psnr, 100);
}

TEST(ScriptedCall, FailsWithAMessageAndLeavesNoFile) {
  const struct {
    std::function<void(CallRig& rig)> provoke;
    ExitCode code;
    const char* text;
  } cases[] = {
      {[](CallRig& rig) {
         rig.server.omx().failWhere(
             [](const auto& call) { return call.index == OMX_IndexParamVideoBitrate; });
       },
       ExitCode::Device, "the encoder of device msm8x55 cannot be created"},
      {[](CallRig& rig) { rig.server.omx().fail(omxtest::Method::SendCommand); }, ExitCode::Device,
       "the decoder of device msm8x55 cannot be started"},
      {[](CallRig& rig) { rig.server.omx().fail(omxtest::Method::EmptyBuffer, 4); }, ExitCode::Failed,
       "refused"},
      {[](CallRig& rig) {
         rig.server.omx().after(omxtest::Method::EmptyBuffer, [&rig](const omxtest::Call& call) {
           if (call.number > 100) rig.server.decoder().raiseError(OMX_ErrorHardware);
         });
       },
       ExitCode::Failed, "the decoder of device msm8x55 has failed"},
      {[](CallRig& rig) {
         rig.server.encoder().editPort(mediaserver::kOutputPort,
                                       [](auto& port) { port.nBufferSize = 80'000; });
         rig.server.encoder().onInput([](const Packet& input) {
           std::vector<Packet> outputs{CallRig::coded(input)};
           outputs[0].bytes.resize(70'000);
           return outputs;
         });
       },
       ExitCode::Failed, "a coded picture of 70000 bytes is larger than the input buffers of the decoder"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.text);
    CallRig rig;
    rig.settings.streamPath = rig.directory.file("coded.264");
    rig.settings.picturesPath = rig.directory.file("decoded.y4m");
    each.provoke(rig);
    GraySource source(1000);
    const auto report = rig.run(source);
    ASSERT_FALSE(report.ok());
    EXPECT_EQ(report.failure().code, each.code);
    EXPECT_NE(report.failure().text.find(each.text), std::string::npos) << report.failure().text;
    EXPECT_TRUE(rig.directory.names().empty());
  }
}

}  // namespace
