#include "tools/base/interrupt.h"

#include <poll.h>
#include <signal.h>
#include <stdint.h>
#include <sys/eventfd.h>
#include <sys/signalfd.h>
#include <unistd.h>

#include "tools/base/failure.h"
#include "tools/base/temporary_files.h"

namespace tool {

Interrupt::Interrupt() {
  sigset_t mask;
  sigemptyset(&mask);
  sigaddset(&mask, SIGINT);
  sigaddset(&mask, SIGTERM);
  sigaddset(&mask, SIGHUP);
  pthread_sigmask(SIG_BLOCK, &mask, nullptr);
  signal(SIGPIPE, SIG_IGN);
  _signals = signalfd(-1, &mask, SFD_CLOEXEC);
  if (_signals < 0) pthread_sigmask(SIG_UNBLOCK, &mask, nullptr);  // then they just kill
  _ended = eventfd(0, EFD_CLOEXEC);
  _watcher = std::thread([this] { watch(); });
}

Interrupt::~Interrupt() {
  const uint64_t one = 1;
  [[maybe_unused]] const ssize_t written = write(_ended, &one, sizeof(one));
  _watcher.join();
  close(_signals);
  close(_ended);
}

void Interrupt::watch() const {
  std::stop_source source = _source;
  for (;;) {
    pollfd watched[] = {{_signals, POLLIN, 0}, {_ended, POLLIN, 0}};
    if (poll(watched, 2, -1) < 0) continue;
    if (watched[1].revents != 0) return;
    signalfd_siginfo info;
    if (read(_signals, &info, sizeof(info)) != ssize_t{sizeof(info)}) continue;
    if (!source.request_stop()) {
      removeTemporaryFiles();
      _exit(static_cast<int>(ExitCode::Interrupted));
    }
  }
}

}  // namespace tool
