#include "platform/ti_board_platform_wrapper.h"

#include <stdint.h>

#include <OMX_Video.h>

#include "core/log.h"
#include "core/omx_interface.h"
#include "core/omx_record.h"
#include "platform/avc_profile.h"
#include "platform/component_node.h"
#include "platform/encoder_config.h"

using android::status_t;

namespace {

constexpr int kRefused = -1;

constexpr auto kTiSemiPlanar = OMX_TI_COLOR_FormatYUV420PackedSemiPlanar;
constexpr OMX_U32 kCompressedBuffers = 4;  // of an encoder's output, of a decoder's input
constexpr uint8_t kLowestFrameRate = 2;    // frames per second; the encoder does not start below it

// Reads or writes a record. Where the component refuses, logs `failure`, which ends in ':' or ": ", and
// the status.
template <typename Record>
bool get(const ComponentNode& node, OMX_INDEXTYPE index, Record* record, const char* failure) {
  const status_t status = node.getParameter(index, record);
  if (status != android::OK) logError("%s%d", failure, status);
  return status == android::OK;
}
template <typename Record>
bool set(const ComponentNode& node, OMX_INDEXTYPE index, const Record& record, const char* failure) {
  const status_t status = node.setParameter(index, record);
  if (status != android::OK) logError("%s%d", failure, status);
  return status == android::OK;
}

bool getDefinition(const ComponentNode& node, OMX_PARAM_PORTDEFINITIONTYPE* definition) {
  return get(node, OMX_IndexParamPortDefinition, definition,
             definition->nPortIndex == kOmxInputPort ? "get OMX_IndexParamPortDefinition InPort Error:"
                                                     : "get OMX_IndexParamPortDefinition OutPort Error:");
}

// Confirms the format that the input port has.
bool confirmInputFormat(const ComponentNode& node) {
  auto format = makeOmxRecord<OMX_VIDEO_PARAM_PORTFORMATTYPE>(kOmxInputPort);
  const status_t status = node.getParameter(OMX_IndexParamVideoPortFormat, &format);
  if (status != android::OK) {
    logError("get OMX_IndexParamVideoPortFormat InPort Error:0x%x. OMX_ErrorUnsupportedIndex=0x%x",
             static_cast<unsigned int>(status), static_cast<unsigned int>(OMX_ErrorUnsupportedIndex));
    return false;
  }
  return set(node, OMX_IndexParamVideoPortFormat, format, "set OMX_IndexParamVideoPortFormat InPort Error:");
}

// Looks for one pair of formats in what the output port offers and sets it. There is no limit but the
// end of the component's list, which it reports as an error: how long a list may be is its affair.
bool chooseOutputFormat(const ComponentNode& node, OMX_VIDEO_CODINGTYPE coding, OMX_COLOR_FORMATTYPE color) {
  auto format = makeOmxRecord<OMX_VIDEO_PARAM_PORTFORMATTYPE>(kOmxOutputPort);
  for (OMX_U32 i = 0;; ++i) {
    format.nIndex = i;
    if (!get(node, OMX_IndexParamVideoPortFormat, &format,
             "get OMX_IndexParamVideoPortFormat OutPort Error:")) {
      return false;
    }
    if (format.eCompressionFormat == coding && format.eColorFormat == color) break;
  }
  return set(node, OMX_IndexParamVideoPortFormat, format, "set OMX_IndexParamVideoPortFormat OutPort Error:");
}

bool defineEncoderInput(const ComponentNode& node, webrtc::VideoCodec* codec) {
  auto definition = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(kOmxInputPort);
  if (!getDefinition(node, &definition)) return false;
  auto& video = definition.format.video;
  video.nFrameWidth = codec->width;
  video.nFrameHeight = codec->height;
  video.nStride = (codec->width + 15) & ~15;
  video.nSliceHeight = 0;
  // Kept: the caller's own record shows afterwards what the encoder runs at.
  if (codec->maxFramerate < kLowestFrameRate) codec->maxFramerate = kLowestFrameRate;
  video.xFramerate = OMX_U32{codec->maxFramerate} << 16;
  video.eCompressionFormat = OMX_VIDEO_CodingUnused;
  video.eColorFormat = kTiSemiPlanar;
  // Kept: a signed word, also for pictures too large for one.
  const auto bytesDoubled = static_cast<int32_t>(uint32_t{codec->width} * codec->height * 3);
  definition.nBufferSize = static_cast<OMX_U32>(bytesDoubled >> 1);
  return set(node, OMX_IndexParamPortDefinition, definition,
             "set OMX_IndexParamPortDefinition InPort Error:");
}

bool defineEncoderOutput(const ComponentNode& node, const webrtc::VideoCodec& codec) {
  auto definition = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(kOmxOutputPort);
  if (!getDefinition(node, &definition)) return false;
  definition.nBufferCountActual = kCompressedBuffers;
  auto& video = definition.format.video;
  video.nFrameWidth = codec.width;
  video.nFrameHeight = codec.height;
  video.nBitrate = codec.startBitrate * 1000;
  video.xFramerate = 0;
  video.eCompressionFormat = OMX_VIDEO_CodingAVC;
  video.eColorFormat = OMX_COLOR_FormatUnused;
  return set(node, OMX_IndexParamPortDefinition, definition,
             "set OMX_IndexParamPortDefinition OutPort Error:");
}

// Kept: 0 for a profile_idc that is not offered; the component's own profile does not stay.
OMX_VIDEO_AVCPROFILETYPE profileToSet(int32_t profileIdc) {
  return avcProfile(profileIdc).value_or(static_cast<OMX_VIDEO_AVCPROFILETYPE>(0));
}

bool setAvc(const ComponentNode& node, const webrtc::VideoCodecH264& h264) {
  auto avc = makeOmxRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOmxOutputPort);
  if (!get(node, OMX_IndexParamVideoAvc, &avc, "get OMX_IndexParamVideoAvc failed : ")) return false;
  avc.nSliceHeaderSpacing = 0;
  // Kept: these components count the whole interval, key frame included.
  avc.nPFrames = static_cast<OMX_U32>(h264.keyFrameInterval);
  avc.nBFrames = 0;
  avc.bUseHadamard = OMX_TRUE;
  avc.nRefFrames = h264.referenceFrames;
  avc.nRefIdx10ActiveMinus1 = 0;
  avc.nRefIdx11ActiveMinus1 = 0;
  avc.bEnableUEP = OMX_FALSE;
  avc.bEnableFMO = OMX_FALSE;
  avc.bEnableASO = OMX_FALSE;
  avc.bEnableRS = OMX_FALSE;
  avc.eProfile = profileToSet(h264.profile);
  avc.eLevel = OMX_VIDEO_AVCLevel31;
  avc.nAllowedPictureTypes = OMX_VIDEO_PictureTypeI | OMX_VIDEO_PictureTypeP;
  avc.bFrameMBsOnly = OMX_TRUE;
  avc.bMBAFF = OMX_FALSE;
  // Kept: the caller's byte as it is, not only 0 and 1.
  avc.bEntropyCodingCABAC = static_cast<OMX_BOOL>(h264.entropyCoding);
  avc.bWeightedPPrediction = OMX_FALSE;
  avc.bconstIpred = OMX_FALSE;
  avc.bDirect8x8Inference = OMX_FALSE;
  avc.bDirectSpatialTemporal = OMX_FALSE;
  avc.nCabacInitIdc = 0;
  avc.eLoopFilterMode = OMX_VIDEO_AVCLoopFilterEnable;
  return set(node, OMX_IndexParamVideoAvc, avc, "set OMX_IndexParamVideoAvc failed : ");
}

bool setProfileAndLevel(const ComponentNode& node, int32_t profileIdc) {
  auto current = makeOmxRecord<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(kOmxOutputPort);
  if (!get(node, OMX_IndexParamVideoProfileLevelCurrent, &current,
           "get OMX_IndexParamVideoProfileLevelCurrent failed : ")) {
    return false;
  }
  current.eProfile = profileToSet(profileIdc);
  current.eLevel = OMX_VIDEO_AVCLevel31;
  return set(node, OMX_IndexParamVideoProfileLevelCurrent, current,
             "set OMX_IndexParamVideoProfileLevelCurrent failed : ");
}

bool setRateControl(const ComponentNode& node, uint32_t bitsPerSecond) {
  auto bitRate = makeOmxRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOmxOutputPort);
  if (!get(node, OMX_IndexParamVideoBitrate, &bitRate, "get OMX_IndexParamVideoBitrate failed : ")) {
    return false;
  }
  bitRate.eControlRate = OMX_Video_ControlRateVariable;
  bitRate.nTargetBitrate = bitsPerSecond;
  return node.setParameter(OMX_IndexParamVideoBitrate, bitRate) == android::OK;  // Kept: refused silently
}

bool passPixelsInBuffers(const ComponentNode& node) {
  if (node.storeMetaDataInBuffers(kOmxInputPort, false) == android::OK) return true;
  logError("Storing meta data in video buffers is not supported");
  return false;
}

}  // namespace

CTIBoardPlatformWrapper::CTIBoardPlatformWrapper(OmxInterface* owner, android::sp<android::IOMX> omx,
                                                 void* node)
    : CBoardPlatformWrapper(owner, omx, node) {
  if (owner == nullptr) return;
  owner->setPortBufferModes(OMX_BUFFER_COMPONENT_ALLOCATES, OMX_BUFFER_COMPONENT_ALLOCATES);
}

int CTIBoardPlatformWrapper::configureEncoder(webrtc::VideoCodec* codec) {
  const ComponentNode node(_omx, _node);
  const webrtc::VideoCodecH264& h264 = codec->codecSpecific.H264;
  const bool configured = confirmInputFormat(node) &&
                          chooseOutputFormat(node, OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused) &&
                          defineEncoderInput(node, codec) && defineEncoderOutput(node, *codec) &&
                          setAvc(node, h264) && setProfileAndLevel(node, h264.profile) &&
                          setRateControl(node, codec->startBitrate * 1000) && passPixelsInBuffers(node);
  return configured ? OMXI_OK : kRefused;
}

int CTIBoardPlatformWrapper::setConfig(CONFIGTYPE type, unsigned long value) {
  const ComponentNode node(_omx, _node);
  switch (type) {
    case CONFIG_FRAMERATE: {
      // Kept: of all items this one alone goes to the input port.
      auto record = makeOmxRecord<OMX_CONFIG_FRAMERATETYPE>(kOmxInputPort);
      const unsigned long framesPerSecond = value < kLowestFrameRate ? kLowestFrameRate : value;
      record.xEncodeFramerate = static_cast<OMX_U32>(framesPerSecond) << 16;
      return sendConfig(node, OMX_IndexConfigVideoFramerate, record);
    }
    case CONFIG_INTRA_PERIOD:
      return OMXI_OK;  // fixed at creation on these components
    default:
      return sendCommonConfig(node, type, value);
  }
}

int CTIBoardPlatformWrapper::setOutputColorFormat(int /*format*/) {
  const ComponentNode node(_omx, _node);
  if (!chooseOutputFormat(node, OMX_VIDEO_CodingUnused, kTiSemiPlanar)) return kRefused;

  auto input = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(kOmxInputPort);
  if (!getDefinition(node, &input)) return kRefused;
  input.format.video.eCompressionFormat = OMX_VIDEO_CodingAVC;
  input.nBufferCountActual = kCompressedBuffers;
  if (!set(node, OMX_IndexParamPortDefinition, input, "set OMX_IndexParamPortDefinition InPort Error:")) {
    return kRefused;
  }

  auto output = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(kOmxOutputPort);
  if (!getDefinition(node, &output)) return kRefused;
  output.format.video.eCompressionFormat = OMX_VIDEO_CodingUnused;
  output.format.video.eColorFormat = kTiSemiPlanar;
  return set(node, OMX_IndexParamPortDefinition, output,
             "=====set OMX_IndexParamPortDefinition OutPort Error:")
             ? OMXI_OK
             : kRefused;
}
