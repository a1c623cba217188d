// Bits of a NAL unit's payload, most significant first, without the emulation prevention bytes. Reading
// behind the end gives zeros and is remembered.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <span>

namespace tool {

class BitReader {
 public:
  explicit BitReader(std::span<const uint8_t> bytes) : _bytes(bytes) {}

  uint32_t bit();
  // `count` is 0 to 32.
  uint32_t bits(unsigned int count);
  // Exp-Golomb codes.
  uint32_t ue();
  int32_t se();

  bool overrun() const { return _overrun; }

 private:
  const std::span<const uint8_t> _bytes;
  size_t _next = 0;         // in _bytes
  unsigned int _zeros = 0;  // bytes of 0 directly before _next
  uint8_t _current = 0;
  unsigned int _left = 0;  // bits of _current
  bool _overrun = false;
};

}  // namespace tool
