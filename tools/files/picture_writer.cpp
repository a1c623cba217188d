#include "tools/files/picture_writer.h"

#include <inttypes.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <regex>
#include <string_view>

extern "C" {
#include <libavutil/md5.h>
}

#include "tools/base/text.h"
#include "tools/files/output_file.h"
#include "tools/media/png.h"
#include "tools/video/layout.h"
#include "tools/video/rework.h"

namespace tool {

namespace {

using File = std::unique_ptr<OutputFile>;

std::span<const uint8_t> bytesOf(std::string_view text) {
  return {reinterpret_cast<const uint8_t*>(text.data()), text.size()};
}

// Pictures one behind the other, of any size.
class RawWriter : public PictureWriter {
 public:
  RawWriter(File file, VideoTraits traits, OtherSizes)
      : _file(std::move(file)), _layout(findLayout(traits.layout)) {}

  Outcome write(const Picture& picture) override {
    _any = true;
    if (_layout == nullptr) return _file->write(picture.bytes);
    _raw.resize(_layout->rawBytes(picture.size));
    _layout->write(picture.bytes.data(), static_cast<unsigned int>(picture.size.width),
                   static_cast<unsigned int>(picture.size.height), _raw.data());
    return _file->write(_raw);
  }
  Outcome finish() override { return _any ? _file->commit() : Outcome(); }

 private:
  const File _file;
  const Layout* const _layout;  // null: I420
  std::vector<uint8_t> _raw;
  bool _any = false;
};

class Y4mWriter : public PictureWriter {
 public:
  Y4mWriter(File file, VideoTraits traits, OtherSizes otherSizes)
      : _file(std::move(file)), _traits(std::move(traits)), _otherSizes(otherSizes) {}

  Outcome write(const Picture& picture) override {
    if (_size == Size()) {
      _size = picture.size;
      const std::string header = formatted("YUV4MPEG2 W%d H%d F%u:%u Ip A%s C%s\n", _size.width, _size.height,
                                           _traits.rate.numerator, _traits.rate.denominator,
                                           _traits.pixelAspect.c_str(), _traits.chroma.c_str());
      if (auto failed = _file->write(bytesOf(header))) return failed;
    }
    if (picture.size != _size && _otherSizes == OtherSizes::Fit) {
      fit(picture, _size, _fitted);
      return write(_fitted);
    }
    if (picture.size != _size) {
      return _file->failure(
          formatted("the pictures change from %dx%d to %dx%d, and Y4M holds one size: write raw pictures "
                    "(--format raw)",
                    _size.width, _size.height, picture.size.width, picture.size.height));
    }
    if (auto failed = _file->write(bytesOf("FRAME\n"))) return failed;
    return _file->write(picture.bytes);
  }
  Outcome finish() override { return _size != Size() ? _file->commit() : Outcome(); }

 private:
  const File _file;
  const VideoTraits _traits;
  const OtherSizes _otherSizes;
  Size _size;  // of the first picture
  Picture _fitted;
};

// A file a picture, with its number in the name; on standard output one behind the other.
class PngWriter : public PictureWriter {
 public:
  explicit PngWriter(std::string pattern) : _pattern(std::move(pattern)) {}

  Outcome write(const Picture& picture) override {
    const auto path = nameOf(_written++);
    if (!path) {
      return Failure{ExitCode::Output, _pattern +
                                           ": holds one picture; put a number into the name, as in "
                                           "frame-%04d.png"};
    }
    const auto png = toPng(picture);
    if (!png) return Failure{ExitCode::Output, *path + ": not enough memory"};
    const auto file = OutputFile::create(*path);
    if (!file.ok()) return file.failure();
    if (auto failed = file.value()->write(*png)) return failed;
    return file.value()->commit();
  }
  Outcome finish() override { return {}; }

 private:
  // Nothing where a second picture would overwrite the first.
  std::optional<std::string> nameOf(uint64_t number) const {
    static const std::regex kNumber("%(0?)([0-9]?)d");
    std::smatch found;
    if (!std::regex_search(_pattern, found, kNumber)) {
      return number == 0 || isStandardOutput(_pattern) ? std::optional(_pattern) : std::nullopt;
    }
    std::string digits = std::to_string(number);
    const size_t width = found[2].length() > 0 ? static_cast<size_t>(found[2].str()[0] - '0') : 0;
    if (digits.size() < width) digits.insert(0, width - digits.size(), '0');
    return found.prefix().str() + digits + found.suffix().str();
  }

  const std::string _pattern;
  uint64_t _written = 0;
};

// A line a picture: its number, its size, and the MD5 sum of its I420 bytes.
class HashWriter : public PictureWriter {
 public:
  HashWriter(File file, VideoTraits, OtherSizes) : _file(std::move(file)) {}

  Outcome write(const Picture& picture) override {
    std::array<uint8_t, 16> sum{};
    av_md5_sum(sum.data(), picture.bytes.data(), picture.bytes.size());
    std::string line = formatted("%" PRIu64 " %dx%d ", _written++, picture.size.width, picture.size.height);
    for (const uint8_t byte : sum) line += formatted("%02x", byte);
    return _file->write(bytesOf(line + "\n"));
  }
  Outcome finish() override { return _written > 0 ? _file->commit() : Outcome(); }

 private:
  const File _file;
  uint64_t _written = 0;
};

class NoWriter : public PictureWriter {
 public:
  Outcome write(const Picture&) override { return {}; }
  Outcome finish() override { return {}; }
};

using Writer = Result<std::unique_ptr<PictureWriter>>;

template <typename Kind>
Writer make(const std::string& path, const VideoTraits& traits, OtherSizes otherSizes) {
  auto file = OutputFile::create(path);
  if (!file.ok()) return file.failure();
  return std::unique_ptr<PictureWriter>(std::make_unique<Kind>(std::move(file.value()), traits, otherSizes));
}

struct OutputKind {
  std::string_view name;
  std::string_view extensions;  // each between blanks
  Writer (*make)(const std::string& path, const VideoTraits& traits, OtherSizes otherSizes);
};

constexpr std::array kOutputKinds{
    OutputKind{"y4m", " .y4m ", make<Y4mWriter>},
    OutputKind{"raw", " .yuv .i420 .raw ", make<RawWriter>},
    OutputKind{"png", " .png ",
               [](const std::string& path, const VideoTraits&, OtherSizes) {
                 return Writer(std::make_unique<PngWriter>(path));
               }},
    OutputKind{"hash", " .md5 ", make<HashWriter>},
};

const OutputKind& kindOf(const std::string& path, const std::string& format) {
  const std::string extension = " " + std::filesystem::path(path).extension().string() + " ";
  for (const OutputKind& kind : kOutputKinds) {
    if (format.empty() ? kind.extensions.find(extension) != std::string_view::npos : kind.name == format) {
      return kind;
    }
  }
  return kOutputKinds.front();
}

}  // namespace

std::vector<std::string> pictureFormats() {
  std::vector<std::string> names;
  for (const OutputKind& kind : kOutputKinds) names.emplace_back(kind.name);
  return names;
}

Result<std::unique_ptr<PictureWriter>> createPictureWriter(const std::string& path, const std::string& format,
                                                           const VideoTraits& traits, OtherSizes otherSizes) {
  if (path.empty()) return std::unique_ptr<PictureWriter>(std::make_unique<NoWriter>());
  return kindOf(path, format).make(path, traits, otherSizes);
}

}  // namespace tool
