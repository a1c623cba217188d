#include "tests/tools/process.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>

namespace tooltest {

namespace {

constexpr int kLimit = 50'000;  // milliseconds

}  // namespace

Process::Process(std::vector<std::string> arguments, Streams streams) {
  std::string tool = OMXBRIDGE_TOOL;
  std::vector<char*> words{tool.data()};
  for (std::string& argument : arguments) words.push_back(argument.data());
  words.push_back(nullptr);
  int out[2] = {-1, -1};
  EXPECT_EQ(pipe2(out, O_CLOEXEC), 0);
  const std::string err = _directory.file("err");
  _pid = fork();
  if (_pid == 0) {
    for (const char* name : {"OMXBRIDGE_DEVICE", "OMXBRIDGE_LOG", "OMXBRIDGE_MEDIASERVER"}) unsetenv(name);
    for (std::string& each : streams.environment) putenv(each.data());
    dup2(open(streams.in.c_str(), O_RDONLY), STDIN_FILENO);
    dup2(streams.out.empty() ? out[1] : open(streams.out.c_str(), O_WRONLY), STDOUT_FILENO);
    dup2(open(err.c_str(), O_WRONLY | O_CREAT, 0600), STDERR_FILENO);
    execv(tool.c_str(), words.data());
    _exit(127);
  }
  close(out[1]);
  _out = out[0];
}

Process::~Process() {
  if (_out >= 0) close(_out);
  if (_pid < 0) return;
  kill(_pid, SIGKILL);
  waitpid(_pid, nullptr, 0);
}

void Process::closeOutput() {
  close(_out);
  _out = -1;
}

// Reads once; false at the end, or when nothing came in time.
bool Process::readOutput() {
  pollfd watched{_out, POLLIN, 0};
  if (poll(&watched, 1, kLimit) <= 0) return false;
  std::array<char, 65536> bytes{};
  const ssize_t count = read(_out, bytes.data(), bytes.size());
  _collected.append(bytes.data(), static_cast<size_t>(std::max<ssize_t>(count, 0)));
  return count > 0;
}

bool Process::waitForOutput(std::string_view text) {
  while (!contains(_collected, text)) {
    if (!readOutput()) return false;
  }
  return true;
}

void Process::signal(int number) const {
  EXPECT_EQ(kill(_pid, number), 0);
}

Ended Process::finish() {
  while (_out >= 0 && readOutput()) {
  }
  Ended run{.out = std::move(_collected)};
  const int handle = static_cast<int>(syscall(SYS_pidfd_open, _pid, 0));
  pollfd watched{handle, POLLIN, 0};
  EXPECT_EQ(poll(&watched, 1, kLimit), 1) << "still running";
  int status = 0;
  if (waitpid(_pid, &status, WNOHANG) == _pid) {
    _pid = -1;
    if (WIFEXITED(status)) run.exitCode = WEXITSTATUS(status);
    EXPECT_TRUE(WIFEXITED(status)) << "ended by signal " << WTERMSIG(status);
  }
  close(handle);
  run.err = contentOf(_directory.file("err"));
  return run;
}

}  // namespace tooltest
