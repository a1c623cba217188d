// A decoder session through the C interface, fed with mutated streams: access units, pieces, several pictures
// a buffer, in every compression format. Each life ends, in order or by destruction, and every picture that
// comes can be read as it is described.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <future>
#include <span>
#include <vector>

#include <omxhost/log.h>

#include "omxbridge/omxbridge.h"
#include "tests/core/application.h"
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

// False where the session does not take anything any more.
bool send(void* session, const omxtest::Application& application, std::span<const uint8_t> unit,
          int timestamp) {
  void* buffer = nullptr;
  void* memory = nullptr;
  for (;;) {
    const size_t seen = application.inputCallbacks().size();
    const int result = omx_interface_reserve_input_buffer(session, &buffer, &memory);
    if (result == 0) break;
    const bool over = result != -1 || omx_interface_error(session) != 0;
    if (over || !application.waitForCalls(seen + 1, 0, kPatience)) return false;
  }
  // The input port is made for 640x480 at least.
  const size_t length = std::min<size_t>(unit.size(), 64 << 10);
  std::memcpy(memory, unit.data(), length);
  return omx_interface_send_input_buffer(session, buffer, static_cast<int>(length), timestamp) == 0;
}

// Runs one of the calls that may wait without a limit. Where it takes too long the session is destroyed under
// it, which ends it; then false.
template <typename Call>
bool ends(void* session, Call call) {
  const std::future<void> end = std::async(std::launch::async, call);  // waited for at the end
  const bool inTime = end.wait_for(kPatience) == std::future_status::ready;
  if (!inTime) omx_interface_destroy(session);
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
  omxtest::Application application;
  tool::DecodedPictureReader reader;  // the output thread's
  application.leaveDataAlone();
  application.onOutput([&reader](const omxtest::Output& output) {
    require(output.data != nullptr && output.length > 0);
    tool::Picture picture;
    const std::span<const uint8_t> seen(static_cast<const uint8_t*>(output.data), output.length);
    static_cast<void>(reader.read(output.info, seen, picture));
    return 0;
  });
  application.attach(*static_cast<OmxInterface*>(session));
  require(omx_interface_init(session) == 0);
  std::span<const uint8_t> rest(stream);
  size_t sent = 0;
  for (; sent < kMostUnits && !rest.empty(); ++sent) {
    const size_t length = pieces == 0 ? nextUnit(rest) : std::min(rest.size(), pieces * pieces * 97);
    if (!send(session, application, rest.first(length), static_cast<int>(sent))) break;
    rest = rest.subspan(length);
  }
  if (inOrder && application.waitForCalls(sent, 0, kPatience)) {
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
