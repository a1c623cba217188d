#include "tools/files/byte_reader.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <string.h>
#include <sys/eventfd.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <functional>

namespace tool {

namespace {

constexpr size_t kBufferSize = 65536;
static_assert(ByteReader::kMaxPeek <= kBufferSize);

}  // namespace

class ByteReader::StopSignal {
 public:
  explicit StopSignal(const std::stop_token& stop)
      : _callback(stop, [this] {
          const uint64_t one = 1;
          [[maybe_unused]] const ssize_t written = ::write(_event.descriptor, &one, sizeof(one));
        }) {}

  int descriptor() const { return _event.descriptor; }

 private:
  struct Event {
    Event() = default;
    ~Event() { close(descriptor); }
    Event(const Event&) = delete;
    Event& operator=(const Event&) = delete;
    const int descriptor = eventfd(0, EFD_CLOEXEC);
  };

  Event _event;  // outlives the callback
  std::stop_callback<std::function<void()>> _callback;
};

ByteReader::ByteReader(std::string name, int descriptor, bool owned, std::optional<uint64_t> size,
                       std::stop_token stop)
    : _name(std::move(name)),
      _descriptor(descriptor),
      _owned(owned),
      _size(size),
      _stop(std::move(stop)),
      _stopSignal(std::make_unique<StopSignal>(_stop)),
      _buffer(kBufferSize) {}

ByteReader::~ByteReader() {
  if (_owned) close(_descriptor);
}

Result<std::unique_ptr<ByteReader>> ByteReader::open(const std::string& path, const std::stop_token& stop) {
  const bool isStandardInput = path == "-";
  const std::string name = isStandardInput ? "standard input" : path;
  const int descriptor = isStandardInput ? STDIN_FILENO : ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
  if (descriptor < 0) return Failure{ExitCode::Input, name + ": " + strerror(errno)};
  struct stat status {};
  std::optional<uint64_t> size;
  if (fstat(descriptor, &status) == 0 && S_ISREG(status.st_mode))
    size = static_cast<uint64_t>(status.st_size);
  return std::unique_ptr<ByteReader>(new ByteReader(name, descriptor, !isStandardInput, size, stop));
}

// What one read brings, at least a byte unless the input is at its end.
Result<size_t> ByteReader::readDescriptor(std::span<uint8_t> out) {
  for (;;) {
    pollfd watched[] = {{_descriptor, POLLIN, 0}, {_stopSignal->descriptor(), POLLIN, 0}};
    if (poll(watched, 2, -1) < 0 && errno != EINTR) return failure(strerror(errno));
    if (stopped()) return size_t{0};
    const ssize_t count = ::read(_descriptor, out.data(), out.size());
    if (count >= 0) return static_cast<size_t>(count);
    if (errno != EINTR && errno != EAGAIN) return failure(strerror(errno));
  }
}

Result<size_t> ByteReader::readSome(std::span<uint8_t> out) {
  const size_t ready = std::min(out.size(), buffered().size());
  if (ready == 0) return readDescriptor(out);
  std::copy_n(buffered().begin(), ready, out.begin());
  _begin += ready;
  return ready;
}

Result<size_t> ByteReader::read(std::span<uint8_t> out) {
  size_t filled = 0;
  while (filled < out.size()) {
    const auto count = readSome(out.subspan(filled));
    if (!count.ok()) return count;
    if (count.value() == 0) break;
    filled += count.value();
  }
  return filled;
}

Result<std::span<const uint8_t>> ByteReader::peek(size_t count) {
  count = std::min(count, kMaxPeek);
  if (_begin > 0 && buffered().size() < count) {
    std::copy(buffered().begin(), buffered().end(), _buffer.begin());
    _end -= _begin;
    _begin = 0;
  }
  while (buffered().size() < count) {
    const auto got = readDescriptor(std::span(_buffer).subspan(_end));
    if (!got.ok()) return got.failure();
    if (got.value() == 0) break;
    _end += got.value();
  }
  return buffered().first(std::min(count, buffered().size()));
}

bool ByteReader::seek(uint64_t offset) {
  if (!_size || lseek(_descriptor, static_cast<off_t>(offset), SEEK_SET) < 0) return false;
  _begin = _end = 0;
  return true;
}

Result<std::optional<std::string>> ByteReader::readLine(size_t limit) {
  limit = std::min(limit, kMaxPeek);
  // One byte more at a time: a pipe may hold no more than the line for now.
  for (size_t wanted = 1;;) {
    const auto bytes = peek(wanted);
    if (!bytes.ok()) return bytes.failure();
    const auto available = buffered().first(std::min(limit, buffered().size()));
    const auto lineEnd = std::find(available.begin(), available.end(), uint8_t{'\n'});
    if (lineEnd != available.end()) {
      std::string line(available.begin(), lineEnd);
      _begin += line.size() + 1;
      return std::optional(std::move(line));
    }
    if (available.size() >= limit || bytes.value().size() < wanted) return std::optional<std::string>();
    wanted = available.size() + 1;
  }
}

}  // namespace tool
