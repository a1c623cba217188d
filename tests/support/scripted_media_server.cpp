#include "tests/support/scripted_media_server.h"

#include <gtest/gtest.h>

#include <vector>

#include <binder/IServiceManager.h>
#include <omxhost/services.h>
#include <utils/String16.h>

#include "host/mediaserver/media_player_service.h"

namespace omxtest {

namespace {

android::String16 serviceName() {
  return android::String16(mediaserver::kServiceName);
}

void publish(const android::sp<android::IOMX>& omx) {
  const android::sp<mediaserver::MediaPlayerService> service = new mediaserver::MediaPlayerService(omx);
  EXPECT_EQ(android::defaultServiceManager()->addService(serviceName(), service->asBinder()), android::OK);
}

}  // namespace

ScriptedMediaServer::ScriptedMediaServer(const char* device, std::chrono::milliseconds readingTime)
    : _loadedOnDemand(omxhost::setLoadOnDemand(false)) {
  if (device != nullptr && !omxhost::setDevice(device)) ADD_FAILURE() << "no device " << device;
  const omxhost::Device& posed = omxhost::posedDevice();
  std::vector<mediaserver::Component> list;
  if (posed.decoderComponent != nullptr) list.push_back(_decoder.component(posed.decoderComponent));
  if (posed.encoderComponent != nullptr) list.push_back(_encoder.component(posed.encoderComponent));
  _omx = new RecordingOmx(std::move(list), readingTime);
  serve();
}

ScriptedMediaServer::~ScriptedMediaServer() {
  unregister();
  omxhost::setLoadOnDemand(_loadedOnDemand);
  _omx->freeAbandonedNodes();
  EXPECT_EQ(leaks(), "");
  EXPECT_EQ(_omx->nodeCount(), _omx->outstandingNodes()) << "nodes are left in the server only";
}

void ScriptedMediaServer::unregister() {
  omxhost::removeService(serviceName());
}

void ScriptedMediaServer::serve() {
  publish(_omx);
}

void ScriptedMediaServer::serveWithoutOmx() {
  publish(nullptr);
}

std::string ScriptedMediaServer::leaks() const {
  const size_t nodes = _omx->outstandingNodes();
  const size_t buffers = _omx->outstandingBuffers();
  if (nodes + buffers == 0) return "";
  return std::to_string(nodes) + " nodes and " + std::to_string(buffers) + " buffers were not freed";
}

}  // namespace omxtest
