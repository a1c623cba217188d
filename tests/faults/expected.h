// What each fault has to lead to: results, log lines, and the waits that go on until the session ends. By
// what failed and in which step, so one rule answers for many faults.
#pragma once

#include "tests/core/session_fixture.h"
#include "tests/faults/life.h"

namespace omxtest {

struct Subject {
  const char* device;
  bool encoding;

  bool isTi() const { return std::string(device) == "omap4"; }
  // One, so that each is needed: but a decoder of TI's asks for four.
  size_t inputs() const { return isTi() && !encoding ? 4 : 1; }
};

inline void PrintTo(const Subject& subject, std::ostream* stream) {
  *stream << subject.device << (subject.encoding ? " encoder" : " decoder");
}

// That a life was what it had to be.
void expectAnswered(const Subject& subject, const Fault& fault, const Outcome& outcome, LogLines log);

}  // namespace omxtest
