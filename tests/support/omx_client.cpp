#include "tests/support/omx_client.h"

#include <utils/String8.h>

namespace omxtest {

using android::omx_message;
using android::status_t;
using android::String8;

std::string describe(const omx_message& message) {
  static constexpr const char* kCommands[] = {"state", "flush", "disable", "enable", "mark"};
  if (message.type == omx_message::EMPTY_BUFFER_DONE) return "emptied";
  if (message.type == omx_message::FILL_BUFFER_DONE) return "filled";
  const auto& [event, data1, data2] = message.u.event_data;
  if (event == OMX_EventCmdComplete && data1 < std::size(kCommands))
    return String8::format("complete %s %u", kCommands[data1], data2).string();
  if (event == OMX_EventError) return String8::format("error 0x%x", data1).string();
  if (event == OMX_EventPortSettingsChanged)
    return String8::format("settings %u 0x%x", data1, data2).string();
  if (event == OMX_EventBufferFlag) return String8::format("flag %u 0x%x", data1, data2).string();
  return String8::format("event %u %u %u", static_cast<unsigned>(event), data1, data2).string();
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

}  // namespace omxtest
