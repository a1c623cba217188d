#include "tools/files/frame_source.h"

#include <array>

#include "tools/base/text.h"
#include "tools/files/byte_reader.h"
#include "tools/files/raw_reader.h"
#include "tools/files/y4m_reader.h"
#include "tools/video/scene.h"

namespace tool {

namespace {

using Source = Result<std::unique_ptr<FrameSource>>;
using FirstBytes = std::span<const uint8_t>;

constexpr Size kSceneSize{640, 480};
constexpr size_t kFirstBytes = 16;

// The kinds of input file; the first that recognises the input opens it.
struct InputKind {
  bool (*recognises)(FirstBytes bytes, const SourceRequest& request);
  Source (*open)(std::unique_ptr<ByteReader> bytes, const SourceRequest& request);
};

constexpr std::array kInputKinds{
    InputKind{[](FirstBytes bytes, const SourceRequest&) { return isY4m(bytes); },
              [](std::unique_ptr<ByteReader> bytes, const SourceRequest& request) -> Source {
                if (request.size) {
                  return bytes->failure("is a Y4M stream and has a size of its own: leave --size out");
                }
                return openY4m(std::move(bytes), request.rate);
              }},
    InputKind{[](FirstBytes, const SourceRequest& request) { return request.size.has_value(); },
              [](std::unique_ptr<ByteReader> bytes, const SourceRequest& request) -> Source {
                return openRaw(std::move(bytes), *request.size, request.rate.value_or(FrameRate()));
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
  for (const InputKind& kind : kInputKinds) {
    if (!kind.recognises(first.value(), request)) continue;
    Source source = kind.open(std::move(bytes.value()), request);
    if (source.ok() && !isEven(source.value()->size())) {
      return Failure{ExitCode::Input, request.path + ": " + oddSize(source.value()->size())};
    }
    return source;
  }
  return bytes.value()->failure("is no Y4M stream; for raw I420 give the size of a picture with --size WxH");
}

}  // namespace tool
