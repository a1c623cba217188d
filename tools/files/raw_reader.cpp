#include "tools/files/raw_reader.h"

#include <inttypes.h>

#include "tools/base/text.h"

namespace tool {

namespace {

// Fills `raw`; false at the end of the input.
Result<bool> readWhole(ByteReader& bytes, Size size, uint64_t number, std::span<uint8_t> raw) {
  const auto count = bytes.read(raw);
  if (!count.ok()) return count.failure();
  if (count.value() == raw.size()) return true;
  if (count.value() == 0 || bytes.stopped()) return false;
  return bytes.failure(formatted("ends in the middle of picture %" PRIu64
                                 " (%zu of %zu bytes); is %dx%d right?",
                                 number, count.value(), raw.size(), size.width, size.height));
}

class RawReader : public FrameSource {
 public:
  RawReader(std::unique_ptr<ByteReader> bytes, Size size, FrameRate rate, const Layout& layout)
      : _bytes(std::move(bytes)),
        _size(size),
        _traits{.rate = rate},
        _layout(layout),
        _raw(layout.rawBytes(size)) {}

  Size size() const override { return _size; }
  const VideoTraits& traits() const override { return _traits; }
  std::optional<uint64_t> frameCount() const override {
    if (!_bytes->size()) return std::nullopt;
    return *_bytes->size() / _raw.size();
  }
  Result<bool> next(Picture& picture) override {
    const auto more = readWhole(*_bytes, _size, _read++, _raw);
    if (!more.ok() || !more.value()) return more;
    picture.resize(_size);
    _layout.read(_raw.data(), static_cast<unsigned int>(_size.width), static_cast<unsigned int>(_size.height),
                 picture.bytes.data());
    return true;
  }

 private:
  const std::unique_ptr<ByteReader> _bytes;
  const Size _size;
  const VideoTraits _traits;
  const Layout& _layout;
  std::vector<uint8_t> _raw;
  uint64_t _read = 0;
};

}  // namespace

Result<std::unique_ptr<FrameSource>> openRaw(std::unique_ptr<ByteReader> bytes, Size size, FrameRate rate,
                                             const Layout& layout) {
  return std::unique_ptr<FrameSource>(std::make_unique<RawReader>(std::move(bytes), size, rate, layout));
}

Result<bool> readPicture(ByteReader& bytes, Size size, uint64_t number, Picture& picture) {
  picture.resize(size);
  return readWhole(bytes, size, number, picture.bytes);
}

}  // namespace tool
