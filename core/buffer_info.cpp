#include "core/buffer_info.h"

BufferInfo::BufferInfo()
    : bufferId(nullptr),
      busy(false),
      memory(),
      length(0),
      data(nullptr),
      rangeLength(0),
      outputData(nullptr),
      timestamp(0),
      eos(false) {
  pthread_mutex_init(&lock, nullptr);
}

BufferInfo::~BufferInfo() {
  pthread_mutex_destroy(&lock);
}

BufferInfo::BufferInfo(const BufferInfo& other)
    : bufferId(other.bufferId),
      busy(other.busy),
      memory(other.memory),
      length(other.length),
      data(other.data),
      rangeLength(other.rangeLength),
      outputData(other.outputData),
      timestamp(other.timestamp),
      eos(other.eos) {
  pthread_mutex_init(&lock, nullptr);
}

BufferInfo& BufferInfo::operator=(const BufferInfo& other) {
  if (this == &other) return *this;
  bufferId = other.bufferId;
  busy = other.busy;
  memory = other.memory;
  length = other.length;
  data = other.data;
  rangeLength = other.rangeLength;
  outputData = other.outputData;
  timestamp = other.timestamp;
  eos = other.eos;
  return *this;  // `lock` stays this record's own
}
