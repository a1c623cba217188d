#pragma once
// A plain client of IOMX for tests that drive a component without a session: one node, its buffers and its
// messages, with verbs for the usual steps. Steps that wait have a limit and report a failure of the test
// when it passes. Used by one thread; messages arrive on the server's.

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include <OMX_Component.h>
#include <binder/MemoryDealer.h>
#include <media/IOMX.h>

#include "host/mediaserver/codec.h"
#include "tests/support/message_tap.h"
#include "tests/support/packet.h"
#include "tests/support/script.h"

namespace omxtest {

// Collects a node's messages in order.
class CollectingObserver : public android::BnOMXObserver {
 public:
  void onMessage(const android::omx_message& message) override;

  std::vector<android::omx_message> all() const;
  size_t count(const Match& match) const;
  [[nodiscard]] bool waitFor(const Match& match, size_t count = 1,
                             std::chrono::milliseconds limit = kWaitLimit) const;
  void clear();

 private:
  mutable std::mutex _mutex;
  mutable std::condition_variable _changed;
  std::vector<android::omx_message> _messages;
};

// A message in a few words: "complete state 2", "complete disable 1", "error 0x80001012", "settings 1 0",
// "flag 1 0x1", "emptied", "filled".
std::string describe(const android::omx_message& message);

enum class Giving { Use, Backup, Allocate };

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

  const android::sp<android::IOMX>& omx() const { return _omx; }
  android::IOMX::node_id node() const { return _node; }
  CollectingObserver& messages() { return *_observer; }

  // Statuses of the calls themselves.
  android::status_t command(OMX_COMMANDTYPE command, OMX_U32 param);
  android::status_t free();  // freeNode; the destructor then leaves it
  OMX_STATETYPE state() const;
  mediaserver::PortDefinition definition(OMX_U32 port) const;
  android::status_t define(OMX_U32 port, const mediaserver::PortDefinition& definition);

  // How buffers of a port are given; default Use.
  void setGiving(OMX_U32 port, Giving giving) { _giving[port] = giving; }
  // Gives one buffer of the port's size, or of `size` bytes.
  android::status_t give(OMX_U32 port, size_t size = 0);
  // Gives what the definition asks for.
  void populate(OMX_U32 port);
  android::status_t freeBuffer(OMX_U32 port, size_t which = 0);
  void freeBuffers(OMX_U32 port);
  const std::vector<Buffer>& buffers(OMX_U32 port) const { return _buffers[port]; }

  // The whole way to a state through the states between, with buffers given and freed where that is due.
  void toIdle();
  void toExecuting();
  void executingToIdle() { complete(OMX_CommandStateSet, OMX_StateIdle); }
  void idleToLoaded();

  android::status_t fill(size_t which);
  void fillAll();
  android::status_t empty(size_t which, std::string_view text, OMX_U32 flags = 0, OMX_TICKS timestamp = 0);

  // Waits for `count` messages that match, counted from the last clear.
  void expect(const Match& match, size_t count = 1);
  void expectComplete(OMX_COMMANDTYPE command, OMX_U32 data) { expect(commandComplete(command, data)); }
  // Sends a command and waits until it is complete.
  void complete(OMX_COMMANDTYPE command, OMX_U32 param);
  // The outputs so far, as the client reads them.
  std::vector<Packet> outputs() const;
  // All messages in a few words.
  std::vector<std::string> heard() const;

 private:
  Buffer allocate(OMX_U32 port, size_t size, android::status_t* status);

  const android::sp<android::IOMX> _omx;
  const android::sp<CollectingObserver> _observer;
  android::IOMX::node_id _node = nullptr;
  Giving _giving[mediaserver::kPortCount] = {Giving::Use, Giving::Use};
  std::vector<Buffer> _buffers[mediaserver::kPortCount];
  std::vector<Buffer> _retired;  // freed ones: messages may still name them
};

}  // namespace omxtest
