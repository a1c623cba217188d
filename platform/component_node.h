// One component's node as the wrappers and the encoder see it: records written and read by index. The
// size that goes with a record is always the record's own, whatever its size word says.
//
// Any thread; the media server serialises the calls. Holds its own reference to IOMX. Without a
// connection every call fails with NO_INIT.
#pragma once

#include <OMX_Core.h>
#include <OMX_Index.h>
#include <media/IOMX.h>
#include <utils/Errors.h>
#include <utils/RefBase.h>

class ComponentNode {
 public:
  ComponentNode(const android::sp<android::IOMX>& omx, android::IOMX::node_id node)
      : _omx(omx), _node(node) {}

  template <typename Record>
  android::status_t getParameter(OMX_INDEXTYPE index, Record* record) const {
    if (_omx == nullptr) return android::NO_INIT;
    return _omx->getParameter(_node, index, record, sizeof(Record));
  }
  template <typename Record>
  android::status_t setParameter(OMX_INDEXTYPE index, const Record& record) const {
    if (_omx == nullptr) return android::NO_INIT;
    return _omx->setParameter(_node, index, &record, sizeof(Record));
  }
  template <typename Record>
  android::status_t getConfig(OMX_INDEXTYPE index, Record* record) const {
    if (_omx == nullptr) return android::NO_INIT;
    return _omx->getConfig(_node, index, record, sizeof(Record));
  }
  template <typename Record>
  android::status_t setConfig(OMX_INDEXTYPE index, const Record& record) const {
    if (_omx == nullptr) return android::NO_INIT;
    return _omx->setConfig(_node, index, &record, sizeof(Record));
  }
  // Whether the port's buffers carry pictures' handles (true) or their pixels (false).
  android::status_t storeMetaDataInBuffers(OMX_U32 port, bool enable) const {
    if (_omx == nullptr) return android::NO_INIT;
    return _omx->storeMetaDataInBuffers(_node, port, enable ? OMX_TRUE : OMX_FALSE);
  }

 private:
  android::sp<android::IOMX> _omx;
  android::IOMX::node_id _node;
};
