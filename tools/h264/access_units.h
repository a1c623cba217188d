// An H.264 byte stream (Annex B) cut into access units: one coded picture each, with the parameter sets
// and messages before it, start codes included. One thread at a time.
#pragma once

#include <memory>
#include <vector>

#include "tools/files/byte_reader.h"
#include "tools/h264/headers.h"

namespace tool {

// Whether the bytes hold a slice of a picture, and not parameter sets and messages alone.
bool holdsPicture(std::span<const uint8_t> bytes);
// Whether a decoder can begin with them.
bool holdsKeyPicture(std::span<const uint8_t> bytes);
// What precedes the first slice: parameter sets and messages.
std::span<const uint8_t> leadingParameters(std::span<const uint8_t> bytes);
// From the first sequence parameters in the bytes, if there are any.
std::optional<SequenceInfo> findSequenceInfo(std::span<const uint8_t> bytes);

// Where access units come from.
class AccessUnitSource {
 public:
  virtual ~AccessUnitSource() = default;
  // The next unit into `unit`. False at the end of the stream, or once a stop has been requested.
  virtual Result<bool> next(std::vector<uint8_t>& unit) = 0;
  // What the stream says so far.
  virtual std::optional<FrameRate> frameRate() const = 0;
  // A failure of this input, for messages.
  virtual Failure failure(const std::string& problem) const = 0;
};

class AccessUnitReader : public AccessUnitSource {
 public:
  explicit AccessUnitReader(std::unique_ptr<ByteReader> bytes) : _bytes(std::move(bytes)) {}

  // What precedes the first start code is skipped. Fails where the input is no such stream.
  Result<bool> next(std::vector<uint8_t>& unit) override;
  std::optional<FrameRate> frameRate() const override { return _parameters.frameRate(); }
  Failure failure(const std::string& problem) const override { return _bytes->failure(problem); }

 private:
  Result<bool> nextNal();
  std::optional<size_t> boundaryBeforeNal();
  void handOut(std::vector<uint8_t>& unit, size_t end);
  void discard(size_t end);

  const std::unique_ptr<ByteReader> _bytes;
  ParameterSets _parameters;
  std::vector<uint8_t> _pending;  // read, and not handed out yet
  size_t _nalBegin = 0;           // the NAL unit in hand, in _pending, from its start code on
  size_t _nalEnd = 0;
  bool _begun = false;  // the first start code has been found
  bool _inputEnded = false;
  bool _anyPicture = false;             // a unit has been handed out
  std::optional<SliceIdentity> _slice;  // the last one of the pending unit
  std::optional<size_t> _prefix;        // where a prefix begins that may belong to the next unit
};

}  // namespace tool
