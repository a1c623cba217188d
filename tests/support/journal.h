#pragma once
// What happens, in its order: written by any thread, read and waited for by any other. Matches run with the
// lock held and must not call the journal.

#include <algorithm>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <mutex>
#include <vector>

#include "tests/support/eventually.h"

namespace omxtest {

template <typename Entry>
class Journal {
 public:
  using Match = std::function<bool(const Entry&)>;

  void add(const Entry& entry) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _entries.push_back(entry);
    _changed.notify_all();
  }
  void clear() {
    const std::lock_guard<std::mutex> lock(_mutex);
    _entries.clear();
  }
  std::vector<Entry> all() const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return _entries;
  }
  size_t count(const Match& match) const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return matching(match);
  }
  // Until so many match.
  [[nodiscard]] bool waitFor(const Match& match, size_t count = 1,
                             std::chrono::milliseconds limit = kWaitLimit) const {
    std::unique_lock<std::mutex> lock(_mutex);
    return _changed.wait_for(lock, limit, [&] { return matching(match) >= count; });
  }

 private:
  size_t matching(const Match& match) const {
    return static_cast<size_t>(std::count_if(_entries.begin(), _entries.end(), match));
  }

  mutable std::mutex _mutex;
  mutable std::condition_variable _changed;
  std::vector<Entry> _entries;
};

}  // namespace omxtest
