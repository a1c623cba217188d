#include "tools/h264/access_units.h"

#include <string.h>

#include <algorithm>

namespace tool {

namespace {

constexpr size_t kChunk = 65536;
constexpr size_t kStartCode = 3;               // 0, 0, 1
constexpr size_t kMaxUnit = size_t{32} << 20;  // far more than any level allows

// Where the first start code at or behind `from` is; the size where there is none.
size_t findStartCode(std::span<const uint8_t> bytes, size_t from) {
  for (size_t at = from + 2; at < bytes.size(); ++at) {
    const void* const one = memchr(bytes.data() + at, 1, bytes.size() - at);
    if (one == nullptr) break;
    at = static_cast<size_t>(static_cast<const uint8_t*>(one) - bytes.data());
    if (bytes[at - 1] == 0 && bytes[at - 2] == 0) return at - 2;
  }
  return bytes.size();
}

std::span<const uint8_t> withoutStartCode(std::span<const uint8_t> nal) {
  return nal.subspan(std::min(nal.size(), findStartCode(nal, 0) + kStartCode));
}

// The first NAL unit of a type that `wanted` accepts, and all behind it; empty where there is none.
std::span<const uint8_t> findNal(std::span<const uint8_t> bytes, bool (*wanted)(NalType)) {
  for (size_t at = findStartCode(bytes, 0); at + kStartCode < bytes.size();
       at = findStartCode(bytes, at + 1)) {
    const auto nal = bytes.subspan(at + kStartCode);
    if (wanted(nalType(nal))) return nal;
  }
  return {};
}

// Types that begin a new unit when they follow a picture.
bool leadsUnit(NalType type) {
  return (type >= kNalSei && type <= kNalDelimiter) || (type > kNalPrefix && type <= kNalReserved18);
}

}  // namespace

bool holdsPicture(std::span<const uint8_t> bytes) {
  return !findNal(bytes, isSlice).empty();
}

bool holdsKeyPicture(std::span<const uint8_t> bytes) {
  return !findNal(bytes, [](NalType type) { return type == kNalIdrSlice; }).empty();
}

std::span<const uint8_t> leadingParameters(std::span<const uint8_t> bytes) {
  const auto slice = findNal(bytes, isSlice);
  return slice.empty() ? bytes : bytes.first(bytes.size() - slice.size() - kStartCode);
}

std::optional<SequenceInfo> findSequenceInfo(std::span<const uint8_t> bytes) {
  const auto nal = findNal(bytes, [](NalType type) { return type == kNalSequenceParameters; });
  if (nal.size() < 4) return std::nullopt;
  constexpr uint8_t kConstraint1 = 0x40;
  return SequenceInfo{.profile = nal[1], .constrained = (nal[2] & kConstraint1) != 0, .level = nal[3]};
}

// Moves on to the next NAL unit; false behind the last one.
Result<bool> AccessUnitReader::nextNal() {
  size_t searchFrom = _nalEnd;
  bool begun = false;
  for (;;) {
    const size_t found = findStartCode(_pending, searchFrom);
    if (found < _pending.size()) {
      // The fourth byte of a long start code goes with it.
      const size_t at = found > _nalEnd && _pending[found - 1] == 0 ? found - 1 : found;
      if (begun) {
        _nalEnd = at;
        return true;
      }
      _nalBegin = at;
      searchFrom = found + kStartCode;
      begun = true;
      continue;
    }
    if (_inputEnded) {
      if (!begun) return false;
      _nalEnd = _pending.size();
      return true;
    }
    if (_pending.size() >= kMaxUnit) return _bytes->failure("is no H.264 byte stream (Annex B)");
    // A start code may lie across the edge.
    searchFrom = std::max(searchFrom, _pending.size() < 2 ? 0 : _pending.size() - 2);
    const size_t size = _pending.size();
    _pending.resize(size + kChunk);
    const auto count = _bytes->readSome(std::span(_pending).subspan(size));
    _pending.resize(size + (count.ok() ? count.value() : 0));
    if (!count.ok()) return count.failure();
    _inputEnded = count.value() == 0;
  }
}

// Looks at the NAL unit in hand. Where it begins a new access unit, the end of the one before.
std::optional<size_t> AccessUnitReader::boundaryBeforeNal() {
  const auto nal = withoutStartCode(std::span(_pending).subspan(_nalBegin, _nalEnd - _nalBegin));
  const NalType type = nalType(nal);
  _parameters.update(nal);
  std::optional<size_t> boundary;
  if (isSlice(type)) {
    const SliceIdentity slice = _parameters.identify(nal);
    if (_slice && beginsPicture(*_slice, slice)) boundary = _prefix.value_or(_nalBegin);
    _slice = slice;
    _prefix.reset();
  } else if (_slice && type == kNalPrefix) {
    // It goes with the slice behind it, which may be of either picture.
    if (!_prefix) _prefix = _nalBegin;
  } else if (_slice && leadsUnit(type)) {
    boundary = _prefix.value_or(_nalBegin);
    _slice.reset();
    _prefix.reset();
  }
  return boundary;
}

void AccessUnitReader::discard(size_t end) {
  _pending.erase(_pending.begin(), _pending.begin() + static_cast<ptrdiff_t>(end));
  _nalBegin -= std::min(_nalBegin, end);
  _nalEnd -= end;
}

void AccessUnitReader::handOut(std::vector<uint8_t>& unit, size_t end) {
  unit.assign(_pending.begin(), _pending.begin() + static_cast<ptrdiff_t>(end));
  discard(end);
  _anyPicture = true;
}

Result<bool> AccessUnitReader::next(std::vector<uint8_t>& unit) {
  for (;;) {
    const auto nal = nextNal();
    if (!nal.ok()) return nal;
    if (_bytes->stopped()) return false;
    if (!nal.value()) break;
    if (!_begun) discard(_nalBegin);
    _begun = true;
    if (const auto boundary = boundaryBeforeNal()) {
      handOut(unit, *boundary);
      return true;
    }
  }
  if (_slice) {
    _slice.reset();
    handOut(unit, _pending.size());
    return true;
  }
  if (!_anyPicture) return _bytes->failure("holds no H.264 picture; is it a byte stream (Annex B)?");
  return false;
}

}  // namespace tool
