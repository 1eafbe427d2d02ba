// UTF-16: code points outside the basic plane are pairs of a high and a low surrogate. Texts may
// hold surrogates that are lone, which have no form in UTF-8 or UTF-32.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/Blocks.h"
#include "xquery/String.h"

#include <algorithm>
#include <string_view>

namespace xquery {

// Whether 8-bit units can hold the text.
inline bool isNarrow(NSStringView text) {
  if (!text.isWide()) return true;
  std::u16string_view units(text.wideUnits(), text.length());
  while (!units.empty()) {
    char16_t bits = 0;
    for (const char16_t unit : units.substr(0, unitsPerBlock)) {
      bits = static_cast<char16_t>(bits | unit);
    }
    if (bits >= 0x80) return false;
    checkUnits(static_cast<uint32_t>(std::min<size_t>(units.size(), unitsPerBlock)));
    units.remove_prefix(std::min<size_t>(units.size(), unitsPerBlock));
  }
  return true;
}

constexpr bool isHighSurrogate(char32_t unit) {
  return unit >= 0xD800 && unit < 0xDC00;
}
constexpr bool isLowSurrogate(char32_t unit) {
  return unit >= 0xDC00 && unit < 0xE000;
}

constexpr char32_t codePointOfPair(char16_t high, char16_t low) {
  return 0x10000 + ((char32_t{high} - 0xD800U) << 10) + (low - 0xDC00U);
}

// The code point that begins at the index; a lone surrogate is itself.
inline char32_t codePointAt(NSStringView text, uint32_t index) {
  const char16_t high = text[index];
  if (!isHighSurrogate(high) || index + 1 >= text.length()) return high;
  const char16_t low = text[index + 1];
  return isLowSurrogate(low) ? codePointOfPair(high, low) : high;
}

// To a string of char16_t.
template <class Text>
void appendUTF16(Text& out, char32_t point) {
  if (point < 0x10000) {
    out += static_cast<char16_t>(point);
  } else {
    out += static_cast<char16_t>(0xD800 + ((point - 0x10000) >> 10));
    out += static_cast<char16_t>(0xDC00 + ((point - 0x10000) & 0x3FF));
  }
}

inline bool hasLoneSurrogate(NSStringView text) {
  if (!text.isWide()) return false;
  const std::u16string_view units(text.wideUnits(), text.length());
  WorkPacer pacer;
  for (size_t index = 0; index < units.size(); ++index) {
    pacer.turn();
    if (isLowSurrogate(units[index])) return true;
    if (!isHighSurrogate(units[index])) continue;
    ++index;
    if (index == units.size() || !isLowSurrogate(units[index])) return true;
  }
  return false;
}

}  // namespace xquery
