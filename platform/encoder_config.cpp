#include "platform/encoder_config.h"

#include <OMX_Video.h>

#include "core/omx_interface.h"
#include "core/omx_record.h"

int sendCommonConfig(const ComponentNode& node, CONFIGTYPE type, unsigned long value) {
  switch (type) {
    case CONFIG_BITRATE: {
      auto record = makeOmxRecord<OMX_VIDEO_CONFIG_BITRATETYPE>(kOmxOutputPort);
      record.nEncodeBitrate = static_cast<OMX_U32>(value);
      return sendConfig(node, OMX_IndexConfigVideoBitrate, record);
    }
    case CONFIG_REQUEST_IFRAME: {
      auto record = makeOmxRecord<OMX_CONFIG_INTRAREFRESHVOPTYPE>(kOmxOutputPort);
      record.IntraRefreshVOP = OMX_TRUE;
      return sendConfig(node, OMX_IndexConfigVideoIntraVOPRefresh, record);
    }
    case CONFIG_ROTATION: {
      auto record = makeOmxRecord<OMX_CONFIG_ROTATIONTYPE>(kOmxOutputPort);
      record.nRotation = static_cast<OMX_S32>(value);
      return sendConfig(node, OMX_IndexConfigCommonRotate, record);
    }
    default:
      return OMXI_ERR_SET_CONFIG;
  }
}
