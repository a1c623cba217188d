// The whole life of a session, once for each thing that can go wrong in it: every call to IOMX, every block
// of shared memory and every thread refused, every message lost, withheld, delayed, late, doubled and forged.
// Each time everything but the fault's own consequences is as in every other life, nobody waits for what can
// still come, and nothing is left behind.
#include <gtest/gtest.h>
#include <stdio.h>

#include <omxhost/faults.h>
#include <omxhost/log.h>

#include "tests/core/bounded.h"
#include "tests/faults/expected.h"
#include "tests/faults/standstill.h"

namespace omxtest {
namespace {

// What a process has when no session and no server is there.
struct Belongings {
  int64_t objects = omxhost::liveObjects();
  size_t threads = entryCount("/proc/self/task");
  size_t files = entryCount("/proc/self/fd");  // each heap of shared memory is one
  auto operator<=>(const Belongings&) const = default;
};

class FaultsTest : public ::testing::TestWithParam<Subject> {
 protected:
  struct Summary {
    size_t injected = 0;
    size_t answered = 0;
    size_t hangs = 0;
    size_t leaks = 0;
  };

  // One life; the places in it. Empty differences: as it has to be.
  std::array<size_t, kPlaces> live(const Fault& fault);
  // Whether a call had to be helped.
  bool wasStuck() const { return _stuck; }

  Worker _owner;
  Worker _other;
  Belongings _before;
  bool _stuck = false;
  Summary _summary;
};

std::array<size_t, kPlaces> FaultsTest::live(const Fault& fault) {
  const Subject& subject = GetParam();
  std::string wrong;
  std::string leaks;
  std::string what;
  std::array<size_t, kPlaces> counts{};
  {
    const omxhost::LogCapture log;
    ScriptedMediaServer server(subject.device, std::chrono::milliseconds(0));
    server.decoder().separatePorts();  // a decoder of that size would take its time
    for (Script* script : {&server.decoder(), &server.encoder()}) {
      script->editPort(0, [](auto& port) { port.nBufferCountActual = 1; });
      script->editPort(1, [](auto& port) { port.nBufferCountActual = 4; });
    }
    Injector injector(server, fault);
    hangReport() = [&] {
      fprintf(stderr, "%s\n", injector.describe().c_str());
      for (const std::string& line : logLines(log)) fprintf(stderr, "    %s\n", line.c_str());
    };
    const Outcome outcome = Life(server, injector, subject.encoding, _owner, _other).live();
    wrong = differences(subject, fault, injector.hit(), outcome, logLines(log));
    if (wrong.find("HANG") != wrong.npos) ++_summary.hangs;
    _stuck = outcome.stuck.has_value();
    counts = injector.counts();
    what = injector.describe();
    server.messages().forgetFreedNodes();
    server.omx().freeAbandonedNodes();
    leaks = server.leaks();
    hangReport() = nullptr;
  }
  // A thread may still be on its way out when it has been joined.
  requireEventually([&] { return Belongings() == _before || atStandstill(); }, "the end of all movement");
  const Belongings after;
  if (fault.kind != Kind::None && after != _before) {
    leaks += std::to_string(after.objects - _before.objects) + " objects, threads " +
             std::to_string(after.threads) + ", files " + std::to_string(after.files);
  }
  _before = after;
  if (!leaks.empty()) ++_summary.leaks;
  if (wrong.empty() && leaks.empty()) ++_summary.answered;
  ++_summary.injected;
  EXPECT_EQ(wrong, "") << what;
  EXPECT_EQ(leaks, "") << what;
  return counts;
}

TEST_P(FaultsTest, AreAnsweredOneByOne) {
  const std::array<size_t, kPlaces> places = live({});  // what is made once a process is made now
  ASSERT_EQ(live({}), places);
  _summary = {};
  for (const Place place : {Place::Call, Place::Memory, Place::Thread}) {
    for (size_t i = 1; i <= places[static_cast<size_t>(place)]; ++i) live({Kind::Refused, place, i});
  }
  for (size_t i = 1; i <= places[static_cast<size_t>(Place::Message)]; ++i) {
    live({Kind::Lost, Place::Message, i});
    if (wasStuck()) live({Kind::Withheld, Place::Message, i});  // the other way out
    for (const Kind kind : {Kind::Delayed, Kind::Late, Kind::Doubled, Kind::Forged}) {
      live({kind, Place::Message, i});
    }
  }
  printf(
      "%s %s: %zu calls, %zu blocks of memory, %zu threads, %zu messages: %zu faults injected, %zu answered, "
      "%zu hangs, %zu leaks\n",
      GetParam().device, GetParam().encoding ? "encoder" : "decoder", places[0], places[1], places[2],
      places[3], _summary.injected, _summary.answered, _summary.hangs, _summary.leaks);
}

INSTANTIATE_TEST_SUITE_P(Lives, FaultsTest,
                         ::testing::Values(Subject{"msm8960", true}, Subject{"msm8960", false},
                                           Subject{"omap4", true}, Subject{"omap4", false}));

}  // namespace
}  // namespace omxtest
