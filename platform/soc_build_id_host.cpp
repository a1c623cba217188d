#include <omxhost/device.h>

#include "platform/soc_build_id.h"

int readSocBuildId(char* bytes, size_t count) {
  return omxhost::readSocBuildId(bytes, count);
}
