/// @file
/// Which chip generation the device belongs to. Applications need it to lay out what goes into an
/// encoder's input buffers and to tell what comes out of a decoder. For C and C++.
#pragma once

#include "omxbridge/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Values of getHardwareBaseVersion().
enum HardwareBaseVersion {
  HW_VERSION_UNKNOWN = 0,     ///< no build id, or one shorter than four bytes
  HW_VERSION_QCOM_OTHER = 1,  ///< a build id of none of the chips below
  HW_VERSION_MSM7X30 = 2,     ///< Qualcomm MSM7x30
  HW_VERSION_MSM8X55 = 3,     ///< Qualcomm MSM8x55
  HW_VERSION_MSM8X60 = 4,     ///< Qualcomm MSM8x60
  HW_VERSION_OMAP4 = 5        ///< TI OMAP4
};

/// The device's hardware base version. Reads the platform property and, where that does not settle it,
/// the build id, on every call. Any thread; never fails.
OMXBRIDGE_EXPORT int getHardwareBaseVersion(void);

#ifdef __cplusplus
}
#endif
