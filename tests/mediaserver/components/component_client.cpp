#include "tests/mediaserver/components/component_client.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "host/mediaserver/components/component_list.h"

namespace componenttest {

using android::omx_message;
using mediaserver::kInputPort;
using mediaserver::kOutputPort;

ComponentClient::ComponentClient(const char* device, Kind kind)
    : _device(omxhost::findDevice(device)),
      _layout(_device->components.decoderOutput),
      _server(new mediaserver::OmxServer(mediaserver::componentsOf(*_device))) {
  const char* const name = kind == Kind::Decoder ? _device->decoderComponent : _device->encoderComponent;
  _node = std::make_unique<omxtest::OmxClient>(_server, name);
  // As our wrappers do.
  using omxtest::Giving;
  _node->setGiving(kInputPort, isTi() ? Giving::Backup : Giving::Use);
  _node->setGiving(kOutputPort, isTi() || kind == Kind::Decoder ? Giving::Backup : Giving::Use);
}

void ComponentClient::start() {
  _node->toExecuting();
  _handled = 0;
  _ending = _ended = false;
  _inputFree.assign(_node->buffers(kInputPort).size(), true);
  _node->fillAll();
  _outputsOut = _node->buffers(kOutputPort).size();
}

size_t ComponentClient::indexOf(OMX_U32 port, android::IOMX::buffer_id id) const {
  const auto& buffers = _node->buffers(port);
  const auto found =
      std::find_if(buffers.begin(), buffers.end(), [&](const auto& buffer) { return buffer.id == id; });
  return static_cast<size_t>(found - buffers.begin());
}

bool ComponentClient::handleNext() {
  if (!_node->messages().waitFor(omxtest::anyMessage(), _handled + 1)) {
    ADD_FAILURE() << "nothing more comes after " << ::testing::PrintToString(_node->heard());
    return false;
  }
  const omx_message message = _node->messages().all()[_handled++];
  switch (message.type) {
    case omx_message::EMPTY_BUFFER_DONE:
      _inputFree.at(indexOf(kInputPort, message.u.buffer_data.buffer)) = true;
      break;
    case omx_message::FILL_BUFFER_DONE:
      onFilled(message);
      break;
    case omx_message::EVENT:
      onEvent(message.u.event_data.event, message.u.event_data.data1, message.u.event_data.data2);
      break;
  }
  return true;
}

void ComponentClient::onFilled(const omx_message& message) {
  const auto& data = message.u.extended_buffer_data;
  const size_t index = indexOf(kOutputPort, data.buffer);
  const auto& buffer = _node->buffers(kOutputPort).at(index);
  --_outputsOut;
  if (data.range_length > 0) {
    Output output{};
    const uint8_t* const begin = buffer.data + data.range_offset;
    output.bytes.assign(begin, begin + data.range_length);
    output.timestamp = data.timestamp;
    output.flags = data.flags;
    output.definition = _node->definition(kOutputPort);
    output.crop = makeRecord<OMX_CONFIG_RECTTYPE>(kOutputPort);
    static_cast<void>(getConfig(OMX_IndexConfigCommonOutputCrop, &output.crop));
    _outputs.push_back(std::move(output));
  }
  if ((data.flags & OMX_BUFFERFLAG_EOS) != 0) _ended = true;
  if (_reconfiguring) {
    if (_outputsOut == 0) _node->freeBuffers(kOutputPort);
  } else if (!_ending) {
    EXPECT_EQ(_node->fill(index), android::OK);
    ++_outputsOut;
  }
}

void ComponentClient::onEvent(OMX_U32 event, OMX_U32 data1, OMX_U32 data2) {
  if (event == OMX_EventError) {
    _errors.push_back(omxtest::describe(_node->messages().all()[_handled - 1]));
  } else if (event == OMX_EventPortSettingsChanged) {
    EXPECT_EQ(data1, kOutputPort);
    if (data2 != 0 && data2 != OMX_IndexParamPortDefinition) return;
    ++_reconfigurations;
    _reconfiguring = true;
    EXPECT_EQ(_node->command(OMX_CommandPortDisable, kOutputPort), android::OK);
  } else if (event == OMX_EventCmdComplete && data1 == OMX_CommandPortDisable && data2 == kOutputPort) {
    EXPECT_EQ(_node->command(OMX_CommandPortEnable, kOutputPort), android::OK);
    _node->populate(kOutputPort);
  } else if (event == OMX_EventCmdComplete && data1 == OMX_CommandPortEnable && data2 == kOutputPort) {
    _reconfiguring = false;
    _node->fillAll();
    _outputsOut = _node->buffers(kOutputPort).size();
  }
}

void ComponentClient::await(const std::function<bool()>& condition) {
  while (!condition()) {
    if (!handleNext()) return;
  }
}

void ComponentClient::reopenInput(const std::function<void()>& change) {
  await([this] { return std::find(_inputFree.begin(), _inputFree.end(), false) == _inputFree.end(); });
  EXPECT_EQ(_node->command(OMX_CommandPortDisable, kInputPort), android::OK);
  _node->freeBuffers(kInputPort);
  _node->expectComplete(OMX_CommandPortDisable, kInputPort);
  change();
  EXPECT_EQ(_node->command(OMX_CommandPortEnable, kInputPort), android::OK);
  _node->populate(kInputPort);
  _node->expectComplete(OMX_CommandPortEnable, kInputPort);
}

void ComponentClient::awaitOutputs(size_t count) {
  await([&] { return _outputs.size() >= count; });
}

void ComponentClient::send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags) {
  auto free = _inputFree.end();
  await([&] {
    free = std::find(_inputFree.begin(), _inputFree.end(), true);
    return free != _inputFree.end();
  });
  if (free == _inputFree.end()) return;
  *free = false;
  const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  EXPECT_EQ(_node->empty(static_cast<size_t>(free - _inputFree.begin()), text, flags, timestamp),
            android::OK);
}

void ComponentClient::finish() {
  constexpr int64_t kTime = -1;
  send({}, kTime, OMX_BUFFERFLAG_EOS);
  _ending = true;
  await([this] { return _ended; });
}

std::vector<Decoded> ComponentClient::pictures() const {
  std::vector<Decoded> pictures;
  for (const Output& output : _outputs) {
    const auto& video = output.definition.format.video;
    const Rectangle visible{static_cast<uint32_t>(output.crop.nLeft), static_cast<uint32_t>(output.crop.nTop),
                            output.crop.nWidth, output.crop.nHeight};
    pictures.push_back({unpackOutput(output.bytes, _layout, video.nFrameWidth, video.nFrameHeight, visible),
                        output.timestamp});
  }
  return pictures;
}

}  // namespace componenttest
