#include "tools/commands/devices.h"

#include <nlohmann/json.hpp>

#include <binder/IServiceManager.h>
#include <media/IMediaPlayerService.h>
#include <omxhost/device.h>

#include "omxbridge/omxbridge.h"
#include "tools/base/text.h"
#include "tools/commands/summary.h"

namespace tool {

namespace {

using Json = nlohmann::ordered_json;

const char* versionName(int version) {
  switch (version) {
    case HW_VERSION_QCOM_OTHER:
      return "other Qualcomm";
    case HW_VERSION_MSM7X30:
      return "MSM7x30";
    case HW_VERSION_MSM8X55:
      return "MSM8x55";
    case HW_VERSION_MSM8X60:
      return "MSM8x60";
    case HW_VERSION_OMAP4:
      return "OMAP4";
    default:
      return "unknown";
  }
}

std::string versionText(int version) {
  return formatted("%d (%s)", version, versionName(version));
}

const char* orNone(const char* name) {
  return name != nullptr ? name : "none";
}

bool isNamed(const char* expected, const std::string& name) {
  return expected != nullptr && name == expected;
}

}  // namespace

std::string deviceLine() {
  const omxhost::Device& device = omxhost::posedDevice();
  return formatted("%s (ro.board.platform %s), hardware version %s", device.name, device.boardPlatform,
                   versionText(getHardwareBaseVersion()).c_str());
}

std::string componentsLine() {
  const omxhost::Device& device = omxhost::posedDevice();
  return formatted("%s, %s", orNone(device.encoderComponent), orNone(device.decoderComponent));
}

std::string listDevices(bool json) {
  const std::string chosen = omxhost::posedDevice().name;
  Json list = Json::array();
  std::string table = formatted("  %-12s %-12s %-19s %-29s %s\n", "DEVICE", "PLATFORM", "HARDWARE VERSION",
                                "ENCODER", "DECODER");
  for (const omxhost::Device& device : omxhost::devices()) {
    if (!omxhost::setDevice(device.name)) continue;
    const int version = getHardwareBaseVersion();
    list.push_back({{"name", device.name},
                    {"board_platform", device.boardPlatform},
                    {"hardware_version", version},
                    {"encoder", orNull(device.encoderComponent)},
                    {"decoder", orNull(device.decoderComponent)},
                    {"chosen", chosen == device.name}});
    table += formatted("%c %-12s %-12s %-19s %-29s %s\n", chosen == device.name ? '*' : ' ', device.name,
                       device.boardPlatform, versionText(version).c_str(), orNone(device.encoderComponent),
                       orNone(device.decoderComponent));
  }
  static_cast<void>(omxhost::setDevice(chosen));
  return json ? Json({{"devices", list}}).dump() + "\n" : table;
}

Result<std::string> listComponents(bool json) {
  android::sp<android::IMediaPlayerService> service;
  android::getService(android::String16("media.player"), &service);
  const android::sp<android::IOMX> omx = service != nullptr ? service->getOMX() : nullptr;
  if (omx == nullptr) {
    return Failure{ExitCode::Device,
                   "there is no media server: libomxmediaserver.so has to be beside the other libraries, or "
                   "OMXBRIDGE_MEDIASERVER to name it"};
  }
  android::List<android::IOMX::ComponentInfo> components;
  if (omx->listNodes(&components) != android::OK) {
    return Failure{ExitCode::Device, "the media server does not list its components"};
  }
  const omxhost::Device& device = omxhost::posedDevice();
  Json list = Json::array();
  std::string table = formatted("Device         %s\n", deviceLine().c_str());
  for (const auto& component : components) {
    const std::string name = component.mName.string();
    const bool isEncoder = isNamed(device.encoderComponent, name);
    const bool isDecoder = isNamed(device.decoderComponent, name);
    const char* const use = isEncoder ? "encoder" : isDecoder ? "decoder" : nullptr;
    const bool available = omx_component_is_available(name.c_str()) != 0;
    std::string roles;
    Json roleList = Json::array();
    for (const auto& role : component.mRoles) {
      roles += formatted(" %s", role.string());
      roleList.push_back(role.string());
    }
    list.push_back({{"name", name}, {"roles", roleList}, {"use", orNull(use)}, {"available", available}});
    table += formatted("%-14s %s%s%s\n", use != nullptr ? use : "not used", name.c_str(), roles.c_str(),
                       available ? "" : " (not available)");
  }
  if (components.empty()) table += "no components\n";
  if (!json) return table;
  return Json({{"device", device.name}, {"components", list}}).dump() + "\n";
}

}  // namespace tool
