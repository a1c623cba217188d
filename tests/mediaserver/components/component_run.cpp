#include "tests/mediaserver/components/component_run.h"

#include <algorithm>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/component_list.h"

namespace componenttest {

using android::omx_message;
using omxhost::findDevice;
using omxtest::Giving;

ComponentRun::ComponentRun(const omxhost::Device& device, const char* component, Giving output)
    : _traits(device.components),
      _node(new mediaserver::OmxServer(mediaserver::componentsOf(device)), component) {
  // As our wrappers do.
  _node.setGiving(kInputPort, isTi() ? Giving::Backup : Giving::Use);
  _node.setGiving(kOutputPort, isTi() ? Giving::Backup : output);
}

android::status_t ComponentRun::define(OMX_U32 port, const VideoEdit& edit) {
  auto definition = _node.definition(port);
  edit(definition.format.video);
  return _node.define(port, definition);
}

void ComponentRun::start() {
  _node.toExecuting();
  _handled = 0;
  _ending = _ended = false;
  _inputFree.assign(_node.buffers(kInputPort).size(), true);
  _node.fillAll();
  _outputsOut = _node.buffers(kOutputPort).size();
}

size_t ComponentRun::indexOf(OMX_U32 port, android::IOMX::buffer_id id) const {
  const auto& buffers = _node.buffers(port);
  const auto found =
      std::find_if(buffers.begin(), buffers.end(), [&](const auto& buffer) { return buffer.id == id; });
  return static_cast<size_t>(found - buffers.begin());
}

bool ComponentRun::handleNext() {
  if (!_node.messages().waitFor(omxtest::anyMessage(), _handled + 1)) {
    ADD_FAILURE() << "nothing more comes after " << ::testing::PrintToString(_node.heard());
    return false;
  }
  const omx_message message = _node.messages().all()[_handled++];
  if (message.type == omx_message::EVENT) onEvent(message);
  if (message.type == omx_message::FILL_BUFFER_DONE) onFilled(message);
  if (message.type == omx_message::EMPTY_BUFFER_DONE) {
    _inputFree.at(indexOf(kInputPort, message.u.buffer_data.buffer)) = true;
  }
  return true;
}

void ComponentRun::onFilled(const omx_message& message) {
  const auto& data = message.u.extended_buffer_data;
  const size_t index = indexOf(kOutputPort, data.buffer);
  --_outputsOut;
  if (data.range_length > 0) {
    const uint8_t* const begin = _node.buffers(kOutputPort).at(index).data + data.range_offset;
    Output output{{begin, begin + data.range_length},
                  data.timestamp,
                  data.flags,
                  _node.definition(kOutputPort),
                  makeRecord<OMX_CONFIG_RECTTYPE>(kOutputPort)};
    static_cast<void>(getConfig(OMX_IndexConfigCommonOutputCrop, &output.crop));
    outputs.push_back(std::move(output));
  }
  if ((data.flags & OMX_BUFFERFLAG_EOS) != 0) _ended = true;
  if (_reconfiguring) {
    if (_outputsOut == 0) _node.freeBuffers(kOutputPort);
  } else if (!_ending) {
    EXPECT_EQ(_node.fill(index), kOk);
    ++_outputsOut;
  }
}

void ComponentRun::onEvent(const omx_message& message) {
  const std::string what = omxtest::describe(message);
  if (what.starts_with("error")) errors.push_back(what);
  if (what == "complete disable 1") {
    EXPECT_EQ(_node.command(OMX_CommandPortEnable, kOutputPort), kOk);
    _node.populate(kOutputPort);
  } else if (what == "complete enable 1") {
    _reconfiguring = false;
    _node.fillAll();
    _outputsOut = _node.buffers(kOutputPort).size();
  } else if (what.starts_with("settings")) {
    EXPECT_EQ(message.u.event_data.data1, kOutputPort);
    const OMX_U32 changed = message.u.event_data.data2;
    if (changed != 0 && changed != OMX_IndexParamPortDefinition) return;
    ++reconfigurations;
    _reconfiguring = true;
    EXPECT_EQ(_node.command(OMX_CommandPortDisable, kOutputPort), kOk);
  }
}

void ComponentRun::await(const std::function<bool()>& condition) {
  while (!condition()) {
    if (!handleNext()) return;
  }
}

void ComponentRun::awaitOutputs(size_t count) {
  await([&] { return outputs.size() >= count; });
}

void ComponentRun::awaitEnd() {
  await([this] { return _ended; });
}

void ComponentRun::reopenInput(const std::function<void()>& change) {
  await([this] { return std::find(_inputFree.begin(), _inputFree.end(), false) == _inputFree.end(); });
  EXPECT_EQ(_node.command(OMX_CommandPortDisable, kInputPort), kOk);
  _node.freeBuffers(kInputPort);
  _node.expectComplete(OMX_CommandPortDisable, kInputPort);
  change();
  EXPECT_EQ(_node.command(OMX_CommandPortEnable, kInputPort), kOk);
  _node.populate(kInputPort);
  _node.expectComplete(OMX_CommandPortEnable, kInputPort);
}

void ComponentRun::send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags) {
  const auto free = [this] { return std::find(_inputFree.begin(), _inputFree.end(), true); };
  await([&] { return free() != _inputFree.end(); });
  const auto index = static_cast<size_t>(free() - _inputFree.begin());
  _inputFree.at(index) = false;
  const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  EXPECT_EQ(_node.empty(index, text, flags, timestamp), kOk);
}

void ComponentRun::finish() {
  send({}, -1, OMX_BUFFERFLAG_EOS);
  _ending = true;
  awaitEnd();
}

// --- Decoders

DecoderRun::DecoderRun(const char* device)
    : ComponentRun(*findDevice(device), findDevice(device)->decoderComponent, Giving::Backup) {}

android::status_t DecoderRun::setOrder(QcomOrder order) {
  auto record = makeRecord<mediaserver::QcomPictureOrder>(kInputPort);
  record.eOutputPictureOrder = static_cast<OMX_U32>(order);
  return set(mediaserver::kQcomPictureOrderIndex, record);
}

android::status_t DecoderRun::setPacking(QcomPacking packing) {
  auto record = makeRecord<mediaserver::QcomPortDefinition>(kInputPort);
  record.nFramePackingFormat = static_cast<OMX_U32>(packing);
  return set(mediaserver::kQcomPortDefinitionIndex, record);
}

void DecoderRun::setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width, uint32_t height) {
  EXPECT_EQ(define(kInputPort,
                   [&](auto& video) {
                     video.eCompressionFormat = coding;
                     if (width != 0) video.nFrameWidth = width;
                     if (height != 0) video.nFrameHeight = height;
                   }),
            kOk);
}

void DecoderRun::sendAll(const std::vector<Unit>& units) {
  for (const Unit& unit : units) send(unit.bytes, unit.timestamp);
}

void DecoderRun::run(const std::vector<Unit>& units) {
  start();
  sendAll(units);
  finish();
}

std::vector<Decoded> DecoderRun::pictures() const {
  std::vector<Decoded> pictures;
  for (const Output& output : outputs) {
    const auto& video = output.definition.format.video;
    pictures.push_back({unpackOutput(output.bytes, traits().decoderOutput, video.nFrameWidth,
                                     video.nFrameHeight, output.crop),
                        output.timestamp});
  }
  return pictures;
}

// --- Encoders

EncoderRun::EncoderRun(const char* device)
    : ComponentRun(*findDevice(device), findDevice(device)->encoderComponent, Giving::Use) {}

void EncoderRun::setSize(uint32_t width, uint32_t height, uint32_t framesPerSecond) {
  for (const OMX_U32 port : {kInputPort, kOutputPort}) {
    EXPECT_EQ(define(port,
                     [&](auto& video) {
                       video.nFrameWidth = width;
                       video.nFrameHeight = height;
                       video.xFramerate = framesPerSecond << 16;
                     }),
              kOk);
  }
}

void EncoderRun::setBitRate(uint32_t bitsPerSecond) {
  auto record = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOutputPort);
  record.eControlRate = OMX_Video_ControlRateVariable;
  record.nTargetBitrate = bitsPerSecond;
  EXPECT_EQ(set(OMX_IndexParamVideoBitrate, record), kOk);
}

OMX_VIDEO_PARAM_AVCTYPE EncoderRun::avc() {
  auto record = makeRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOutputPort);
  EXPECT_EQ(get(OMX_IndexParamVideoAvc, &record), kOk);
  return record;
}

android::status_t EncoderRun::setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change) {
  OMX_VIDEO_PARAM_AVCTYPE record = avc();
  change(record);
  return set(OMX_IndexParamVideoAvc, record);
}

Output& EncoderRun::encode(const Picture& picture) {
  const size_t before = outputs.size();
  send(packInput(picture, traits().encoderInput), static_cast<int64_t>(before) * 1000);
  awaitOutputs(before + 1);
  return outputs.back();
}

void EncoderRun::encodeScene(uint32_t width, uint32_t height, uint32_t count) {
  for (uint32_t i = 0; i < count; ++i) encode(scene(width, height, _next++));
}

std::vector<size_t> EncoderRun::keyFrames() const {
  std::vector<size_t> found;
  for (size_t i = 0; i < outputs.size(); ++i) {
    if ((outputs[i].flags & OMX_BUFFERFLAG_SYNCFRAME) != 0) found.push_back(i);
  }
  return found;
}

std::vector<Unit> EncoderRun::units() const {
  std::vector<Unit> units;
  for (const Output& output : outputs) units.push_back({output.bytes, output.timestamp});
  return units;
}

double EncoderRun::bits(size_t first, size_t count) const {
  size_t bytes = 0;
  for (size_t i = first; i < first + count; ++i) bytes += outputs.at(i).bytes.size();
  return static_cast<double>(bytes) * 8;
}

void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted, bool timed) {
  ASSERT_EQ(got.size(), wanted.size());
  for (size_t i = 0; i < got.size(); ++i) {
    EXPECT_TRUE(got[i].picture == wanted[i].picture)
        << "picture " << i << ": " << got[i].picture.width << "x" << got[i].picture.height << " for "
        << wanted[i].picture.width << "x" << wanted[i].picture.height;
    EXPECT_TRUE(!timed || got[i].timestamp == wanted[i].timestamp) << "picture " << i;
  }
}

std::vector<std::vector<uint8_t>> nals(const std::vector<uint8_t>& stream) {
  std::vector<std::vector<uint8_t>> found;
  mediaserver::Bytes rest(stream);
  for (auto nal = mediaserver::takeNal(&rest); !nal.empty(); nal = mediaserver::takeNal(&rest)) {
    found.emplace_back(nal.begin(), nal.end());
  }
  return found;
}

NalTypes nalTypes(const std::vector<uint8_t>& unit) {
  NalTypes types;
  for (const auto& nal : nals(unit)) types.push_back(mediaserver::nalType(nal));
  return types;
}

mediaserver::SequenceSet sequenceSet(const std::vector<uint8_t>& unit) {
  for (const auto& nal : nals(unit)) {
    if (const auto set = mediaserver::readSequenceSet(nal)) return *set;
  }
  ADD_FAILURE() << "no sequence set";
  return {};
}

}  // namespace componenttest
