#pragma once
// A whole media server for tests: the posed device's decoder and encoder as scripted components behind real
// nodes, behind a recording IOMX, registered as "media.player". While it lives, sessions find it; at its
// end it takes the service away and reports nodes that were not freed as test failures.
// One at a time in a process. Threads: as its parts; the object itself belongs to the test.

#include <gtest/gtest.h>

#include <chrono>

#include <binder/IServiceManager.h>
#include <omxhost/device.h>
#include <omxhost/services.h>
#include <utils/String16.h>

#include "host/mediaserver/media_player_service.h"
#include "tests/support/recording_omx.h"
#include "tests/support/script.h"

namespace omxtest {

class ScriptedMediaServer {
 public:
  // Poses as `device`, a name from the host's table. Product code detects the device once a process, so tests
  // for several devices run in processes of their own. `readingTime` is that of the server's nodes.
  explicit ScriptedMediaServer(const char* device,
                               std::chrono::milliseconds readingTime = std::chrono::milliseconds(500)) {
    omxhost::setLoadOnDemand(false);
    EXPECT_TRUE(omxhost::setDevice(device));
    const omxhost::Device& posed = omxhost::posedDevice();
    std::vector<mediaserver::Component> list;
    if (posed.decoderComponent != nullptr) list.push_back(_decoder.component(posed.decoderComponent));
    if (posed.encoderComponent != nullptr) list.push_back(_encoder.component(posed.encoderComponent));
    _omx = new RecordingOmx(_messages, std::move(list), readingTime);
    serve(_omx);
  }
  ~ScriptedMediaServer() {
    unregister();
    EXPECT_EQ(_omx->nodeCount(), 0u) << "nodes were not freed";
  }

  // Components carry the posed device's names. On a device without components the list is empty.
  Script& decoder() { return _decoder; }
  Script& encoder() { return _encoder; }
  RecordingOmx& omx() { return *_omx; }
  MessageTap& messages() { return _messages; }

  // The service is no longer found, until it is served again: with its IOMX or, with null, none to give.
  void unregister() { omxhost::removeService(_name); }
  void serve(const android::sp<android::IOMX>& omx) {
    const android::sp<mediaserver::MediaPlayerService> service = new mediaserver::MediaPlayerService(omx);
    EXPECT_EQ(android::defaultServiceManager()->addService(_name, service->asBinder()), android::OK);
  }

 private:
  const android::String16 _name{mediaserver::kServiceName};
  Script _decoder{Script::Kind::Decoder};
  Script _encoder{Script::Kind::Encoder};
  MessageTap _messages;
  android::sp<RecordingOmx> _omx;
};

}  // namespace omxtest
