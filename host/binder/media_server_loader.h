// Loads the media server library into the process. Called by the service manager, from any thread.
#pragma once

namespace omxhost {

// Loads the library and runs its entry point, once in the life of the process; further callers wait
// until that has happened. A failure is reported to the log and final. The library stays loaded.
void loadMediaServer();

}  // namespace omxhost
