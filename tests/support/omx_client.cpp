#include "tests/support/omx_client.h"

#include <algorithm>

#include <utils/String8.h>

namespace omxtest {

using android::omx_message;
using android::status_t;
using android::String8;
using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::kPortCount;
using mediaserver::PortDefinition;

std::string describe(const omx_message& message) {
  static constexpr const char* kCommands[] = {"state", "flush", "disable", "enable", "mark"};
  if (message.type == omx_message::EMPTY_BUFFER_DONE) return "emptied";
  if (message.type == omx_message::FILL_BUFFER_DONE) return "filled";
  if (message.type != omx_message::EVENT) return "unknown";
  const auto& data = message.u.event_data;
  if (data.event == OMX_EventCmdComplete && data.data1 < std::size(kCommands))
    return String8::format("complete %s %u", kCommands[data.data1], data.data2).string();
  if (data.event == OMX_EventError) return String8::format("error 0x%x", data.data1).string();
  if (data.event == OMX_EventPortSettingsChanged)
    return String8::format("settings %u 0x%x", data.data1, data.data2).string();
  if (data.event == OMX_EventBufferFlag)
    return String8::format("flag %u 0x%x", data.data1, data.data2).string();
  return String8::format("event %u %u %u", static_cast<unsigned>(data.event), data.data1, data.data2)
      .string();
}

OmxClient::OmxClient(const android::sp<android::IOMX>& omx, const char* component)
    : _omx(omx), _observer(new CollectingObserver) {
  EXPECT_EQ(_omx->allocateNode(component, _observer, &_node), android::OK) << component;
}

OmxClient::~OmxClient() {
  free();
}

status_t OmxClient::free() {
  if (_node == nullptr) return android::OK;
  const status_t status = _omx->freeNode(_node);
  _node = nullptr;
  return status;
}

OMX_STATETYPE OmxClient::state() const {
  OMX_STATETYPE state = OMX_StateInvalid;
  EXPECT_EQ(_omx->getState(_node, &state), android::OK);
  return state;
}

PortDefinition OmxClient::definition(OMX_U32 port) const {
  auto definition = makeRecord<PortDefinition>(port);
  EXPECT_EQ(get(OMX_IndexParamPortDefinition, &definition), kOk);
  return definition;
}

status_t OmxClient::define(OMX_U32 port, const PortDefinition& definition) {
  PortDefinition record = definition;
  record.nPortIndex = port;
  return set(OMX_IndexParamPortDefinition, record);
}

status_t OmxClient::give(OMX_U32 port, size_t size) {
  Buffer buffer;
  buffer.size = size != 0 ? size : definition(port).nBufferSize;
  void* data = nullptr;
  status_t status = kOk;
  if (_giving[port] == Giving::Allocate) {
    status = _omx->allocateBuffer(_node, port, buffer.size, &buffer.id, &data);
  } else {
    // The block keeps its dealer alive.
    buffer.block = (new android::MemoryDealer(buffer.size, "OmxClient"))->allocate(buffer.size);
    data = buffer.block->pointer();
    status = _giving[port] == Giving::Use
                 ? _omx->useBuffer(_node, port, buffer.block, &buffer.id)
                 : _omx->allocateBufferWithBackup(_node, port, buffer.block, &buffer.id);
  }
  if (status != kOk) return status;
  buffer.data = static_cast<uint8_t*>(data);
  _buffers[port].push_back(buffer);
  _given[buffer.id] = buffer;
  return kOk;
}

void OmxClient::populate(OMX_U32 port) {
  const PortDefinition wanted = definition(port);
  for (OMX_U32 i = 0; i < wanted.nBufferCountActual; ++i)
    EXPECT_EQ(give(port, wanted.nBufferSize), android::OK);
}

status_t OmxClient::freeBuffer(OMX_U32 port, size_t which) {
  std::vector<Buffer>& buffers = _buffers[port];
  const status_t status = _omx->freeBuffer(_node, port, buffers.at(which).id);
  buffers.erase(buffers.begin() + static_cast<ptrdiff_t>(which));
  return status;
}

void OmxClient::freeBuffers(OMX_U32 port) {
  while (!_buffers[port].empty()) EXPECT_EQ(freeBuffer(port), android::OK);
}

void OmxClient::toIdle() {
  EXPECT_EQ(command(OMX_CommandStateSet, OMX_StateIdle), android::OK);
  for (OMX_U32 port = 0; port < kPortCount; ++port) populate(port);
  expectComplete(OMX_CommandStateSet, OMX_StateIdle);
}

void OmxClient::toExecuting() {
  toIdle();
  complete(OMX_CommandStateSet, OMX_StateExecuting);
  messages().clear();
}

void OmxClient::fillAll() {
  for (size_t i = 0; i < _buffers[kOutputPort].size(); ++i) EXPECT_EQ(fill(i), android::OK);
}

status_t OmxClient::empty(size_t which, std::string_view text, OMX_U32 flags, OMX_TICKS timestamp) {
  const Buffer& buffer = _buffers[kInputPort].at(which);
  std::copy_n(text.begin(), std::min(text.size(), buffer.size), buffer.data);
  return _omx->emptyBuffer(_node, buffer.id, 0, static_cast<OMX_U32>(text.size()), flags, timestamp);
}

void OmxClient::expect(const Match& match, size_t count) {
  EXPECT_TRUE(_observer->messages.waitFor(match, count))
      << "heard " << ::testing::PrintToString(heard()) << " and waited for " << count;
}

Packet OmxClient::output(const omx_message& filled) const {
  const auto& data = filled.u.extended_buffer_data;
  const uint8_t* const begin = _given.at(data.buffer).data + data.range_offset;
  Packet packet;
  packet.bytes.assign(begin, begin + data.range_length);
  packet.timestamp = data.timestamp;
  packet.flags = data.flags;
  packet.offset = data.range_offset;
  return packet;
}

std::vector<Packet> OmxClient::outputs() const {
  std::vector<Packet> packets;
  for (const omx_message& message : _observer->messages.all()) {
    if (message.type == omx_message::FILL_BUFFER_DONE) packets.push_back(output(message));
  }
  return packets;
}

std::vector<std::string> OmxClient::heard() const {
  std::vector<std::string> words;
  for (const omx_message& message : _observer->messages.all()) words.push_back(describe(message));
  return words;
}

}  // namespace omxtest
