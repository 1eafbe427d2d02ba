#include "Output.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <unistd.h>

namespace cli {

Output::Output() = default;

Output::~Output() {
  if (_owned) close(_file);
}

bool Output::open(const std::optional<std::string>& path) {
  _buffer.reserve(bufferSize);
  if (!path) {
    _file = STDOUT_FILENO;
    return true;
  }
  _file = ::open(path->c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
  _owned = _file >= 0;
  return _owned || fail();
}

bool Output::append(std::string_view text) {
  if (!_error.empty()) return false;
  if (_buffer.size() + text.size() > bufferSize && !flush()) return false;
  // A piece as large as the buffer gains nothing from being copied into it.
  if (text.size() >= bufferSize) return writeAll(text);
  _buffer += text;
  return true;
}

bool Output::finish() {
  if (_error.empty()) flush();
  if (_owned) {
    _owned = false;
    // Some file systems report a full disk only here.
    if (close(_file) != 0 && _error.empty()) fail();
  }
  return _error.empty();
}

bool Output::flush() {
  const bool written = writeAll(_buffer);
  _buffer.clear();
  return written;
}

bool Output::writeAll(std::string_view text) {
  while (!text.empty()) {
    const ssize_t count = write(_file, text.data(), text.size());
    if (count >= 0) {
      text.remove_prefix(static_cast<size_t>(count));
    } else if (errno != EINTR) {
      return fail();
    }
  }
  return true;
}

bool Output::fail() {
  _error = std::strerror(errno);
  return false;
}

}  // namespace cli
