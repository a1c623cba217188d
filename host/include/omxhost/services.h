// What this port adds to the service manager. Any thread may call these functions.
//
// The media server is loaded on demand: looking up "media.player" while nobody has registered it loads
// libomxmediaserver.so, from the directory of this library or else as the system's loader finds it, and
// calls its entry point, which registers the service. OMXBRIDGE_MEDIASERVER names another file.
// A library that cannot be loaded is reported once, and the service stays unknown.
#pragma once

#include <utils/String16.h>

namespace omxhost {

// The entry point of a media server library: extern "C", no arguments, registers "media.player".
constexpr const char* kMediaServerEntryPoint = "omxhost_media_server_start";

// False where no service has that name. Whoever holds the service keeps it.
bool removeService(const android::String16& name);

// Off: an unregistered "media.player" is unknown and nothing is loaded. Returns the former setting.
bool setLoadOnDemand(bool enabled);

// Whether ProcessState::startThreadPool() was called.
bool isThreadPoolStarted();

}  // namespace omxhost
