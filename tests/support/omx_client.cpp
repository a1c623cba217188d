#include "tests/support/omx_client.h"

#include <gtest/gtest.h>

#include <algorithm>

#include <utils/String8.h>

namespace omxtest {

using android::omx_message;
using android::status_t;
using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::kPortCount;
using mediaserver::PortDefinition;

void CollectingObserver::onMessage(const omx_message& message) {
  std::lock_guard<std::mutex> lock(_mutex);
  _messages.push_back(message);
  _changed.notify_all();
}

std::vector<omx_message> CollectingObserver::all() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _messages;
}

size_t CollectingObserver::count(const Match& match) const {
  std::lock_guard<std::mutex> lock(_mutex);
  return static_cast<size_t>(std::count_if(_messages.begin(), _messages.end(), match));
}

bool CollectingObserver::waitFor(const Match& match, size_t count, std::chrono::milliseconds limit) const {
  std::unique_lock<std::mutex> lock(_mutex);
  return _changed.wait_for(lock, limit, [&] {
    return static_cast<size_t>(std::count_if(_messages.begin(), _messages.end(), match)) >= count;
  });
}

void CollectingObserver::clear() {
  std::lock_guard<std::mutex> lock(_mutex);
  _messages.clear();
}

std::string describe(const omx_message& message) {
  static constexpr const char* kCommands[] = {"state", "flush", "disable", "enable", "mark"};
  if (message.type == omx_message::EMPTY_BUFFER_DONE) return "emptied";
  if (message.type == omx_message::FILL_BUFFER_DONE) return "filled";
  if (message.type != omx_message::EVENT) return "unknown";
  const auto& data = message.u.event_data;
  switch (data.event) {
    case OMX_EventCmdComplete:
      if (data.data1 >= std::size(kCommands)) break;
      return android::String8::format("complete %s %u", kCommands[data.data1], data.data2).string();
    case OMX_EventError:
      return android::String8::format("error 0x%x", data.data1).string();
    case OMX_EventPortSettingsChanged:
      return android::String8::format("settings %u 0x%x", data.data1, data.data2).string();
    case OMX_EventBufferFlag:
      return android::String8::format("flag %u 0x%x", data.data1, data.data2).string();
    default:
      break;
  }
  return android::String8::format("event %u %u %u", static_cast<unsigned>(data.event), data.data1, data.data2)
      .string();
}

OmxClient::OmxClient(const android::sp<android::IOMX>& omx, const char* component)
    : _omx(omx), _observer(new CollectingObserver) {
  EXPECT_EQ(_omx->allocateNode(component, _observer, &_node), android::OK) << component;
}

OmxClient::~OmxClient() {
  free();
}

status_t OmxClient::command(OMX_COMMANDTYPE command, OMX_U32 param) {
  return _omx->sendCommand(_node, command, static_cast<OMX_S32>(param));
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
  PortDefinition definition{};
  definition.nSize = sizeof(definition);
  definition.nVersion.s.nVersionMajor = 1;
  definition.nVersion.s.nVersionMinor = 1;
  definition.nPortIndex = port;
  EXPECT_EQ(_omx->getParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition)),
            android::OK);
  return definition;
}

status_t OmxClient::define(OMX_U32 port, const PortDefinition& definition) {
  PortDefinition record = definition;
  record.nPortIndex = port;
  return _omx->setParameter(_node, OMX_IndexParamPortDefinition, &record, sizeof(record));
}

OmxClient::Buffer OmxClient::allocate(OMX_U32 port, size_t size, status_t* status) {
  Buffer buffer;
  buffer.size = size;
  if (_giving[port] == Giving::Allocate) {
    void* data = nullptr;
    *status = _omx->allocateBuffer(_node, port, size, &buffer.id, &data);
    buffer.data = static_cast<uint8_t*>(data);
    return buffer;
  }
  // The block keeps its dealer alive.
  const android::sp<android::MemoryDealer> dealer = new android::MemoryDealer(size, "OmxClient");
  buffer.block = dealer->allocate(size);
  buffer.data = static_cast<uint8_t*>(buffer.block->pointer());
  *status = _giving[port] == Giving::Use
                ? _omx->useBuffer(_node, port, buffer.block, &buffer.id)
                : _omx->allocateBufferWithBackup(_node, port, buffer.block, &buffer.id);
  return buffer;
}

status_t OmxClient::give(OMX_U32 port, size_t size) {
  status_t status = android::OK;
  const Buffer buffer = allocate(port, size != 0 ? size : definition(port).nBufferSize, &status);
  if (status == android::OK) _buffers[port].push_back(buffer);
  return status;
}

void OmxClient::populate(OMX_U32 port) {
  const PortDefinition wanted = definition(port);
  for (OMX_U32 i = 0; i < wanted.nBufferCountActual; ++i)
    EXPECT_EQ(give(port, wanted.nBufferSize), android::OK);
}

status_t OmxClient::freeBuffer(OMX_U32 port, size_t which) {
  std::vector<Buffer>& buffers = _buffers[port];
  const status_t status = _omx->freeBuffer(_node, port, buffers.at(which).id);
  _retired.push_back(buffers[which]);
  buffers.erase(buffers.begin() + static_cast<ptrdiff_t>(which));
  return status;
}

void OmxClient::freeBuffers(OMX_U32 port) {
  while (!_buffers[port].empty()) EXPECT_EQ(freeBuffer(port), android::OK);
}

void OmxClient::complete(OMX_COMMANDTYPE kind, OMX_U32 param) {
  EXPECT_EQ(command(kind, param), android::OK);
  expectComplete(kind, param);
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

void OmxClient::idleToLoaded() {
  EXPECT_EQ(command(OMX_CommandStateSet, OMX_StateLoaded), android::OK);
  for (OMX_U32 port = 0; port < kPortCount; ++port) freeBuffers(port);
  expectComplete(OMX_CommandStateSet, OMX_StateLoaded);
}

status_t OmxClient::fill(size_t which) {
  return _omx->fillBuffer(_node, _buffers[kOutputPort].at(which).id);
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
  EXPECT_TRUE(_observer->waitFor(match, count))
      << "heard " << ::testing::PrintToString(heard()) << " and waited for " << count;
}

std::vector<Packet> OmxClient::outputs() const {
  std::vector<Packet> packets;
  for (const omx_message& message : _observer->all()) {
    if (message.type != omx_message::FILL_BUFFER_DONE) continue;
    const auto& data = message.u.extended_buffer_data;
    Packet packet;
    packet.timestamp = data.timestamp;
    packet.flags = data.flags;
    packet.offset = data.range_offset;
    const auto holds = [&](const Buffer& buffer) { return buffer.id == data.buffer; };
    for (const std::vector<Buffer>* list : {&_buffers[kOutputPort], &_retired}) {
      const auto buffer = std::find_if(list->begin(), list->end(), holds);
      if (buffer == list->end()) continue;
      const uint8_t* const begin = buffer->data + data.range_offset;
      if (buffer->data != nullptr) packet.bytes.assign(begin, begin + data.range_length);
      break;
    }
    packets.push_back(std::move(packet));
  }
  return packets;
}

std::vector<std::string> OmxClient::heard() const {
  std::vector<std::string> words;
  for (const omx_message& message : _observer->all()) words.push_back(describe(message));
  return words;
}

}  // namespace omxtest
