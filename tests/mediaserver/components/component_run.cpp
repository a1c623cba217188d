#include "tests/mediaserver/components/component_run.h"

#include <algorithm>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/component_list.h"

namespace componenttest {

using android::omx_message;
using omxtest::Giving;

ComponentRun::ComponentRun(const omxhost::Device& device, const char* component, Giving output)
    : OmxClient(new mediaserver::OmxServer(mediaserver::componentsOf(device)), component),
      _traits(device.components) {
  // As our wrappers do.
  setGiving(kInputPort, isTi() ? Giving::Backup : Giving::Use);
  setGiving(kOutputPort, isTi() ? Giving::Backup : output);
}

android::status_t ComponentRun::resize(OMX_U32 port, uint32_t width, uint32_t height,
                                       uint32_t framesPerSecond) {
  auto wanted = definition(port);
  wanted.format.video.nFrameWidth = width;
  wanted.format.video.nFrameHeight = height;
  if (framesPerSecond != 0) wanted.format.video.xFramerate = framesPerSecond << 16;
  return define(port, wanted);
}

void ComponentRun::start() {
  toExecuting();
  _handled = 0;
  _ending = _ended = false;
  _inputFree.assign(buffers(kInputPort).size(), true);
  fillAll();
  _outputsOut = buffers(kOutputPort).size();
}

size_t ComponentRun::indexOf(OMX_U32 port, android::IOMX::buffer_id id) const {
  const auto& given = buffers(port);
  const auto found =
      std::find_if(given.begin(), given.end(), [&](const auto& buffer) { return buffer.id == id; });
  return static_cast<size_t>(found - given.begin());
}

bool ComponentRun::handleNext() {
  if (!messages().waitFor(omxtest::anyMessage(), _handled + 1)) {
    ADD_FAILURE() << "nothing more comes after " << ::testing::PrintToString(heard());
    return false;
  }
  const omx_message message = messages().all()[_handled++];
  if (message.type == omx_message::EVENT) onEvent(message);
  if (message.type == omx_message::FILL_BUFFER_DONE) onFilled(message);
  if (message.type == omx_message::EMPTY_BUFFER_DONE) {
    _inputFree.at(indexOf(kInputPort, message.u.buffer_data.buffer)) = true;
  }
  return true;
}

void ComponentRun::onFilled(const omx_message& message) {
  const auto& data = message.u.extended_buffer_data;
  --_outputsOut;
  if (data.range_length > 0) {
    const auto whole = makeRecord<OMX_CONFIG_RECTTYPE>(kOutputPort);
    outputs.push_back({{output(message).bytes, data.timestamp}, data.flags, definition(kOutputPort), whole});
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

void ComponentRun::onEvent(const omx_message& message) {
  const std::string what = omxtest::describe(message);
  if (what.starts_with("error")) errors.push_back(what);
  if (what == "complete disable 1") {
    EXPECT_EQ(command(OMX_CommandPortEnable, kOutputPort), kOk);
    populate(kOutputPort);
  } else if (what == "complete enable 1") {
    _reconfiguring = false;
    fillAll();
    _outputsOut = buffers(kOutputPort).size();
  } else if (what.starts_with("settings")) {
    EXPECT_EQ(message.u.event_data.data1, kOutputPort);
    const OMX_U32 changed = message.u.event_data.data2;
    if (changed != 0 && changed != OMX_IndexParamPortDefinition) return;
    ++reconfigurations;
    _reconfiguring = true;
    EXPECT_EQ(command(OMX_CommandPortDisable, kOutputPort), kOk);
  }
}

void ComponentRun::await(const std::function<bool()>& condition) {
  while (!condition() && handleNext()) {
  }
}

void ComponentRun::send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags) {
  const auto free = [this] { return std::find(_inputFree.begin(), _inputFree.end(), true); };
  await([&] { return free() != _inputFree.end(); });
  const auto index = static_cast<size_t>(free() - _inputFree.begin());
  _inputFree.at(index) = false;
  const std::string_view text(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  EXPECT_EQ(empty(index, text, flags, timestamp), kOk);
}

void ComponentRun::finish() {
  send({}, -1, OMX_BUFFERFLAG_EOS);
  _ending = true;
  awaitEnd();
}

// --- Decoders

void DecoderRun::setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width, uint32_t height) {
  auto wanted = definition(kInputPort);
  wanted.format.video.eCompressionFormat = coding;
  EXPECT_EQ(define(kInputPort, wanted), kOk);
  EXPECT_TRUE(width == 0 || resize(kInputPort, width, height) == kOk);
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

Output& EncoderRun::encode(const Picture& picture) {
  const size_t before = outputs.size();
  send(packInput(picture, traits().encoderInput), static_cast<int64_t>(before) * 1000);
  awaitOutputs(before + 1);
  return outputs.back();
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
