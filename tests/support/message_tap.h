#pragma once
// Stands between a node and its client for messages: what the node sends passes the tap, which lets it
// through, keeps it for later, drops or repeats it, and can send messages of its own making. One tap serves
// any number of nodes; each client's messages are delivered on a thread of its own, one at a time, and
// never from inside a call of the test.
// All functions may be called from any thread, also from a delivery. Matches and filters run on the nodes'
// threads and must not call the tap. It outlives its nodes.

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <optional>

#include <media/IOMX.h>

#include "tests/support/journal.h"

namespace omxtest {

enum class Fate { Pass, Hold, Drop, Repeat };  // Repeat: delivered twice

// May change the message.
using Filter = std::function<Fate(android::omx_message&)>;
using Messages = Journal<android::omx_message>;
using Match = Messages::Match;

// Matches for the usual kinds of messages. Words that are not given may be any.
Match anyMessage();
Match anyEvent();
Match eventIs(OMX_EVENTTYPE event, std::optional<OMX_U32> data1 = {}, std::optional<OMX_U32> data2 = {});
Match commandComplete(OMX_COMMANDTYPE command, std::optional<OMX_U32> data = {});
Match emptyBufferDone();
Match fillBufferDone();

// Messages to forge.
android::omx_message makeEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2);
android::omx_message makeEmptyBufferDone(android::IOMX::buffer_id buffer);
android::omx_message makeFillBufferDone(android::IOMX::buffer_id buffer, OMX_U32 length, OMX_U32 flags = 0);

class MessageTap {
 public:
  using NodeId = android::IOMX::node_id;

  MessageTap();
  ~MessageTap();  // drops what is held, waits for deliveries in progress
  MessageTap(const MessageTap&) = delete;
  MessageTap& operator=(const MessageTap&) = delete;

  // From now on messages that match are kept, and others treated as before.
  void hold(const Match& match);
  // Decides about every message from now on. Null: all pass. What is held stays held.
  void setFilter(Filter filter);
  void passAll() { setFilter(nullptr); }

  [[nodiscard]] bool waitForHeld(size_t count, std::chrono::milliseconds limit = kWaitLimit) const;
  // Delivers the held message at `position`, counted from the oldest (so reordering is a choice of
  // positions); false if there is none. Also when its node has been freed: that is a late message.
  bool release(size_t position = 0);
  void releaseAll() {
    while (release()) {
    }
  }

  // A message out of nothing. The node in it is `node` unless it names one itself; it is delivered to
  // `node`'s client behind what waits there, also after freeNode. False for a node that never was, or that
  // was forgotten.
  bool forge(NodeId node, const android::omx_message& message);

  // Messages that clients have handled, that is: their function has returned.
  size_t deliveredCount(const Match& match) const { return _delivered.count(match); }
  [[nodiscard]] bool waitForDelivered(const Match& match, size_t count = 1) const {
    return _delivered.waitFor(match, count);
  }

  // Lets go of the clients of freed nodes, and of messages held for them.
  void forgetFreedNodes();

  // --- For RecordingOmx.

  // The observer to give to the server in the client's place. Null when there is no thread for it.
  android::sp<android::IOMXObserver> wrap(const android::sp<android::IOMXObserver>& client);
  void attach(const android::sp<android::IOMXObserver>& wrapped, NodeId node);
  // As freeNode: nothing more is delivered by itself, and no delivery is in progress (but the one that this
  // is called from). Held messages stay.
  void detach(NodeId node);

 private:
  class Observer;
  struct Held {
    android::sp<Observer> observer;
    android::omx_message message;
  };

  void onMessage(const android::sp<Observer>& observer, android::omx_message message);
  android::sp<Observer> find(NodeId node) const;

  Messages _delivered;
  mutable std::mutex _mutex;  // guards everything below; never held while a client is called
  mutable std::condition_variable _changed;
  Filter _filter;
  std::list<Held> _held;
  std::map<NodeId, android::sp<Observer>> _observers;
};

}  // namespace omxtest
