#pragma once
// The bytes of one buffer with what travels along: an input as a component got it, or an output that it is
// to produce. A plain value.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <OMX_Types.h>

namespace omxtest {

struct Packet {
  std::vector<uint8_t> bytes;
  OMX_TICKS timestamp = 0;
  OMX_U32 flags = 0;
  // Outputs only.
  OMX_U32 offset = 0;                   // where in the buffer the bytes begin
  std::optional<OMX_U32> lengthToTell;  // instead of the true length: a component that lies

  Packet() = default;
  explicit Packet(std::string_view text, OMX_TICKS time = 0, OMX_U32 flagWord = 0)
      : bytes(text.begin(), text.end()), timestamp(time), flags(flagWord) {}

  std::string text() const { return {bytes.begin(), bytes.end()}; }
};

}  // namespace omxtest
