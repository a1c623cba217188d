#include "host/mediaserver/buffer.h"

#include <algorithm>
#include <cstring>
#include <new>

namespace mediaserver {

namespace {

// What the codecs' vector units like best; more than any port asks for.
constexpr std::align_val_t kAlignment{64};

// Beyond this a request is a mistake and not a picture.
constexpr size_t kLargestBuffer = size_t{1} << 28;

uint8_t* allocateZeroed(size_t size) {
  void* memory = ::operator new(std::max<size_t>(size, 1), kAlignment, std::nothrow);
  if (memory != nullptr) std::memset(memory, 0, size);
  return static_cast<uint8_t*>(memory);
}

}  // namespace

void Buffer::Release::operator()(uint8_t* memory) const {
  ::operator delete(memory, kAlignment);
}

std::shared_ptr<Buffer> Buffer::onBlock(const android::sp<android::IMemory>& block) {
  if (block.get() == nullptr) return nullptr;
  const size_t size = block->size();
  auto* const memory = static_cast<uint8_t*>(block->pointer());
  if (size > kLargestBuffer || (memory == nullptr && size > 0)) return nullptr;
  auto buffer = std::make_shared<Buffer>();
  buffer->_block = block;
  buffer->header.pBuffer = memory;
  buffer->header.nAllocLen = static_cast<OMX_U32>(size);
  return buffer;
}

std::shared_ptr<Buffer> Buffer::own(size_t size) {
  if (size > kLargestBuffer) return nullptr;
  auto buffer = std::make_shared<Buffer>();
  buffer->_own.reset(allocateZeroed(size));
  if (buffer->_own == nullptr) return nullptr;
  buffer->header.pBuffer = buffer->_own.get();
  buffer->header.nAllocLen = static_cast<OMX_U32>(size);
  return buffer;
}

bool Buffer::contains(size_t offset, size_t length) const {
  return offset <= capacity() && length <= capacity() - offset;
}

}  // namespace mediaserver
