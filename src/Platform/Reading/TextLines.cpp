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

bool continuesCharacter(char byte) {
  return (byte & 0xC0) == 0x80;
}

int64_t countContinuing(std::string_view text) {
  return std::count_if(text.begin(), text.end(), continuesCharacter);
}

// Takes the text up to its first `end`, and that, off its front; without one, all of it.
std::string_view takeTo(std::string_view& text, std::string_view end) {
  const size_t length = std::min(text.find(end), text.size());
  const std::string_view taken = text.substr(0, length);
  text.remove_prefix(std::min(length + end.size(), text.size()));
  return taken;
}

// libxml2 compares the name in an end tag with that of the start tag byte by byte, and where they
// are the same counts a column for each byte. Of a text between pieces, from a place on.
int64_t moreColumnsOfEndTags(std::string_view text, const char* from) {
  struct Construct {
    std::string_view start, end;
  };
  static constexpr Construct opaque[] = {{"<!--", "-->"}, {"<![CDATA[", "]]>"}, {"<?", "?>"}};
  int64_t more = 0;
  for (size_t at = text.find('<'); at != text.npos; at = text.find('<')) {
    text.remove_prefix(at);
    const auto* const found =
        std::find_if(std::begin(opaque), std::end(opaque),
                     [&](const Construct& each) { return text.starts_with(each.start); });
    if (found != std::end(opaque)) {
      text.remove_prefix(found->start.size());
      takeTo(text, found->end);
    } else if (text.starts_with("</")) {
      const bool isCounted = text.data() >= from;
      const std::string_view tag = takeTo(text, ">");
      if (isCounted) more += countContinuing(tag);
    } else {
      text.remove_prefix(1);
    }
  }
  return more;
}

}  // namespace

void TextPlace::pass(std::string_view text) {
  pass(text, countLines(text));
}

void TextPlace::pass(std::string_view text, int64_t lines) {
  line += lines;
  const size_t begin = lines > 0 ? text.rfind('\n') + 1 : 0;
  if (lines > 0) column = 1;
  const std::string_view inLine = text.substr(begin);
  const int64_t continuing = countContinuing(inLine);
  column += static_cast<int64_t>(inLine.size()) - continuing;
  // Most texts are ASCII. A comment may have begun on a line before.
  if (continuing > 0) column += moreColumnsOfEndTags(text, inLine.data());
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
