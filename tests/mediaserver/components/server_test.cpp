// The library as clients find it: behind the service, with the posed device's components.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include <binder/IServiceManager.h>
#include <media/IMediaPlayerService.h>
#include <omxhost/device.h>

#include "host/mediaserver/components/component_list.h"

namespace componenttest {
namespace {

TEST(MediaServer, IsLoadedWhenItIsLookedUp) {
  const android::sp<android::IBinder> binder =
      android::defaultServiceManager()->getService(android::String16("media.player"));
  const auto service = android::interface_cast<android::IMediaPlayerService>(binder);
  ASSERT_NE(service.get(), nullptr);
  const android::sp<android::IOMX> omx = service->getOMX();
  ASSERT_NE(omx.get(), nullptr);
  android::List<android::IOMX::ComponentInfo> nodes;
  EXPECT_EQ(omx->listNodes(&nodes), android::OK);
  std::vector<std::string> names;
  for (const auto& each : nodes) names.emplace_back(each.mName.string());
  const omxhost::Device& device = omxhost::posedDevice();
  EXPECT_EQ(names, (std::vector<std::string>{device.decoderComponent, device.encoderComponent}));
}

TEST(MediaServer, HasWhatTheDevicesTableSays) {
  for (const omxhost::Device& device : omxhost::devices()) {
    const auto components = mediaserver::componentsOf(device);
    EXPECT_EQ(components.empty(), device.decoderComponent == nullptr) << device.name;
    for (const auto& each : components) EXPECT_FALSE(each.roles.empty());
  }
}

}  // namespace
}  // namespace componenttest
