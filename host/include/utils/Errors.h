// Status codes of the platform. A status is 0 (OK) or a failure.
#pragma once

#include <errno.h>
#include <stdint.h>

namespace android {

typedef int32_t status_t;

// Kept: the enumeration is wider than a status, as it is on the devices, so the codes from
// UNKNOWN_ERROR on are positive here and negative once stored. `status == UNKNOWN_ERROR` is false on
// both; compare with OK, or with static_cast<status_t>(UNKNOWN_ERROR).
enum : int64_t {
  OK = 0,
  NO_ERROR = 0,

  UNKNOWN_ERROR = 0x80000000,
  BAD_TYPE = 0x80000001,
  FAILED_TRANSACTION = 0x80000002,

  NO_MEMORY = -ENOMEM,
  INVALID_OPERATION = -ENOSYS,
  BAD_VALUE = -EINVAL,
  NAME_NOT_FOUND = -ENOENT,
  PERMISSION_DENIED = -EPERM,
  NO_INIT = -ENODEV,
  ALREADY_EXISTS = -EEXIST,
  DEAD_OBJECT = -EPIPE,
  BAD_INDEX = -EOVERFLOW,
  NOT_ENOUGH_DATA = -ENODATA,
  WOULD_BLOCK = -EWOULDBLOCK,
  TIMED_OUT = -ETIMEDOUT,
  UNKNOWN_TRANSACTION = -EBADMSG
};

}  // namespace android
