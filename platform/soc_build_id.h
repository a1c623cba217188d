// The build id of the system on chip, as the kernel names it. The one place where product code meets
// the device's files; the build picks the source that answers: the device's own (soc_build_id.cpp), or
// on Linux the device that the host poses as (soc_build_id_host.cpp).
#pragma once

#include <stddef.h>

// Reads up to `count` bytes from the start of the build id. The number of bytes read, or -1 when there
// is no build id. Any thread; nothing is cached.
int readSocBuildId(char* bytes, size_t count);
