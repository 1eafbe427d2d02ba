#include "Parser/XQueryScanner.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>

namespace xquery {
namespace {

// The character that starts `bytes` and its length; the text is well-formed UTF-8.
char32_t decode(std::string_view bytes, size_t& length) {
  const auto byte = [&](size_t index) {
    return index < bytes.size() ? static_cast<unsigned char>(bytes[index]) : 0U;
  };
  const auto tail = [&](size_t index) { return byte(index) & 0x3FU; };
  const unsigned first = byte(0);
  if (first < 0x80) return length = 1, first;
  if (first < 0xE0) return length = 2, (first & 0x1FU) << 6 | tail(1);
  if (first < 0xF0) return length = 3, (first & 0x0FU) << 12 | tail(1) << 6 | tail(2);
  return length = 4, (first & 0x07U) << 18 | tail(1) << 12 | tail(2) << 6 | tail(3);
}

constexpr size_t longestRun = size_t{64} * 1024;
constexpr size_t bytesPerStep = 4096;

bool isWhiteSpace(char character) {
  return character == ' ' || character == '\t' || character == '\n' || character == '\r';
}

// U+FFFE and U+FFFF, which are no characters.
bool isNonCharacter(std::string_view text) {
  return text.substr(0, 2) == "\xEF\xBF" && text.size() > 2 && (text[2] | 1) == '\xBF';
}

bool isControl(char character) {
  return static_cast<unsigned char>(character) < 0x20 && !isWhiteSpace(character);
}

bool isInsideCharacter(char byte) {
  return (static_cast<unsigned char>(byte) & 0xC0) == 0x80;
}

unsigned hexDigit(char character, bool& isDigit) {
  isDigit = true;
  if (character >= '0' && character <= '9') return static_cast<unsigned>(character - '0');
  if (character >= 'a' && character <= 'f') return static_cast<unsigned>(character - 'a') + 10;
  if (character >= 'A' && character <= 'F') return static_cast<unsigned>(character - 'A') + 10;
  isDigit = false;
  return 0;
}

}  // namespace

size_t XQWhiteSpaceRun(std::string_view text) {
  const std::string_view piece = text.substr(0, longestRun);
  const auto end = std::find_if_not(piece.begin(), piece.end(), isWhiteSpace);
  const auto length = static_cast<size_t>(end - piece.begin());
  checkWork(length / bytesPerStep);
  return length;
}

size_t XQWhiteSpaceLength(std::string_view text) {
  size_t length = 0;
  while (const size_t run = XQWhiteSpaceRun(text.substr(length))) length += run;
  return length;
}

size_t XQTextRun(std::string_view text, char delimiter, char otherDelimiter) {
  const size_t most = std::min(text.size(), longestRun);
  size_t length = 0;
  for (; length < most; ++length) {
    const char byte = text[length];
    if (byte == delimiter || byte == otherDelimiter || isControl(byte)) break;
    if (byte == '\xEF' && isNonCharacter(text.substr(length, 3))) break;
  }
  // A piece ends with a whole character.
  while (length < text.size() && isInsideCharacter(text[length])) --length;
  checkWork(length / bytesPerStep);
  return length;
}

char16_t CharRefToUnicode(std::string_view text) {
  constexpr uint32_t tooLarge = 0x10000;
  text.remove_prefix(2);
  const bool hexadecimal = !text.empty() && text.front() == 'x';
  if (hexadecimal) text.remove_prefix(1);
  uint32_t value = 0;
  for (const char character : text) {
    if (character == ';') break;
    bool isDigit = false;
    const unsigned digit = hexDigit(character, isDigit);
    if (hexadecimal) {
      // What is no digit only shifts the value.
      value = value * 16 + digit;
    } else {
      value = value * 10 + (digit < 10 ? digit : 0);
    }
    if (value >= tooLarge) return 0;
  }
  return static_cast<char16_t>(value);
}

char16_t PredefinedEntityToUnicode(std::string_view text) {
  switch (text.size() > 1 ? text[1] : '\0') {
    case 'a':
      return text.size() > 2 && text[2] == 'm' ? u'&' : u'\'';
    case 'g':
      return u'>';
    case 'l':
      return u'<';
    case 'q':
      return u'"';
    default:
      return 0;
  }
}

char16_t UTF8ToUnicode(std::string_view bytes) {
  size_t length = 0;
  const char32_t point = decode(bytes, length);
  if (point < 0x10000) return static_cast<char16_t>(point);
  return static_cast<char16_t>(0xD800 + ((point - 0x10000) >> 10));
}

int UniCodeToUTF8(char16_t codeUnit, char* out) {
  const unsigned unit = codeUnit;
  if (unit <= 0x7F) {
    out[0] = static_cast<char>(unit);
    return 1;
  }
  if (unit <= 0x7FF) {
    out[0] = static_cast<char>(0xC0U | unit >> 6);
    out[1] = static_cast<char>(0x80U | (unit & 0x3FU));
    return 2;
  }
  out[0] = static_cast<char>(0xE0U | unit >> 12);
  out[1] = static_cast<char>(0x80U | (unit >> 6 & 0x3FU));
  out[2] = static_cast<char>(0x80U | (unit & 0x3FU));
  return 3;
}

void XQAppendUTF8(NSMutableString& to, std::string_view bytes) {
  while (!bytes.empty()) {
    size_t length = 0;
    while (length < bytes.size() && static_cast<unsigned char>(bytes[length]) < 0x80) ++length;
    if (length > 0) {
      to.append(NSStringView::ascii(bytes.substr(0, length)));
    } else {
      to.appendCodePoint(decode(bytes, length));
    }
    bytes.remove_prefix(length < bytes.size() ? length : bytes.size());
  }
}

}  // namespace xquery
