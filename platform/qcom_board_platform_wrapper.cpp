#include "platform/qcom_board_platform_wrapper.h"

#include <stdint.h>

#include <bit>

#include <OMX_Video.h>

#include "core/log.h"
#include "core/omx_interface.h"
#include "core/omx_record.h"
#include "encoder/omx_interface_encoder.h"
#include "platform/component_node.h"
#include "platform/encoder_config.h"
#include "platform/vendor_records.h"

namespace {

// Q16 by way of whole half frames per second, which is how these components' clients have always
// counted. Saturates where the devices' own conversion does.
OMX_U32 toQ16(float framesPerSecond) {
  constexpr auto kLimit = 2147483648.0F;  // one above what an int32_t holds
  const float doubled = framesPerSecond * 2.0F;
  const int32_t halves = doubled < kLimit ? static_cast<int32_t>(doubled) : INT32_MAX;
  return static_cast<OMX_U32>(halves) << 15;
}

}  // namespace

CQcomBoardPlatformWrapper::CQcomBoardPlatformWrapper(OmxInterface* owner, android::sp<android::IOMX> omx,
                                                     void* node)
    : CBoardPlatformWrapper(owner, omx, node) {
  if (owner == nullptr) return;
  owner->setPortBufferModes(OMX_BUFFER_CLIENT_MEMORY,
                            owner->isEncoder() ? OMX_BUFFER_CLIENT_MEMORY : OMX_BUFFER_COMPONENT_ALLOCATES);
}

int CQcomBoardPlatformWrapper::configureEncoder(webrtc::VideoCodec* codec) {
  if (_owner == nullptr || !_owner->isEncoder()) return OMXI_ERR_CREATE_INTERFACE;
  auto& encoder = static_cast<OmxInterfaceEncoder&>(*_owner);
  const auto bitRate = static_cast<int>(codec->startBitrate * 1000);

  for (const int port : {kOmxInputPort, kOmxOutputPort}) {
    const int result = encoder.setupPortParameters(port, codec->width, codec->height, codec->maxFramerate);
    if (result != OMXI_OK) return result;
  }
  if (codec->codecType == webrtc::kVideoCodecH264) {
    const int result = encoder.setupAvcSettings(&codec->codecSpecific.H264);
    if (result != OMXI_OK) return result;
  }
  const int result = encoder.setupPortBitRate(kOmxOutputPort, bitRate);
  if (result != OMXI_OK) return result;
  return encoder.setupRateControl(OMX_Video_ControlRateVariableSkipFrames, bitRate);
}

int CQcomBoardPlatformWrapper::setConfig(CONFIGTYPE type, unsigned long value) {
  const ComponentNode node(_omx, _node);
  switch (type) {
    case CONFIG_FRAMERATE: {
      const auto framesPerSecond = static_cast<float>(value);
      auto record = makeUnsizedOmxRecord<OMX_CONFIG_FRAMERATETYPE>();
      record.nPortIndex = kOmxOutputPort;
      record.xEncodeFramerate = toQ16(framesPerSecond);
      // Kept: the size word carries the rate as a single-precision float; the components go by the size
      // argument.
      record.nSize = std::bit_cast<OMX_U32>(framesPerSecond);
      return sendConfig(node, OMX_IndexConfigVideoFramerate, record);
    }
    case CONFIG_INTRA_PERIOD: {
      auto record = makeOmxRecord<QcomIntraPeriod>(kOmxOutputPort);
      record.nIDRPeriod = 1;
      record.nPFrames = static_cast<OMX_U32>(value) - 1;  // Kept: 0 wraps to no further key frame at all
      return sendConfig(node, kQcomIndexIntraPeriod, record);
    }
    default:
      return sendCommonConfig(node, type, value);
  }
}

int CQcomBoardPlatformWrapper::setPictureOrder(int order) {
  QcomPictureOrder record = {};  // Kept: without a version; the components do not look at it
  record.nSize = sizeof(record);
  record.nPortIndex = kOmxInputPort;
  if (order == 0) record.eOutputPictureOrder = QCOM_OUTPUT_IN_DISPLAY_ORDER;
  if (order == 1) record.eOutputPictureOrder = QCOM_OUTPUT_IN_DECODE_ORDER;
  const android::status_t status = ComponentNode(_omx, _node).setParameter(kQcomIndexPictureOrder, record);
  if (status != android::OK) {
    return failWith(OMXI_ERR_PICTURE_ORDER, "OMXINTERFACE: Set Decode Order Failed: %d", status);
  }
  return OMXI_OK;
}

int CQcomBoardPlatformWrapper::setInputPackingFormat(int format) {
  auto record = makeOmxRecord<QcomPortDefinition>(kOmxInputPort);
  if (format == 1) record.nFramePackingFormat = QCOM_FRAME_PACKING_ONE_COMPLETE_FRAME;
  if (format == 2) record.nFramePackingFormat = QCOM_FRAME_PACKING_ARBITRARY;
  const android::status_t status = ComponentNode(_omx, _node).setParameter(kQcomIndexPortDefinition, record);
  if (status != android::OK) {
    return failWith(OMXI_ERR_PACKING_FORMAT, "OMXINTERFACE - Could not set input frame packing format (%d)",
                    status);
  }
  return OMXI_OK;
}
