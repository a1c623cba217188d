// Status codes of the media framework.
#pragma once

#include <utils/Errors.h>

namespace android {

enum : int32_t { MEDIA_ERROR_BASE = -1000, ERROR_UNSUPPORTED = MEDIA_ERROR_BASE - 10 };

}  // namespace android
