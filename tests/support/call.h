#pragma once
// One call to IOMX, and what one buffer carries, as a test sees them. Plain values.

#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <media/IOMX.h>
#include <utils/Errors.h>

namespace omxtest {

// Those that sessions make.
enum class Method {
  ListNodes,
  AllocateNode,
  FreeNode,
  SendCommand,
  GetParameter,
  SetParameter,
  GetConfig,
  SetConfig,
  StoreMetaDataInBuffers,
  UseBuffer,
  AllocateBuffer,
  AllocateBufferWithBackup,
  FreeBuffer,
  FillBuffer,
  EmptyBuffer,
};

// The method as it is written in IOMX.
inline const char* name(Method method) {
  static constexpr const char* kNames[] = {"listNodes",   "allocateNode",   "freeNode",
                                           "sendCommand", "getParameter",   "setParameter",
                                           "getConfig",   "setConfig",      "storeMetaDataInBuffers",
                                           "useBuffer",   "allocateBuffer", "allocateBufferWithBackup",
                                           "freeBuffer",  "fillBuffer",     "emptyBuffer"};
  return kNames[static_cast<size_t>(method)];
}

// Only what the method has is filled in. Results (buffer, node, status, and the record of a get) are
// known after the call: in hooks before it they are empty.
struct Call {
  Method method{};
  android::IOMX::node_id node = nullptr;
  size_t number = 0;                 // counts all calls, from 1
  std::string text = {};             // component name
  OMX_COMMANDTYPE command{};         // SendCommand
  OMX_S32 param = 0;                 // SendCommand
  OMX_INDEXTYPE index{};             // parameters and configurations
  std::vector<uint8_t> record = {};  // as sent by a set; of a get: as sent, and after success as answered
  size_t size = 0;  // of a record as the caller says, of AllocateBuffer's buffer, of a block of ours
  OMX_U32 port = 0;
  android::IOMX::buffer_id buffer = nullptr;
  OMX_U32 offset = 0;  // EmptyBuffer
  OMX_U32 length = 0;
  OMX_U32 flags = 0;
  OMX_TICKS timestamp = 0;
  OMX_BOOL enable = OMX_FALSE;  // StoreMetaDataInBuffers
  android::status_t status = android::OK;

  // The record as a T; nothing if it is shorter.
  template <typename T>
  std::optional<T> as() const {
    if (record.size() < sizeof(T)) return std::nullopt;
    T value;
    std::memcpy(&value, record.data(), sizeof(T));
    return value;
  }
};

// The bytes of one buffer with what travels along: an input as a component got it, or an output that it is
// to produce.
struct Packet {
  std::vector<uint8_t> bytes;
  OMX_TICKS timestamp = 0;
  OMX_U32 flags = 0;
  // Outputs only.
  OMX_U32 offset = 0;                   // where in the buffer the bytes begin
  std::optional<OMX_U32> lengthToTell;  // instead of the true length: a component that lies

  Packet() = default;
  explicit Packet(std::string_view text, OMX_TICKS time = 0, OMX_U32 flagWord = 0)
      : bytes(text.begin(), text.end()), timestamp(time), flags(flagWord) {}

  std::string text() const { return {bytes.begin(), bytes.end()}; }
};

}  // namespace omxtest
