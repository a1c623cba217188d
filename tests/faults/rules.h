// What a refused IOMX call leads to: one row for all calls of a kind. The first row that fits counts.
#pragma once

#include <string>

#include "tests/faults/injector.h"

namespace omxtest {

struct Subject;

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
  Method method;
  OMX_U32 what;      // index, or 100 * (command + 1) + its parameter; 0: any
  int port;          // -1: any
  size_t nth;        // of its like in the step; 0: any further one
  int code;          // the step's result; of a reconfiguration, that of the end
  std::string line;  // may name $status, $hex, $index, $name, $port and $buffer; empty: silence
  Effect effect = Effect::None;
};

inline constexpr const char* kNoFill = "OMXINTERFACE - fillBuffer failed w/ error 0x$hex";
inline constexpr const char* kNoBuffer =
    "OMXINTERFACE - Could not allocate memory: port $port buffer $buffer error $status(0x$hex)\n";

const Rule* findRule(const Subject& subject, const Hit& hit);

}  // namespace omxtest
