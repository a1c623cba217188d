// What each fault has to lead to: results, log lines, and the waits that go on until the session ends. By
// what failed and in which step, so one rule answers for many faults.
#pragma once

#include <map>
#include <optional>
#include <string>

#include <omxhost/device.h>

#include "tests/core/log_lines.h"
#include "tests/faults/life.h"

namespace omxtest {

struct Subject {
  const char* device;
  bool encoding;

  bool isTi() const { return std::string(device) == "omap4"; }
  // One, so that each is needed: but a decoder of TI's asks for four.
  size_t inputs() const { return isTi() && !encoding ? 4 : 1; }
  const char* component() const {
    const omxhost::Device& posed = *omxhost::findDevice(device);
    return encoding ? posed.encoderComponent : posed.decoderComponent;
  }
};

inline void PrintTo(const Subject& subject, std::ostream* stream) {
  *stream << subject.device << (subject.encoding ? " encoder" : " decoder");
}

// --- What a refused IOMX call leads to: one row for all calls of a kind. The first row that fits counts. ---

enum class Effect {
  None,
  LosesAPicture,
  EndsTheOutput,  // the end of the stream does not come out, or the component does not let go of its buffers
  TakesTheInput   // a buffer stays handed out
};

struct Rule {
  const char* device;  // null: both
  char session;        // 'E', 'D', or 'B' for both
  Step step;
  const char* method;  // its name's end: "Parameter" for both ways
  OMX_U32 what;        // index, or 100 * (command + 1) + its parameter; 0: any
  int port;            // -1: any
  size_t nth;          // of its like in the step; 0: any further one
  int code;            // the step's result, of a reconfiguration that of the end; see codeOf()
  std::string line;  // may name $status, $hex, $index, $name, $port, $buffer, $get and $side; empty: silence
  Effect effect = Effect::None;
};

inline constexpr const char* kNoFill = "OMXINTERFACE - fillBuffer failed w/ error 0x$hex";
inline constexpr const char* kNoBuffer =
    "OMXINTERFACE - Could not allocate memory: port $port buffer $buffer error $status(0x$hex)\n";

// Where a row is for both ways its positive code is the get's; the set's is the next one.
inline int codeOf(const Rule& rule, const Call& refused) {
  const bool set = rule.method == std::string("Parameter") && refused.method == Method::SetParameter;
  return set && rule.code > 0 ? rule.code + 1 : rule.code;
}

const Rule* findRule(const Subject& subject, const Hit& hit);

// --- What any fault leads to ---

struct Expected {
  std::map<Step, int> results;             // those that are not 0
  std::optional<Step> stuck;               // waits for what the fault keeps back
  LogLines lines;                          // besides those of every life
  std::string maybe;                       // one that depends on who is quicker; empty: none
  std::optional<size_t> picturesLost = 0;  // nothing: does not matter
  int endMarkEvents = 1;                   // that a decoder sees
};

Expected expected(const Subject& subject, const Fault& fault, const Hit& hit);

// How a life differs from what it had to be; empty if it does not.
std::string differences(const Subject& subject, const Fault& fault, const std::optional<Hit>& hit,
                        const Outcome& outcome, const LogLines& log);

}  // namespace omxtest
