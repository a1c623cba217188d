// Where pictures go: Y4M, raw, PNG, a sum for each, or nowhere. One thread at a time.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "tools/base/failure.h"
#include "tools/video/picture.h"

namespace tool {

class PictureWriter {
 public:
  virtual ~PictureWriter() = default;
  virtual Outcome write(const Picture& picture) = 0;
  // Once, behind the last picture: the file gets its name. Without a picture there is no file.
  virtual Outcome finish() = 0;
};

// The names of the formats, for --help and --format.
std::vector<std::string> pictureFormats();

// `format` is one of the names; empty: as the path ends, and Y4M where that tells nothing. An empty path
// gives a writer that drops the pictures. Y4M holds one size: pictures of another one than the first are a
// failure, or are scaled to fit into it.
enum class OtherSizes { Refuse, Fit };
Result<std::unique_ptr<PictureWriter>> createPictureWriter(const std::string& path, const std::string& format,
                                                           const VideoTraits& traits,
                                                           OtherSizes otherSizes = OtherSizes::Refuse);

}  // namespace tool
