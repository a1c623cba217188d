// The memory interfaces' helpers, heaps on anonymous memory files, and plain blocks of a heap.
#include <stdint.h>
#include <sys/mman.h>
#include <unistd.h>

#include <binder/MemoryBase.h>
#include <binder/MemoryHeapBase.h>

namespace android {

IMPLEMENT_META_INTERFACE(MemoryHeap, "android.utils.IMemoryHeap");
IMPLEMENT_META_INTERFACE(Memory, "android.utils.IMemory");

BnMemoryHeap::BnMemoryHeap() = default;
BnMemoryHeap::~BnMemoryHeap() = default;

BnMemory::BnMemory() = default;
BnMemory::~BnMemory() = default;

void* IMemory::pointer() const {
  ssize_t offset = 0;
  const sp<IMemoryHeap> heap = getMemory(&offset);
  void* const base = heap != nullptr ? heap->base() : nullptr;
  return base != nullptr ? static_cast<uint8_t*>(base) + offset : nullptr;
}

size_t IMemory::size() const {
  size_t size = 0;
  (void)getMemory(nullptr, &size);
  return size;
}

ssize_t IMemory::offset() const {
  ssize_t offset = 0;
  (void)getMemory(&offset);
  return offset;
}

MemoryHeapBase::MemoryHeapBase(size_t size, uint32_t flags, const char* name) : _flags(flags) {
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  if (size == 0 || size > static_cast<size_t>(PTRDIFF_MAX) - page) return;
  const size_t rounded = (size + page - 1) / page * page;

  const int file = memfd_create(name != nullptr ? name : "heap", MFD_CLOEXEC);
  if (file < 0) return;
  void* base = MAP_FAILED;
  if (ftruncate(file, static_cast<off_t>(rounded)) == 0) {
    const int access = (flags & READ_ONLY) != 0 ? PROT_READ : PROT_READ | PROT_WRITE;
    base = mmap(nullptr, rounded, access, MAP_SHARED, file, 0);
  }
  if (base == MAP_FAILED) {
    close(file);
    return;
  }
  _file = file;
  _base = base;
  _size = rounded;
}

MemoryHeapBase::~MemoryHeapBase() {
  if (_base != nullptr) munmap(_base, _size);
  if (_file >= 0) close(_file);
}

int MemoryHeapBase::getHeapID() const {
  return _file;
}
void* MemoryHeapBase::getBase() const {
  return _base;
}
size_t MemoryHeapBase::getSize() const {
  return _size;
}
uint32_t MemoryHeapBase::getFlags() const {
  return _flags;
}
uint32_t MemoryHeapBase::getOffset() const {
  return 0;
}

MemoryBase::MemoryBase(const sp<IMemoryHeap>& heap, ssize_t offset, size_t size)
    : _heap(heap), _offset(offset), _size(size) {}

MemoryBase::~MemoryBase() = default;

sp<IMemoryHeap> MemoryBase::getMemory(ssize_t* offset, size_t* size) const {
  if (offset != nullptr) *offset = _offset;
  if (size != nullptr) *size = _size;
  return _heap;
}

}  // namespace android
