// Many sessions at once, encoders and decoders mixed, each of them made, used for a while and destroyed, some
// in order and some in the middle of their work. Memory, descriptors, threads and latency have to stay level,
// and when all sessions are gone nothing of theirs may be left.
#include <stdio.h>
#include <stdlib.h>

#include <CLI/CLI.hpp>
#include <atomic>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include <omxhost/device.h>

#include "bench/soak/life.h"
#include "bench/soak/report.h"
#include "bench/soak/samples.h"
#include "tools/base/text.h"
#include "tools/files/output_file.h"

namespace bench {
namespace {

struct Settings {
  double seconds = 60;
  unsigned sessions = 64;
  unsigned drivers = 4;  // threads of the application
  uint32_t seed = 1;
  std::string report;
};

// What the libraries below keep for themselves (buffer pools, books of threads) does not come to as much.
constexpr double kHeapLeft = 256;  // KB

// The first failure of any thread.
class FirstFailure {
 public:
  void note(const tool::Outcome& outcome) {
    if (!outcome) return;
    const std::lock_guard held(_mutex);
    if (!_first) _first = outcome;
    happened = true;
  }
  const tool::Outcome& get() const { return _first; }

  std::atomic<bool> happened{false};

 private:
  std::mutex _mutex;
  tool::Outcome _first;
};

using Lives = std::vector<std::unique_ptr<Life>>;

std::vector<Sample> soak(const Settings& settings, Lives& lives, Latencies& latencies,
                         FirstFailure& failure) {
  const auto drive = [&](const std::stop_token& stop, unsigned driver) {
    while (!stop.stop_requested()) {
      for (size_t i = driver; i < lives.size(); i += settings.drivers) failure.note(lives[i]->step());
      std::this_thread::yield();  // the sessions' threads have the work
    }
  };
  std::vector<Sample> samples;
  std::vector<std::jthread> drivers;
  for (unsigned i = 0; i < settings.drivers; ++i) drivers.emplace_back(drive, i);
  const auto begin = tool::Clock::now();
  const auto interval = std::chrono::duration_cast<tool::Clock::duration>(
      std::chrono::duration<double>(settings.seconds / 300));
  for (auto next = begin; samples.size() < 300 && !failure.happened; next += interval) {
    std::this_thread::sleep_until(next);
    const std::chrono::duration<double> time = tool::Clock::now() - begin;
    samples.push_back({time.count(), usageNow(), latencies.take()});
  }
  return samples;
}

bool writePage(const Settings& settings, const std::string& title, const std::vector<Sample>& samples) {
  if (settings.report.empty()) return true;
  const std::string page = soakPage(title, samples);
  auto file = tool::OutputFile::create(settings.report);
  tool::Outcome failed;
  if (!file.ok()) failed = file.failure();
  if (!failed) failed = file.value()->write({reinterpret_cast<const uint8_t*>(page.data()), page.size()});
  if (!failed) failed = file.value()->commit();
  if (failed) fprintf(stderr, "soak: %s\n", failed->text.c_str());
  return !failed;
}

int run(const Settings& settings) {
  const auto material = makeMaterial({160, 128});
  if (!material.ok()) {
    fprintf(stderr, "soak: %s\n", material.failure().text.c_str());
    return 1;
  }
  const Usage before = usageNow();  // the media server has been loaded
  const double heapBefore = heapInUse();
  Latencies latencies;
  FirstFailure failure;
  Lives lives;
  for (unsigned i = 0; i < settings.sessions; ++i)
    lives.push_back(std::make_unique<Life>(material.value(), latencies, settings.seed + i));
  const std::vector<Sample> samples = soak(settings, lives, latencies, failure);
  uint64_t born = 0;
  for (const auto& life : lives) born += life->born();
  lives.clear();
  const Usage after = usageNow();
  const double heapLeft = (heapInUse() - heapBefore) / 1024;
  if (failure.get()) {
    fprintf(stderr, "soak: %s\n", failure.get()->text.c_str());
    return 1;
  }

  const std::string title = tool::formatted(
      "%u sessions at once for %.0f s on %s, %llu in all", settings.sessions, samples.back().time,
      omxhost::posedDevice().name, static_cast<unsigned long long>(born));
  printf("%s\n", title.c_str());
  bool isFlat = true;
  for (const Line& line : lines()) {
    const Flatness level = flatness(line, samples);
    isFlat = isFlat && level.isFlat;
    printf("%-12s %10.4g -> %10.4g  %s %s\n", line.name, level.before, level.after, line.unit,
           level.isFlat ? "" : "NOT FLAT");
  }
  const bool isGone =
      after.descriptors <= before.descriptors && after.threads <= before.threads && heapLeft <= kHeapLeft;
  printf("%-12s %.0f descriptors (%.0f before), %.0f threads (%.0f before), %.0f KB of heap%s\n", "Left",
         after.descriptors, before.descriptors, after.threads, before.threads, heapLeft,
         isGone ? "" : "  TOO MUCH");
  return writePage(settings, title, samples) && isFlat && isGone ? 0 : 1;
}

}  // namespace
}  // namespace bench

int main(int argc, char** argv) {
  bench::Settings settings;
  std::string device;
  CLI::App app{
      "Many sessions at once, made and destroyed all the time; fails unless what they use stays level"};
  app.add_option("--seconds", settings.seconds, "How long")
      ->check(CLI::Range(1.0, 1e6))
      ->capture_default_str();
  app.add_option("--sessions", settings.sessions, "How many at once")
      ->check(CLI::Range(1, 1000))
      ->capture_default_str();
  app.add_option("--drivers", settings.drivers, "Threads that drive them")
      ->check(CLI::Range(1, 64))
      ->capture_default_str();
  app.add_option("--seed", settings.seed, "Of the random order")->capture_default_str();
  app.add_option("--device", device, "The device to pose as");
  app.add_option("--report", settings.report, "Write a page with plots to this file");
  CLI11_PARSE(app, argc, argv);
  setenv("OMXBRIDGE_LOG", "silent", 0);  // sessions that are destroyed in the middle say so
  if (!device.empty() && !omxhost::setDevice(device)) {
    fprintf(stderr, "soak: no device %s\n", device.c_str());
    return 2;
  }
  return bench::run(settings);
}
