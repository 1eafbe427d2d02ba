// Places in a text that is read through a window, and the lines on which the elements that are open
// began, as libxml2 tells of them.
#pragma once

#include "Platform/Text/Blocks.h"

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

namespace xquery {

// Counted from 1; columns in characters, but for the names in end tags in bytes.
struct TextPlace {
  int64_t line = 1;
  int64_t column = 1;

  void pass(std::string_view text);
  // Of a text of so many line feeds.
  void pass(std::string_view text, int64_t lines);
};

class TextLines {
 public:
  // An element has been opened: how many are open with it, and where in the window its tag begins.
  void open(size_t depth, const char* at) {
    if (_opened.size() < depth) _opened.resize(depth);
    _opened[depth - 1] = {at, 0};
  }
  // The window moves on by that, with so many elements open.
  void leave(std::string_view text, size_t depth);

  // Where the window begins.
  const TextPlace& place() const { return _place; }
  // Of an open element that has been left.
  int64_t lineOf(size_t depth) const { return _opened[depth - 1].line; }

 private:
  struct Opened {
    const char* at;
    int64_t line;  // 0 while `at` is in the window
  };

  TextPlace _place;
  std::vector<Opened, ValueAllocator<Opened>> _opened;
};

}  // namespace xquery
