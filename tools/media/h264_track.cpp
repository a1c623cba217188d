#include "tools/media/h264_track.h"

#include <algorithm>

#include "tools/base/text.h"
#include "tools/media/demuxer.h"

namespace tool {

namespace {

constexpr size_t kFirstBytes = 16;

// Packets of the track, with start codes and with parameter sets before each key frame.
class H264Track : public AccessUnitSource {
 public:
  explicit H264Track(std::unique_ptr<Demuxer> demuxer)
      : _demuxer(std::move(demuxer)), _packet(av_packet_alloc()) {}

  Outcome start() {
    const AVStream& track = _demuxer->track();
    if (track.codecpar->codec_id != AV_CODEC_ID_H264) {
      return failure(
          formatted("holds %s video, not H.264: only the decoder for that is there; take it as the "
                    "input of call or encode",
                    avcodec_get_name(track.codecpar->codec_id)));
    }
    AVBSFContext* filter = nullptr;
    const AVBitStreamFilter* const kind = av_bsf_get_by_name("h264_mp4toannexb");
    if (_packet == nullptr || kind == nullptr || av_bsf_alloc(kind, &filter) < 0) {
      return failure("cannot be turned into a byte stream");
    }
    _filter.reset(filter);
    if (avcodec_parameters_copy(filter->par_in, track.codecpar) < 0 || av_bsf_init(filter) < 0) {
      return failure("has bad H.264 parameters");
    }
    return {};
  }

  Result<bool> next(std::vector<uint8_t>& unit) override {
    for (;;) {
      const auto more = _demuxer->next(*_packet);
      if (!more.ok() || !more.value()) return more;
      if (av_bsf_send_packet(_filter.get(), _packet.get()) < 0) continue;  // damaged
      if (av_bsf_receive_packet(_filter.get(), _packet.get()) < 0) continue;
      unit.assign(_packet->data, _packet->data + _packet->size);
      av_packet_unref(_packet.get());
      if (!unit.empty()) return true;
    }
  }
  std::optional<FrameRate> frameRate() const override { return _demuxer->frameRate(); }
  Failure failure(const std::string& problem) const override { return _demuxer->failure(problem); }

 private:
  const std::unique_ptr<Demuxer> _demuxer;
  const AvPacket _packet;
  AvFilter _filter;
};

bool isByteStream(std::span<const uint8_t> bytes) {
  const auto one = std::find_if(bytes.begin(), bytes.end(), [](uint8_t byte) { return byte != 0; });
  return one != bytes.end() && *one == 1 && one - bytes.begin() >= 2;
}

}  // namespace

Result<std::unique_ptr<AccessUnitSource>> openAccessUnits(const std::string& path,
                                                          const std::stop_token& stop) {
  auto bytes = ByteReader::open(path, stop);
  if (!bytes.ok()) return bytes.failure();
  const auto first = bytes.value()->peek(kFirstBytes);
  if (!first.ok()) return first.failure();
  if (first.value().empty()) return bytes.value()->failure("is empty");
  if (isByteStream(first.value())) {
    return std::unique_ptr<AccessUnitSource>(std::make_unique<AccessUnitReader>(std::move(bytes.value())));
  }
  auto demuxer = Demuxer::open(std::move(bytes.value()));
  if (!demuxer.ok()) return demuxer.failure();
  auto track = std::make_unique<H264Track>(std::move(demuxer.value()));
  if (auto failure = track->start()) return *failure;
  return std::unique_ptr<AccessUnitSource>(std::move(track));
}

}  // namespace tool
