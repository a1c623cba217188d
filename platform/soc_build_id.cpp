#include "platform/soc_build_id.h"

#include <stdio.h>

int readSocBuildId(char* bytes, size_t count) {
  FILE* file = fopen("/sys/devices/system/soc/soc0/build_id", "r");
  if (file == nullptr) return -1;
  const size_t read = fread(bytes, 1, count, file);
  fclose(file);
  return static_cast<int>(read);
}
