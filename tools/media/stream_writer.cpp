#include "tools/media/stream_writer.h"

#include <stdio.h>
#include <string.h>

#include <filesystem>

#include "tools/files/output_file.h"
#include "tools/h264/access_units.h"
#include "tools/media/av.h"

namespace tool {

namespace {

using File = std::unique_ptr<OutputFile>;

constexpr int kIoBuffer = 65536;
constexpr AVRational kMicroseconds{1, 1'000'000};
constexpr AVRational kTicks{1, 90'000};

class NoWriter : public StreamWriter {
 public:
  Outcome write(std::span<const uint8_t>, int64_t, bool) override { return {}; }
  Outcome finish() override { return {}; }
};

class ByteStreamWriter : public StreamWriter {
 public:
  explicit ByteStreamWriter(File file) : _file(std::move(file)) {}

  Outcome write(std::span<const uint8_t> picture, int64_t, bool) override {
    _any = true;
    return _file->write(picture);
  }
  Outcome finish() override { return _any ? _file->commit() : Outcome(); }

 private:
  const File _file;
  bool _any = false;
};

class Mp4Writer : public StreamWriter {
 public:
  Mp4Writer(File file, Size size, FrameRate rate)
      : _file(std::move(file)), _size(size), _rate(rate), _packet(av_packet_alloc()) {}
  ~Mp4Writer() override { avformat_free_context(_format); }

  Outcome write(std::span<const uint8_t> picture, int64_t time, bool isKey) override {
    if (_track == nullptr) {
      if (auto failure = begin(leadingParameters(picture))) return failure;
    }
    if (av_new_packet(_packet.get(), static_cast<int>(picture.size())) < 0) return noMemory();
    memcpy(_packet->data, picture.data(), picture.size());
    _packet->pts = _packet->dts = av_rescale_q(time, kMicroseconds, _track->time_base);
    _packet->duration = av_rescale_q(
        1, {static_cast<int>(_rate.denominator), static_cast<int>(_rate.numerator)}, _track->time_base);
    if (isKey) _packet->flags |= AV_PKT_FLAG_KEY;
    const int result = av_write_frame(_format, _packet.get());
    av_packet_unref(_packet.get());
    return outcome(result);
  }

  Outcome finish() override {
    if (_track == nullptr) return {};
    const int result = av_write_trailer(_format);
    avio_flush(_io.get());
    if (auto failure = outcome(result)) return failure;
    return _file->commit();
  }

 private:
  Outcome begin(std::span<const uint8_t> parameters) {
    av_log_set_level(AV_LOG_QUIET);
    auto* const buffer = static_cast<uint8_t*>(av_malloc(kIoBuffer));
    _io.reset(
        avio_alloc_context(buffer, kIoBuffer, 1, this, nullptr, put, _file->isSeekable() ? seek : nullptr));
    avformat_alloc_output_context2(&_format, nullptr, "mp4", nullptr);
    AVStream* const track = _format != nullptr ? avformat_new_stream(_format, nullptr) : nullptr;
    if (_io == nullptr || track == nullptr || _packet == nullptr) return noMemory();
    _format->pb = _io.get();
    AVCodecParameters& coded = *track->codecpar;
    coded.codec_type = AVMEDIA_TYPE_VIDEO;
    coded.codec_id = AV_CODEC_ID_H264;
    coded.width = _size.width;
    coded.height = _size.height;
    coded.extradata = static_cast<uint8_t*>(av_mallocz(parameters.size() + AV_INPUT_BUFFER_PADDING_SIZE));
    if (coded.extradata == nullptr) return noMemory();
    coded.extradata_size = static_cast<int>(parameters.size());
    memcpy(coded.extradata, parameters.data(), parameters.size());
    track->time_base = kTicks;
    track->avg_frame_rate = {static_cast<int>(_rate.numerator), static_cast<int>(_rate.denominator)};
    AVDictionary* options = nullptr;
    if (!_file->isSeekable()) av_dict_set(&options, "movflags", "frag_keyframe+empty_moov", 0);
    const int result = avformat_write_header(_format, &options);
    av_dict_free(&options);
    if (result >= 0) _track = track;
    return outcome(result);
  }

  // What went wrong with the file is nearer to the cause.
  Outcome outcome(int result) const {
    if (_writeFailure) return _writeFailure;
    if (result >= 0) return {};
    return _file->failure("cannot be written as MP4 (" + avText(result) + ")");
  }
  Failure noMemory() const { return _file->failure("not enough memory"); }

  static int put(void* self, uint8_t* data, int size) {
    auto* const writer = static_cast<Mp4Writer*>(self);
    if (auto failure = writer->_file->write({data, static_cast<size_t>(size)})) {
      writer->_writeFailure = std::move(failure);
      return AVERROR(EIO);
    }
    return size;
  }
  static int64_t seek(void* self, int64_t offset, int whence) {
    if (whence != SEEK_SET || offset < 0) return AVERROR(EINVAL);
    return static_cast<Mp4Writer*>(self)->_file->seek(static_cast<uint64_t>(offset)) ? offset : AVERROR(EIO);
  }

  const File _file;
  const Size _size;
  const FrameRate _rate;
  const AvPacket _packet;
  AvIo _io;
  Outcome _writeFailure;
  AVFormatContext* _format = nullptr;
  AVStream* _track = nullptr;  // null: nothing has been written
};

}  // namespace

std::vector<std::string> streamFormats() {
  return {"h264", "mp4"};
}

Result<std::unique_ptr<StreamWriter>> createStreamWriter(const std::string& path, const std::string& format,
                                                         Size size, FrameRate rate) {
  using Writer = std::unique_ptr<StreamWriter>;
  if (path.empty()) return Writer(std::make_unique<NoWriter>());
  auto file = OutputFile::create(path);
  if (!file.ok()) return file.failure();
  const std::string extension = std::filesystem::path(path).extension().string();
  const bool isMp4 =
      format.empty() ? extension == ".mp4" || extension == ".m4v" || extension == ".mov" : format == "mp4";
  if (!isMp4) return Writer(std::make_unique<ByteStreamWriter>(std::move(file.value())));
  return Writer(std::make_unique<Mp4Writer>(std::move(file.value()), size, rate));
}

}  // namespace tool
