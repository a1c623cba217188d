#include "tools/files/output_file.h"

#include <errno.h>
#include <fcntl.h>
#include <poll.h>
#include <stdlib.h>
#include <string.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tools/base/temporary_files.h"

namespace tool {

namespace {

mode_t fileMode() {
  const mode_t mask = umask(0);
  umask(mask);
  return static_cast<mode_t>(0666 & ~mask);
}

}  // namespace

bool isStandardOutput(const std::string& path) {
  return path == "-";
}

OutputFile::OutputFile(std::string name, int descriptor) : _name(std::move(name)), _descriptor(descriptor) {}

OutputFile::~OutputFile() {
  if (_descriptor > STDERR_FILENO) close(_descriptor);
  if (!_temporaryPath.empty()) {
    unlink(_temporaryPath.c_str());
    forgetTemporaryFile(_temporaryPath);
  }
}

Result<std::unique_ptr<OutputFile>> OutputFile::create(const std::string& path) {
  using File = std::unique_ptr<OutputFile>;
  if (isStandardOutput(path)) return File(new OutputFile("standard output", STDOUT_FILENO));

  struct stat status {};
  const bool exists = stat(path.c_str(), &status) == 0;
  if (exists && !S_ISREG(status.st_mode)) {
    File file(new OutputFile(path, open(path.c_str(), O_WRONLY | O_CLOEXEC)));
    if (file->_descriptor < 0) return file->systemFailure(errno);
    return file;
  }
  // An existing file is replaced where it really is, not the link to it.
  char* const resolved = exists ? realpath(path.c_str(), nullptr) : nullptr;
  const std::string target = resolved != nullptr ? resolved : path;
  free(resolved);
  std::string temporary = target + ".XXXXXX";
  File file(new OutputFile(path, mkostemp(temporary.data(), O_CLOEXEC)));
  if (file->_descriptor < 0) return file->systemFailure(errno);
  noteTemporaryFile(temporary);
  file->_path = target;
  file->_temporaryPath = temporary;
  static_cast<void>(fchmod(file->_descriptor, exists ? status.st_mode & 07777 : fileMode()));
  return file;
}

Failure OutputFile::systemFailure(int error) const {
  switch (error) {
    case EPIPE:
      return failure("whoever was reading it has gone");
    case ENOSPC:
      return failure("no space left on the device");
    case EISDIR:
      return failure("is a directory: name a file");
    default:
      return failure(strerror(error));
  }
}

Outcome OutputFile::write(std::span<const uint8_t> bytes) {
  while (!bytes.empty()) {
    const ssize_t count = ::write(_descriptor, bytes.data(), bytes.size());
    if (count >= 0) {
      bytes = bytes.subspan(static_cast<size_t>(count));
    } else if (errno == EAGAIN) {  // somebody made the pipe we were given non-blocking
      pollfd watched{_descriptor, POLLOUT, 0};
      poll(&watched, 1, -1);
    } else if (errno != EINTR) {
      return systemFailure(errno);
    }
  }
  return {};
}

bool OutputFile::seek(uint64_t offset) {
  return isSeekable() && lseek(_descriptor, static_cast<off_t>(offset), SEEK_SET) >= 0;
}

Outcome OutputFile::commit() {
  if (_descriptor > STDERR_FILENO) {
    const int closed = close(_descriptor);  // where some file systems report what did not fit
    _descriptor = -1;
    if (closed != 0) return systemFailure(errno);
  }
  if (_temporaryPath.empty()) return {};
  if (rename(_temporaryPath.c_str(), _path.c_str()) != 0) return systemFailure(errno);
  forgetTemporaryFile(_temporaryPath);
  _temporaryPath.clear();
  return {};
}

}  // namespace tool
