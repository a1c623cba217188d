#include "tools/h264/bit_reader.h"

namespace tool {

uint32_t BitReader::bit() {
  if (_left == 0) {
    if (_zeros >= 2 && _next < _bytes.size() && _bytes[_next] == 3) {
      _zeros = 0;
      ++_next;
    }
    if (_next >= _bytes.size()) {
      _overrun = true;
      return 0;
    }
    _current = _bytes[_next++];
    _zeros = _current == 0 ? _zeros + 1 : 0;
    _left = 8;
  }
  --_left;
  return (uint32_t{_current} >> _left) & 1;
}

uint32_t BitReader::bits(unsigned int count) {
  uint32_t value = 0;
  for (; count > 0; --count) value = value << 1 | bit();
  return value;
}

uint32_t BitReader::ue() {
  unsigned int zeros = 0;
  while (zeros < 32 && !_overrun && bit() == 0) ++zeros;
  if (zeros >= 32) {
    _overrun = true;  // no code is that long
    return 0;
  }
  return (uint32_t{1} << zeros) - 1 + bits(zeros);
}

int32_t BitReader::se() {
  const uint32_t code = ue();
  const auto magnitude = static_cast<int32_t>(code / 2 + code % 2);
  return code % 2 != 0 ? magnitude : -magnitude;
}

}  // namespace tool
