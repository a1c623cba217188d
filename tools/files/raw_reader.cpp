#include "tools/files/raw_reader.h"

#include <inttypes.h>

#include "tools/base/text.h"

namespace tool {

namespace {

class RawReader : public FrameSource {
 public:
  RawReader(std::unique_ptr<ByteReader> bytes, Size size, FrameRate rate)
      : _bytes(std::move(bytes)), _size(size), _traits{.rate = rate} {}

  Size size() const override { return _size; }
  const VideoTraits& traits() const override { return _traits; }
  std::optional<uint64_t> frameCount() const override {
    if (!_bytes->size()) return std::nullopt;
    return *_bytes->size() / pictureBytes(_size);
  }
  Result<bool> next(Picture& picture) override { return readPicture(*_bytes, _size, _read++, picture); }

 private:
  const std::unique_ptr<ByteReader> _bytes;
  const Size _size;
  const VideoTraits _traits;
  uint64_t _read = 0;
};

}  // namespace

Result<std::unique_ptr<FrameSource>> openRaw(std::unique_ptr<ByteReader> bytes, Size size, FrameRate rate) {
  return std::unique_ptr<FrameSource>(std::make_unique<RawReader>(std::move(bytes), size, rate));
}

Result<bool> readPicture(ByteReader& bytes, Size size, uint64_t number, Picture& picture) {
  picture.resize(size);
  const auto count = bytes.read(picture.bytes);
  if (!count.ok()) return count.failure();
  if (count.value() == picture.bytes.size()) return true;
  if (count.value() == 0 || bytes.stopped()) return false;
  return bytes.failure(formatted("ends in the middle of picture %" PRIu64
                                 " (%zu of %zu bytes); is %dx%d right?",
                                 number, count.value(), picture.bytes.size(), size.width, size.height));
}

}  // namespace tool
