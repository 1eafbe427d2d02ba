// UTF-8 as RFC 3629 defines it, read one code point at a time.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

namespace xquery {

inline bool isASCII(std::string_view text) {
  uint64_t bits = 0;
  size_t at = 0;
  for (; at + sizeof bits <= text.size(); at += sizeof bits) {
    uint64_t word = 0;
    std::memcpy(&word, text.data() + at, sizeof word);
    bits |= word;
  }
  for (; at < text.size(); ++at) bits |= static_cast<unsigned char>(text[at]);
  return (bits & 0x8080808080808080ULL) == 0;
}

constexpr char32_t invalidCodePoint = UINT32_MAX;

// Reads the code point at `text` (text < end) and moves past it. Overlong forms, surrogates and
// points above U+10FFFF are not well formed: then the answer is invalidCodePoint and `text` moves
// one byte.
inline char32_t readUTF8(const unsigned char*& text, const unsigned char* end) {
  const unsigned char first = *text++;
  if (first < 0x80) return first;
  // The range of the second byte depends on the first; it is what excludes the bad forms.
  unsigned low = 0x80;
  unsigned high = 0xBF;
  size_t more = 0;
  char32_t point = 0;
  if (first >= 0xC2 && first <= 0xDF) {
    more = 1;
    point = first & 0x1FU;
  } else if (first >= 0xE0 && first <= 0xEF) {
    more = 2;
    point = first & 0x0FU;
    if (first == 0xE0) low = 0xA0;
    if (first == 0xED) high = 0x9F;
  } else if (first >= 0xF0 && first <= 0xF4) {
    more = 3;
    point = first & 0x07U;
    if (first == 0xF0) low = 0x90;
    if (first == 0xF4) high = 0x8F;
  } else {
    return invalidCodePoint;
  }
  if (static_cast<size_t>(end - text) < more) return invalidCodePoint;
  for (size_t index = 0; index < more; ++index) {
    const unsigned byte = text[index];
    if (byte < low || byte > high) return invalidCodePoint;
    point = (point << 6) | (byte & 0x3FU);
    low = 0x80;
    high = 0xBF;
  }
  text += more;
  return point;
}

}  // namespace xquery
