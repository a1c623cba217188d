// Ctrl-C (SIGTERM and SIGHUP, too) as a stop token. The first one asks for a clean end; the second ends the
// process at once, without its temporary files.
#pragma once

#include <stop_token>
#include <thread>

namespace tool {

class Interrupt {
 public:
  // On the main thread, before the process has a second one: every thread has to inherit the mask that
  // keeps the signals for ours. Also turns broken pipes into write errors.
  Interrupt();
  // The signals stay blocked: one that comes now must not kill a process that has done its work.
  ~Interrupt();
  Interrupt(const Interrupt&) = delete;
  Interrupt& operator=(const Interrupt&) = delete;

  std::stop_token token() const { return _source.get_token(); }
  bool requested() const { return _source.stop_requested(); }

 private:
  void watch() const;

  std::stop_source _source;
  int _signals = -1;  // a signalfd
  int _ended = -1;    // an eventfd: the watching thread is to end
  std::thread _watcher;
};

}  // namespace tool
