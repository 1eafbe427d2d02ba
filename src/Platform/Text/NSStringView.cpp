// Questions about text: search, comparison, hashing, conversion to UTF-8.
//
// Both representations give the same answers. 8-bit text against 8-bit text, the common case, goes
// through the C library's byte functions; the other pairings share one implementation per question.
#include "Platform/Base/KeyedHash.h"
#include "Platform/Text/Blocks.h"
#include "Platform/Text/UTF16.h"
#include "xquery/String.h"

#include <algorithm>
#include <type_traits>
#include <vector>

namespace xquery {

namespace {

template <class Unit>
char16_t widened(Unit unit) {
  return static_cast<char16_t>(static_cast<std::make_unsigned_t<Unit>>(unit));
}
template <>
char16_t widened(char16_t unit) {
  return unit;
}

template <class Function>
auto withUnits(NSStringView text, Function function) {
  return text.isWide() ? function(text.wideUnits()) : function(text.asciiUnits());
}

template <class UnitA, class UnitB>
bool sameUnitsOfBlock(const UnitA* a, const UnitB* b, uint32_t length) {
  if constexpr (std::is_same_v<UnitA, UnitB>) {
    return length == 0 || std::memcmp(a, b, size_t{length} * sizeof(UnitA)) == 0;
  } else {
    for (uint32_t index = 0; index < length; ++index) {
      if (widened(a[index]) != widened(b[index])) return false;
    }
    return true;
  }
}

// Goes through so many units in blocks, between which the work can be ended, until one is
// `done(from, length)`.
template <class Work>
void untilDone(uint32_t length, Work done) {
  for (uint32_t from = 0; from < length;) {
    const uint32_t count = std::min(length - from, unitsPerBlock);
    if (done(from, count)) return;
    checkUnits(count);
    from += count;
  }
}

template <class UnitA, class UnitB>
bool sameUnits(const UnitA* a, const UnitB* b, uint32_t length) {
  bool same = true;
  untilDone(length, [&](uint32_t from, uint32_t count) {
    same = sameUnitsOfBlock(a + from, b + from, count);
    return !same;
  });
  return same;
}

template <class UnitA, class UnitB>
uint32_t firstDifferenceInBlock(const UnitA* a, const UnitB* b, uint32_t length) {
  uint32_t index = 0;
  if constexpr (std::is_same_v<UnitA, UnitB>) {
    // Whole words first; the word that differs is looked at unit by unit.
    constexpr uint32_t step = sizeof(uint64_t) / sizeof(UnitA);
    for (; index + step <= length; index += step) {
      uint64_t wordA = 0;
      uint64_t wordB = 0;
      std::memcpy(&wordA, a + index, sizeof wordA);
      std::memcpy(&wordB, b + index, sizeof wordB);
      if (wordA != wordB) break;
    }
  }
  while (index < length && widened(a[index]) == widened(b[index])) ++index;
  return index;
}

template <class UnitA, class UnitB>
uint32_t firstDifference(const UnitA* a, const UnitB* b, uint32_t length) {
  uint32_t index = 0;
  untilDone(length, [&](uint32_t from, uint32_t count) {
    index = from + firstDifferenceInBlock(a + from, b + from, count);
    return index < from + count;
  });
  return index;
}

// Knuth, Morris and Pratt's search: linear whatever the texts are, so that a hostile pattern
// cannot make a search take the product of the lengths.
template <class Unit, class PatternUnit>
uint32_t findLinear(const Unit* text, uint32_t length, const PatternUnit* pattern,
                    uint32_t patternLength, uint32_t from) {
  std::vector<uint32_t> fallback(patternLength, 0);
  WorkPacer pacer;
  for (uint32_t index = 1, matched = 0; index < patternLength; ++index) {
    pacer.turn();
    while (matched && pattern[index] != pattern[matched]) matched = fallback[matched - 1];
    if (pattern[index] == pattern[matched]) ++matched;
    fallback[index] = matched;
  }
  for (uint32_t index = from, matched = 0; index < length; ++index) {
    pacer.turn();
    while (matched && widened(text[index]) != widened(pattern[matched])) {
      matched = fallback[matched - 1];
    }
    if (widened(text[index]) == widened(pattern[matched])) ++matched;
    if (matched == patternLength) return index + 1 - patternLength;
  }
  return NSStringView::notFound;
}

template <class Unit>
uint32_t findUnit(const Unit* text, uint32_t length, char16_t unit, uint32_t from) {
  if constexpr (sizeof(Unit) == 1) {
    if (unit >= 0x80) return NSStringView::notFound;
    const void* found = std::memchr(text + from, unit, length - from);
    return found ? static_cast<uint32_t>(static_cast<const Unit*>(found) - text)
                 : NSStringView::notFound;
  } else {
    const Unit* found = std::find(text + from, text + length, unit);
    return found != text + length ? static_cast<uint32_t>(found - text) : NSStringView::notFound;
  }
}

// Of a pattern that is short: but for the library's search, it is tried at each place where its
// first unit stands.
template <class Unit, class PatternUnit>
uint32_t findShort(const Unit* text, uint32_t length, const PatternUnit* pattern,
                   uint32_t patternLength, uint32_t from) {
  if constexpr (sizeof(Unit) == 1 && sizeof(PatternUnit) == 1) {
    const void* found = memmem(text + from, length - from, pattern, patternLength);
    return found ? static_cast<uint32_t>(static_cast<const Unit*>(found) - text)
                 : NSStringView::notFound;
  } else {
    const uint32_t last = length - patternLength;
    while (from <= last) {
      const uint32_t start = findUnit(text, last + 1, widened(pattern[0]), from);
      if (start == NSStringView::notFound) break;
      if (sameUnitsOfBlock(text + start, pattern, patternLength)) return start;
      from = start + 1;
    }
    return NSStringView::notFound;
  }
}

// A long text is searched in pieces, between which the search can be ended. They overlap by the
// pattern but for one unit, so that each place is looked at in one of them.
template <class Unit, class PatternUnit>
uint32_t findUnits(const Unit* text, uint32_t length, const PatternUnit* pattern,
                   uint32_t patternLength, uint32_t from) {
  constexpr uint32_t placesOfPiece = 0x10000;
  constexpr bool areBytes = sizeof(Unit) == 1 && sizeof(PatternUnit) == 1;
  constexpr uint32_t longest = areBytes ? placesOfPiece : 16;
  if (patternLength > longest) return findLinear(text, length, pattern, patternLength, from);
  for (;; from += placesOfPiece) {
    const bool isLast = length - from - patternLength < placesOfPiece;
    const uint32_t end = isLast ? length : from + placesOfPiece + patternLength - 1;
    const uint32_t found = findShort(text, end, pattern, patternLength, from);
    checkUnits((found == NSStringView::notFound ? end : found) - from);
    if (found != NSStringView::notFound || isLast) return found;
  }
}

// Four units as 16-bit lanes, so that both representations give the same hash.
uint64_t fourUnits(const char* units) {
  uint32_t bytes = 0;
  std::memcpy(&bytes, units, sizeof bytes);
  uint64_t word = bytes;
  word = (word | (word << 16)) & 0x0000FFFF0000FFFFULL;
  return (word | (word << 8)) & 0x00FF00FF00FF00FFULL;
}
uint64_t fourUnits(const char16_t* units) {
  uint64_t word = 0;
  std::memcpy(&word, units, sizeof word);
  return word;
}

// The last eight units or fewer; where there are less than eight, the two words share some.
template <class Unit>
uint64_t mixedEnd(const HashSecrets& secrets, uint64_t hash, const Unit* units, uint32_t count) {
  if (count >= 4) {
    return mixedHash(secrets, hash, fourUnits(units), fourUnits(units + count - 4));
  }
  uint64_t word = 0;
  for (uint32_t index = 0; index < count; ++index) word = word << 16 | widened(units[index]);
  return mixedHash(secrets, hash, word, 0);
}

// Texts of different lengths may have the same words; the length tells them apart.
template <class Unit>
uint32_t hashUnits(const Unit* units, uint32_t length) {
  constexpr uint32_t unitsAtOnce = 8;
  static_assert(unitsPerBlock % unitsAtOnce == 0);
  const HashSecrets& secrets = hashSecrets();
  uint64_t hash = secrets.start;
  uint32_t index = 0;
  untilDone(length, [&](uint32_t from, uint32_t count) {
    const uint32_t end = from + count;
    for (; index + unitsAtOnce < end; index += unitsAtOnce) {
      hash = mixedHash(secrets, hash, fourUnits(units + index), fourUnits(units + index + 4));
    }
    return false;
  });
  hash = mixedEnd(secrets, hash, units + index, length - index);
  return static_cast<uint32_t>(foldedProduct(hash ^ length, secrets.right));
}

void appendUTF8(std::string& out, char32_t point) {
  if (point < 0x80) {
    out += static_cast<char>(point);
  } else if (point < 0x800) {
    out += static_cast<char>(0xC0 | (point >> 6));
    out += static_cast<char>(0x80 | (point & 0x3F));
  } else if (point < 0x10000) {
    out += static_cast<char>(0xE0 | (point >> 12));
    out += static_cast<char>(0x80 | ((point >> 6) & 0x3F));
    out += static_cast<char>(0x80 | (point & 0x3F));
  } else {
    out += static_cast<char>(0xF0 | (point >> 18));
    out += static_cast<char>(0x80 | ((point >> 12) & 0x3F));
    out += static_cast<char>(0x80 | ((point >> 6) & 0x3F));
    out += static_cast<char>(0x80 | (point & 0x3F));
  }
}

}  // namespace

NSStringView NSStringView::substring(uint32_t from, uint32_t count) const {
  from = std::min(from, _length);
  count = std::min(count, _length - from);
  return _wide ? NSStringView(wideUnits() + from, count) : NSStringView(asciiUnits() + from, count);
}

uint32_t NSStringView::find(NSStringView text, uint32_t from) const {
  if (from > _length || text._length > _length - from) return notFound;
  if (text.isEmpty()) return from;
  return withUnits(*this, [&](auto* units) {
    return withUnits(text, [&](auto* pattern) {
      return findUnits(units, _length, pattern, text._length, from);
    });
  });
}

uint32_t NSStringView::find(char16_t unit, uint32_t from) const {
  if (from >= _length) return notFound;
  const uint32_t found =
      withUnits(*this, [&](auto* units) { return findUnit(units, _length, unit, from); });
  checkUnits((found == notFound ? _length : found) - from);
  return found;
}

bool NSStringView::startsWith(NSStringView text) const {
  return text._length <= _length && substring(0, text._length).equals(text);
}

bool NSStringView::endsWith(NSStringView text) const {
  return text._length <= _length && substring(_length - text._length).equals(text);
}

int NSStringView::compare(NSStringView other) const {
  const uint32_t common = std::min(_length, other._length);
  const uint32_t index = withUnits(*this, [&](auto* a) {
    return withUnits(other, [&](auto* b) { return firstDifference(a, b, common); });
  });
  if (index == common) {
    return _length == other._length ? 0 : _length < other._length ? -1 : 1;
  }
  // After a high surrogate that the texts share, a unit that completes the pair wins over one that
  // leaves the surrogate alone.
  if (index > 0 && isHighSurrogate((*this)[index - 1])) {
    const bool completes = isLowSurrogate((*this)[index]);
    if (completes != isLowSurrogate(other[index])) return completes ? 1 : -1;
  }
  return codePointAt(*this, index) < codePointAt(other, index) ? -1 : 1;
}

bool NSStringView::equals(NSStringView other) const {
  if (_length != other._length) return false;
  return withUnits(*this, [&](auto* a) {
    return withUnits(other, [&](auto* b) { return sameUnits(a, b, _length); });
  });
}

uint32_t NSStringView::hash() const {
  return withUnits(*this, [&](auto* units) { return hashUnits(units, _length); });
}

void NSStringView::appendUTF8To(std::string& out) const {
  if (!_wide) {
    appendInBlocks(out, std::string_view(asciiUnits(), _length));
    return;
  }
  constexpr size_t mostBytesPerUnit = 3;
  const char16_t* units = wideUnits();
  uint32_t index = 0;  // past a block whose last unit begins a pair
  untilDone(_length, [&](uint32_t from, uint32_t count) {
    makeRoom(out, count * mostBytesPerUnit);
    for (; index < from + count; ++index) {
      const char16_t unit = units[index];
      if (isHighSurrogate(unit) && index + 1 < _length && isLowSurrogate(units[index + 1])) {
        appendUTF8(out, codePointAt(*this, index++));
      } else if (isHighSurrogate(unit) || isLowSurrogate(unit)) {
        appendUTF8(out, 0xFFFD);
      } else {
        appendUTF8(out, unit);
      }
    }
    return false;
  });
}

std::string NSStringView::utf8() const {
  std::string out;
  out.reserve(_length);
  appendUTF8To(out);
  return out;
}

std::u16string NSStringView::utf16() const {
  std::u16string out;
  out.reserve(_length);
  withUnitsOf(*this, [&out](auto units) { appendInBlocks(out, units); });
  return out;
}

}  // namespace xquery
