#include "tools/base/temporary_files.h"

#include <unistd.h>

#include <mutex>
#include <set>

namespace tool {

namespace {

struct Names {
  std::mutex mutex;
  std::set<std::string> paths;

  // Never destroyed: the process may end while the signal thread is in here.
  static Names& instance() {
    static Names& names = *new Names();
    return names;
  }
};

}  // namespace

void noteTemporaryFile(const std::string& path) {
  Names& names = Names::instance();
  const std::lock_guard held(names.mutex);
  names.paths.insert(path);
}

void forgetTemporaryFile(const std::string& path) {
  Names& names = Names::instance();
  const std::lock_guard held(names.mutex);
  names.paths.erase(path);
}

void removeTemporaryFiles() {
  Names& names = Names::instance();
  const std::lock_guard held(names.mutex);
  for (const std::string& path : names.paths) unlink(path.c_str());
  names.paths.clear();
}

}  // namespace tool
