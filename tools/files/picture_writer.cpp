#include "tools/files/picture_writer.h"

#include <algorithm>
#include <array>
#include <filesystem>
#include <string_view>

#include "tools/base/text.h"
#include "tools/files/output_file.h"
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
  RawWriter(File file, VideoTraits, OtherSizes) : _file(std::move(file)) {}

  Outcome write(const Picture& picture) override {
    _any = true;
    return _file->write(picture.bytes);
  }
  Outcome finish() override { return _any ? _file->commit() : Outcome(); }

 private:
  const File _file;
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

class NoWriter : public PictureWriter {
 public:
  Outcome write(const Picture&) override { return {}; }
  Outcome finish() override { return {}; }
};

template <typename Writer>
std::unique_ptr<PictureWriter> make(File file, const VideoTraits& traits, OtherSizes otherSizes) {
  return std::make_unique<Writer>(std::move(file), traits, otherSizes);
}

struct OutputKind {
  std::string_view name;
  std::string_view extensions;  // each between blanks
  std::unique_ptr<PictureWriter> (*make)(File file, const VideoTraits& traits, OtherSizes otherSizes);
};

constexpr std::array kOutputKinds{
    OutputKind{"y4m", " .y4m ", make<Y4mWriter>},
    OutputKind{"raw", " .yuv .i420 .raw ", make<RawWriter>},
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
  auto file = OutputFile::create(path);
  if (!file.ok()) return file.failure();
  return kindOf(path, format).make(std::move(file.value()), traits, otherSizes);
}

}  // namespace tool
