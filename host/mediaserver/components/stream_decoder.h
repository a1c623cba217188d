// One compressed video stream being decoded by libavcodec: buffers in, pictures out, in display order or in
// the order of decoding (but for WMV, which libavcodec gives in display order alone). Interlaced pictures
// come with both fields woven into one. Damaged data gives concealed pictures or none, and never an end. One
// thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <OMX_Types.h>
#include <OMX_Video.h>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/av.h"
#include "host/mediaserver/components/picture_layout.h"

namespace mediaserver {

enum class PictureOrder { Display, Decoding };

// What a buffer holds: one whole access unit, several whole ones, or any piece of the stream.
enum class Packing { Unit, Units, Pieces };

struct DecoderOptions {
  OMX_VIDEO_CODINGTYPE coding;
  PictureOrder order;
  Packing packing;
  uint32_t width;  // as the client says: where the stream does not
  uint32_t height;
  uint32_t largestPicture;  // macroblocks; larger pictures are skipped

  bool operator==(const DecoderOptions&) const = default;
};

class StreamDecoder {
 public:
  explicit StreamDecoder(const DecoderOptions& options);
  ~StreamDecoder();
  StreamDecoder(const StreamDecoder&) = delete;
  StreamDecoder& operator=(const StreamDecoder&) = delete;

  // `config`: the bytes are settings of the stream and no pictures.
  void push(Bytes bytes, int64_t timestamp, bool config);
  // No more comes: all pictures that were held back follow. The next push begins a new stream.
  void drain();
  // Forgets everything on the way, pictures included; decoding goes on with the next key frame.
  void flush();

  // Decoded pictures, oldest first.
  size_t waiting() const { return _pictures.size(); }
  void dropPictures() { _pictures.clear(); }
  // A view of the picture and what keeps its memory.
  PlanarView front() const;
  std::shared_ptr<const AVFrame> frontMemory() const { return _pictures.front().frame; }
  int64_t frontTimestamp() const { return _pictures.front().frame->pts; }
  bool frontIsKey() const { return _pictures.front().key; }
  void pop() { _pictures.pop_front(); }

  // How many pictures are held back at most for their order.
  uint32_t depth() const;

 private:
  struct Picture {
    std::shared_ptr<const AVFrame> frame;
    bool key;
  };

  bool open(Bytes* bytes, bool config);
  void parse(Bytes bytes, int64_t timestamp);
  void decode(Bytes unit, int64_t timestamp);
  void receive();
  void takeBegun();
  void lookInside(Bytes unit);
  void take(AvFrame frame, bool key);
  static void onRows(AVCodecContext* context, const AVFrame* frame, int* offsets, int y, int type,
                     int height);

  const DecoderOptions _options;
  const bool _fromRows;  // see takeBegun()
  AvContext _context;
  AvParser _parser;
  AvPacket _packet;
  int64_t _lastTimestamp = 0;

  std::vector<AvFrame> _begun;       // by the unit at hand
  std::set<const uint8_t*> _inside;  // buffers of pictures that were taken and have yet to be returned
  bool _synchronised = false;        // a key frame has been seen
  bool _unitIsKey = false;

  std::deque<Picture> _pictures;
  bool _complained = false;
};

}  // namespace mediaserver
