#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <algorithm>
#include <array>
#include <condition_variable>
#include <mutex>

#include <android/log.h>
#include <omxhost/log.h>

namespace omxhost {

struct LogCapture::State {
  mutable std::mutex mutex;
  mutable std::condition_variable arrived;
  std::vector<LogLine> lines;

  size_t countLocked(std::string_view part) const {
    return static_cast<size_t>(std::count_if(lines.begin(), lines.end(), [part](const LogLine& line) {
      return line.text.find(part) != std::string::npos;
    }));
  }
};

// Never destroyed: threads may still write while the process exits.
struct LogSinks {
  std::mutex mutex;
  std::vector<std::shared_ptr<LogCapture::State>> captures;
  const int level = levelFromEnvironment();

  static LogSinks& instance() {
    static LogSinks& sinks = *new LogSinks();
    return sinks;
  }

  void write(int priority, const char* tag, const char* text) {
    const std::lock_guard lock(mutex);
    for (const auto& capture : captures) {
      const std::lock_guard captureLock(capture->mutex);
      capture->lines.push_back({priority, tag, text});
      capture->arrived.notify_all();
    }
    if (captures.empty() && priority >= level && priority < ANDROID_LOG_SILENT) print(priority, tag, text);
  }

 private:
  static int levelFromEnvironment() {
    struct Name {
      const char* name;
      int level;
    };
    constexpr std::array<Name, 6> kNames{{{"verbose", ANDROID_LOG_VERBOSE},
                                          {"debug", ANDROID_LOG_DEBUG},
                                          {"info", ANDROID_LOG_INFO},
                                          {"warn", ANDROID_LOG_WARN},
                                          {"error", ANDROID_LOG_ERROR},
                                          {"silent", ANDROID_LOG_SILENT}}};
    const char* const wanted = getenv("OMXBRIDGE_LOG");
    if (wanted == nullptr || *wanted == '\0') return ANDROID_LOG_WARN;
    for (const Name& each : kNames) {
      if (strcmp(each.name, wanted) == 0) return each.level;
    }
    print(ANDROID_LOG_WARN, "omxhost",
          "OMXBRIDGE_LOG names no level: use verbose, debug, info, warn, error or silent");
    return ANDROID_LOG_WARN;
  }

  // One line in one write, so lines of several threads and processes stay whole.
  static void print(int priority, const char* tag, const char* text) {
    constexpr std::string_view kLetters = "??VDIWEF";
    const bool known = priority >= 0 && static_cast<size_t>(priority) < kLetters.size();
    std::string line(1, known ? kLetters[static_cast<size_t>(priority)] : '?');
    line.append("/").append(tag).append(": ").append(text);
    while (line.back() == '\n') line.pop_back();
    std::replace(line.begin(), line.end(), '\n', ' ');
    line += '\n';
    fwrite(line.data(), 1, line.size(), stderr);
  }
};

LogCapture::LogCapture() : _state(std::make_shared<State>()) {
  LogSinks& sinks = LogSinks::instance();
  const std::lock_guard lock(sinks.mutex);
  sinks.captures.push_back(_state);
}

LogCapture::~LogCapture() {
  LogSinks& sinks = LogSinks::instance();
  const std::lock_guard lock(sinks.mutex);
  std::erase(sinks.captures, _state);
}

std::vector<LogLine> LogCapture::lines() const {
  const std::lock_guard lock(_state->mutex);
  return _state->lines;
}

void LogCapture::clear() {
  const std::lock_guard lock(_state->mutex);
  _state->lines.clear();
}

size_t LogCapture::count(std::string_view part) const {
  const std::lock_guard lock(_state->mutex);
  return _state->countLocked(part);
}

bool LogCapture::waitFor(std::string_view part, std::chrono::milliseconds limit) const {
  std::unique_lock lock(_state->mutex);
  return _state->arrived.wait_for(lock, limit, [&] { return _state->countLocked(part) != 0; });
}

}  // namespace omxhost

namespace {

constexpr size_t kTextSize = 1024;  // with the terminator

}  // namespace

int __android_log_write(int prio, const char* tag, const char* text) {
  const std::string cut(text != nullptr ? text : "", text != nullptr ? strnlen(text, kTextSize - 1) : 0);
  omxhost::LogSinks::instance().write(prio, tag != nullptr ? tag : "", cut.c_str());
  return static_cast<int>(cut.size());
}

int __android_log_vprint(int prio, const char* tag, const char* fmt, va_list ap) {
  std::array<char, kTextSize> text{};
  // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the caller has started it
  if (vsnprintf(text.data(), text.size(), fmt, ap) < 0) return -1;
  return __android_log_write(prio, tag, text.data());
}

int __android_log_print(int prio, const char* tag, const char* fmt, ...) {
  va_list arguments;
  va_start(arguments, fmt);
  const int written = __android_log_vprint(prio, tag, fmt, arguments);
  va_end(arguments);
  return written;
}
