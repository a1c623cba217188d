// A decoder session through the C interface, fed with mutated streams: access units, pieces, several pictures
// a buffer, in every compression format. Each life ends, in order or by destruction, and every picture that
// comes can be read as it is described.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <span>
#include <thread>
#include <vector>

#include <omxhost/log.h>

#include "omxbridge/omxbridge.h"
#include "tools/video/device_layout.h"

namespace {

// A session that has not moved for so long is destroyed from another thread. Applications may leave a
// component without the output buffers that the end of its stream needs; that is a wait without a limit, by
// contract.
constexpr std::chrono::milliseconds kPatience{500};
constexpr size_t kMostUnits = 64;

void require(bool holds) {
  if (!holds) std::abort();
}

// Where a buffer's bytes end: before the next start code, or after as many bytes as asked for.
size_t nextUnit(std::span<const uint8_t> stream) {
  static constexpr uint8_t kStart[] = {0, 0, 0, 1};
  if (stream.size() <= 4) return stream.size();
  const auto next = std::search(stream.begin() + 4, stream.end(), std::begin(kStart), std::end(kStart));
  return static_cast<size_t>(next - stream.begin());
}

class Application {
 public:
  explicit Application(void* session) : _session(session) {
    omx_interface_register_input_callback(session, onInput, this);
    omx_interface_register_output_callback(session, onOutput, this);
  }

  // False where the session does not take anything any more.
  bool send(std::span<const uint8_t> unit) {
    void* buffer = nullptr;
    void* memory = nullptr;
    for (;;) {
      const uint64_t seen = moves();
      const int result = omx_interface_reserve_input_buffer(_session, &buffer, &memory);
      if (result == 0) break;
      if (result != -1 || omx_interface_error(_session) != 0 || !waitForMove(seen)) return false;
    }
    // The input port is made for 640x480 at least.
    const size_t length = std::min<size_t>(unit.size(), 64 << 10);
    std::memcpy(memory, unit.data(), length);
    ++_sent;
    return omx_interface_send_input_buffer(_session, buffer, static_cast<int>(length), ++_time) == 0;
  }
  bool waitForInput() {
    std::unique_lock<std::mutex> lock(_mutex);
    return _moved.wait_for(lock, kPatience, [this] { return _returned >= _sent; });
  }

 private:
  uint64_t moves() {
    const std::lock_guard<std::mutex> lock(_mutex);
    return _returned + _pictures;
  }
  bool waitForMove(uint64_t seen) {
    std::unique_lock<std::mutex> lock(_mutex);
    return _moved.wait_for(lock, kPatience, [&] { return _returned + _pictures > seen; });
  }
  static int onInput(void* /*session*/, void* context) {
    auto& self = *static_cast<Application*>(context);
    const std::lock_guard<std::mutex> lock(self._mutex);
    ++self._returned;
    self._moved.notify_all();
    return 0;
  }
  static int onOutput(void* info, void* data, unsigned int length, void* /*buffer*/, void* context,
                      unsigned int /*timestamp*/) {
    auto& self = *static_cast<Application*>(context);
    require(data != nullptr && length > 0);
    tool::Picture picture;
    static_cast<void>(self._reader.read(*static_cast<DECODEDDATAINFO*>(info),
                                        {static_cast<const uint8_t*>(data), length}, picture));
    const std::lock_guard<std::mutex> lock(self._mutex);
    ++self._pictures;
    self._moved.notify_all();
    return 0;
  }

  void* const _session;
  uint64_t _sent = 0;
  int _time = 0;
  tool::DecodedPictureReader _reader;  // the output thread's
  std::mutex _mutex;                   // guards the next three
  std::condition_variable _moved;
  uint64_t _returned = 0;
  uint64_t _pictures = 0;
};

// Runs one of the calls that may wait without a limit. Where it takes too long the session is destroyed under
// it, which ends it; then false.
template <typename Call>
bool ends(void* session, Call call) {
  std::mutex mutex;
  std::condition_variable changed;
  bool ended = false;
  std::thread owner([&] {
    call();
    const std::lock_guard<std::mutex> lock(mutex);
    ended = true;
    changed.notify_all();
  });
  bool inTime = false;
  {
    std::unique_lock<std::mutex> lock(mutex);
    inTime = changed.wait_for(lock, kPatience, [&] { return ended; });
  }
  if (!inTime) omx_interface_destroy(session);
  owner.join();
  return inTime;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  static const omxhost::LogCapture silence;
  FuzzedDataProvider data(bytes, size);
  const int format = data.ConsumeIntegralInRange(0, 4);
  const int packing = data.ConsumeIntegralInRange(0, 2);
  const bool inOrder = data.ConsumeBool();
  const auto pieces = data.ConsumeIntegralInRange<size_t>(0, 3);  // 0: units
  const std::vector<uint8_t> stream = data.ConsumeRemainingBytes<uint8_t>();

  int result = -1;
  void* const session = decoder_create(&result, nullptr);
  require(session != nullptr && result == 0);
  omx_decoder_set_input_compression_format(session, format);
  omx_decoder_set_input_packing_format(session, packing);
  Application application(session);
  require(omx_interface_init(session) == 0);
  std::span<const uint8_t> rest(stream);
  for (size_t i = 0; i < kMostUnits && !rest.empty(); ++i) {
    const size_t length = pieces == 0 ? nextUnit(rest) : std::min(rest.size(), pieces * pieces * 97);
    if (!application.send(rest.first(length))) break;
    rest = rest.subspan(length);
  }
  if (inOrder && application.waitForInput()) {
    // Pictures that have yet to be delivered may hold all output buffers by now: how many will come of
    // damaged data nobody knows, so either call may wait for ever.
    if (!ends(session, [&] { omx_interface_send_end_of_input_flag(session, 0); }) ||
        !ends(session, [&] { omx_interface_deinit(session); })) {
      return 0;
    }
  }
  omx_interface_destroy(session);
  return 0;
}
