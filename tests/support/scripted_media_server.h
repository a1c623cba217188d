#pragma once
// A whole media server for tests: the posed device's decoder and encoder as scripted components behind real
// nodes, behind a recording IOMX, registered as "media.player". While it lives, sessions find it; at its
// end it takes the service away and reports nodes that were not freed as test failures.
// One at a time in a process. Threads: as its parts; the object itself belongs to the test.

#include <chrono>

#include <omxhost/device.h>

#include "tests/support/recording_omx.h"
#include "tests/support/script.h"

namespace omxtest {

class ScriptedMediaServer {
 public:
  // Poses as `device`, a name from the host's table. Product code detects the device once a process, so tests
  // for several devices run in processes of their own. `readingTime` is that of the server's nodes.
  explicit ScriptedMediaServer(const char* device,
                               std::chrono::milliseconds readingTime = std::chrono::milliseconds(500));
  ~ScriptedMediaServer();

  // Components carry the posed device's names. On a device without components the list is empty.
  Script& decoder() { return _decoder; }
  Script& encoder() { return _encoder; }
  RecordingOmx& omx() { return *_omx; }
  MessageTap& messages() { return _messages; }

  // The service is no longer found, until it is served again: with its IOMX or, with null, none to give.
  void unregister();
  void serve(const android::sp<android::IOMX>& omx);

 private:
  Script _decoder{Script::Kind::Decoder};
  Script _encoder{Script::Kind::Encoder};
  MessageTap _messages;
  android::sp<RecordingOmx> _omx;
};

}  // namespace omxtest
