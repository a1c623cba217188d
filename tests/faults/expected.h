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
