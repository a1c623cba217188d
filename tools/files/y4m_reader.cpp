#include "tools/files/y4m_reader.h"

#include <inttypes.h>

#include <algorithm>
#include <array>
#include <string_view>

#include "tools/base/text.h"
#include "tools/files/raw_reader.h"

namespace tool {

namespace {

constexpr std::string_view kMagic = "YUV4MPEG2";
constexpr std::string_view kFrame = "FRAME";
constexpr size_t kMaxLine = 1024;
constexpr std::array<std::string_view, 5> kChroma{"420", "420jpeg", "420mpeg2", "420paldv", "420unspecified"};

struct Header {
  size_t length = 0;  // bytes, with the line feed
  Size size;
  VideoTraits traits;
};

// Parses the words behind the magic. On failure the text says which one is wrong.
std::optional<std::string> parseHeader(std::string_view line, Header& header) {
  std::optional<int> width;
  std::optional<int> height;
  const auto side = [](std::string_view text) -> std::optional<int> {
    const auto size = parseSize(std::string(text) + "x2");
    return size ? std::optional(size->width) : std::nullopt;
  };
  header.traits.chroma = "420jpeg";  // what a stream without a word about it means
  for (line.remove_prefix(kMagic.size()); !line.empty();) {
    const size_t begin = line.find_first_not_of(' ');
    if (begin == std::string_view::npos) break;
    line.remove_prefix(begin);
    const std::string_view word = line.substr(0, line.find(' '));
    const std::string_view value = word.substr(1);
    line.remove_prefix(word.size());
    bool good = true;
    switch (word.front()) {
      case 'W':
        good = (width = side(value)).has_value();
        break;
      case 'H':
        good = (height = side(value)).has_value();
        break;
      case 'F':
        if (value == "0:0") break;  // unknown: the default
        if (const auto rate = parseFrameRate(value)) {
          header.traits.rate = *rate;
        } else {
          good = false;
        }
        break;
      case 'C':
        if (std::find(kChroma.begin(), kChroma.end(), value) == kChroma.end()) {
          return formatted(
              "has chroma format %.*s; only 8-bit 4:2:0 can be coded: convert it to yuv420p first",
              static_cast<int>(value.size()), value.data());
        }
        header.traits.chroma = value;
        break;
      case 'A':
        header.traits.pixelAspect = value;
        break;
      default:  // interlacing is coded as it is, in whole frames; comments and the rest do not matter
        break;
    }
    if (!good) return formatted("has a bad header word \"%.*s\"", static_cast<int>(word.size()), word.data());
  }
  if (!width || !height) return "has no picture size in its header";
  header.size = {*width, *height};
  return std::nullopt;
}

class Y4mReader : public FrameSource {
 public:
  Y4mReader(std::unique_ptr<ByteReader> bytes, Header header)
      : _bytes(std::move(bytes)), _header(std::move(header)) {}

  Size size() const override { return _header.size; }
  const VideoTraits& traits() const override { return _header.traits; }

  // Frames may carry words of their own, but hardly any do.
  std::optional<uint64_t> frameCount() const override {
    if (!_bytes->size()) return std::nullopt;
    return (*_bytes->size() - _header.length) / (kFrame.size() + 1 + pictureBytes(_header.size));
  }

  Result<bool> next(Picture& picture) override {
    const auto end = _bytes->peek(1);
    if (!end.ok()) return end.failure();
    if (end.value().empty()) return false;
    const auto line = _bytes->readLine(kMaxLine);
    if (!line.ok()) return line.failure();
    if (_bytes->stopped()) return false;
    const bool isFrame = line.value() && line.value()->starts_with(kFrame) &&
                         (line.value()->size() == kFrame.size() || (*line.value())[kFrame.size()] == ' ');
    if (!isFrame) {
      return _bytes->failure(formatted("has something else where frame %" PRIu64 " should begin", _read));
    }
    const auto picturePresent = readPicture(*_bytes, _header.size, _read, picture);
    if (!picturePresent.ok()) return picturePresent;
    if (!picturePresent.value() && !_bytes->stopped()) {
      return _bytes->failure(formatted("ends where frame %" PRIu64 " should have its picture", _read));
    }
    ++_read;
    return picturePresent;
  }

 private:
  const std::unique_ptr<ByteReader> _bytes;
  const Header _header;
  uint64_t _read = 0;
};

}  // namespace

bool isY4m(std::span<const uint8_t> firstBytes) {
  return firstBytes.size() > kMagic.size() && std::equal(kMagic.begin(), kMagic.end(), firstBytes.begin()) &&
         (firstBytes[kMagic.size()] == ' ' || firstBytes[kMagic.size()] == '\n');
}

Result<std::unique_ptr<FrameSource>> openY4m(std::unique_ptr<ByteReader> bytes,
                                             std::optional<FrameRate> rate) {
  const auto line = bytes->readLine(kMaxLine);
  if (!line.ok()) return line.failure();
  if (!line.value()) return bytes->failure("has no end of its Y4M header");
  Header header;
  header.length = line.value()->size() + 1;
  if (const auto problem = parseHeader(*line.value(), header)) return bytes->failure(*problem);
  if (rate) header.traits.rate = *rate;
  return std::unique_ptr<FrameSource>(std::make_unique<Y4mReader>(std::move(bytes), std::move(header)));
}

}  // namespace tool
