// IOMX: the media server's door to OpenMAX components, and the observer through which it calls back.
//
// A node is a component instance that belongs to one client. Any thread may call IOMX; a component's
// results arrive later as messages, one after the other and never from inside a call of the client.
// The server watches the observer and does not hold it: when its last owner lets go of it, the client is
// taken for dead and the node is freed.
// Failures of a component arrive as ERROR_UNSUPPORTED or, nearly always, as UNKNOWN_ERROR.
#pragma once

#include <stddef.h>
#include <stdint.h>
#include <sys/types.h>

#include <OMX_Component.h>
#include <OMX_Core.h>
#include <OMX_Index.h>
#include <binder/IInterface.h>
#include <binder/IMemory.h>
#include <utils/List.h>
#include <utils/String8.h>

namespace android {

class GraphicBuffer;
class IOMXObserver;

class IOMX : public IInterface {
 public:
  DECLARE_META_INTERFACE(OMX);

  // Opaque to the client; 0 is none.
  typedef void* buffer_id;
  typedef void* node_id;

  struct ComponentInfo {
    String8 mName;
    List<String8> mRoles;
  };

  // The order of the operations is the platform's and part of the interface.

  virtual bool livesLocally(pid_t pid) = 0;

  // Replaces what the list holds.
  virtual status_t listNodes(List<ComponentInfo>* list) = 0;

  virtual status_t allocateNode(const char* name, const sp<IOMXObserver>& observer, node_id* node) = 0;

  // Works in any state of the node and takes its buffers down with it.
  virtual status_t freeNode(node_id node) = 0;

  // Success means that the component took the command; its completion is an event.
  virtual status_t sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) = 0;

  // `size` is the record's in bytes. A record that could not be read is left unchanged.
  virtual status_t getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) = 0;
  virtual status_t setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) = 0;
  virtual status_t getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) = 0;
  virtual status_t setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) = 0;

  virtual status_t getState(node_id node, OMX_STATETYPE* state) = 0;

  virtual status_t storeMetaDataInBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) = 0;
  virtual status_t enableGraphicBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) = 0;
  virtual status_t getGraphicBufferUsage(node_id node, OMX_U32 port_index, OMX_U32* usage) = 0;

  // The component works on the block itself.
  virtual status_t useBuffer(node_id node, OMX_U32 port_index, const sp<IMemory>& params,
                             buffer_id* buffer) = 0;
  virtual status_t useGraphicBuffer(node_id node, OMX_U32 port_index, const sp<GraphicBuffer>& graphicBuffer,
                                    buffer_id* buffer) = 0;

  // The component allocates; `buffer_data` is an address of the server's.
  virtual status_t allocateBuffer(node_id node, OMX_U32 port_index, size_t size, buffer_id* buffer,
                                  void** buffer_data) = 0;

  // As useBuffer, but what the client sends is copied first: it may reuse the block at once.
  virtual status_t allocateBufferWithBackup(node_id node, OMX_U32 port_index, const sp<IMemory>& params,
                                            buffer_id* buffer) = 0;

  virtual status_t freeBuffer(node_id node, OMX_U32 port_index, buffer_id buffer) = 0;

  virtual status_t fillBuffer(node_id node, buffer_id buffer) = 0;
  virtual status_t emptyBuffer(node_id node, buffer_id buffer, OMX_U32 range_offset, OMX_U32 range_length,
                               OMX_U32 flags, OMX_TICKS timestamp) = 0;

  virtual status_t getExtensionIndex(node_id node, const char* parameter_name, OMX_INDEXTYPE* index) = 0;
};

class BnOMX : public BnInterface<IOMX> {
 protected:
  BnOMX();
  ~BnOMX() override;
};

// One callback of a component.
struct omx_message {
  enum : uint32_t { EVENT = 0, EMPTY_BUFFER_DONE = 1, FILL_BUFFER_DONE = 2 } type;

  IOMX::node_id node;

  union {
    // EVENT
    struct {
      OMX_EVENTTYPE event;
      OMX_U32 data1;
      OMX_U32 data2;
    } event_data;

    // EMPTY_BUFFER_DONE
    struct {
      IOMX::buffer_id buffer;
    } buffer_data;

    // FILL_BUFFER_DONE
    struct {
      IOMX::buffer_id buffer;
      OMX_U32 range_offset;
      OMX_U32 range_length;
      OMX_U32 flags;
      OMX_TICKS timestamp;
      OMX_PTR platform_private;
      OMX_PTR data_ptr;
    } extended_buffer_data;
  } u;
};

class IOMXObserver : public IInterface {
 public:
  DECLARE_META_INTERFACE(OMXObserver);

  // Runs on a thread of the server; for one node never twice at the same time.
  virtual void onMessage(const omx_message& msg) = 0;
};

class BnOMXObserver : public BnInterface<IOMXObserver> {
 protected:
  BnOMXObserver();
  ~BnOMXObserver() override;
};

struct CodecProfileLevel {
  OMX_U32 mProfile;
  OMX_U32 mLevel;
};

}  // namespace android
