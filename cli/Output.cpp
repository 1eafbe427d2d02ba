#include "Output.h"

#include "Streams.h"

#include <cerrno>
#include <cstring>
#include <unistd.h>

namespace cli {

bool Output::open(const std::optional<std::string>& path) {
  _buffer.reserve(bufferSize);
  _file = path ? _result.open(*path) : STDOUT_FILENO;
  _error = _result.error();
  return _file >= 0;
}

bool Output::append(std::string_view text) {
  if (!_error.empty()) return false;
  if (_buffer.size() + text.size() > bufferSize && !flush()) return false;
  // A piece as large as the buffer gains nothing from being copied into it.
  if (text.size() >= bufferSize) return write(text);
  _buffer += text;
  return true;
}

bool Output::finish() {
  if (!flush()) return false;
  if (!_result.finish()) _error = _result.error();
  return _error.empty();
}

bool Output::flush() {
  if (!_error.empty()) return false;
  const bool written = write(_buffer);
  _buffer.clear();
  return written;
}

bool Output::write(std::string_view text) {
  if (!writeAll(_file, text)) _error = std::strerror(errno);
  return _error.empty();
}

}  // namespace cli
