#pragma once
// A whole media server for tests: the posed device's decoder and encoder as scripted components behind real
// nodes, behind a recording IOMX, registered as "media.player". While it lives, sessions find it; at its
// end it takes the service away and reports nodes that were not freed as test failures.
// One at a time in a process. Threads: as its parts; the object itself belongs to the test.

#include <chrono>
#include <string>

#include <omxhost/device.h>

#include "tests/support/recording_omx.h"
#include "tests/support/script.h"

namespace omxtest {

class ScriptedMediaServer {
 public:
  // Poses as `device`, a name from the host's table; null: as whatever the process poses as. Product code
  // detects the device once a process, so tests for several devices run in processes of their own.
  // `readingTime` is that of the server's nodes.
  explicit ScriptedMediaServer(const char* device = nullptr,
                               std::chrono::milliseconds readingTime = std::chrono::milliseconds(500));
  ~ScriptedMediaServer();
  ScriptedMediaServer(const ScriptedMediaServer&) = delete;
  ScriptedMediaServer& operator=(const ScriptedMediaServer&) = delete;

  // Components carry the posed device's names. On a device without components the list is empty.
  Script& decoder() { return _decoder; }
  Script& encoder() { return _encoder; }
  RecordingOmx& omx() { return *_omx; }
  MessageTap& messages() { return _omx->messages(); }

  // The service is no longer found, until `serve` puts it back.
  void unregister();
  void serve();
  // The service is found, but has no IOMX to give.
  void serveWithoutOmx();

  // Says what has not been freed; empty when everything was.
  std::string leaks() const;

 private:
  const bool _loadedOnDemand;  // as it was before
  Script _decoder{Script::Kind::Decoder};
  Script _encoder{Script::Kind::Encoder};
  android::sp<RecordingOmx> _omx;
};

}  // namespace omxtest
