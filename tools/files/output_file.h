// A file being written, or standard output ("-"). One thread at a time.
//
// A regular file gets its name when it is complete: until commit() it is a temporary file beside it,
// which goes away with this object. Pipes and devices are written to directly.
#pragma once

#include <stdint.h>

#include <memory>
#include <span>
#include <string>

#include "tools/base/failure.h"

namespace tool {

class OutputFile {
 public:
  static Result<std::unique_ptr<OutputFile>> create(const std::string& path);
  ~OutputFile();
  OutputFile(const OutputFile&) = delete;
  OutputFile& operator=(const OutputFile&) = delete;

  // For messages: the path, or "standard output".
  const std::string& name() const { return _name; }

  Outcome write(std::span<const uint8_t> bytes);
  // Goes on from this byte. Only files that get their name later can do so.
  bool isSeekable() const { return !_temporaryPath.empty(); }
  bool seek(uint64_t offset);
  // Once, at the end.
  Outcome commit();

  Failure failure(const std::string& problem) const { return {ExitCode::Output, _name + ": " + problem}; }

 private:
  OutputFile(std::string name, int descriptor);
  Failure systemFailure(int error) const;

  const std::string _name;
  int _descriptor;
  std::string _path;           // what a temporary file is to be called
  std::string _temporaryPath;  // empty: written directly
};

bool isStandardOutput(const std::string& path);

}  // namespace tool
