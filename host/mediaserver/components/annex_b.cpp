#include "host/mediaserver/components/annex_b.h"

#include <cstring>

namespace mediaserver {

namespace {

constexpr size_t kStartCode = 3;  // bytes: 0, 0, 1

// The position of the next start code, or the stream's size. Coded data has few zeros, and the library looks
// for one many bytes at a time: a unit is walked over while its picture is waited for.
size_t findStart(Bytes stream) {
  for (size_t i = 0; i + kStartCode <= stream.size(); ++i) {
    const void* const zero = std::memchr(&stream[i], 0, stream.size() - i - (kStartCode - 1));
    if (zero == nullptr) break;
    i = static_cast<size_t>(static_cast<const uint8_t*>(zero) - stream.data());
    if (stream[i + 1] == 0 && stream[i + 2] == 1) return i;
  }
  return stream.size();
}

}  // namespace

Bytes findNal(Bytes stream) {
  const size_t start = findStart(stream);
  return start == stream.size() ? Bytes() : stream.subspan(start + kStartCode);
}

Bytes takeNal(Bytes* stream) {
  for (;;) {
    const Bytes rest = findNal(*stream);
    if (rest.empty()) {
      *stream = {};
      return {};
    }
    const size_t end = findStart(rest);
    *stream = rest.subspan(end);
    Bytes nal = rest.first(end);
    while (!nal.empty() && nal.back() == 0) nal = nal.first(nal.size() - 1);
    if (!nal.empty()) return nal;
  }
}

std::vector<uint8_t> unescape(Bytes nal) {
  std::vector<uint8_t> payload;
  payload.reserve(nal.size());
  unsigned zeros = 0;
  for (size_t i = 1; i < nal.size(); ++i) {
    if (zeros >= 2 && nal[i] == 3) {
      zeros = 0;
      continue;
    }
    zeros = nal[i] == 0 ? zeros + 1 : 0;
    payload.push_back(nal[i]);
  }
  return payload;
}

void appendNal(uint8_t header, Bytes payload, std::vector<uint8_t>* stream) {
  stream->insert(stream->end(), {0, 0, 0, 1, header});
  unsigned zeros = 0;
  for (const uint8_t byte : payload) {
    if (zeros >= 2 && byte <= 3) {
      stream->push_back(3);
      zeros = 0;
    }
    zeros = byte == 0 ? zeros + 1 : 0;
    stream->push_back(byte);
  }
}

uint32_t BitReader::bits(unsigned count) {
  uint32_t value = 0;
  for (; count > 0; --count, ++_position) {
    const size_t byte = _position / 8;
    const unsigned octet = byte < _bytes.size() ? _bytes[byte] : 0U;
    const unsigned bit = octet >> (7 - _position % 8) & 1U;
    value = value << 1 | bit;
  }
  return value;
}

uint32_t BitReader::ue() {
  unsigned zeros = 0;
  while (zeros < 32 && !flag() && !overrun()) ++zeros;
  return zeros < 32 ? (uint32_t{1} << zeros) - 1 + bits(zeros) : UINT32_MAX;
}

int32_t BitReader::se() {
  const uint32_t code = ue();
  if (code == UINT32_MAX) return 0;  // damaged
  const auto magnitude = static_cast<int32_t>(code / 2);
  return code % 2 != 0 ? magnitude + 1 : -magnitude;
}

BitWriter& BitWriter::bits(uint32_t value, unsigned count) {
  for (; count > 0; --count, ++_position) {
    if (_position % 8 == 0) _bytes.push_back(0);
    const unsigned bit = value >> (count - 1) & 1U;
    _bytes.back() = static_cast<uint8_t>(_bytes.back() | bit << (7 - _position % 8));
  }
  return *this;
}

BitWriter& BitWriter::ue(uint32_t value) {
  unsigned zeros = 0;
  while ((uint64_t{value} + 1) >> (zeros + 1) != 0) ++zeros;
  return bits(0, zeros).bits(1, 1).bits(value + 1, zeros);
}

BitWriter& BitWriter::finish() {
  bits(1, 1);
  while (_position % 8 != 0) bits(0, 1);
  return *this;
}

}  // namespace mediaserver
