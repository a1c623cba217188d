// Detection of the platform family and the chip generation.
#include <string.h>

#include <array>

#include <cutils/properties.h>

#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"
#include "platform/soc_build_id.h"

namespace {

using PropertyValue = std::array<char, PROPERTY_VALUE_MAX>;

PropertyValue readBoardPlatform() {
  PropertyValue value{};
  property_get("ro.board.platform", value.data(), "");
  return value;
}

bool startsWith(const PropertyValue& value, const char* prefix) {
  return strncasecmp(value.data(), prefix, strlen(prefix)) == 0;
}

}  // namespace

SharedValue<int32_t> CBoardPlatformWrapper::_BoardPlatformType(BOARD_PLATFORM_UNDETECTED);

int CBoardPlatformWrapper::GetBoardPlatformType() {
  // Concurrent first calls detect and store the same value.
  if (_BoardPlatformType != BOARD_PLATFORM_UNDETECTED) return _BoardPlatformType;
  const PropertyValue platform = readBoardPlatform();
  if (startsWith(platform, "msm")) {
    _BoardPlatformType = BOARD_PLATFORM_QCOM;
  } else if (startsWith(platform, "omap")) {
    _BoardPlatformType = BOARD_PLATFORM_TI;
  } else {
    _BoardPlatformType = BOARD_PLATFORM_OTHER;
  }
  return _BoardPlatformType;
}

int getHardwareBaseVersion() {
  if (startsWith(readBoardPlatform(), "omap4")) return HW_VERSION_OMAP4;
  std::array<char, 4> id{};
  if (readSocBuildId(id.data(), id.size()) != static_cast<int>(id.size())) return HW_VERSION_UNKNOWN;

  // The second byte is the variant within a family: 7630 and 7x30 are the same chip to us.
  struct Chip {
    char pattern[5];
    int version;
  };
  static constexpr Chip kChips[] = {
      {"7?30", HW_VERSION_MSM7X30}, {"8?55", HW_VERSION_MSM8X55}, {"8?60", HW_VERSION_MSM8X60}};
  for (const Chip& chip : kChips) {
    if (id[0] == chip.pattern[0] && id[2] == chip.pattern[2] && id[3] == chip.pattern[3]) return chip.version;
  }
  return HW_VERSION_QCOM_OTHER;
}

const HardwareTraits& hardwareTraits(int hardwareVersion) {
  static constexpr HardwareTraits kOthers = {1920, 1088, 1, false};
  static constexpr HardwareTraits kMsm7x30 = {640, 480, 1, true};
  static constexpr HardwareTraits kMsm8x55 = {640, 480, 1, false};
  static constexpr HardwareTraits kMsm8x60 = {1920, 1088, 2048, false};
  switch (hardwareVersion) {
    case HW_VERSION_MSM7X30:
      return kMsm7x30;
    case HW_VERSION_MSM8X55:
      return kMsm8x55;
    case HW_VERSION_MSM8X60:
      return kMsm8x60;
    default:
      return kOthers;
  }
}
