// The tool's readers on any bytes: Y4M, raw pictures, whatever libavformat opens, and H.264 byte streams.
// They read to the end or fail with a text.
#include <fuzzer/FuzzedDataProvider.h>
#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <vector>

extern "C" {
#include <libavutil/log.h>
#include <libavutil/mem.h>
}

#include "tools/files/frame_source.h"
#include "tools/media/h264_track.h"
#include "tools/video/layout.h"
#include "tools/video/picture.h"

namespace {

constexpr int kMostPictures = 16;  // enough to come to the second of everything
constexpr int kMostUnits = 4096;   // no input is long enough for as many
constexpr size_t kMemory = 256 << 20;

// The bytes as a file that has a path and no place on a disk.
class MemoryFile {
 public:
  explicit MemoryFile(const std::vector<uint8_t>& bytes)
      : _descriptor(memfd_create("input", MFD_CLOEXEC)),
        _path("/proc/self/fd/" + std::to_string(_descriptor)) {
    const ssize_t written = write(_descriptor, bytes.data(), bytes.size());
    if (written != static_cast<ssize_t>(bytes.size())) std::abort();
  }
  ~MemoryFile() { close(_descriptor); }
  MemoryFile(const MemoryFile&) = delete;
  MemoryFile& operator=(const MemoryFile&) = delete;
  const std::string& path() const { return _path; }

 private:
  const int _descriptor;
  const std::string _path;
};

void require(bool holds) {
  if (!holds) std::abort();
}

void readPictures(const tool::SourceRequest& request) {
  auto source = tool::openFrameSource(request, {});
  if (!source.ok()) return require(!source.failure().text.empty());
  const tool::Size size = source.value()->size();
  require(size.width > 0 && size.height > 0 && size.width % 2 == 0 && size.height % 2 == 0);
  tool::Picture picture;
  for (int i = 0; i < kMostPictures; ++i) {
    const tool::Result<bool> read = source.value()->next(picture);
    if (!read.ok()) return require(!read.failure().text.empty());
    if (!read.value()) return;
    require(picture.size == size && picture.bytes.size() == tool::pictureBytes(size));
  }
}

void readUnits(const std::string& path) {
  auto source = tool::openAccessUnits(path, {});
  if (!source.ok()) return require(!source.failure().text.empty());
  std::vector<uint8_t> unit;
  for (int i = 0;; ++i) {
    require(i < kMostUnits);
    const tool::Result<bool> read = source.value()->next(unit);
    if (!read.ok()) return require(!read.failure().text.empty());
    if (!read.value()) return;
    require(!unit.empty());
    static_cast<void>(tool::findSequenceInfo(unit));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  av_log_set_level(AV_LOG_QUIET);
  av_max_alloc(kMemory);  // a file that announces gigabytes is refused, not tried
  // Taken from the back, so that a file with some bytes behind it is a seed.
  FuzzedDataProvider choices(data, size);
  const bool units = choices.ConsumeBool();
  tool::SourceRequest request;
  if (choices.ConsumeBool()) {
    request.size =
        tool::Size{choices.ConsumeIntegralInRange(1, 64) * 2, choices.ConsumeIntegralInRange(1, 64) * 2};
    const std::vector<std::string> layouts = tool::readableLayouts();
    request.layout = layouts[choices.ConsumeIntegralInRange<size_t>(0, layouts.size() - 1)];
  }
  const MemoryFile file(choices.ConsumeRemainingBytes<uint8_t>());
  request.path = file.path();
  if (units) {
    readUnits(file.path());
  } else {
    readPictures(request);
  }
  return 0;
}
