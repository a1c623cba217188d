#include <assert.h>

#include <atomic>

#include <omxhost/faults.h>
#include <utils/RefBase.h>

namespace android {

namespace {

// The strong count of an object that nobody has held yet. It is positive, so that a weak reference can
// be promoted before the first strong one exists, while 0 always means: gone.
constexpr int32_t kNeverHeld = 1 << 28;

std::atomic<int64_t> counted{0};

}  // namespace

class RefBase::Counts : public RefBase::weakref_type {
 public:
  explicit Counts(RefBase* owner) : object(owner) { counted.fetch_add(1, std::memory_order_relaxed); }
  ~Counts() { counted.fetch_sub(1, std::memory_order_relaxed); }

  void countFirst() {
    strong.fetch_sub(kNeverHeld, std::memory_order_relaxed);
    object->onFirstRef();
  }

  RefBase* const object;
  std::atomic<int32_t> strong{kNeverHeld};
  // Weak references, plus one for the object while it exists.
  std::atomic<int32_t> weak{1};
};

void RefBase::weakref_type::incWeak(const void* /*id*/) {
  static_cast<Counts*>(this)->weak.fetch_add(1, std::memory_order_relaxed);
}

void RefBase::weakref_type::decWeak(const void* /*id*/) {
  auto* const counts = static_cast<Counts*>(this);
  // Acquire and release: whoever deletes the counts has seen everybody else's last use of them.
  const int32_t before = counts->weak.fetch_sub(1, std::memory_order_acq_rel);
  assert(before >= 1);
  if (before == 1) delete counts;
}

bool RefBase::weakref_type::attemptIncStrong(const void* /*id*/) {
  auto* const counts = static_cast<Counts*>(this);
  int32_t seen = counts->strong.load(std::memory_order_relaxed);
  do {
    if (seen <= 0) return false;
  } while (!counts->strong.compare_exchange_weak(seen, seen + 1, std::memory_order_acquire,
                                                 std::memory_order_relaxed));
  if (seen == kNeverHeld) counts->countFirst();
  return true;
}

RefBase::RefBase() : _counts(new Counts(this)) {}

RefBase::~RefBase() {
  // An object that was never held, say a member of another one, may still be watched.
  _counts->strong.store(0, std::memory_order_relaxed);
  _counts->decWeak(this);
}

void RefBase::incStrong(const void* /*id*/) const {
  const int32_t before = _counts->strong.fetch_add(1, std::memory_order_relaxed);
  assert(before >= 1);
  if (before == kNeverHeld) _counts->countFirst();
}

void RefBase::decStrong(const void* id) const {
  // Acquire and release: the destructor runs after everything the other owners did to the object.
  const int32_t before = _counts->strong.fetch_sub(1, std::memory_order_acq_rel);
  assert(before >= 1);
  if (before != 1) return;
  _counts->object->onLastStrongRef(id);
  delete this;
}

int32_t RefBase::getStrongCount() const {
  const int32_t count = _counts->strong.load(std::memory_order_relaxed);
  return count >= kNeverHeld ? count - kNeverHeld : count;
}

RefBase::weakref_type* RefBase::createWeak(const void* id) const {
  _counts->incWeak(id);
  return _counts;
}

RefBase::weakref_type* RefBase::getWeakRefs() const {
  return _counts;
}

void RefBase::onFirstRef() {}
void RefBase::onLastStrongRef(const void* /*id*/) {}

}  // namespace android

int64_t omxhost::liveObjects() {
  return android::counted.load(std::memory_order_relaxed);
}
