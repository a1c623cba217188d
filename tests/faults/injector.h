// Brings about one fault in a session's life and notes where it happened. Without a fault it counts the
// places at which one could: it is the only list of them that there is.
#pragma once

#include <array>
#include <atomic>
#include <map>
#include <mutex>
#include <optional>
#include <string>

#include "tests/core/faults.h"
#include "tests/support/scripted_media_server.h"

namespace omxtest {

// What an application does in its order; only a decoder's output is reconfigured.
enum class Step { Create, Configure, Init, Feed, Reconfigure, FeedMore, EndOfInput, DeInit, Destroy };
const char* name(Step step);

// Where something can go wrong, and how.
enum class Place { Call, Memory, Thread, Message };
inline constexpr size_t kPlaces = 4;
enum class Kind {
  None,
  Refused,   // an IOMX call, a block of shared memory, a thread
  Lost,      // a message that never comes
  Withheld,  // ... that comes when a call cannot go on without it
  Delayed,   // ... when nothing else moves any more
  Late,      // ... when the session is gone
  Doubled,   // twice in a row
  Forged     // with the id of no buffer, an event with that of no node
};

struct Fault {
  Kind kind = Kind::None;
  Place place = Place::Call;
  size_t number = 0;  // which of them, from 1
};

// Where the fault has happened.
struct Hit {
  Step step{};
  size_t nth = 0;  // of its like in that step, from 1
  Call call;       // of Place::Call
  OMX_U32 port = 0;
  android::omx_message message{};  // of Place::Message, as the component sent it
};

class Injector {
 public:
  Injector(ScriptedMediaServer& server, const Fault& fault);
  ~Injector();
  Injector(const Injector&) = delete;
  Injector& operator=(const Injector&) = delete;

  // The life comes to a step.
  void enter(Step step);
  // Lets the message go that such a fault has kept; false if there is none.
  bool release(Kind kind);
  // Until both of a doubled message have been dealt with: what the second does must not depend on how
  // quickly the first has been.
  void awaitRepeat() const;

  // How many of each place there were.
  std::array<size_t, kPlaces> counts() const;
  // Empty if there were fewer than the fault's number.
  std::optional<Hit> hit() const;
  std::string describe() const;

 private:
  bool refuses(const Call& call);
  Fate fate(android::omx_message& message);
  uint64_t threadsMade() const;
  uint64_t asked() const;

  ScriptedMediaServer& _server;
  const Fault _fault;
  const faults::Fault _threadFault;
  std::atomic<bool> _happened{false};  // to a call or a message
  mutable std::mutex _mutex;           // guards everything below
  Step _step = Step::Destroy;          // of nobody yet
  size_t _calls = 0;
  size_t _messages = 0;
  std::map<std::array<OMX_U32, 5>, size_t> _alike;  // how many of each in this step
  Hit _hit;
};

// The port that a call is about, of whatever method.
OMX_U32 portOf(const Call& call);

}  // namespace omxtest
