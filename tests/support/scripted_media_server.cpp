#include "tests/support/scripted_media_server.h"

#include <gtest/gtest.h>

#include <vector>

#include <binder/IServiceManager.h>
#include <omxhost/services.h>
#include <utils/String16.h>

#include "host/mediaserver/media_player_service.h"

namespace omxtest {

namespace {

const android::String16& serviceName() {
  static const android::String16& kName = *new android::String16(mediaserver::kServiceName);
  return kName;
}

void publish(const android::sp<android::IOMX>& omx) {
  const android::sp<mediaserver::MediaPlayerService> service = new mediaserver::MediaPlayerService(omx);
  EXPECT_EQ(android::defaultServiceManager()->addService(serviceName(), service->asBinder()), android::OK);
}

std::vector<mediaserver::Component> components(const omxhost::Device& device, Script* decoder,
                                               Script* encoder) {
  std::vector<mediaserver::Component> list;
  if (device.decoderComponent != nullptr) list.push_back(decoder->component(device.decoderComponent));
  if (device.encoderComponent != nullptr) list.push_back(encoder->component(device.encoderComponent));
  return list;
}

const omxhost::Device& pose(const char* device) {
  if (device != nullptr && !omxhost::setDevice(device)) ADD_FAILURE() << "no device " << device;
  return omxhost::posedDevice();
}

}  // namespace

ScriptedMediaServer::ScriptedMediaServer(const char* device, std::chrono::milliseconds readingTime)
    : _decoder(std::make_unique<Script>(Script::Kind::Decoder)),
      _encoder(std::make_unique<Script>(Script::Kind::Encoder)),
      _server(
          new mediaserver::OmxServer(components(pose(device), _decoder.get(), _encoder.get()), readingTime)),
      _omx(new RecordingOmx(_server)),
      _loadedOnDemand(omxhost::setLoadOnDemand(false)) {
  serve();
}

ScriptedMediaServer::~ScriptedMediaServer() {
  unregister();
  omxhost::setLoadOnDemand(_loadedOnDemand);
  _omx->freeAbandonedNodes();
  EXPECT_EQ(leaks(), "");
  EXPECT_EQ(_server->nodeCount(), _omx->outstandingNodes()) << "nodes are left in the server only";
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
