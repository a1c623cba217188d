// The whole life of a session, once for each thing that can go wrong in it: every call to IOMX refused, every
// message delayed, late and forged. Each time everything but the fault's own consequences
// is as in every other life, nobody waits for what can still come, and nothing is left behind.
#include <gtest/gtest.h>

#include <filesystem>

#include <omxhost/faults.h>
#include <omxhost/log.h>

#include "tests/core/bounded.h"
#include "tests/faults/expected.h"

namespace omxtest {
namespace {

size_t entryCount(const char* directory) {
  const std::filesystem::directory_iterator entries(directory);
  return static_cast<size_t>(std::distance(begin(entries), end(entries)));
}

// What a process has when no session and no server is there.
std::map<std::string, size_t> belongings() {
  return {{"objects", static_cast<size_t>(omxhost::liveObjects())},
          {"threads", entryCount("/proc/self/task")},
          {"files", entryCount("/proc/self/fd")}};  // each heap of shared memory is one
}

class FaultsTest : public ::testing::TestWithParam<Subject> {
 protected:
  // A life that has to be as expected.
  Outcome live(const Fault& fault) {
    Outcome outcome;
    LogLines lines;
    {
      const omxhost::LogCapture log;
      ScriptedMediaServer server(GetParam().device, std::chrono::milliseconds(0));
      for (Script* script : {&server.decoder(), &server.encoder()}) {
        script->editPort(0, [](auto& port) { port.nBufferCountActual = 1; });
        script->editPort(1, [](auto& port) { port.nBufferCountActual = 4; });
      }
      outcome = omxtest::live(server, fault, GetParam().encoding);
      lines = logLines(log);
    }
    SCOPED_TRACE(describe(fault, outcome.hit));
    expectAnswered(GetParam(), fault, outcome, lines);
    // A thread may still be on its way out when it has been joined.
    requireEventually([&] { return belongings() == _before || atStandstill(); }, "the end of all movement");
    const auto after = belongings();
    EXPECT_TRUE(after == _before || fault.kind == Kind::None) << ::testing::PrintToString(after);
    _before = after;
    return outcome;
  }

  std::map<std::string, size_t> _before = belongings();
};

TEST_P(FaultsTest, AreAnsweredOneByOne) {
  const Outcome whole = live({});  // what is made once a process is made now
  const Outcome again = live({});
  ASSERT_EQ(std::pair(again.calls, again.messages), std::pair(whole.calls, whole.messages));
  for (size_t i = 1; i <= whole.calls; ++i) live({Kind::Refused, i});
  for (size_t i = 1; i <= whole.messages; ++i) {
    for (const Kind kind : {Kind::Late, Kind::Delayed, Kind::Forged}) live({kind, i});
  }
}

INSTANTIATE_TEST_SUITE_P(Lives, FaultsTest,
                         ::testing::Values(Subject{"msm8960", true}, Subject{"msm8960", false},
                                           Subject{"omap4", true}, Subject{"omap4", false}));

}  // namespace
}  // namespace omxtest
