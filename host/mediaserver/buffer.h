// One buffer of a port: its header, the memory behind it and who holds it. The node's table owns it; the
// worker keeps a second reference while its codec works on the memory, so a client that frees a buffer
// which it does not hold harms nobody.
// Threads: `holder`, `header`, `freed` and `unread` are guarded by the node's mutex, `incomplete` is atomic.
// The memory belongs to whoever holds the buffer; pointers and sizes never change.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>

#include <OMX_Core.h>
#include <binder/IMemory.h>
#include <media/IOMX.h>
#include <utils/RefBase.h>

#include "host/mediaserver/codec.h"

namespace mediaserver {

enum class Holder {
  Client,
  Node,   // waits in its port's line
  Codec,  // the worker has it in hand
};

class Buffer {
 public:
  // Works on the client's block directly. Null when there is no block or no memory behind it.
  static std::shared_ptr<Buffer> onBlock(const android::sp<android::IMemory>& block);
  // Memory of its own. Null when memory is short.
  static std::shared_ptr<Buffer> own(size_t size);

  uint8_t* data() const { return header.pBuffer; }
  size_t capacity() const { return header.nAllocLen; }
  // True when `length` bytes from `offset` lie inside the buffer.
  bool contains(size_t offset, size_t length) const;

  OMX_BUFFERHEADERTYPE header{};
  android::IOMX::buffer_id id = nullptr;
  Holder holder = Holder::Client;
  bool freed = false;   // no longer in its port's table
  bool unread = false;  // came back to the client with output, and has not been sent again
  // On its way back to the client, and yet to be written: nobody may send it.
  std::atomic<bool> incomplete{false};

 private:
  struct Release {
    void operator()(uint8_t* memory) const;
  };

  android::sp<android::IMemory> _block;
  std::unique_ptr<uint8_t, Release> _own;
};

}  // namespace mediaserver
