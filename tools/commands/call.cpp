#include "tools/commands/call.h"

#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>
#include <utility>

#include "omxbridge/hardware_version.h"
#include "tools/base/cpu_time.h"
#include "tools/files/output_file.h"
#include "tools/files/picture_writer.h"
#include "tools/report/html_report.h"
#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"
#include "tools/video/rework.h"

namespace tool {

namespace {

// Pictures that may wait between the encoder and the decoder.
constexpr size_t kLinkLimit = 4;

// For pictures that the encoder or the decoder drops.
constexpr std::chrono::seconds kPatience{2};

class Call : private SenderOwner {
 public:
  Call(const CallSettings& settings, FrameSource& source, std::stop_source& enough)
      : _settings(settings),
        _source(source),
        _enough(enough),
        _path(settings.impairments),
        _snapshots(settings.snapshots, !settings.reportPath.empty()),
        _sender(settings.sender, source, _book, *this, enough.get_token()) {}

  Outcome open();
  Outcome run();
  CallReport report() const;

 private:
  bool waitForRoom(const std::stop_token& stop, Deadline deadline) override;
  bool wantsKeyFrame(int64_t time) override;
  void onCoded(CodedPicture picture) override;
  void bringOn(std::vector<CodedPicture> pictures);
  void carry();
  Outcome carryOne(const CodedPicture& picture);
  void onDecoded(const DECODEDDATAINFO& info, std::span<const uint8_t> data, uint32_t timestamp);
  void fail(Failure failure);
  bool failed() const { return _broken.stop_requested(); }
  bool isImpaired() const { return _settings.impairments.any(); }

  const CallSettings _settings;
  FrameSource& _source;
  std::stop_source& _enough;  // no more pictures are taken from the source
  std::stop_source _broken;   // nothing is of use any more; requests _enough as well
  Clock::time_point _begin;   // of run()
  double _cpuAtBegin = 0;

  mutable std::mutex _mutex;
  std::condition_variable_any _coded;          // a picture has come from the encoder
  Outcome _failure;                            // the first; under the mutex
  uint64_t _codedCount = 0;                    // under the mutex
  LossyPath _path;                             // under the mutex
  std::map<uint32_t, int64_t> _networkDelays;  // of pictures on their way, by time stamp; under the mutex

  // The link thread's.
  std::unique_ptr<OutputFile> _streamFile;  // null: not kept
  uint64_t _carried = 0;                    // handed to the decoder
  // The decoder's output thread's.
  DecodedPictureReader _reader;
  Picture _decoded;
  Picture _turned;
  SnapshotTaker _snapshots;
  std::unique_ptr<OutputFile> _reportFile;  // null: no report
  std::unique_ptr<PictureWriter> _writer;

  CallBook _book;
  Link _link;
  // Last: when they are gone, no callback uses the rest.
  std::unique_ptr<Session> _decoder;
  Sender _sender;
};

// Everything that can go wrong before the first picture is sent does so here.
Outcome Call::open() {
  const auto opened = _sender.open();
  if (!opened.ok()) return opened.failure();
  if (!opened.value()) return {};
  if (!_settings.streamPath.empty()) {
    auto file = OutputFile::create(_settings.streamPath);
    if (!file.ok()) return file.failure();
    _streamFile = std::move(file.value());
  }
  if (!_settings.reportPath.empty()) {
    auto file = OutputFile::create(_settings.reportPath);
    if (!file.ok()) return file.failure();
    _reportFile = std::move(file.value());
  }
  auto writer = createPictureWriter(_settings.picturesPath, _settings.picturesFormat, _source.traits(),
                                    OtherSizes::Fit);
  if (!writer.ok()) return writer.failure();
  _writer = std::move(writer.value());

  auto decoder = Session::openDecoder([this](const DECODEDDATAINFO& info, std::span<const uint8_t> data,
                                             uint32_t timestamp) { onDecoded(info, data, timestamp); });
  if (!decoder.ok()) return decoder.failure();
  _decoder = std::move(decoder.value());
  if (auto failed = _decoder->start()) return failed;
  return _sender.start();
}

Outcome Call::run() {
  _begin = Clock::now();
  _cpuAtBegin = processCpuSeconds();
  if (_decoder == nullptr) return {};  // stopped before the first picture
  {
    const std::jthread carrier([this] { carry(); });
    if (auto failure = _sender.run()) fail(*failure);
    bringOn([this] {
      const std::lock_guard held(_mutex);
      return _path.drain();
    }());
    _link.close();
  }
  const auto end = static_cast<uint32_t>(_sender.timeOf(_carried));
  if (auto failure = _decoder->finish(_carried, end, kPatience)) fail(*failure);
  if (failed()) {
    const std::lock_guard held(_mutex);
    return _failure;
  }
  if (_streamFile != nullptr && _book.figures().framesEncoded > 0) {
    if (auto failure = _streamFile->commit()) return failure;
  }
  if (auto failure = _writer->finish()) return failure;
  if (_reportFile != nullptr) {
    const std::string page = htmlReport(report(), _snapshots.kept());
    const auto* const bytes = reinterpret_cast<const uint8_t*>(page.data());
    if (auto failure = _reportFile->write({bytes, page.size()})) return failure;
    if (auto failure = _reportFile->commit()) return failure;
  }
  return _snapshots.finish();
}

// A way with impairments runs in the time of the video: what happens on it until a picture is taken depends
// on all pictures before, so these have to be coded first.
bool Call::waitForRoom(const std::stop_token& stop, Deadline deadline) {
  if (!_link.waitForRoom(kLinkLimit, stop, deadline)) return false;
  if (!isImpaired()) return true;
  const uint64_t sent = _book.figures().framesSent;
  std::unique_lock held(_mutex);
  _coded.wait_for(held, stop, kPatience, [&] { return _codedCount >= sent; });
  return !stop.stop_requested();
}

bool Call::wantsKeyFrame(int64_t time) {
  if (!isImpaired()) return false;
  std::vector<CodedPicture> arrived;
  bool isKeyWanted = false;
  {
    const std::lock_guard held(_mutex);
    arrived = _path.advance(time);
    isKeyWanted = _path.takeKeyRequest(time);
  }
  bringOn(std::move(arrived));
  return isKeyWanted;
}

void Call::onCoded(CodedPicture picture) {
  if (failed()) return;
  if (_streamFile != nullptr) {
    if (auto failure = _streamFile->write(picture.bytes)) return fail(*failure);
  }
  if (!isImpaired()) return _link.push(std::move(picture));
  const int64_t time = _book.timeOf(picture.timestamp);
  const std::lock_guard held(_mutex);
  _path.send(std::move(picture), time);
  ++_codedCount;
  _coded.notify_all();
}

// To the decoder, in the order in which they come out of the way.
void Call::bringOn(std::vector<CodedPicture> pictures) {
  for (CodedPicture& picture : pictures) {
    {
      const std::lock_guard held(_mutex);
      _networkDelays[picture.timestamp] = picture.networkDelay;
    }
    _link.push(std::move(picture));
  }
}

void Call::carry() {
  while (const auto picture = _link.pop(_broken.get_token())) {
    if (auto failure = carryOne(*picture)) return fail(*failure);
  }
}

Outcome Call::carryOne(const CodedPicture& picture) {
  const auto sent = _decoder->sendCopy(picture.bytes, picture.timestamp, _broken.get_token());
  if (!sent.ok()) return sent.failure();
  if (sent.value()) ++_carried;
  return {};
}

void Call::onDecoded(const DECODEDDATAINFO& info, std::span<const uint8_t> data, uint32_t timestamp) {
  const auto now = Clock::now();
  if (failed()) return;
  if (auto failure = _reader.read(info, data, _decoded)) return fail(*failure);
  if (const auto source = _book.arrived(timestamp)) {
    std::chrono::microseconds onTheWay{0};
    if (isImpaired()) {
      const std::lock_guard held(_mutex);
      onTheWay = std::chrono::microseconds(_networkDelays[timestamp]);
      _networkDelays.erase(timestamp);
    }
    const Picture& before = turned(source->picture, source->rotation, _turned);
    std::optional<double> quality;
    if (_decoded.size == before.size) quality = psnr(_decoded.luma(), before.luma());
    _book.decoded(timestamp, now - source->captured + onTheWay, quality);
    _snapshots.offer(source->time, before, _decoded, quality.value_or(0));
  } else {
    _book.strayed();
  }
  if (auto failure = _writer->write(_decoded)) fail(*failure);
}

void Call::fail(Failure failure) {
  {
    const std::lock_guard held(_mutex);
    if (!_failure) _failure = std::move(failure);
  }
  _enough.request_stop();
  _broken.request_stop();
}

CallReport Call::report() const {
  CallReport report;
  report.input = _settings.inputName;
  report.figures = _book.figures();
  report.trace = _book.trace();
  report.encoder = _sender.encoder();
  report.impairments = _settings.impairments;
  report.path = _path.figures();
  report.seconds = _sender.seconds();
  report.meanBitRate = _sender.meanBitRate();
  report.sequence = _sender.sequence();
  report.hardwareVersion = getHardwareBaseVersion();
  report.wallSeconds = std::chrono::duration<double>(Clock::now() - _begin).count();
  report.cpuSeconds = processCpuSeconds() - _cpuAtBegin;
  report.inputFailure = _sender.inputFailure();
  return report;
}

}  // namespace

Result<CallReport> runCall(const CallSettings& settings, FrameSource& source, std::stop_source& enough) {
  Call call(settings, source, enough);
  if (auto failure = call.open()) return *failure;
  if (auto failure = call.run()) return *failure;
  return call.report();
}

}  // namespace tool
