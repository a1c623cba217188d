// Qualcomm components (platforms "msm..."): configured through the session's generic operations, plus
// the decoder's picture order and input packing, which are vendor parameters.
//
// Threads and ownership: board_platform_wrapper.h.
#pragma once

#include "platform/board_platform_wrapper.h"

class OMXBRIDGE_EXPORT CQcomBoardPlatformWrapper final : public CBoardPlatformWrapper {
 public:
  // Gives the owner's input port client memory; the output port too in an encoder, while a decoder's
  // output buffers are the component's.
  CQcomBoardPlatformWrapper(OmxInterface* owner, android::sp<android::IOMX> omx, void* node);

  int configureEncoder(webrtc::VideoCodec* codec) override;
  int setConfig(CONFIGTYPE type, unsigned long value) override;
  int setPictureOrder(int order) override;
  int setInputPackingFormat(int format) override;
};
