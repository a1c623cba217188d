// OpenMAX records as the library sends them: zero-filled, with size and version 1.1.0.0 set.
#pragma once

#include <OMX_Core.h>

// Zero-fills a record and sets its version, but not its size: for the few records that are sent
// with another size word on purpose.
template <typename Record>
Record makeUnsizedOmxRecord() {
  Record record{};
  record.nVersion.s.nVersionMajor = 1;
  record.nVersion.s.nVersionMinor = 1;
  return record;
}

// A record without a port (header of size and version only).
template <typename Record>
Record makeOmxRecord() {
  auto record = makeUnsizedOmxRecord<Record>();
  record.nSize = sizeof(Record);
  return record;
}

// A record that names a port.
template <typename Record>
Record makeOmxRecord(OMX_U32 port) {
  auto record = makeOmxRecord<Record>();
  record.nPortIndex = port;
  return record;
}
