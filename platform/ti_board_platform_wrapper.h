// TI OMAP4 components (platforms "omap..."): configured port by port by the wrapper itself, with the
// components' own packed semi-planar layout.
//
// Threads and ownership: board_platform_wrapper.h.
#pragma once

#include "platform/board_platform_wrapper.h"

class OMXBRIDGE_EXPORT CTIBoardPlatformWrapper final : public CBoardPlatformWrapper {
 public:
  // Has the component allocate the buffers of both of the owner's ports.
  CTIBoardPlatformWrapper(OmxInterface* owner, android::sp<android::IOMX> omx, void* node);

  int configureEncoder(webrtc::VideoCodec* codec) override;
  int setConfig(CONFIGTYPE type, unsigned long value) override;
  int setOutputColorFormat(int format) override;
};
