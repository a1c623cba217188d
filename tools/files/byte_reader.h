// Bytes of a file, a pipe or standard input ("-"), in order. One thread at a time.
//
// A read that waits for a pipe ends when a stop is requested; from then on the input looks as if it had
// ended.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <memory>
#include <optional>
#include <span>
#include <stop_token>
#include <string>
#include <vector>

#include "tools/base/failure.h"

namespace tool {

class ByteReader {
 public:
  static Result<std::unique_ptr<ByteReader>> open(const std::string& path, const std::stop_token& stop);
  ~ByteReader();
  ByteReader(const ByteReader&) = delete;
  ByteReader& operator=(const ByteReader&) = delete;

  // For messages: the path, or "standard input".
  const std::string& name() const { return _name; }
  // Of a regular file, in bytes.
  std::optional<uint64_t> size() const { return _size; }
  bool stopped() const { return _stop.stop_requested(); }

  // Fills `out`; returns how many bytes there were, fewer than asked for only at the end.
  Result<size_t> read(std::span<uint8_t> out);
  // Reads what is there, at least one byte; 0 at the end.
  Result<size_t> readSome(std::span<uint8_t> out);
  // The next bytes, at most kMaxPeek, without taking them; fewer only at the end.
  Result<std::span<const uint8_t>> peek(size_t count);
  // Takes bytes up to and including the next line feed and returns them without it. Nothing at the end of
  // the input, and where `limit` bytes hold no line feed: then the input is not lines.
  Result<std::optional<std::string>> readLine(size_t limit);

  // Goes on from this byte; regular files only. False where that is impossible.
  bool seek(uint64_t offset);

  static constexpr size_t kMaxPeek = 4096;

  // A failure of this input: "NAME: problem".
  Failure failure(const std::string& problem) const { return {ExitCode::Input, _name + ": " + problem}; }

 private:
  // Readable once a stop has been requested, for poll().
  class StopSignal;

  ByteReader(std::string name, int descriptor, bool owned, std::optional<uint64_t> size,
             std::stop_token stop);
  Result<size_t> readDescriptor(std::span<uint8_t> out);
  std::span<const uint8_t> buffered() const { return std::span(_buffer).subspan(_begin, _end - _begin); }

  const std::string _name;
  const int _descriptor;
  const bool _owned;
  const std::optional<uint64_t> _size;
  const std::stop_token _stop;
  std::unique_ptr<StopSignal> _stopSignal;
  std::vector<uint8_t> _buffer;
  size_t _begin = 0;  // of what is in _buffer and not taken yet
  size_t _end = 0;
};

}  // namespace tool
