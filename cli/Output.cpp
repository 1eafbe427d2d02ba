#include "Output.h"

#include "Messages.h"
#include "Streams.h"

#include <cerrno>
#include <cstring>
#include <unistd.h>
#include <utility>

namespace cli {

namespace {

// Where the last character begins of which a part is missing; the end where none is.
size_t startOfCutCharacter(std::string_view text) {
  constexpr size_t longest = 4;
  for (size_t length = 1; length < longest && length <= text.size(); ++length) {
    const auto byte = static_cast<unsigned char>(text[text.size() - length]);
    if ((byte & 0xC0) == 0x80) continue;
    const size_t whole = byte >= 0xF0 ? 4 : byte >= 0xE0 ? 3 : byte >= 0xC0 ? 2 : 1;
    return whole > length ? text.size() - length : text.size();
  }
  return text.size();
}

}  // namespace

bool Output::open(const std::optional<std::string>& path) {
  _buffer.reserve(bufferSize);
  _file = path ? _result.open(*path) : STDOUT_FILENO;
  _error = _result.error();
  return _file >= 0;
}

bool Output::append(std::string_view text) {
  if (text.empty()) return _error.empty();
  _last = text.back();
  return _isVisible ? appendVisible(text) : appendBytes(text);
}

bool Output::appendVisible(std::string_view text) {
  std::string whole = std::exchange(_cut, {}) + std::string(text);
  const size_t cut = startOfCutCharacter(whole);
  _cut = whole.substr(cut);
  whole.resize(cut);
  return appendBytes(visible(whole));
}

void Output::discard() {
  _buffer.clear();
  _cut.clear();
}

bool Output::appendBytes(std::string_view text) {
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
  if (!_cut.empty()) _buffer += visible(std::exchange(_cut, {}));
  const bool written = write(_buffer);
  _buffer.clear();
  return written;
}

bool Output::write(std::string_view text) {
  if (!writeAll(_file, text)) _error = std::strerror(errno);
  return _error.empty();
}

}  // namespace cli
