#include "tools/media/demuxer.h"

#include <inttypes.h>
#include <stdio.h>

#include <algorithm>
#include <vector>

#include "tools/base/text.h"

namespace tool {

namespace {

constexpr int kIoBuffer = 65536;
constexpr AVRational kMicroseconds{1, AV_TIME_BASE};

}  // namespace

Result<std::unique_ptr<Demuxer>> Demuxer::open(std::unique_ptr<ByteReader> bytes) {
  av_log_set_level(AV_LOG_QUIET);
  std::unique_ptr<Demuxer> demuxer(new Demuxer(std::move(bytes)));
  if (auto failure = demuxer->start()) return *failure;
  return demuxer;
}

Demuxer::~Demuxer() {
  avformat_close_input(&_format);
}

Outcome Demuxer::start() {
  auto* const buffer = static_cast<uint8_t*>(av_malloc(kIoBuffer));
  _io.reset(avio_alloc_context(buffer, kIoBuffer, 0, this, read, nullptr, _bytes->size() ? seek : nullptr));
  _format = avformat_alloc_context();
  if (_io == nullptr || _format == nullptr) return failure("not enough memory");
  _format->pb = _io.get();
  _format->io_open = [](AVFormatContext*, AVIOContext**, const char*, int, AVDictionary**) {
    return AVERROR(EPERM);
  };
  int result = avformat_open_input(&_format, "", nullptr, nullptr);
  if (result < 0) return failureOf("is no video file that can be read", result);
  result = avformat_find_stream_info(_format, nullptr);
  if (result < 0) return failureOf("is no video file that can be read", result);
  const int best = av_find_best_stream(_format, AVMEDIA_TYPE_VIDEO, -1, -1, nullptr, 0);
  if (best < 0) return failure("has no video in it");
  _track = _format->streams[best];
  return {};
}

// What went wrong where the bytes come from is nearer to the cause.
Failure Demuxer::failureOf(const char* problem, int error) const {
  if (_readFailure) return *_readFailure;
  return failure(formatted("%s (%s)", problem, avText(error).c_str()));
}

int Demuxer::read(void* self, uint8_t* out, int size) {
  auto* const demuxer = static_cast<Demuxer*>(self);
  const auto count = demuxer->_bytes->readSome({out, static_cast<size_t>(size)});
  if (!count.ok()) {
    demuxer->_readFailure = count.failure();
    return AVERROR(EIO);
  }
  return count.value() > 0 ? static_cast<int>(count.value()) : AVERROR_EOF;
}

int64_t Demuxer::seek(void* self, int64_t offset, int whence) {
  ByteReader& bytes = *static_cast<Demuxer*>(self)->_bytes;
  if (whence == AVSEEK_SIZE) return static_cast<int64_t>(bytes.size().value_or(0));
  // libavformat turns the other kinds into this one.
  if (whence != SEEK_SET || offset < 0 || !bytes.seek(static_cast<uint64_t>(offset))) return AVERROR(EINVAL);
  return offset;
}

Result<bool> Demuxer::next(AVPacket& packet) {
  for (;;) {
    av_packet_unref(&packet);
    const int result = av_read_frame(_format, &packet);
    if (stopped()) return false;
    if (_readFailure) return *_readFailure;
    const auto expected = static_cast<uint64_t>(std::max<int64_t>(_track->nb_frames, 0));
    if (result == AVERROR_EOF && _packets < expected) {
      return failure(formatted("ends after %" PRIu64 " of %" PRIu64 " pictures", _packets, expected));
    }
    if (result == AVERROR_EOF && expected == 0 && endsEarly()) {
      return failure(formatted("ends after %.1f of %.1f seconds", static_cast<double>(_end) / AV_TIME_BASE,
                               static_cast<double>(_format->duration) / AV_TIME_BASE));
    }
    if (result == AVERROR_EOF) return false;
    if (result < 0) {
      return failure(
          formatted("breaks off after %" PRIu64 " pictures (%s)", _packets, avText(result).c_str()));
    }
    noteEnd(packet);
    if (packet.stream_index != _track->index || packet.size == 0) continue;
    ++_packets;
    return true;
  }
}

void Demuxer::noteEnd(const AVPacket& packet) {
  if (packet.pts == AV_NOPTS_VALUE) return;
  const AVRational unit = _format->streams[packet.stream_index]->time_base;
  const int64_t begin = _format->start_time != AV_NOPTS_VALUE ? _format->start_time : 0;
  _end = std::max(_end, av_rescale_q(packet.pts + packet.duration, unit, kMicroseconds) - begin);
}

// For files that state their duration but not how many pictures they have.
bool Demuxer::endsEarly() const {
  constexpr int64_t kTolerance = AV_TIME_BASE / 2;
  return _format->duration_estimation_method == AVFMT_DURATION_FROM_STREAM &&
         _end + kTolerance < _format->duration;
}

FrameRate Demuxer::frameRate() const {
  const AVRational rate = av_guess_frame_rate(_format, _track, nullptr);
  if (rate.num <= 0 || rate.den <= 0) return {};
  return makeFrameRate(static_cast<uint32_t>(rate.num), static_cast<uint32_t>(rate.den))
      .value_or(FrameRate());
}

std::optional<uint64_t> Demuxer::pictureCount() const {
  if (_track->nb_frames > 0) return static_cast<uint64_t>(_track->nb_frames);
  if (_format->duration <= 0) return std::nullopt;
  const double seconds = static_cast<double>(_format->duration) / AV_TIME_BASE;
  return static_cast<uint64_t>(seconds * frameRate().perSecond() + 0.5);
}

std::optional<std::string> knownContainer(std::span<const uint8_t> firstBytes) {
  std::vector<uint8_t> padded(firstBytes.begin(), firstBytes.end());
  padded.resize(padded.size() + AVPROBE_PADDING_SIZE);
  AVProbeData data{};
  data.filename = "";
  data.buf = padded.data();
  data.buf_size = static_cast<int>(firstBytes.size());
  int score = AVPROBE_SCORE_EXTENSION;  // more than a file's name would say
  const AVInputFormat* const format = av_probe_input_format2(&data, 1, &score);
  return format != nullptr ? std::optional<std::string>(format->name) : std::nullopt;
}

}  // namespace tool
