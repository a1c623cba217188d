// A session's whole life as an application leads it, through the C interface: each step until nothing moves
// any more, so that all lives of a kind take the same way up to their fault.
#pragma once

#include <functional>
#include <map>
#include <optional>
#include <string>

#include "tests/faults/injector.h"
#include "tests/faults/worker.h"

namespace omxtest {

struct Outcome {
  std::map<Step, int> results;  // of the steps that were taken; of several calls the first that is not 0
  std::optional<Step> stuck;    // the one that had to be helped: nobody was going to end its wait
  std::string hang;             // what did not end in spite of that; empty: nothing
  size_t pictures = 0;          // delivered
};

class Life {
 public:
  static constexpr size_t kFrames = 2;  // of each feeding step

  // The calls are the owner's; `other` destroys the session while the owner is stuck.
  Life(ScriptedMediaServer& server, Injector& injector, bool encoding, Worker& owner, Worker& other)
      : _server(server), _injector(injector), _encoding(encoding), _owner(owner), _other(other) {}

  Outcome live();

 private:
  // One call; false when the session is gone.
  bool take(Step step, const std::function<int()>& call);
  bool create();
  int configure();
  bool feed(Step step);
  bool run();
  void help(Step step);
  bool ends(const std::function<bool()>& ended);
  void settle();

  static int onInput(void* /*session*/, void* /*context*/) { return 0; }
  static int onOutput(void* first, void* data, unsigned int length, void* bufferId, void* context,
                      unsigned int timestamp);

  ScriptedMediaServer& _server;
  Injector& _injector;
  const bool _encoding;
  Worker& _owner;
  Worker& _other;
  void* _session = nullptr;
  std::atomic<size_t> _pictures{0};
  Outcome _outcome;
};

}  // namespace omxtest
