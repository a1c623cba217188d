#pragma once
// A plain client of IOMX for tests that drive a component without a session: one node, its buffers and its
// messages, with verbs for the usual steps. Steps that wait have a limit and report a failure of the test
// when it passes. Used by one thread; messages arrive on the server's.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include <OMX_Component.h>
#include <binder/MemoryDealer.h>
#include <media/IOMX.h>
#include <media/stagefright/MediaErrors.h>
#include <utils/String8.h>

#include "host/mediaserver/codec.h"
#include "tests/support/call.h"
#include "tests/support/message_tap.h"

namespace omxtest {

inline constexpr auto kOk = static_cast<android::status_t>(android::OK);
inline constexpr auto kUnknownError = static_cast<android::status_t>(android::UNKNOWN_ERROR);
inline constexpr auto kUnsupported = static_cast<android::status_t>(android::ERROR_UNSUPPORTED);

// Collects a node's messages in order.
class CollectingObserver : public android::BnOMXObserver {
 public:
  void onMessage(const android::omx_message& message) override { messages.add(message); }

  Messages messages;
};

// A message in a few words: "complete state 2", "complete disable 1", "error 0x80001012", "settings 1 0",
// "flag 1 0x1", "emptied", "filled".
inline std::string describe(const android::omx_message& message) {
  static constexpr const char* kCommands[] = {"state", "flush", "disable", "enable", "mark"};
  if (message.type == android::omx_message::EMPTY_BUFFER_DONE) return "emptied";
  if (message.type == android::omx_message::FILL_BUFFER_DONE) return "filled";
  const auto& [event, data1, data2] = message.u.event_data;
  if (event == OMX_EventCmdComplete && data1 < std::size(kCommands))
    return android::String8::format("complete %s %u", kCommands[data1], data2).string();
  if (event == OMX_EventError) return android::String8::format("error 0x%x", data1).string();
  if (event == OMX_EventPortSettingsChanged)
    return android::String8::format("settings %u 0x%x", data1, data2).string();
  if (event == OMX_EventBufferFlag) return android::String8::format("flag %u 0x%x", data1, data2).string();
  return android::String8::format("event %u %u %u", static_cast<unsigned>(event), data1, data2).string();
}

enum class Giving { Use, Backup, Allocate };

template <typename Record>
Record makeRecord(OMX_U32 port) {
  Record record{};
  record.nSize = sizeof(record);
  record.nVersion.s.nVersionMajor = 1;
  record.nVersion.s.nVersionMinor = 1;
  record.nPortIndex = port;
  return record;
}

class OmxClient {
 public:
  using Definition = mediaserver::PortDefinition;
  struct Buffer {
    android::IOMX::buffer_id id = nullptr;
    android::sp<android::IMemory> block;  // null: allocated by the component
    uint8_t* data = nullptr;
    size_t size = 0;
  };

  // Allocates the node; a failure is the test's.
  OmxClient(const android::sp<android::IOMX>& omx, const char* component)
      : _omx(omx), _observer(new CollectingObserver) {
    EXPECT_EQ(_omx->allocateNode(component, _observer, &_node), kOk) << component;
  }
  ~OmxClient() { free(); }
  OmxClient(const OmxClient&) = delete;
  OmxClient& operator=(const OmxClient&) = delete;

  android::IOMX::node_id node() const { return _node; }
  Messages& messages() { return _observer->messages; }

  // Statuses of the calls themselves.
  android::status_t command(OMX_COMMANDTYPE command, OMX_U32 param) {
    return _omx->sendCommand(_node, command, static_cast<OMX_S32>(param));
  }
  android::status_t free() {
    const android::IOMX::node_id node = std::exchange(_node, nullptr);
    return node != nullptr ? _omx->freeNode(node) : kOk;
  }
  OMX_STATETYPE state() const {
    OMX_STATETYPE state = OMX_StateInvalid;
    EXPECT_EQ(_omx->getState(_node, &state), kOk);
    return state;
  }
  Definition definition(OMX_U32 port) const {
    auto definition = makeRecord<Definition>(port);
    EXPECT_EQ(get(OMX_IndexParamPortDefinition, &definition), kOk);
    return definition;
  }
  android::status_t define(OMX_U32 port, Definition definition) {
    definition.nPortIndex = port;
    return set(OMX_IndexParamPortDefinition, definition);
  }
  template <typename Record>
  android::status_t get(OMX_INDEXTYPE index, Record* record) const {
    return _omx->getParameter(_node, index, record, sizeof(*record));
  }
  template <typename Record>
  android::status_t set(OMX_INDEXTYPE index, const Record& record) {
    return _omx->setParameter(_node, index, &record, sizeof(record));
  }
  template <typename Record>
  android::status_t getConfig(OMX_INDEXTYPE index, Record* record) {
    return _omx->getConfig(_node, index, record, sizeof(*record));
  }

  // How buffers of a port are given; default Use.
  void setGiving(OMX_U32 port, Giving giving) { _giving[port] = giving; }
  // Gives one buffer of the port's size, or of `size` bytes.
  android::status_t give(OMX_U32 port, size_t size = 0) {
    Buffer buffer;
    buffer.size = size != 0 ? size : definition(port).nBufferSize;
    void* data = nullptr;
    android::status_t status = kOk;
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
  // Gives what the definition asks for.
  void populate(OMX_U32 port) {
    for (OMX_U32 left = definition(port).nBufferCountActual; left > 0; --left) EXPECT_EQ(give(port), kOk);
  }
  android::status_t freeBuffer(OMX_U32 port, size_t which = 0) {
    const android::IOMX::buffer_id id = _buffers[port].at(which).id;
    _buffers[port].erase(_buffers[port].begin() + static_cast<ptrdiff_t>(which));
    return _omx->freeBuffer(_node, port, id);
  }
  void freeBuffers(OMX_U32 port) {
    while (!_buffers[port].empty()) EXPECT_EQ(freeBuffer(port), kOk);
  }
  const std::vector<Buffer>& buffers(OMX_U32 port) const { return _buffers[port]; }

  // The whole way to a state through the states between, with buffers given.
  void toIdle() {
    EXPECT_EQ(command(OMX_CommandStateSet, OMX_StateIdle), kOk);
    for (OMX_U32 port = 0; port < mediaserver::kPortCount; ++port) populate(port);
    expectComplete(OMX_CommandStateSet, OMX_StateIdle);
  }
  void toExecuting() {
    toIdle();
    complete(OMX_CommandStateSet, OMX_StateExecuting);
    messages().clear();
  }

  android::status_t fill(size_t which) {
    return _omx->fillBuffer(_node, _buffers[mediaserver::kOutputPort].at(which).id);
  }
  void fillAll() {
    for (size_t i = 0; i < _buffers[mediaserver::kOutputPort].size(); ++i) EXPECT_EQ(fill(i), kOk);
  }
  android::status_t empty(size_t which, std::string_view text, OMX_U32 flags = 0, OMX_TICKS timestamp = 0) {
    const Buffer& buffer = _buffers[mediaserver::kInputPort].at(which);
    std::copy_n(text.begin(), std::min(text.size(), buffer.size), buffer.data);
    return _omx->emptyBuffer(_node, buffer.id, 0, static_cast<OMX_U32>(text.size()), flags, timestamp);
  }

  // Waits for `count` messages that match, counted from the last clear.
  void expect(const Match& match, size_t count = 1) {
    EXPECT_TRUE(messages().waitFor(match, count))
        << "heard " << ::testing::PrintToString(heard()) << " and waited for " << count;
  }
  void expectComplete(OMX_COMMANDTYPE command, OMX_U32 data) { expect(commandComplete(command, data)); }
  // Sends a command and waits until it is complete.
  void complete(OMX_COMMANDTYPE kind, OMX_U32 param) {
    EXPECT_EQ(command(kind, param), kOk);
    expectComplete(kind, param);
  }
  // The outputs so far, as the client reads them.
  std::vector<Packet> outputs() const {
    std::vector<Packet> packets;
    for (const android::omx_message& message : _observer->messages.all()) {
      if (message.type == android::omx_message::FILL_BUFFER_DONE) packets.push_back(output(message));
    }
    return packets;
  }
  // All messages in a few words.
  std::vector<std::string> heard() const {
    std::vector<std::string> words;
    for (const auto& message : _observer->messages.all()) words.push_back(describe(message));
    return words;
  }

 protected:
  // A filled buffer.
  Packet output(const android::omx_message& filled) const {
    const auto& data = filled.u.extended_buffer_data;
    const uint8_t* const begin = _given.at(data.buffer).data + data.range_offset;
    Packet packet;
    packet.bytes.assign(begin, begin + data.range_length);
    packet.timestamp = data.timestamp;
    packet.flags = data.flags;
    packet.offset = data.range_offset;
    return packet;
  }

 private:
  const android::sp<android::IOMX> _omx;
  const android::sp<CollectingObserver> _observer;
  android::IOMX::node_id _node = nullptr;
  Giving _giving[mediaserver::kPortCount] = {Giving::Use, Giving::Use};
  std::vector<Buffer> _buffers[mediaserver::kPortCount];
  std::map<android::IOMX::buffer_id, Buffer> _given;  // also freed ones: messages may still name them
};

}  // namespace omxtest
