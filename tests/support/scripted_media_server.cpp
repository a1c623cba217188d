#include "tests/support/scripted_media_server.h"

#include <gtest/gtest.h>

#include <binder/IServiceManager.h>
#include <omxhost/services.h>
#include <utils/String16.h>

#include "host/mediaserver/media_player_service.h"

namespace omxtest {

ScriptedMediaServer::ScriptedMediaServer(const char* device, std::chrono::milliseconds readingTime) {
  omxhost::setLoadOnDemand(false);
  if (!omxhost::setDevice(device)) ADD_FAILURE() << "no device " << device;
  const omxhost::Device& posed = omxhost::posedDevice();
  std::vector<mediaserver::Component> list;
  if (posed.decoderComponent != nullptr) list.push_back(_decoder.component(posed.decoderComponent));
  if (posed.encoderComponent != nullptr) list.push_back(_encoder.component(posed.encoderComponent));
  _omx = new RecordingOmx(_messages, std::move(list), readingTime);
  serve(_omx);
}

ScriptedMediaServer::~ScriptedMediaServer() {
  unregister();
  EXPECT_EQ(_omx->nodeCount(), 0u) << "nodes were not freed";
}

void ScriptedMediaServer::unregister() {
  omxhost::removeService(android::String16(mediaserver::kServiceName));
}

void ScriptedMediaServer::serve(const android::sp<android::IOMX>& omx) {
  const android::sp<mediaserver::MediaPlayerService> service = new mediaserver::MediaPlayerService(omx);
  const android::String16 name(mediaserver::kServiceName);
  EXPECT_EQ(android::defaultServiceManager()->addService(name, service->asBinder()), android::OK);
}

}  // namespace omxtest
