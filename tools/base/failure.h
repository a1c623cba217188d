// How the tool reports that something went wrong: a text for the user that says what to do, and the exit
// code that goes with it. Errors travel as values; there are no exceptions between functions.
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <variant>

namespace tool {

// Documented in --help; scripts rely on the numbers.
enum class ExitCode : int {
  Done = 0,
  Failed = 1,         // a session reported a failure while it ran
  Usage = 2,          // the command line
  Input = 3,          // the input cannot be read, or is not what it should be
  Output = 4,         // an output cannot be written
  Device = 5,         // the device has no such component, or it refuses the settings
  Interrupted = 130,  // Ctrl-C; what was done until then has been written
};

struct Failure {
  ExitCode code;
  std::string text;  // one sentence, names the file or device it is about
};

// Nothing: success.
using Outcome = std::optional<Failure>;

// A value, or why there is none.
template <typename T>
class [[nodiscard]] Result {
 public:
  Result(T value) : _content(std::move(value)) {}
  Result(Failure failure) : _content(std::move(failure)) {}

  bool ok() const { return std::holds_alternative<T>(_content); }
  // Only where ok().
  T& value() { return std::get<T>(_content); }
  const T& value() const { return std::get<T>(_content); }
  // Only where not ok().
  const Failure& failure() const { return std::get<Failure>(_content); }

 private:
  std::variant<T, Failure> _content;
};

}  // namespace tool
