#pragma once
// A plain client of IOMX for tests that drive a component without a session: one node, its buffers and its
// messages, with verbs for the usual steps. Steps that wait have a limit and report a failure of the test
// when it passes. Used by one thread; messages arrive on the server's.

#include <gtest/gtest.h>

#include <cstddef>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include <OMX_Component.h>
#include <binder/MemoryDealer.h>
#include <media/IOMX.h>
#include <media/stagefright/MediaErrors.h>

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
std::string describe(const android::omx_message& message);

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
  using BufferId = android::IOMX::buffer_id;
  struct Buffer {
    BufferId id = nullptr;
    android::sp<android::IMemory> block;  // null: allocated by the component
    uint8_t* data = nullptr;
    size_t size = 0;
  };

  // Allocates the node; a failure is the test's.
  OmxClient(const android::sp<android::IOMX>& omx, const char* component);
  ~OmxClient();  // frees the node
  OmxClient(const OmxClient&) = delete;
  OmxClient& operator=(const OmxClient&) = delete;

  android::IOMX::node_id node() const { return _node; }
  Messages& messages() { return _observer->messages; }

  // Statuses of the calls themselves.
  android::status_t command(OMX_COMMANDTYPE command, OMX_U32 param) {
    return _omx->sendCommand(_node, command, static_cast<OMX_S32>(param));
  }
  android::status_t free();  // freeNode; the destructor then leaves it
  OMX_STATETYPE state() const;
  mediaserver::PortDefinition definition(OMX_U32 port) const;
  android::status_t define(OMX_U32 port, const mediaserver::PortDefinition& definition);
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
  template <typename Record>
  android::status_t setConfig(OMX_INDEXTYPE index, const Record& record) {
    return _omx->setConfig(_node, index, &record, sizeof(record));
  }

  // How buffers of a port are given; default Use.
  void setGiving(OMX_U32 port, Giving giving) { _giving[port] = giving; }
  // Gives one buffer of the port's size, or of `size` bytes.
  android::status_t give(OMX_U32 port, size_t size = 0);
  // Gives what the definition asks for.
  void populate(OMX_U32 port);
  android::status_t freeBuffer(OMX_U32 port, size_t which = 0);
  void freeBuffers(OMX_U32 port);
  const std::vector<Buffer>& buffers(OMX_U32 port) const { return _buffers[port]; }

  // The whole way to a state through the states between, with buffers given.
  void toIdle();
  void toExecuting();

  android::status_t fill(size_t which) {
    return _omx->fillBuffer(_node, _buffers[mediaserver::kOutputPort].at(which).id);
  }
  void fillAll();
  android::status_t empty(size_t which, std::string_view text, OMX_U32 flags = 0, OMX_TICKS timestamp = 0);

  // Waits for `count` messages that match, counted from the last clear.
  void expect(const Match& match, size_t count = 1);
  void expectComplete(OMX_COMMANDTYPE command, OMX_U32 data) { expect(commandComplete(command, data)); }
  // Sends a command and waits until it is complete.
  void complete(OMX_COMMANDTYPE kind, OMX_U32 param) {
    EXPECT_EQ(command(kind, param), android::OK);
    expectComplete(kind, param);
  }
  // A filled buffer, and the outputs so far, as the client reads them.
  Packet output(const android::omx_message& filled) const;
  std::vector<Packet> outputs() const;
  // All messages in a few words.
  std::vector<std::string> heard() const;

 private:
  const android::sp<android::IOMX> _omx;
  const android::sp<CollectingObserver> _observer;
  android::IOMX::node_id _node = nullptr;
  Giving _giving[mediaserver::kPortCount] = {Giving::Use, Giving::Use};
  std::vector<Buffer> _buffers[mediaserver::kPortCount];
  std::map<BufferId, Buffer> _given;  // also those that were freed: messages may still name them
};

}  // namespace omxtest
