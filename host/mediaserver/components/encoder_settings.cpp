#include "host/mediaserver/components/encoder_settings.h"

#include <algorithm>
#include <iterator>
#include <utility>

#include "host/mediaserver/components/avc_level.h"
#include "host/mediaserver/components/sequence_set.h"

namespace mediaserver {

namespace {

constexpr uint32_t kMostReferences = 16;
constexpr OMX_U32 kNoFurtherKey = 0xFFFF;  // P frames from here on mean: as many as there are

int profileIdc(OMX_U32 profile) {
  switch (profile) {
    case OMX_VIDEO_AVCProfileMain:
      return kProfileMain;
    case OMX_VIDEO_AVCProfileHigh:
      return kProfileHigh;
    default:
      return kProfileBaseline;
  }
}

}  // namespace

EncoderSettings::EncoderSettings(const omxhost::ComponentTraits& traits) : _traits(traits) {
  _pace.keyPeriod = 30;
  _avc.nBFrames = 0;
  _avc.bUseHadamard = OMX_TRUE;
  _avc.nRefFrames = 1;
  // TI's clients write a number of their own here; Qualcomm's leave it, and mean all reference frames.
  _avc.nRefIdx10ActiveMinus1 = _traits.vendor == omxhost::Vendor::Ti ? 0 : kMostReferences - 1;
  _avc.eProfile = OMX_VIDEO_AVCProfileBaseline;
  _avc.eLevel = OMX_VIDEO_AVCLevel31;
  _avc.nAllowedPictureTypes = OMX_VIDEO_PictureTypeI | OMX_VIDEO_PictureTypeP;
  _avc.bFrameMBsOnly = OMX_TRUE;
  _avc.eLoopFilterMode = OMX_VIDEO_AVCLoopFilterEnable;
}

StreamTools EncoderSettings::tools() const {
  std::lock_guard<std::mutex> lock(_mutex);
  StreamTools tools{};
  tools.profileIdc = profileIdc(_avc.eProfile);
  tools.leastLevelIdc = levelIdc(_avc.eLevel);
  tools.cabac = cabac();
  tools.transform8x8 = transform8x8();
  tools.referenceFrames = std::max<uint32_t>(_avc.nRefFrames, 1);
  tools.activeReferences = std::min(tools.referenceFrames, _avc.nRefIdx10ActiveMinus1 + 1);
  tools.constrainedIntra = _avc.bconstIpred != OMX_FALSE;
  tools.weightedPrediction = _avc.bWeightedPPrediction != OMX_FALSE && tools.profileIdc != kProfileBaseline;
  tools.deblocking = _avc.eLoopFilterMode != OMX_VIDEO_AVCLoopFilterDisable;
  tools.cabacInit = tools.cabac ? _avc.nCabacInitIdc : 0;
  tools.sliceMacroblocks = _avc.nSliceHeaderSpacing;
  tools.constantQuantizer = _controlRate == OMX_Video_ControlRateDisable;
  if (tools.constantQuantizer) {
    tools.quantizerI = _quantizerI;
    tools.quantizerP = _quantizerP;
  }
  // None of the modes drops pictures, those neither that would be allowed to: each picture that a client
  // sends comes out, and the quantizer alone keeps the rate.
  const bool constant = _controlRate == OMX_Video_ControlRateConstant ||
                        _controlRate == OMX_Video_ControlRateConstantSkipFrames;
  tools.bufferedSeconds = constant ? 0.25 : 0.5;
  return tools;
}

StreamPace EncoderSettings::pace() const {
  std::lock_guard<std::mutex> lock(_mutex);
  StreamPace pace = _pace;
  if ((_avc.nAllowedPictureTypes & OMX_VIDEO_PictureTypeP) == 0) pace.keyPeriod = 1;
  return pace;
}

bool EncoderSettings::takeKeyRequest() {
  std::lock_guard<std::mutex> lock(_mutex);
  return std::exchange(_keyRequested, false);
}

void EncoderSettings::setBitRate(uint32_t bitsPerSecond) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (bitsPerSecond != 0) _pace.bitRate = bitsPerSecond;
}

void EncoderSettings::setFrameRate(uint32_t q16) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (q16 != 0) _pace.frameRate = q16;
}

bool EncoderSettings::knowsProfile(OMX_U32 profile) const {
  if (profile == OMX_VIDEO_AVCProfileBaseline) return true;
  if (_traits.baselineOnly) return false;
  return profile == OMX_VIDEO_AVCProfileMain || profile == OMX_VIDEO_AVCProfileHigh;
}

// Tools that the profile does not have stay off, whatever was asked: clients leave such flags behind when
// they change the profile.
bool EncoderSettings::cabac() const {
  return _avc.bEntropyCodingCABAC != OMX_FALSE && _avc.eProfile != OMX_VIDEO_AVCProfileBaseline;
}

// Kept: the standard means another thing by this flag, but without B pictures that has no effect, and our
// clients ask for the transform with it.
bool EncoderSettings::transform8x8() const {
  return _avc.bDirect8x8Inference != OMX_FALSE && _avc.eProfile == OMX_VIDEO_AVCProfileHigh;
}

// Kept: TI's components count the key frame as well, and take 0 for none requested.
uint32_t EncoderSettings::keyPeriod(OMX_U32 pFrames) const {
  if (pFrames >= kNoFurtherKey) return 0;
  return _traits.vendor == omxhost::Vendor::Ti ? pFrames : pFrames + 1;
}

OMX_U32 EncoderSettings::countPFrames(uint32_t period) const {
  if (_traits.vendor == omxhost::Vendor::Ti) return period;
  return period == 0 ? kNoFurtherKey : period - 1;
}

bool EncoderSettings::canDo(const OMX_VIDEO_PARAM_AVCTYPE& avc) const {
  const bool slices = avc.nSliceHeaderSpacing != 0;
  return avc.nBFrames == 0 && avc.bEnableUEP == OMX_FALSE && avc.bEnableFMO == OMX_FALSE &&
         avc.bEnableASO == OMX_FALSE && avc.bEnableRS == OMX_FALSE && avc.bFrameMBsOnly != OMX_FALSE &&
         avc.bMBAFF == OMX_FALSE && avc.nRefFrames <= kMostReferences && avc.nRefIdx10ActiveMinus1 < 32 &&
         (avc.nAllowedPictureTypes & OMX_VIDEO_PictureTypeI) != 0 && avc.nCabacInitIdc <= 2 &&
         avc.eLoopFilterMode <= OMX_VIDEO_AVCLoopFilterDisableSliceBoundary &&
         // The encoder library filters across its slices, or not at all.
         !(slices && avc.eLoopFilterMode == OMX_VIDEO_AVCLoopFilterDisableSliceBoundary);
}

// 0 leaves the choice to the component: of the profile, what it has; of the level, the lowest that will do.
OMX_ERRORTYPE EncoderSettings::setProfileAndLevel(OMX_U32 profile, OMX_U32 level) {
  if (profile != 0 && !knowsProfile(profile)) return OMX_ErrorUnsupportedSetting;
  if (level != 0 && levelIdc(level) == 0) return OMX_ErrorUnsupportedSetting;
  if (profile != 0) _avc.eProfile = static_cast<OMX_VIDEO_AVCPROFILETYPE>(profile);
  _avc.eLevel = static_cast<OMX_VIDEO_AVCLEVELTYPE>(level);
  return OMX_ErrorNone;
}

OMX_ERRORTYPE EncoderSettings::setAvc(const OMX_VIDEO_PARAM_AVCTYPE& wanted) {
  if (!canDo(wanted)) return OMX_ErrorUnsupportedSetting;
  const OMX_VIDEO_AVCPROFILETYPE profile = _avc.eProfile;
  const OMX_ERRORTYPE result = setProfileAndLevel(wanted.eProfile, wanted.eLevel);
  if (result != OMX_ErrorNone) return result;
  _pace.keyPeriod = keyPeriod(wanted.nPFrames);
  _avc = wanted;
  if (wanted.eProfile == 0) _avc.eProfile = profile;
  return OMX_ErrorNone;
}

OMX_ERRORTYPE EncoderSettings::enumerate(OMX_VIDEO_PARAM_PROFILELEVELTYPE* entry) const {
  constexpr OMX_U32 kProfiles[] = {OMX_VIDEO_AVCProfileBaseline, OMX_VIDEO_AVCProfileMain,
                                   OMX_VIDEO_AVCProfileHigh};
  if (entry->nProfileIndex >= std::size(kProfiles) || !knowsProfile(kProfiles[entry->nProfileIndex])) {
    return OMX_ErrorNoMore;
  }
  entry->eProfile = kProfiles[entry->nProfileIndex];
  entry->eLevel = OMX_VIDEO_AVCLevel4;  // what the largest picture takes at 30 pictures a second
  return OMX_ErrorNone;
}

}  // namespace mediaserver
