#include "tools/files/frame_source.h"

#include <algorithm>
#include <array>

#include "tools/base/text.h"
#include "tools/files/byte_reader.h"
#include "tools/files/raw_reader.h"
#include "tools/files/y4m_reader.h"
#include "tools/media/demuxer.h"
#include "tools/media/media_reader.h"
#include "tools/video/scene.h"

namespace tool {

namespace {

using Source = Result<std::unique_ptr<FrameSource>>;
using FirstBytes = std::span<const uint8_t>;

constexpr Size kSceneSize{640, 480};
constexpr size_t kFirstBytes = 16;

// What the input is where its first bytes leave no doubt.
std::optional<std::string> surelyIs(ByteReader& bytes) {
  const auto first = bytes.peek(ByteReader::kMaxPeek);
  return first.ok() ? knownContainer(first.value()) : std::nullopt;
}

Failure hasSizeOfItsOwn(const ByteReader& bytes, const std::string& kind) {
  return bytes.failure("is " + kind + " and has a size of its own: leave --size out");
}

// The kinds of input file; the first that recognises the input opens it.
struct InputKind {
  bool (*recognises)(FirstBytes bytes, const SourceRequest& request);
  Source (*open)(std::unique_ptr<ByteReader> bytes, const SourceRequest& request);
};

constexpr std::array kInputKinds{
    InputKind{[](FirstBytes bytes, const SourceRequest&) { return isY4m(bytes); },
              [](std::unique_ptr<ByteReader> bytes, const SourceRequest& request) -> Source {
                if (request.size) return hasSizeOfItsOwn(*bytes, "a Y4M stream");
                return openY4m(std::move(bytes), request.rate);
              }},
    InputKind{[](FirstBytes, const SourceRequest& request) { return request.size.has_value(); },
              [](std::unique_ptr<ByteReader> bytes, const SourceRequest& request) -> Source {
                if (const auto kind = surelyIs(*bytes))
                  return hasSizeOfItsOwn(*bytes, "a file of format " + *kind);
                return openRaw(std::move(bytes), *request.size, request.rate.value_or(FrameRate()),
                               *findLayout(request.layout));
              }},
    InputKind{[](FirstBytes, const SourceRequest&) { return true; },
              [](std::unique_ptr<ByteReader> bytes, const SourceRequest& request) -> Source {
                const bool mayBeRaw = !surelyIs(*bytes);
                Source source = openMedia(std::move(bytes), request.rate);
                if (source.ok() || !mayBeRaw) return source;
                return Failure{source.failure().code,
                               source.failure().text + "; for raw I420 give the size with --size WxH"};
              }},
};

std::string oddSize(Size size) {
  return formatted("%dx%d is an odd size; the encoder takes even ones: cut the picture first", size.width,
                   size.height);
}

}  // namespace

Source openFrameSource(const SourceRequest& request, const std::stop_token& stop) {
  if (request.size && !isEven(*request.size)) return Failure{ExitCode::Usage, oddSize(*request.size)};
  if (request.path.empty()) {
    return std::unique_ptr<FrameSource>(
        std::make_unique<Scene>(request.size.value_or(kSceneSize), request.rate.value_or(FrameRate())));
  }
  auto bytes = ByteReader::open(request.path, stop);
  if (!bytes.ok()) return bytes.failure();
  const auto first = bytes.value()->peek(kFirstBytes);
  if (!first.ok()) return first.failure();
  if (first.value().empty()) return bytes.value()->failure("is empty");
  const auto kind = std::find_if(kInputKinds.begin(), kInputKinds.end(), [&](const InputKind& each) {
    return each.recognises(first.value(), request);
  });
  Source source = kind->open(std::move(bytes.value()), request);
  if (source.ok() && !isEven(source.value()->size())) {
    return Failure{ExitCode::Input, request.path + ": " + oddSize(source.value()->size())};
  }
  return source;
}

}  // namespace tool
