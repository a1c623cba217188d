#include "tests/support/call.h"

#include <cinttypes>

#include <utils/String8.h>

namespace omxtest {

const char* name(Method method) {
  switch (method) {
    case Method::LivesLocally:
      return "livesLocally";
    case Method::ListNodes:
      return "listNodes";
    case Method::AllocateNode:
      return "allocateNode";
    case Method::FreeNode:
      return "freeNode";
    case Method::SendCommand:
      return "sendCommand";
    case Method::GetParameter:
      return "getParameter";
    case Method::SetParameter:
      return "setParameter";
    case Method::GetConfig:
      return "getConfig";
    case Method::SetConfig:
      return "setConfig";
    case Method::GetState:
      return "getState";
    case Method::StoreMetaDataInBuffers:
      return "storeMetaDataInBuffers";
    case Method::EnableGraphicBuffers:
      return "enableGraphicBuffers";
    case Method::GetGraphicBufferUsage:
      return "getGraphicBufferUsage";
    case Method::UseBuffer:
      return "useBuffer";
    case Method::UseGraphicBuffer:
      return "useGraphicBuffer";
    case Method::AllocateBuffer:
      return "allocateBuffer";
    case Method::AllocateBufferWithBackup:
      return "allocateBufferWithBackup";
    case Method::FreeBuffer:
      return "freeBuffer";
    case Method::FillBuffer:
      return "fillBuffer";
    case Method::EmptyBuffer:
      return "emptyBuffer";
    case Method::GetExtensionIndex:
      return "getExtensionIndex";
  }
  return "unknown";
}

std::string describe(const Call& call) {
  return android::String8::format(
             "#%zu %s node %p %s command %u/%d index 0x%08x size %zu port %u buffer %p range %u+%u flags "
             "0x%x "
             "time %" PRId64 " -> %d%s",
             call.number, name(call.method), call.node, call.text.c_str(),
             static_cast<unsigned>(call.command), call.param, static_cast<unsigned>(call.index), call.size,
             call.port, call.buffer, call.offset, call.length, call.flags, call.timestamp, call.status,
             call.forwarded ? "" : " (on request)")
      .string();
}

}  // namespace omxtest
