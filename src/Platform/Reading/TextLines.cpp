#include "Platform/Reading/TextLines.h"

#include <algorithm>

namespace xquery {

void TextPlace::pass(std::string_view text) {
  line += std::count(text.begin(), text.end(), '\n');
  const size_t last = text.rfind('\n');
  if (last != text.npos) {
    column = 1;
    text.remove_prefix(last + 1);
  }
  column +=
      std::count_if(text.begin(), text.end(), [](char byte) { return (byte & 0xC0) != 0x80; });
}

void TextLines::leave(std::string_view text, size_t depth) {
  size_t first = depth;
  while (first > 0 && _opened[first - 1].line == 0) --first;
  int64_t line = _place.line;
  const char* at = text.data();
  for (; first < depth; ++first) {
    Opened& opened = _opened[first];
    line += std::count(at, opened.at, '\n');
    at = opened.at;
    opened.line = line;
  }
  _place.pass(text);
}

}  // namespace xquery
