#include "decoder/hardware_version_cache.h"

#include <stdint.h>

#include "core/shared_value.h"
#include "platform/hardware_version.h"

namespace {

SharedValue<int32_t> g_hwVersion(-1);  // -1: not asked for yet

}  // namespace

int cachedHardwareBaseVersion() {
  // Concurrent first calls store the same value.
  if (g_hwVersion == -1) g_hwVersion = getHardwareBaseVersion();
  return g_hwVersion;
}
