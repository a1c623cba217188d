// H.264 byte streams: finding NAL units between start codes, and the bits inside of a parameter set. Pure
// functions on memory; nothing reads beyond the range that it was given.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace mediaserver {

using Bytes = std::span<const uint8_t>;

enum NalType : unsigned {
  kNalSlice = 1,
  kNalIdrSlice = 5,
  kNalSequenceSet = 7,
  kNalPictureSet = 8,
};

inline unsigned nalType(Bytes nal) {
  return nal.empty() ? 0U : nal[0] & 0x1FU;
}

// The stream from its next NAL unit on, without the start code in front of that. Empty when there is none
// left.
Bytes findNal(Bytes stream);

// Takes the next NAL unit, without its start code, from the front of `stream`. Empty when there is none left.
// Zeros behind a unit belong to none.
Bytes takeNal(Bytes* stream);

// The payload of a NAL unit: everything behind the header byte, without emulation prevention.
std::vector<uint8_t> unescape(Bytes nal);

// Appends a start code of four bytes, the header byte and the payload with emulation prevention.
void appendNal(uint8_t header, Bytes payload, std::vector<uint8_t>* stream);

// Reads beyond the end give zeros and are remembered.
class BitReader {
 public:
  explicit BitReader(Bytes bytes) : _bytes(bytes) {}
  uint32_t bits(unsigned count);  // up to 32
  bool flag() { return bits(1) != 0; }
  uint32_t ue();
  int32_t se();
  size_t position() const { return _position; }  // bits from the beginning
  bool overrun() const { return _position > _bytes.size() * 8; }

 private:
  const Bytes _bytes;
  size_t _position = 0;
};

class BitWriter {
 public:
  BitWriter& bits(uint32_t value, unsigned count);
  BitWriter& ue(uint32_t value);
  // Stop bit and zeros up to the next byte.
  BitWriter& finish();
  const std::vector<uint8_t>& bytes() const { return _bytes; }

 private:
  std::vector<uint8_t> _bytes;
  size_t _position = 0;
};

}  // namespace mediaserver
