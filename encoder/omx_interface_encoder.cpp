// Creation, settings and the end of an encoding session.
#include "encoder/omx_interface_encoder.h"

#include <memory>
#include <new>

#include "core/log.h"
#include "core/omx_record.h"
#include "core/session_state.h"
#include "platform/avc_profile.h"
#include "platform/board_platform_wrapper.h"
#include "platform/component_node.h"
#include "platform/hardware_version.h"

using android::status_t;

OmxInterfaceEncoder::OmxInterfaceEncoder() {
  _isEncoder = true;
}

OmxInterfaceEncoder::~OmxInterfaceEncoder() {
  endSession();
}

int OmxInterfaceEncoder::Create(OmxInterfaceEncoder** out, webrtc::VideoCodec* codec) {
  *out = nullptr;
  std::unique_ptr<OmxInterfaceEncoder> session;
  int result = OMXI_OK;
  try {  // the session's parts and the platform's objects are not all made without exceptions
    session.reset(new (std::nothrow) OmxInterfaceEncoder);
    if (session == nullptr) return OMXI_ERR_CREATE_INTERFACE;
    if (codec == nullptr) {
      *out = session.release();
      return OMXI_ERR_INVALID_ENCODING_PARAMS;
    }
    result = session->setupIOMXConnections();
  } catch (const std::bad_alloc&) {
    return OMXI_ERR_CREATE_INTERFACE;
  }
  if (result != OMXI_OK) return result;
  result = session->configureEncoder(codec);
  if (result != OMXI_OK) return failWith(result, "OMXINTERFACE - [ENC] Init: failed to setup params!");
  *out = session.release();
  return OMXI_OK;
}

int OmxInterfaceEncoder::configureEncoder(webrtc::VideoCodec* codec) {
  const SessionCall call(*_state);
  const WrapperUse use(*this);
  if (use.wrapper() == nullptr) return OMXI_ERR_NO_PLATFORM_WRAPPER;
  if (codec == nullptr) return OMXI_ERR_INVALID_ENCODING_PARAMS;
  return use.wrapper()->configureEncoder(codec);
}

int OmxInterfaceEncoder::setConfig(CONFIGTYPE type, unsigned long value) {
  const SessionCall call(*_state);
  const WrapperUse use(*this);
  return use.wrapper() != nullptr ? use.wrapper()->setConfig(type, value) : OMXI_ERR_NO_PLATFORM_WRAPPER;
}

int OmxInterfaceEncoder::updateBitRate(int bitrate) {
  const SessionCall call(*_state);
  const ComponentNode node(_omx, _node);
  // Kept: read from the input port, written to the output port.
  auto record = makeOmxRecord<OMX_VIDEO_CONFIG_BITRATETYPE>(kOmxInputPort);
  if (node.getConfig(OMX_IndexConfigVideoBitrate, &record) != android::OK) return OMXI_ERR_GET_BITRATE;
  record.nEncodeBitrate = static_cast<OMX_U32>(bitrate);
  record.nPortIndex = kOmxOutputPort;
  const status_t status = node.setConfig(OMX_IndexConfigVideoBitrate, record);
  return status == android::OK ? OMXI_OK : OMXI_ERR_SET_BITRATE;
}

int OmxInterfaceEncoder::updateAVCIntraPeriod(int period) {
  const SessionCall call(*_state);
  auto record = makeOmxRecord<OMX_VIDEO_CONFIG_AVCINTRAPERIOD>(kOmxOutputPort);
  record.nIDRPeriod = static_cast<OMX_U32>(period);
  record.nPFrames = static_cast<OMX_U32>(period) - 1;
  const status_t status = ComponentNode(_omx, _node).setConfig(OMX_IndexConfigVideoAVCIntraPeriod, record);
  return status == android::OK ? OMXI_OK : OMXI_ERR_SET_INTRA_PERIOD;
}

int OmxInterfaceEncoder::requestIFrame() {
  const SessionCall call(*_state);
  auto record = makeOmxRecord<OMX_CONFIG_INTRAREFRESHVOPTYPE>(kOmxOutputPort);
  record.IntraRefreshVOP = OMX_TRUE;
  const status_t status = ComponentNode(_omx, _node).setConfig(OMX_IndexConfigVideoIntraVOPRefresh, record);
  return status == android::OK ? OMXI_OK : OMXI_ERR_REQUEST_IFRAME;
}

int OmxInterfaceEncoder::setupRateControl(int controlRate, int targetBitrate) {
  const SessionCall call(*_state);
  const ComponentNode node(_omx, _node);
  auto record = makeOmxRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOmxOutputPort);
  status_t status = node.getParameter(OMX_IndexParamVideoBitrate, &record);
  if (status != android::OK) {
    return failWith(OMXI_ERR_GET_BITRATE, "OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: %d",
                    status);
  }
  record.eControlRate = static_cast<OMX_VIDEO_CONTROLRATETYPE>(controlRate);
  record.nTargetBitrate = static_cast<OMX_U32>(targetBitrate);
  status = node.setParameter(OMX_IndexParamVideoBitrate, record);
  if (status != android::OK) {
    return failWith(OMXI_ERR_SET_BITRATE, "OMXINTERFACE - RATE CONTROL: ERROR setting bitrate parameters: %d",
                    status);
  }
  return OMXI_OK;
}

int OmxInterfaceEncoder::setupPortBitRate(int port, int bitrate) {
  const SessionCall call(*_state);
  const ComponentNode node(_omx, _node);
  auto definition = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(static_cast<OMX_U32>(port));
  status_t status = node.getParameter(OMX_IndexParamPortDefinition, &definition);
  if (status != android::OK) {
    return failWith(OMXI_ERR_GET_PORT_DEFINITION, "OMXINTERFACE - BITRATE: ERROR getting port definition: %d",
                    status);
  }
  definition.format.video.nBitrate = static_cast<OMX_U32>(bitrate);
  status = node.setParameter(OMX_IndexParamPortDefinition, definition);
  if (status != android::OK) {
    return failWith(OMXI_ERR_SET_PORT_DEFINITION, "OMXINTERFACE - BITRATE: ERROR setting port definition: %d",
                    status);
  }
  return OMXI_OK;
}

int OmxInterfaceEncoder::setupAvcSettings(webrtc::VideoCodecH264* h264) {
  constexpr OMX_U32 kNoFurtherKeyFrames = 0xFFFF;

  const SessionCall call(*_state);
  const ComponentNode node(_omx, _node);
  auto avc = makeOmxRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOmxOutputPort);
  status_t status = node.getParameter(OMX_IndexParamVideoAvc, &avc);
  if (status != android::OK) {
    return failWith(OMXI_ERR_GET_AVC_PARAMS, "OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: %d",
                    status);
  }
  // What is not named here stays as the component has it.
  avc.nPFrames =
      h264->keyFrameInterval != 0 ? static_cast<OMX_U32>(h264->keyFrameInterval) - 1 : kNoFurtherKeyFrames;
  avc.nBFrames = 0;
  avc.bUseHadamard = OMX_TRUE;
  avc.nRefFrames = h264->referenceFrames;
  avc.bEnableFMO = OMX_FALSE;
  avc.bEnableASO = OMX_FALSE;
  avc.bEnableRS = OMX_FALSE;
  avc.eProfile = avcProfile(h264->profile).value_or(avc.eProfile);
  avc.eLevel = OMX_VIDEO_AVCLevel31;
  avc.bFrameMBsOnly = OMX_TRUE;
  avc.bMBAFF = OMX_FALSE;
  // Kept: the caller's bytes as they are, not only 0 and 1.
  avc.bEntropyCodingCABAC = static_cast<OMX_BOOL>(h264->entropyCoding);
  avc.bWeightedPPrediction = OMX_FALSE;
  avc.bconstIpred = OMX_TRUE;
  avc.bDirect8x8Inference = static_cast<OMX_BOOL>(h264->transform8x8);
  avc.bDirectSpatialTemporal = OMX_FALSE;
  if (hardwareTraits(getHardwareBaseVersion()).encoderBaselineOnly) {
    avc.eProfile = OMX_VIDEO_AVCProfileBaseline;
    avc.bEntropyCodingCABAC = OMX_FALSE;
    avc.bDirect8x8Inference = OMX_FALSE;
  }
  status = node.setParameter(OMX_IndexParamVideoAvc, avc);
  if (status != android::OK) {
    return failWith(OMXI_ERR_SET_AVC_PARAMS, "OMXINTERFACE - RATE CONTROL: ERROR setting avc parameters: %d",
                    status);
  }
  return OMXI_OK;
}
