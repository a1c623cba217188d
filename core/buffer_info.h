// The record of one component buffer: which memory it is, who has it, what it last held. The
// session keeps one per buffer in its port tables and guards them with its own lock; threads pass
// buffer ids to each other and find the record again under that lock.
#pragma once

#include <pthread.h>
#include <stdint.h>

#include <binder/IMemory.h>
#include <media/IOMX.h>

#include "core/shared_value.h"
#include "omxbridge/export.h"

// Kept: the order of the fields is known to binaries that walk a port's table.
struct OMXBRIDGE_EXPORT BufferInfo {
  BufferInfo();
  ~BufferInfo();
  // A copy shares the memory (one more reference) and has a mutex of its own.
  BufferInfo(const BufferInfo& other);
  BufferInfo& operator=(const BufferInfo& other);

  android::IOMX::buffer_id bufferId;     // the component's id
  SharedValue<bool> busy;                // with the component, or reserved by the caller
  android::sp<android::IMemory> memory;  // shared block behind the buffer; null if the component allocated it
  uint32_t length;       // bytes: the buffer's size, on the input port what was last submitted
  void* data;            // the buffer's bytes in this process
  uint32_t rangeLength;  // bytes the component filled in last (output)
  void* outputData;      // what the output callback gets; `data`, or null where only the id leads to it
  uint32_t timestamp;    // low 32 bits of the last filled buffer's time stamp
  bool eos;              // the last filled buffer ended the stream
  // Kept: for binaries that take it around `busy`. The session's own lock covers the whole record.
  pthread_mutex_t lock;
};
