// The encoder's settings as records: which there are, on which port, and what they say.

#include "host/mediaserver/components/encoder_settings.h"
#include "host/mediaserver/components/records.h"
#include "host/mediaserver/components/vendor_records.h"

namespace mediaserver {

namespace {

constexpr uint32_t kLargestQuantizer = 51;

// What concerns the stream belongs to the output port.
template <typename T>
OMX_ERRORTYPE outputOnly(const T& record) {
  return record.nPortIndex == kOutputPort ? OMX_ErrorNone : OMX_ErrorBadPortIndex;
}

// Kept: what changes while the encoder runs is asked and told on either port. Clients read the bit rate on
// the input port and write it on the output port, and some write the frame rate to the input port.
template <typename T>
OMX_ERRORTYPE eitherPort(const T& record) {
  return record.nPortIndex < kPortCount ? OMX_ErrorNone : OMX_ErrorBadPortIndex;
}

bool isQuarterTurn(OMX_S32 degrees) {
  return degrees == 0 || degrees == 90 || degrees == 180 || degrees == 270;
}

}  // namespace

Codec::Answer EncoderSettings::getParameter(OMX_INDEXTYPE index, void* record, size_t size) const {
  std::lock_guard<std::mutex> lock(_mutex);
  switch (static_cast<OMX_U32>(index)) {
    case OMX_IndexParamVideoAvc:
      return answer<OMX_VIDEO_PARAM_AVCTYPE>(record, size, [this](auto* avc) {
        const OMX_ERRORTYPE result = outputOnly(*avc);
        *avc = _avc;
        avc->nPortIndex = kOutputPort;
        avc->nPFrames = countPFrames(_pace.keyPeriod);
        avc->bEntropyCodingCABAC = cabac() ? OMX_TRUE : OMX_FALSE;
        return result;
      });
    case OMX_IndexParamVideoProfileLevelCurrent:
      return answer<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(record, size, [this](auto* current) {
        current->eProfile = _avc.eProfile;
        current->eLevel = _avc.eLevel;
        return outputOnly(*current);
      });
    case OMX_IndexParamVideoProfileLevelQuerySupported:
      return answer<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(record, size, [this](auto* entry) {
        const OMX_ERRORTYPE result = outputOnly(*entry);
        return result == OMX_ErrorNone ? enumerate(entry) : result;
      });
    case OMX_IndexParamVideoBitrate:
      return answer<OMX_VIDEO_PARAM_BITRATETYPE>(record, size, [this](auto* rate) {
        rate->eControlRate = _controlRate;
        rate->nTargetBitrate = _pace.bitRate;
        return outputOnly(*rate);
      });
    case OMX_IndexParamVideoQuantization:
      return answer<OMX_VIDEO_PARAM_QUANTIZATIONTYPE>(record, size, [this](auto* quantizer) {
        quantizer->nQpI = _quantizerI;
        quantizer->nQpP = _quantizerP;
        quantizer->nQpB = 0;
        return outputOnly(*quantizer);
      });
    default:
      return std::nullopt;
  }
}

Codec::Answer EncoderSettings::setParameter(OMX_INDEXTYPE index, const void* record, size_t size) {
  std::lock_guard<std::mutex> lock(_mutex);
  switch (static_cast<OMX_U32>(index)) {
    case OMX_IndexParamVideoAvc:
      return accept<OMX_VIDEO_PARAM_AVCTYPE>(record, size, [this](const auto& avc) {
        const OMX_ERRORTYPE result = outputOnly(avc);
        return result == OMX_ErrorNone ? setAvc(avc) : result;
      });
    case OMX_IndexParamVideoProfileLevelCurrent:
      return accept<OMX_VIDEO_PARAM_PROFILELEVELTYPE>(record, size, [this](const auto& current) {
        const OMX_ERRORTYPE result = outputOnly(current);
        return result == OMX_ErrorNone ? setProfileAndLevel(current.eProfile, current.eLevel) : result;
      });
    case OMX_IndexParamVideoBitrate:
      return accept<OMX_VIDEO_PARAM_BITRATETYPE>(record, size, [this](const auto& rate) {
        if (outputOnly(rate) != OMX_ErrorNone) return OMX_ErrorBadPortIndex;
        if (rate.eControlRate > OMX_Video_ControlRateConstantSkipFrames) return OMX_ErrorUnsupportedSetting;
        const bool needed = rate.eControlRate != OMX_Video_ControlRateDisable;
        if (needed && rate.nTargetBitrate == 0) return OMX_ErrorBadParameter;
        _controlRate = rate.eControlRate;
        if (rate.nTargetBitrate != 0) _pace.bitRate = rate.nTargetBitrate;
        return OMX_ErrorNone;
      });
    case OMX_IndexParamVideoQuantization:
      return accept<OMX_VIDEO_PARAM_QUANTIZATIONTYPE>(record, size, [this](const auto& quantizer) {
        if (outputOnly(quantizer) != OMX_ErrorNone) return OMX_ErrorBadPortIndex;
        if (quantizer.nQpI > kLargestQuantizer || quantizer.nQpP > kLargestQuantizer) {
          return OMX_ErrorBadParameter;
        }
        _quantizerI = quantizer.nQpI;
        _quantizerP = quantizer.nQpP;
        return OMX_ErrorNone;
      });
    case kStoreMetaDataIndex:
      return accept<StoreMetaData>(record, size, [](const auto& meta) {
        if (eitherPort(meta) != OMX_ErrorNone) return OMX_ErrorBadPortIndex;
        return meta.bStoreMetaData == OMX_FALSE ? OMX_ErrorNone : OMX_ErrorUnsupportedSetting;
      });
    default:
      return std::nullopt;
  }
}

Codec::Answer EncoderSettings::getConfig(OMX_INDEXTYPE index, void* record, size_t size) const {
  std::lock_guard<std::mutex> lock(_mutex);
  switch (static_cast<OMX_U32>(index)) {
    case OMX_IndexConfigVideoBitrate:
      return answer<OMX_VIDEO_CONFIG_BITRATETYPE>(record, size, [this](auto* rate) {
        rate->nEncodeBitrate = _pace.bitRate;
        return eitherPort(*rate);
      });
    case OMX_IndexConfigVideoFramerate:
      return answer<OMX_CONFIG_FRAMERATETYPE>(record, size, [this](auto* rate) {
        rate->xEncodeFramerate = _pace.frameRate;
        return eitherPort(*rate);
      });
    case OMX_IndexConfigVideoAVCIntraPeriod:
      return answer<OMX_VIDEO_CONFIG_AVCINTRAPERIOD>(record, size, [this](auto* period) {
        period->nIDRPeriod = _pace.keyPeriod;
        period->nPFrames = _pace.keyPeriod - 1;
        return eitherPort(*period);
      });
    case OMX_IndexConfigCommonRotate:
      return answer<OMX_CONFIG_ROTATIONTYPE>(record, size, [this](auto* rotation) {
        rotation->nRotation = static_cast<OMX_S32>(_pace.degrees);
        return eitherPort(*rotation);
      });
    default:
      return std::nullopt;
  }
}

Codec::Answer EncoderSettings::setConfig(OMX_INDEXTYPE index, const void* record, size_t size) {
  std::lock_guard<std::mutex> lock(_mutex);
  switch (static_cast<OMX_U32>(index)) {
    case OMX_IndexConfigVideoBitrate:
      return accept<OMX_VIDEO_CONFIG_BITRATETYPE>(record, size, [this](const auto& rate) {
        if (rate.nEncodeBitrate == 0) return OMX_ErrorBadParameter;
        const OMX_ERRORTYPE result = eitherPort(rate);
        if (result == OMX_ErrorNone) _pace.bitRate = rate.nEncodeBitrate;
        return result;
      });
    case OMX_IndexConfigVideoFramerate:
      return accept<OMX_CONFIG_FRAMERATETYPE>(record, size, [this](const auto& rate) {
        if (rate.xEncodeFramerate == 0) return OMX_ErrorBadParameter;
        const OMX_ERRORTYPE result = eitherPort(rate);
        if (result == OMX_ErrorNone) _pace.frameRate = rate.xEncodeFramerate;
        return result;
      });
    case OMX_IndexConfigVideoIntraVOPRefresh:
      return accept<OMX_CONFIG_INTRAREFRESHVOPTYPE>(record, size, [this](const auto& refresh) {
        const OMX_ERRORTYPE result = eitherPort(refresh);
        if (result == OMX_ErrorNone && refresh.IntraRefreshVOP != OMX_FALSE) _keyRequested = true;
        return result;
      });
    case OMX_IndexConfigVideoAVCIntraPeriod:
      return accept<OMX_VIDEO_CONFIG_AVCINTRAPERIOD>(record, size, [this](const auto& period) {
        // Every intra picture is an IDR picture here.
        if (period.nIDRPeriod != period.nPFrames + 1) return OMX_ErrorUnsupportedSetting;
        const OMX_ERRORTYPE result = eitherPort(period);
        if (result == OMX_ErrorNone) _pace.keyPeriod = period.nIDRPeriod;
        return result;
      });
    case kQcomIntraPeriodIndex:
      if (_traits.vendor != omxhost::Vendor::Qualcomm) return std::nullopt;
      return accept<QcomIntraPeriod>(record, size, [this](const auto& period) {
        if (period.nIDRPeriod != 1 || period.nBFrames != 0) return OMX_ErrorUnsupportedSetting;
        const OMX_ERRORTYPE result = eitherPort(period);
        if (result == OMX_ErrorNone) _pace.keyPeriod = keyPeriod(period.nPFrames);
        return result;
      });
    case OMX_IndexConfigCommonRotate:
      return accept<OMX_CONFIG_ROTATIONTYPE>(record, size, [this](const auto& rotation) {
        if (!isQuarterTurn(rotation.nRotation)) return OMX_ErrorUnsupportedSetting;
        const OMX_ERRORTYPE result = eitherPort(rotation);
        if (result == OMX_ErrorNone) _pace.degrees = static_cast<unsigned>(rotation.nRotation);
        return result;
      });
    default:
      return std::nullopt;
  }
}

}  // namespace mediaserver
