// Settings of a running encoder that reach every vendor's component in the same way.
#pragma once

#include "core/log.h"
#include "omxbridge/codec_settings.h"
#include "omxbridge/result.h"
#include "platform/component_node.h"

// Sends one configuration record. 0, or 33 with an error line when the component refuses it.
template <typename Record>
int sendConfig(const ComponentNode& node, OMX_INDEXTYPE index, const Record& record) {
  if (node.setConfig(index, record) == android::OK) return OMXI_OK;
  // Kept: the number in the line is the index, not the status.
  return failWith(OMXI_ERR_SET_CONFIG, "===qoxtest setConfig Error %x!", static_cast<unsigned int>(index));
}

// Bit rate, key-frame request and rotation, whose records are the standard's on every platform, all for
// the output port. Any other item: 33, silently, without a call.
int sendCommonConfig(const ComponentNode& node, CONFIGTYPE type, unsigned long value);
