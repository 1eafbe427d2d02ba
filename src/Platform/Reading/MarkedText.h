// A text with the marks of its bytes, which are made as reading goes on, a block at a time. Every
// block is a look at the limits.
#pragma once

#include "Platform/Reading/ByteMarks.h"

#include <array>
#include <bit>

namespace xquery {

class MarkedText {
 public:
  // Which may be read from any place of it, but not backwards from there.
  void start(const char* begin, const char* end) {
    _block = _blockEnd = begin;
    _end = end;
  }
  const char* end() const { return _end; }
  // For somebody who reads from there again.
  void goBack(const char* to) {
    if (to < _block) start(to, _end);
  }

  // The first byte from `at` on that may end a run of text, a value or a name; `end()` if none
  // does. What is not ASCII before it makes `wide` something else than zero.
  const char* textEnd(const char* at, uint64_t& wide) { return find<&ByteMarks::text>(at, wide); }
  const char* valueEnd(const char* at, uint64_t& wide) { return find<&ByteMarks::value>(at, wide); }
  const char* nameEnd(const char* at, uint64_t& wide) { return find<&ByteMarks::name>(at, wide); }

 private:
  static constexpr size_t marksPerBlock = 256;

  template <uint64_t ByteMarks::*Which>
  const char* find(const char* at, uint64_t& wide);
  void markFrom(const char* at);

  const char* _block = nullptr;
  const char* _blockEnd = nullptr;
  const char* _end = nullptr;
  // Of the block, and one more in which everything is marked: a search ends there.
  std::array<ByteMarks, marksPerBlock + 1> _marks;
};

template <uint64_t ByteMarks::*Which>
const char* MarkedText::find(const char* at, uint64_t& wide) {
  for (;;) {
    if (at >= _blockEnd) {
      if (at == _end) return at;
      markFrom(at);
    }
    const auto offset = static_cast<size_t>(at - _block);
    const ByteMarks* marks = &_marks[offset / bytesPerMarks];
    const size_t before = offset % bytesPerMarks;
    uint64_t found = (marks->*Which) >> before;
    uint64_t wideOnes = marks->wide >> before;
    while (!found) {
      wide |= wideOnes;
      ++marks;
      at = _block + static_cast<size_t>(marks - _marks.data()) * bytesPerMarks;
      found = marks->*Which;
      wideOnes = marks->wide;
    }
    wide |= wideOnes & ((found & -found) - 1);
    at += std::countr_zero(found);
    if (at < _blockEnd) return at;
    at = _blockEnd;
  }
}

}  // namespace xquery
