#include "platform/board_platform_wrapper.h"

#include <new>

#include "platform/qcom_board_platform_wrapper.h"
#include "platform/ti_board_platform_wrapper.h"

using android::IOMX;
using android::sp;

// Binaries that delete a wrapper themselves know only the base: a vendor class has nothing to destroy.
static_assert(sizeof(CQcomBoardPlatformWrapper) == sizeof(CBoardPlatformWrapper));
static_assert(sizeof(CTIBoardPlatformWrapper) == sizeof(CBoardPlatformWrapper));

CBoardPlatformWrapper::CBoardPlatformWrapper(OmxInterface* owner, sp<IOMX> omx, void* node)
    : _owner(owner), _omx(omx), _node(node) {}

CBoardPlatformWrapper::~CBoardPlatformWrapper() = default;

int CBoardPlatformWrapper::setPictureOrder(int /*order*/) {
  return OMXI_OK;
}

int CBoardPlatformWrapper::setInputPackingFormat(int /*format*/) {
  return OMXI_OK;
}

int CBoardPlatformWrapper::setOutputColorFormat(int /*format*/) {
  return OMXI_OK;
}

CBoardPlatformWrapper* CBoardPlatformWrapper::CreateBoardPlatformWrapper(OmxInterface* owner, sp<IOMX> omx,
                                                                         void* node) {
  switch (GetBoardPlatformType()) {
    case BOARD_PLATFORM_QCOM:
      return new (std::nothrow) CQcomBoardPlatformWrapper(owner, omx, node);
    case BOARD_PLATFORM_TI:
      return new (std::nothrow) CTIBoardPlatformWrapper(owner, omx, node);
    default:
      return nullptr;
  }
}

void CBoardPlatformWrapper::Destroy(CBoardPlatformWrapper* wrapper) {
  if (wrapper == nullptr) return;
  // There is no virtual destructor to ask, but the platform that made it is still the same.
  if (GetBoardPlatformType() == BOARD_PLATFORM_TI) {
    delete static_cast<CTIBoardPlatformWrapper*>(wrapper);
  } else {
    delete static_cast<CQcomBoardPlatformWrapper*>(wrapper);
  }
}

const char* CBoardPlatformWrapper::getHardwareDecodeCodecIdentifierString() {
  switch (GetBoardPlatformType()) {
    case BOARD_PLATFORM_QCOM:
      return "OMX.qcom.video.decoder.avc";
    case BOARD_PLATFORM_TI:
      return "OMX.TI.DUCATI1.VIDEO.DECODER==";  // Kept: the two "=" are part of the name
    default:
      return nullptr;
  }
}

const char* CBoardPlatformWrapper::getHardwareEncodeCodecIdentifierString() {
  switch (GetBoardPlatformType()) {
    case BOARD_PLATFORM_QCOM:
      return "OMX.qcom.video.encoder.avc";
    case BOARD_PLATFORM_TI:
      return "OMX.TI.DUCATI1.VIDEO.H264E";
    default:
      return nullptr;
  }
}
