// What tests say about the records that a session sends to its component.
#pragma once

#include <array>
#include <cstring>
#include <functional>
#include <vector>

#include "tests/support/call.h"

namespace omxtest {

using Words = std::vector<OMX_U32>;

constexpr OMX_U32 kVersion = 0x00000101;  // 1.1.0.0

inline Words words(const std::vector<uint8_t>& bytes) {
  Words result(bytes.size() / sizeof(OMX_U32));
  if (!result.empty()) std::memcpy(result.data(), bytes.data(), result.size() * sizeof(OMX_U32));
  return result;
}

// What has to be written after `read`: its record with some fields changed, everything else, padding too,
// as the component had it.
template <typename Record>
std::vector<uint8_t> edited(const Call& read, const std::function<void(Record&)>& edit) {
  std::vector<uint8_t> bytes = read.record;
  bytes.resize(sizeof(Record));
  Record record;
  std::memcpy(&record, bytes.data(), sizeof(record));
  edit(record);
  std::memcpy(bytes.data(), &record, sizeof(record));
  return bytes;
}

// A record of `size` bytes for `port` with another value in every word, to tell what a client leaves alone.
template <size_t size>
std::array<OMX_U32, size / sizeof(OMX_U32)> patternRecord(OMX_U32 port) {
  std::array<OMX_U32, size / sizeof(OMX_U32)> result;
  for (size_t i = 0; i < result.size(); ++i) result[i] = 0x0A0B0C00 + static_cast<OMX_U32>(i);
  result[2] = port;
  return result;
}

}  // namespace omxtest
