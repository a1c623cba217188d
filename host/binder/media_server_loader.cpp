#include "host/binder/media_server_loader.h"

#include <dlfcn.h>
#include <stdlib.h>

#include <mutex>
#include <string>

#include <android/log.h>
#include <omxhost/services.h>

namespace omxhost {

namespace {

constexpr const char* kTag = "omxhost";
constexpr const char* kLibrary = "libomxmediaserver.so";

// With a slash at its end; empty where the system does not know.
std::string ownDirectory() {
  Dl_info info;
  if (dladdr(reinterpret_cast<const void*>(&loadMediaServer), &info) == 0 || info.dli_fname == nullptr) {
    return {};
  }
  const std::string path = info.dli_fname;
  return path.substr(0, path.rfind('/') + 1);
}

void load() {
  constexpr int kFlags = RTLD_NOW | RTLD_LOCAL;
  void* library = nullptr;
  std::string failure;
  const auto attempt = [&](const std::string& file) {
    library = dlopen(file.c_str(), kFlags);
    if (library == nullptr) failure += std::string(failure.empty() ? "" : "; ") + dlerror();
    return library != nullptr;
  };

  const char* const chosen = getenv("OMXBRIDGE_MEDIASERVER");
  if (chosen != nullptr && *chosen != '\0') {
    attempt(chosen);
  } else {
    const std::string directory = ownDirectory();
    if (directory.empty() || !attempt(directory + kLibrary)) attempt(kLibrary);
  }
  if (library == nullptr) {
    __android_log_print(ANDROID_LOG_WARN, kTag, "no media server: %s", failure.c_str());
    return;
  }

  const auto start = reinterpret_cast<void (*)()>(dlsym(library, kMediaServerEntryPoint));
  if (start == nullptr) {
    __android_log_print(ANDROID_LOG_WARN, kTag, "no media server: %s", dlerror());
    return;
  }
  start();
}

}  // namespace

void loadMediaServer() {
  static std::once_flag once;
  std::call_once(once, load);
}

}  // namespace omxhost
