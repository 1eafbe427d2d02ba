#include "Platform/Text/PlainPattern.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <cstring>

namespace xquery {
namespace {

constexpr unsigned char firstOther = 0x80;  // of the bytes of characters that are not ASCII

bool isPlain(char character) {
  return std::string_view("\\^$.[]|()?*+{}").find(character) == std::string_view::npos;
}

bool isASCII(char character) {
  return static_cast<unsigned char>(character) < firstOther;
}

bool isDigit(unsigned char byte) {
  return byte >= '0' && byte <= '9';
}

bool isOfWord(unsigned char byte) {
  const unsigned char letter = byte | 0x20U;
  return isDigit(byte) || byte == '_' || (letter >= 'a' && letter <= 'z');
}

bool isSpace(unsigned char byte) {
  return byte == ' ' || (byte >= '\t' && byte <= '\r');
}

}  // namespace

std::optional<PlainPattern> PlainPattern::of(std::string_view pattern) {
  PlainPattern found;
  if (!pattern.empty() && std::all_of(pattern.begin(), pattern.end(), isPlain)) {
    found._text = pattern;
    return found;
  }
  return found.readSet(pattern) ? std::optional(std::move(found)) : std::nullopt;
}

// A character, an escape or a class, and perhaps "+".
bool PlainPattern::readSet(std::string_view pattern) {
  if (pattern.size() > 1 && pattern.ends_with('+') && pattern[pattern.size() - 2] != '\\') {
    _isRepeated = true;
    pattern.remove_suffix(1);
  }
  const bool isOne = pattern.size() == 1 && isPlain(pattern[0]) && isASCII(pattern[0]);
  if (isOne) {
    add(static_cast<unsigned char>(pattern[0]));
  } else if (pattern.size() == 2 && pattern[0] == '\\') {
    if (!readEscape(pattern[1])) return false;
  } else if (!readClass(pattern)) {
    return false;
  }
  // One character of others than ASCII is several bytes.
  return _isRepeated || !_set[firstOther];
}

// Of other letters than these some mean something; of other characters none does.
bool PlainPattern::readEscape(char letter) {
  const auto addAll = [this](bool (*isIn)(unsigned char)) {
    for (unsigned byte = 0; byte < firstOther; ++byte) {
      if (isIn(static_cast<unsigned char>(byte))) add(static_cast<unsigned char>(byte));
    }
  };
  switch (letter) {
    case 's':
    case 'S':
      addAll(isSpace);
      break;
    case 'd':
    case 'D':
      addAll(isDigit);
      break;
    case 'w':
    case 'W':
      addAll(isOfWord);
      break;
    case 'n':
      add('\n');
      return true;
    case 't':
      add('\t');
      return true;
    default:
      if (!isASCII(letter) || isOfWord(static_cast<unsigned char>(letter))) return false;
      add(static_cast<unsigned char>(letter));
      return true;
  }
  if (letter == 'S' || letter == 'D' || letter == 'W') invert();
  return true;
}

// Characters that mean nothing in a class, and ranges of letters or digits.
bool PlainPattern::readClass(std::string_view pattern) {
  if (pattern.size() < 3 || pattern.front() != '[' || pattern.back() != ']') return false;
  pattern = pattern.substr(1, pattern.size() - 2);
  const bool isComplement = pattern.front() == '^';
  if (isComplement) pattern.remove_prefix(1);
  if (pattern.empty()) return false;
  for (size_t at = 0; at < pattern.size(); ++at) {
    const char first = pattern[at];
    if (!isASCII(first) || std::string_view("[]\\^-:").find(first) != std::string_view::npos) {
      return false;
    }
    if (at + 1 == pattern.size() || pattern[at + 1] != '-') {
      add(static_cast<unsigned char>(first));
      continue;
    }
    const char last = at + 2 < pattern.size() ? pattern[at + 2] : '\\';
    if (!isOfWord(static_cast<unsigned char>(first)) || !isASCII(last) ||
        !isOfWord(static_cast<unsigned char>(last)) || last < first) {
      return false;
    }
    for (int byte = first; byte <= last; ++byte) add(static_cast<unsigned char>(byte));
    at += 2;
  }
  if (isComplement) invert();
  return true;
}

void PlainPattern::invert() {
  for (bool& isIn : _set) isIn = !isIn;
}

namespace {

// The search of the system takes time in proportion to the text, whatever is searched for, and goes
// on piece by piece, so that it can be left.
size_t placeOf(std::string_view wanted, std::string_view subject, size_t from) {
  constexpr size_t bytesPerStep = 512;
  const size_t piece = std::max<size_t>(size_t{1} << 16, 4 * wanted.size());
  while (subject.size() - from >= wanted.size()) {
    const std::string_view left = subject.substr(from, piece + wanted.size() - 1);
    const void* found = ::memmem(left.data(), left.size(), wanted.data(), wanted.size());
    if (found) return static_cast<size_t>(static_cast<const char*>(found) - subject.data());
    checkWork(1 + left.size() / bytesPerStep);
    if (subject.size() - from <= piece) break;
    from += piece;
  }
  return std::string_view::npos;
}

}  // namespace

std::optional<PlainPattern::Match> PlainPattern::find(std::string_view subject, size_t from) const {
  if (!_text.empty()) {
    const size_t at = placeOf(_text, subject, from);
    if (at == std::string_view::npos) return std::nullopt;
    return Match{at, at + _text.size()};
  }
  const auto isIn = [this](char byte) { return _set[static_cast<unsigned char>(byte)]; };
  const auto begin = subject.begin() + static_cast<std::ptrdiff_t>(from);
  const auto start = std::find_if(begin, subject.end(), isIn);
  if (start == subject.end()) return std::nullopt;
  const auto end = _isRepeated ? std::find_if_not(start, subject.end(), isIn) : start + 1;
  return Match{static_cast<size_t>(start - subject.begin()),
               static_cast<size_t>(end - subject.begin())};
}

}  // namespace xquery
