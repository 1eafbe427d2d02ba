#include "Platform/Reading/TextLines.h"

#include <algorithm>
#include <cstring>

namespace xquery {

namespace {

// All of a stream passes here: eight bytes at a time.
int64_t countLines(std::string_view text) {
  constexpr uint64_t ones = 0x0101010101010101U;
  constexpr uint64_t low = ones * 0x7F;
  uint64_t count = 0;
  while (text.size() >= sizeof(uint64_t)) {
    uint64_t bytes;
    std::memcpy(&bytes, text.data(), sizeof bytes);
    bytes ^= ones * '\n';
    const uint64_t matches = ~(((bytes & low) + low) | bytes | low);  // their highest bits
    count += ((matches >> 7) * ones) >> 56;
    text.remove_prefix(sizeof bytes);
  }
  return static_cast<int64_t>(count) + std::count(text.begin(), text.end(), '\n');
}

}  // namespace

void TextPlace::pass(std::string_view text) {
  pass(text, countLines(text));
}

void TextPlace::pass(std::string_view text, int64_t lines) {
  line += lines;
  if (lines > 0) {
    column = 1;
    text.remove_prefix(text.rfind('\n') + 1);
  }
  column +=
      std::count_if(text.begin(), text.end(), [](char byte) { return (byte & 0xC0) != 0x80; });
}

void TextLines::leave(std::string_view text, size_t depth) {
  size_t first = depth;
  while (first > 0 && _opened[first - 1].line == 0) --first;
  int64_t lines = 0;
  const char* at = text.data();
  const auto countTo = [&](const char* end) {
    lines += countLines({at, static_cast<size_t>(end - at)});
    at = end;
  };
  for (; first < depth; ++first) {
    countTo(_opened[first].at);
    _opened[first].line = _place.line + lines;
  }
  countTo(text.data() + text.size());
  _place.pass(text, lines);
}

}  // namespace xquery
