#include <sys/mman.h>
#include <unistd.h>

#include <mutex>
#include <new>

#include <binder/MemoryBase.h>
#include <binder/MemoryDealer.h>
#include <binder/MemoryHeapBase.h>

#include "host/binder/block_books.h"
#include "host/binder/memory_faults.h"

namespace android {

namespace {

// The whole pages of a free range read as zero from now on and cost no memory.
void returnPages(uint8_t* base, size_t offset, size_t bytes) {
  const auto page = static_cast<size_t>(sysconf(_SC_PAGESIZE));
  const size_t begin = (offset + page - 1) / page * page;
  const size_t end = (offset + bytes) / page * page;
  if (begin < end) madvise(base + begin, end - begin, MADV_REMOVE);
}

}  // namespace

struct MemoryDealer::Books {
  explicit Books(size_t bytes) : books(bytes) {}

  std::mutex mutex;
  BlockBooks books;
};

class MemoryDealer::Block : public MemoryBase {
 public:
  Block(const sp<MemoryDealer>& dealer, size_t offset, size_t size, uint64_t ticket)
      : MemoryBase(dealer->getMemoryHeap(), static_cast<ssize_t>(offset), size),
        _dealer(dealer),
        _ticket(ticket) {}

 protected:
  ~Block() override {
    // An empty block has no piece and ticket 0, which must not stand for somebody else's.
    if (_ticket != BlockBooks::kAnyTicket) _dealer->giveBack(static_cast<size_t>(offset()), _ticket);
  }

 private:
  const sp<MemoryDealer> _dealer;
  const uint64_t _ticket;
};

MemoryDealer::MemoryDealer(size_t size, const char* name)
    : _heap(new MemoryHeapBase(size, 0, name)), _books(std::make_unique<Books>(_heap->getSize())) {}

MemoryDealer::~MemoryDealer() = default;

sp<IMemory> MemoryDealer::allocate(size_t size) {
  if (omxhost::memoryBlockFails()) return nullptr;
  if (size == 0) return new Block(this, 0, 0, BlockBooks::kAnyTicket);
  std::optional<BlockBooks::Piece> piece;
  {
    const std::lock_guard lock(_books->mutex);
    piece = _books->books.take(size);
  }
  if (!piece) return nullptr;
  return new Block(this, piece->offset, size, piece->ticket);
}

void MemoryDealer::deallocate(size_t offset) {
  giveBack(offset, BlockBooks::kAnyTicket);
}

sp<IMemoryHeap> MemoryDealer::getMemoryHeap() const {
  return _heap;
}

void MemoryDealer::giveBack(size_t offset, uint64_t ticket) {
  const std::lock_guard lock(_books->mutex);
  const auto piece = _books->books.giveBack(offset, ticket);
  // Under the lock: the piece must not have a new user yet.
  if (piece) returnPages(static_cast<uint8_t*>(_heap->getBase()), piece->offset, piece->bytes);
}

}  // namespace android
