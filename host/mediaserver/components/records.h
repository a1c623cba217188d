// Reading and writing of clients' parameter and configuration records. The size argument counts, not the
// record's own size word, which some clients leave empty or use for something else. Any thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include <OMX_Core.h>
#include <OMX_Index.h>

namespace mediaserver {

// False when the client's record is too short to be a T. A longer one is read as far as T goes.
template <typename T>
bool load(const void* bytes, size_t size, T* record) {
  if (size < sizeof(T)) return false;
  std::memcpy(record, bytes, sizeof(T));
  return true;
}

// Writes all of the record but the size and version words, which are the client's.
template <typename T>
void store(const T& record, void* bytes) {
  constexpr size_t kKept = 2 * sizeof(OMX_U32);
  std::memcpy(static_cast<uint8_t*>(bytes) + kKept, reinterpret_cast<const uint8_t*>(&record) + kKept,
              sizeof(T) - kKept);
}

// Reads a client's record, lets `fill` complete it and writes it back when that succeeds. `fill` takes a T*
// and returns an OMX_ERRORTYPE.
template <typename T, typename Fill>
OMX_ERRORTYPE answer(void* bytes, size_t size, Fill fill) {
  T record;
  if (!load(bytes, size, &record)) return OMX_ErrorBadParameter;
  const OMX_ERRORTYPE result = fill(&record);
  if (result == OMX_ErrorNone) store(record, bytes);
  return result;
}

// Reads a client's record and hands it to `take`, which returns an OMX_ERRORTYPE.
template <typename T, typename Take>
OMX_ERRORTYPE accept(const void* bytes, size_t size, Take take) {
  T record;
  return load(bytes, size, &record) ? take(record) : OMX_ErrorBadParameter;
}

}  // namespace mediaserver
