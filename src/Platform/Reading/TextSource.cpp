#include "Platform/Reading/TextSource.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <cstring>

namespace xquery {

namespace {

constexpr size_t bytesPerStep = 4096;

// The places may overlap where `to` is before `from`.
void moveInBlocks(char* to, std::string_view from) {
  inBlocks(from, [&to](std::string_view block) {
    if (!block.empty()) std::memmove(to, block.data(), block.size());
    to += block.size();
  });
}

}  // namespace

TextSource::TextSource(TextInput input, TextRewinding rewind, size_t smallestWindow,
                       size_t usualWindow)
    : _input(std::move(input)),
      _rewind(std::move(rewind)),
      _smallestWindow(smallestWindow),
      _usualWindow(usualWindow),
      _keeps(!_rewind) {}

TextSource::~TextSource() {
  freeWindow();
}

void TextSource::freeWindow() {
  if (_window) freeValueMemory(_window, _windowSize);
  _window = nullptr;
  _begin = _end = nullptr;
}

void TextSource::makeWindow(size_t size, const char* keep) {
  const auto count = static_cast<size_t>(_end - keep);
  char* const window = static_cast<char*>(allocateValueMemory(size));
  try {
    moveInBlocks(window, {keep, count});
  } catch (...) {
    freeValueMemory(window, size);
    throw;
  }
  freeWindow();
  _window = window;
  _windowSize = size;
  _begin = window;
  _end = window + count;
}

bool TextSource::more(const char* keep) {
  if (!isUnfinished()) {
    _begin = keep;
    return false;
  }
  const auto count = static_cast<size_t>(_end - keep);
  // One that a long piece has made large serves for that piece alone.
  const bool isTooLarge = _windowSize > _usualWindow && count < _usualWindow / 2;
  if (count > _windowSize / 2) {
    makeWindow(std::max(_smallestWindow, 2 * _windowSize), keep);
  } else if (isTooLarge) {
    makeWindow(_usualWindow, keep);
  } else if (_windowSize < _usualWindow) {
    makeWindow(std::clamp(4 * _windowSize, _smallestWindow, _usualWindow), keep);
  } else {
    moveInBlocks(_window, {keep, count});
    _begin = _window;
    _end = _window + count;
  }
  fill();
  return static_cast<size_t>(_end - _begin) > count;
}

// Until the window is full: whoever reads begins again with what was not complete, which must not
// be for a few bytes.
void TextSource::fill() {
  char* at = _window + (_end - _begin);
  char* const end = _window + _windowSize;
  while (at < end && !isEnough(static_cast<size_t>(at - _end))) {
    const ptrdiff_t count = _input(at, static_cast<size_t>(end - at));
    _hasFailed = count < 0;
    _isOver = count <= 0;
    if (_isOver) break;
    if (_keeps) _kept.append({at, static_cast<size_t>(count)});
    at += count;
    checkWork(1 + static_cast<size_t>(count) / bytesPerStep);
  }
  _end = at;
}

// Whether to begin again with so much more than before. A long piece grows by a part of itself.
bool TextSource::isEnough(size_t count) const {
  constexpr size_t shortPiece = 4096;
  const auto before = static_cast<size_t>(_end - _begin);
  return _takesAsItComes && count > (before < shortPiece ? 0 : before / 2);
}

// Large pieces of the input, for a reader of small ones.
ptrdiff_t TextSource::readPieces(char* buffer, size_t size) {
  if (_begin == _end) {
    if (!_window) makeWindow(std::min(_usualWindow, size_t{65536}), _end);
    const ptrdiff_t count = _input(_window, _windowSize);
    if (count <= 0) return count;
    _begin = _window;
    _end = _window + count;
  }
  const size_t count = std::min(size, static_cast<size_t>(_end - _begin));
  std::memcpy(buffer, _begin, count);
  _begin += count;
  return static_cast<ptrdiff_t>(count);
}

ptrdiff_t TextSource::readAgain(char* buffer, size_t size) {
  if (const size_t count = _kept.read(buffer, size)) return static_cast<ptrdiff_t>(count);
  if (_hasFailed) return -1;
  return _isOver ? 0 : readPieces(buffer, size);
}

TextInput TextSource::from(const char* at) {
  _begin = at;
  return [this](char* buffer, size_t size) -> ptrdiff_t {
    if (_begin == _end && !isUnfinished()) return _hasFailed ? -1 : 0;
    return readPieces(buffer, size);
  };
}

TextInput TextSource::fromTheBeginning() {
  if (!_input) {
    return [this, at = size_t{0}](char* buffer, size_t size) mutable {
      const size_t count = std::min(size, _text.size() - at);
      if (count) std::memcpy(buffer, _text.data() + at, count);
      at += count;
      return static_cast<ptrdiff_t>(count);
    };
  }
  freeWindow();
  _kept.rewind();
  if (!_keeps) {
    _hasFailed = !_rewind();
    _isOver = false;
  }
  return [this](char* buffer, size_t size) { return readAgain(buffer, size); };
}

}  // namespace xquery
