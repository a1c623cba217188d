#include <stdlib.h>
#include <string.h>

#include <algorithm>
#include <array>
#include <mutex>

#include <android/log.h>
#include <omxhost/device.h>

#include "host/system/property_store.h"

namespace omxhost {

namespace {

constexpr const char* kQcomDecoder = "OMX.qcom.video.decoder.avc";
constexpr const char* kQcomEncoder = "OMX.qcom.video.encoder.avc";
// The two signs at the end are part of the name.
constexpr const char* kTiDecoder = "OMX.TI.DUCATI1.VIDEO.DECODER==";
constexpr const char* kTiEncoder = "OMX.TI.DUCATI1.VIDEO.H264E";

// Pictures of 1920x1088, upright or on their side. By default there are two more output than input buffers:
// at its end a stream may owe a picture for each input, and clients no longer recycle then.
constexpr ComponentTraits kQcomComponents{.vendor = Vendor::Qualcomm,
                                          .encoderInput = PictureLayout::SemiPlanar,
                                          .decoderOutput = PictureLayout::SemiPlanar,
                                          .baselineOnly = false,
                                          .largestPicture = 120 * 68,
                                          .encoderBuffers = {.input = 4, .output = 6},
                                          .decoderBuffers = {.input = 4, .output = 8}};

constexpr ComponentTraits baselineOnly(ComponentTraits traits) {
  traits.baselineOnly = true;
  return traits;
}

constexpr ComponentTraits tiled(ComponentTraits traits) {
  traits.encoderInput = PictureLayout::SemiPlanarAligned;
  traits.decoderOutput = PictureLayout::Tiled;
  return traits;
}

constexpr ComponentTraits kTiComponents{.vendor = Vendor::Ti,
                                        .encoderInput = PictureLayout::TiPacked,
                                        .decoderOutput = PictureLayout::TiPadded,
                                        .baselineOnly = false,
                                        .largestPicture = 120 * 68,
                                        .encoderBuffers = {.input = 2, .output = 4},
                                        .decoderBuffers = {.input = 4, .output = 8}};

constexpr std::array<Device, 7> kDevices{{
    {.name = "msm7x30",
     .boardPlatform = "msm7x30",
     .buildId = "7x30",
     .decoderComponent = kQcomDecoder,
     .encoderComponent = kQcomEncoder,
     .components = baselineOnly(kQcomComponents)},
    {.name = "msm8x55",
     .boardPlatform = "msm8x55",
     .buildId = "8x55",
     .decoderComponent = kQcomDecoder,
     .encoderComponent = kQcomEncoder,
     .components = kQcomComponents},
    {.name = "msm8x60",
     .boardPlatform = "msm8x60",
     .buildId = "8x60",
     .decoderComponent = kQcomDecoder,
     .encoderComponent = kQcomEncoder,
     .components = tiled(kQcomComponents)},
    // Not "8960": a reader that skips the variant digit, as ours does, would take that for an 8x60.
    {.name = "msm8960",
     .boardPlatform = "msm8960",
     .buildId = "M8960A",
     .decoderComponent = kQcomDecoder,
     .encoderComponent = kQcomEncoder,
     .components = kQcomComponents},
    {.name = "omap4",
     .boardPlatform = "omap4",
     .buildId = nullptr,
     .decoderComponent = kTiDecoder,
     .encoderComponent = kTiEncoder,
     .components = kTiComponents},
    // A known vendor whose generation cannot be told.
    {.name = "msm-unknown",
     .boardPlatform = "msm7627a",
     .buildId = nullptr,
     .decoderComponent = kQcomDecoder,
     .encoderComponent = kQcomEncoder,
     .components = kQcomComponents},
    // A vendor that nobody supports.
    {.name = "exynos4",
     .boardPlatform = "exynos4",
     .buildId = nullptr,
     .decoderComponent = nullptr,
     .encoderComponent = nullptr,
     .components = {}},
}};

constexpr const char* kDefaultName = "msm8960";

// Never destroyed: threads may still ask while the process exits.
struct Pose {
  std::mutex mutex;
  const Device* device = nullptr;
  std::optional<std::string> buildId;

  static Pose& instance() {
    static Pose& pose = *new Pose();
    return pose;
  }

  // The lock is held. The store has a lock of its own, taken after this one.
  void take(const Device& chosen) {
    device = &chosen;
    buildId = chosen.buildId != nullptr ? std::make_optional<std::string>(chosen.buildId) : std::nullopt;
    storeProperty("ro.board.platform", chosen.boardPlatform);
  }

  void settle() {
    if (device == nullptr) take(fromEnvironment());
  }

 private:
  static const Device& fromEnvironment() {
    const char* const name = getenv("OMXBRIDGE_DEVICE");
    if (name == nullptr || *name == '\0') return *findDevice(kDefaultName);
    const Device* const chosen = findDevice(name);
    if (chosen != nullptr) return *chosen;
    std::string known;
    for (const Device& each : kDevices) known.append(known.empty() ? "" : ", ").append(each.name);
    __android_log_print(ANDROID_LOG_ERROR, "omxhost",
                        "OMXBRIDGE_DEVICE: no device \"%s\"; known are %s; this is now %s", name,
                        known.c_str(), kDefaultName);
    return *findDevice(kDefaultName);
  }
};

}  // namespace

std::span<const Device> devices() {
  return kDevices;
}

const Device* findDevice(std::string_view name) {
  const auto* const found = std::find_if(kDevices.begin(), kDevices.end(),
                                         [name](const Device& each) { return name == each.name; });
  return found != kDevices.end() ? found : nullptr;
}

const Device& posedDevice() {
  Pose& pose = Pose::instance();
  const std::lock_guard lock(pose.mutex);
  pose.settle();
  return *pose.device;
}

bool setDevice(std::string_view name) {
  const Device* const chosen = findDevice(name);
  if (chosen == nullptr) return false;
  Pose& pose = Pose::instance();
  const std::lock_guard lock(pose.mutex);
  pose.take(*chosen);
  return true;
}

void setBuildId(std::optional<std::string> content) {
  Pose& pose = Pose::instance();
  const std::lock_guard lock(pose.mutex);
  pose.settle();
  pose.buildId = std::move(content);
}

int readSocBuildId(char* bytes, size_t count) {
  Pose& pose = Pose::instance();
  const std::lock_guard lock(pose.mutex);
  pose.settle();
  if (!pose.buildId) return -1;
  return static_cast<int>(pose.buildId->copy(bytes, count));
}

}  // namespace omxhost
