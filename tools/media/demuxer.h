// The video track of any file that libavformat opens, packet by packet. One thread at a time.
//
// All bytes come through the ByteReader: nothing that a file says makes the tool open another file or the
// network, and a stop ends every wait.
#pragma once

#include <stdint.h>

#include <memory>
#include <optional>

#include "tools/base/units.h"
#include "tools/files/byte_reader.h"
#include "tools/media/av.h"

namespace tool {

class Demuxer {
 public:
  // Finds the best video track. Fails where the input is no file that libavformat knows, or has no video.
  static Result<std::unique_ptr<Demuxer>> open(std::unique_ptr<ByteReader> bytes);
  ~Demuxer();
  Demuxer(const Demuxer&) = delete;
  Demuxer& operator=(const Demuxer&) = delete;

  // The track's next packet. False at the end, or once a stop has been requested. Fails where the input is
  // shorter than it says, after what there is.
  Result<bool> next(AVPacket& packet);

  const AVStream& track() const { return *_track; }
  FrameRate frameRate() const;  // the default where the file does not tell
  std::optional<uint64_t> pictureCount() const;
  bool stopped() const { return _bytes->stopped(); }
  Failure failure(const std::string& problem) const { return _bytes->failure(problem); }

 private:
  explicit Demuxer(std::unique_ptr<ByteReader> bytes) : _bytes(std::move(bytes)) {}
  Outcome start();
  void noteEnd(const AVPacket& packet);
  bool endsEarly() const;
  Failure failureOf(const char* problem, int error) const;

  static int read(void* self, uint8_t* out, int size);
  static int64_t seek(void* self, int64_t offset, int whence);

  const std::unique_ptr<ByteReader> _bytes;
  Outcome _readFailure;  // what a callback could not return
  AvIo _io;
  AVFormatContext* _format = nullptr;
  AVStream* _track = nullptr;
  uint64_t _packets = 0;  // of the track
  int64_t _end = 0;       // of all tracks so far, in AV_TIME_BASE
};

// Whether a file that begins like this is surely of a kind that libavformat knows; then its name.
std::optional<std::string> knownContainer(std::span<const uint8_t> firstBytes);

}  // namespace tool
