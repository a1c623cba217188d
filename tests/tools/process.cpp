#include "tests/tools/process.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>

extern char** environ;

namespace tooltest {

namespace {

constexpr int kLimit = 50'000;  // milliseconds

std::vector<char*> pointers(std::vector<std::string>& texts) {
  std::vector<char*> result;
  for (std::string& text : texts) result.push_back(text.data());
  result.push_back(nullptr);
  return result;
}

}  // namespace

Process::Process(const std::vector<std::string>& arguments, const Streams& streams) {
  std::vector<std::string> words{OMXBRIDGE_TOOL};
  words.insert(words.end(), arguments.begin(), arguments.end());
  std::vector<std::string> environment = streams.environment;
  for (char** each = environ; *each != nullptr; ++each) {
    if (std::string_view(*each).starts_with("OMXBRIDGE_")) continue;
    environment.emplace_back(*each);
  }

  int out[2] = {-1, -1};
  EXPECT_EQ(pipe2(out, O_CLOEXEC), 0);
  const std::string err = _directory.file("err");

  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, STDIN_FILENO, streams.in.c_str(), O_RDONLY, 0);
  if (streams.out.empty()) {
    posix_spawn_file_actions_adddup2(&actions, out[1], STDOUT_FILENO);
  } else {
    posix_spawn_file_actions_addopen(&actions, STDOUT_FILENO, streams.out.c_str(), O_WRONLY, 0);
  }
  posix_spawn_file_actions_addopen(&actions, STDERR_FILENO, err.c_str(), O_WRONLY | O_CREAT, 0600);
  EXPECT_EQ(posix_spawn(&_pid, OMXBRIDGE_TOOL, &actions, nullptr, pointers(words).data(),
                        pointers(environment).data()),
            0);
  posix_spawn_file_actions_destroy(&actions);
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
bool Process::readOutput(int milliseconds) {
  pollfd watched{_out, POLLIN, 0};
  if (poll(&watched, 1, milliseconds) <= 0) return false;
  std::array<char, 65536> bytes{};
  const ssize_t count = read(_out, bytes.data(), bytes.size());
  if (count <= 0) return false;
  _collected.append(bytes.data(), static_cast<size_t>(count));
  return true;
}

bool Process::waitForOutput(std::string_view text) {
  while (_collected.find(text) == std::string::npos) {
    if (!readOutput(kLimit)) return false;
  }
  return true;
}

void Process::signal(int number) const {
  EXPECT_EQ(kill(_pid, number), 0);
}

Ended Process::finish() {
  while (_out >= 0 && readOutput(kLimit)) {
  }
  Ended run;
  const int handle = static_cast<int>(syscall(SYS_pidfd_open, _pid, 0));
  pollfd watched{handle, POLLIN, 0};
  if (poll(&watched, 1, kLimit) == 1) {
    int status = 0;
    EXPECT_EQ(waitpid(_pid, &status, 0), _pid);
    _pid = -1;
    if (WIFEXITED(status)) run.exitCode = WEXITSTATUS(status);
    if (WIFSIGNALED(status)) ADD_FAILURE() << "ended by signal " << WTERMSIG(status);
  } else {
    ADD_FAILURE() << "still running";
  }
  close(handle);
  run.out = std::move(_collected);
  run.err = contentOf(_directory.file("err"));
  return run;
}

}  // namespace tooltest
