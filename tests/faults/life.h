// A session's whole life as an application leads it, through the C interface, with one fault in it: each step
// until nothing moves any more, so that all lives of a kind take the same way up to their fault. A life
// without a fault counts the places at which one could happen: it is the only list of them that there is.
#pragma once

#include <map>
#include <optional>
#include <string>

#include "tests/support/scripted_media_server.h"

namespace omxtest {

// What an application does in its order; only a decoder's output is reconfigured.
enum class Step { Create, Configure, Init, Feed, Reconfigure, FeedMore, EndOfInput, DeInit, Destroy };
inline constexpr size_t kFrames = 2;  // of each feeding step

// What goes wrong with an IOMX call, or with a message.
enum class Kind {
  None,
  Refused,  // the call
  Delayed,  // the message comes when nothing else moves any more
  Late,     // ... when the session is gone
  Forged    // ... with the id of no buffer, an event with that of no node
};

struct Fault {
  Kind kind = Kind::None;
  size_t number = 0;  // which call or message, from 1
};

// Where the fault has happened.
struct Hit {
  Step step{};
  std::string what;  // the call or the message in a few words
  size_t nth = 0;    // of its like in that step, from 1
};

struct Outcome {
  std::map<Step, int> results;  // of the steps that were taken; of several calls the first that is not 0
  std::optional<Step> stuck;    // nobody was going to end its wait: the session was destroyed
  size_t pictures = 0;          // delivered
  size_t calls = 0;             // to IOMX
  size_t messages = 0;
  std::optional<Hit> hit;  // empty if there were fewer than the fault's number
};

const char* name(Step step);
inline void PrintTo(Step step, std::ostream* stream) {
  *stream << name(step);
}
// A fault and where it happened, in words.
std::string describe(const Fault& fault, const std::optional<Hit>& hit);

Outcome live(ScriptedMediaServer& server, const Fault& fault, bool encoding);

// Whether there was a moment in this call at which every other thread of the process slept. A call that has
// not come back then waits for something that nobody is going to bring, so a hang is found at once and
// without a limit of time. A wait with such a limit counts as sleep: those of tests are longer than a test
// may take.
bool atStandstill();

}  // namespace omxtest
