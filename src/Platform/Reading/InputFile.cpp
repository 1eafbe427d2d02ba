#include "Platform/Reading/InputFile.h"

#include "Platform/Base/WorkMeter.h"

#include <cerrno>
#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

namespace xquery {

namespace {

// Waits for a writer where the file is a pipe. Whoever is interrupted in waiting may be told to
// end.
int openedFile(const std::string& path) {
  int descriptor = -1;
  while ((descriptor = ::open(path.c_str(), O_RDONLY | O_CLOEXEC)) < 0 && errno == EINTR) {
    lookAtWork();
  }
  return descriptor;
}

}  // namespace

InputFile::InputFile(const std::string& path)
    : _descriptor(path == "-" ? STDIN_FILENO : openedFile(path)) {
  if (!isOpen()) _failure = errno;
}

InputFile::~InputFile() {
  if (_descriptor > STDIN_FILENO) ::close(_descriptor);
}

ptrdiff_t InputFile::read(char* buffer, size_t size, const NSXMLReadingProgress& progress,
                          const std::function<void()>& beforeWaiting) {
  pollfd input = {_descriptor, POLLIN, 0};
  if (beforeWaiting && ::poll(&input, 1, 0) == 0) beforeWaiting();
  ptrdiff_t count = 0;
  while ((count = ::read(_descriptor, buffer, size)) < 0 && errno == EINTR) lookAtWork();
  if (count < 0) _failure = errno;
  if (count > 0) _bytesRead += static_cast<uint64_t>(count);
  if (count > 0 && progress) progress(_bytesRead, bytesInFile());
  return count;
}

uint64_t InputFile::bytesInFile() const {
  struct stat about;
  const bool isFile = ::fstat(_descriptor, &about) == 0 && S_ISREG(about.st_mode);
  return isFile ? static_cast<uint64_t>(about.st_size) : 0;
}

bool InputFile::isSeekable() const {
  return ::lseek(_descriptor, 0, SEEK_CUR) == 0;
}

bool InputFile::rewind() {
  const bool isThere = ::lseek(_descriptor, 0, SEEK_SET) == 0;
  if (!isThere) _failure = errno;
  _bytesRead = 0;
  return isThere;
}

}  // namespace xquery
