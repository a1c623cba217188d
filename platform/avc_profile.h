// The application's H.264 profiles in OpenMAX's numbering.
#pragma once

#include <stdint.h>

#include <optional>

#include <OMX_Video.h>

// The profile for a profile_idc of ITU-T H.264; nothing for one that the encoders do not offer.
inline std::optional<OMX_VIDEO_AVCPROFILETYPE> avcProfile(int32_t profileIdc) {
  switch (profileIdc) {
    case 66:
      return OMX_VIDEO_AVCProfileBaseline;
    case 77:
      return OMX_VIDEO_AVCProfileMain;
    case 100:
      return OMX_VIDEO_AVCProfileHigh;
    default:
      return std::nullopt;
  }
}
