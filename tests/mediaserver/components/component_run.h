#pragma once
// A device's decoder or encoder component at work, driven through IOMX the way our sessions do it: buffers go
// round, new output settings are answered by new buffers. One test thread. Waits have a limit; what goes
// wrong is the test's failure.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include <omxhost/device.h>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/component_list.h"
#include "host/mediaserver/components/vendor_records.h"
#include "host/mediaserver/omx_server.h"
#include "tests/mediaserver/components/reference.h"
#include "tests/support/omx_client.h"

namespace componenttest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::QcomOrder;
using omxtest::Giving;
using omxtest::kOk;
using omxtest::kUnsupported;
using omxtest::makeRecord;
using Errors = std::vector<std::string>;

// Those that have components.
constexpr const char* kDevices[] = {"msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4", "msm-unknown"};

// A filled output buffer, with the port and the rectangle as the client reads them when it gets it.
struct Output : Unit {
  OMX_U32 flags;
  mediaserver::PortDefinition definition;
  OMX_CONFIG_RECTTYPE crop;
};

class ComponentRun : public omxtest::OmxClient {
 public:
  ComponentRun(const omxhost::Device& device, const char* component, Giving output)
      : OmxClient(new mediaserver::OmxServer(mediaserver::componentsOf(device)), component),
        traits(device.components) {
    // As our wrappers do.
    setGiving(kInputPort, isTi() ? Giving::Backup : Giving::Use);
    setGiving(kOutputPort, isTi() ? Giving::Backup : output);
  }

  bool isTi() const { return traits.vendor == omxhost::Vendor::Ti; }

  android::status_t resize(OMX_U32 port, uint32_t width, uint32_t height) {
    auto wanted = definition(port);
    wanted.format.video.nFrameWidth = width;
    wanted.format.video.nFrameHeight = height;
    return define(port, wanted);
  }

  // Executing, with all output buffers given.
  void start() {
    toExecuting();
    _inputFree.assign(buffers(kInputPort).size(), true);
    giveOutput();
  }
  // Waits for a free input buffer.
  void send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags = OMX_BUFFERFLAG_ENDOFFRAME) {
    const auto free = [this] { return std::find(_inputFree.begin(), _inputFree.end(), true); };
    await([&] { return free() != _inputFree.end(); });
    const auto index = static_cast<size_t>(free() - _inputFree.begin());
    _inputFree.at(index) = false;
    const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
    EXPECT_EQ(empty(index, text, flags, timestamp), kOk);
  }
  // Lets the component work until `count` outputs have come.
  void awaitOutputs(size_t count) {
    await([&] { return outputs.size() >= count; });
  }
  void awaitEnd() {
    await([this] { return std::exchange(_ended, false); });
  }
  // Sends the end mark and waits until it comes out.
  void finish() {
    send({}, -1, OMX_BUFFERFLAG_EOS);
    _ending = true;
    awaitEnd();
  }

  const omxhost::ComponentTraits& traits;
  std::vector<Output> outputs;  // those with bytes
  Errors errors;
  size_t reconfigurations = 0;

 private:
  void giveOutput() {
    fillAll();
    _outputsOut = buffers(kOutputPort).size();
  }

  size_t indexOf(OMX_U32 port, android::IOMX::buffer_id id) const {
    size_t index = 0;
    while (buffers(port).at(index).id != id) ++index;
    return index;
  }

  void await(const std::function<bool()>& condition) {
    while (!condition()) {
      const bool more = messages().waitFor(omxtest::anyMessage(), _handled + 1);
      ASSERT_TRUE(more) << "nothing more comes after " << ::testing::PrintToString(heard());
      const android::omx_message message = messages().all()[_handled++];
      if (message.type == android::omx_message::EVENT) onEvent(message);
      if (message.type == android::omx_message::FILL_BUFFER_DONE) onFilled(message);
      if (message.type == android::omx_message::EMPTY_BUFFER_DONE)
        _inputFree.at(indexOf(kInputPort, message.u.buffer_data.buffer)) = true;
    }
  }

  void onFilled(const android::omx_message& message) {
    const auto& data = message.u.extended_buffer_data;
    --_outputsOut;
    if (data.range_length > 0) {
      const auto whole = makeRecord<OMX_CONFIG_RECTTYPE>(kOutputPort);
      outputs.push_back(
          {{output(message).bytes, data.timestamp}, data.flags, definition(kOutputPort), whole});
      static_cast<void>(getConfig(OMX_IndexConfigCommonOutputCrop, &outputs.back().crop));
    }
    if ((data.flags & OMX_BUFFERFLAG_EOS) != 0) _ended = true;
    if (_reconfiguring) {
      if (_outputsOut == 0) freeBuffers(kOutputPort);
    } else if (!_ending) {
      EXPECT_EQ(fill(indexOf(kOutputPort, data.buffer)), kOk);
      ++_outputsOut;
    }
  }

  void onEvent(const android::omx_message& message) {
    const std::string what = omxtest::describe(message);
    if (what.starts_with("error")) errors.push_back(what);
    if (what == "complete disable 1") {
      EXPECT_EQ(command(OMX_CommandPortEnable, kOutputPort), kOk);
      populate(kOutputPort);
    } else if (what == "complete enable 1") {
      _reconfiguring = false;
      giveOutput();
    } else if (what.starts_with("settings 1")) {
      const OMX_U32 changed = message.u.event_data.data2;
      if (changed != 0 && changed != OMX_IndexParamPortDefinition) return;
      ++reconfigurations;
      _reconfiguring = true;
      EXPECT_EQ(command(OMX_CommandPortDisable, kOutputPort), kOk);
    }
  }

  size_t _handled = 0;  // messages
  std::vector<bool> _inputFree;
  size_t _outputsOut = 0;  // with the component
  bool _reconfiguring = false, _ending = false, _ended = false;
};

class DecoderRun : public ComponentRun {
 public:
  explicit DecoderRun(const char* device)
      : ComponentRun(*omxhost::findDevice(device), omxhost::findDevice(device)->decoderComponent,
                     Giving::Backup) {}

  android::status_t setOrder(QcomOrder order) {
    auto record = makeRecord<mediaserver::QcomPictureOrder>(kInputPort);
    record.eOutputPictureOrder = static_cast<OMX_U32>(order);
    return set(mediaserver::kQcomPictureOrderIndex, record);
  }
  // 0: the size stays.
  void setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width = 0, uint32_t height = 0) {
    auto wanted = definition(kInputPort);
    wanted.format.video.eCompressionFormat = coding;
    EXPECT_EQ(define(kInputPort, wanted), kOk);
    EXPECT_TRUE(width == 0 || resize(kInputPort, width, height) == kOk);
  }
  // One buffer a unit.
  void sendAll(const std::vector<Unit>& units) {
    for (const Unit& unit : units) send(unit.bytes, unit.timestamp);
  }
  // A whole life with these units.
  void run(const std::vector<Unit>& units) {
    start();
    sendAll(units);
    finish();
  }
  // The outputs.
  std::vector<Decoded> pictures() const {
    std::vector<Decoded> pictures;
    for (const Output& output : outputs) {
      const auto& video = output.definition.format.video;
      pictures.push_back({unpackOutput(output.bytes, traits.decoderOutput, video.nFrameWidth,
                                       video.nFrameHeight, output.crop),
                          output.timestamp});
    }
    return pictures;
  }
};

class EncoderRun : public ComponentRun {
 public:
  explicit EncoderRun(const char* device)
      : ComponentRun(*omxhost::findDevice(device), omxhost::findDevice(device)->encoderComponent,
                     Giving::Use) {}
  // Both ports have that size, as wrappers do it.
  EncoderRun(const char* device, uint32_t width, uint32_t height) : EncoderRun(device) {
    for (const OMX_U32 port : {kInputPort, kOutputPort}) EXPECT_EQ(resize(port, width, height), kOk);
  }
  // Changes the record as it is.
  android::status_t setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change) {
    auto record = makeRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOutputPort);
    EXPECT_EQ(get(OMX_IndexParamVideoAvc, &record), kOk);
    change(record);
    return set(OMX_IndexParamVideoAvc, record);
  }

  // One picture in the device's layout, and its access unit.
  Output& encode(const Picture& picture) {
    const size_t before = outputs.size();
    send(packInput(picture, traits.encoderInput), static_cast<int64_t>(before) * 1000);
    awaitOutputs(before + 1);
    return outputs.back();
  }
  std::vector<Unit> units() const { return {outputs.begin(), outputs.end()}; }
};

// Size, bytes and, unless told otherwise, time stamp of every picture.
inline void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted,
                       bool timed = true) {
  ASSERT_EQ(got.size(), wanted.size());
  for (size_t i = 0; i < got.size(); ++i) {
    EXPECT_TRUE(got[i].picture == wanted[i].picture) << "picture " << i;
    EXPECT_TRUE(!timed || got[i].timestamp == wanted[i].timestamp) << "picture " << i;
  }
}

// A stream's NAL units.
inline std::vector<std::vector<uint8_t>> nals(const std::vector<uint8_t>& stream) {
  std::vector<std::vector<uint8_t>> found;
  mediaserver::Bytes rest(stream);
  for (auto nal = mediaserver::takeNal(&rest); !nal.empty(); nal = mediaserver::takeNal(&rest))
    found.emplace_back(nal.begin(), nal.end());
  return found;
}
inline std::vector<unsigned> nalTypes(const std::vector<uint8_t>& unit) {
  std::vector<unsigned> types;
  for (const auto& nal : nals(unit)) types.push_back(mediaserver::nalType(nal));
  return types;
}

}  // namespace componenttest
