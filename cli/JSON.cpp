#include "JSON.h"

#include "xquery/String.h"

#include <algorithm>
#include <cstdio>

namespace cli {
namespace {

// The length of the well-formed character that the text begins with; 0 for none.
size_t characterLength(std::string_view text) {
  for (size_t length = 1; length <= std::min<size_t>(4, text.size()); ++length) {
    if (xquery::NSString::stringWithUTF8(text.substr(0, length))) return length;
  }
  return 0;
}

void appendASCII(char byte, std::string& json) {
  static constexpr std::string_view plain = "\"\\\b\f\n\r\t", letters = "\"\\bfnrt";
  const size_t found = plain.find(byte);
  if (found != plain.npos) {
    json += '\\';
    json += letters[found];
  } else if (static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F) {
    char escape[8];
    std::snprintf(escape, sizeof escape, "\\u%04X", static_cast<unsigned>(byte));
    json += escape;
  } else {
    json += byte;
  }
}

bool isDigit(char byte) {
  return '0' <= byte && byte <= '9';
}

// Takes digits off the text; how many.
size_t takeDigits(std::string_view& text) {
  size_t count = 0;
  while (count < text.size() && isDigit(text[count])) ++count;
  text.remove_prefix(count);
  return count;
}

bool take(std::string_view& text, std::string_view anyOf) {
  if (text.empty() || anyOf.find(text.front()) == anyOf.npos) return false;
  text.remove_prefix(1);
  return true;
}

}  // namespace

std::string jsonString(std::string_view text) {
  const bool isWellFormed = xquery::NSString::stringWithUTF8(text) != nullptr;
  std::string json = "\"";
  while (!text.empty()) {
    const bool isASCII = static_cast<unsigned char>(text.front()) < 0x80;
    const size_t length = isASCII || isWellFormed ? 1 : characterLength(text);
    if (isASCII) {
      appendASCII(text.front(), json);
    } else if (length > 0) {
      json += text.substr(0, length);
    } else {
      json += "\xEF\xBF\xBD";
    }
    text.remove_prefix(std::max<size_t>(length, 1));
  }
  return json + '"';
}

bool isJSONNumber(std::string_view text) {
  take(text, "-");
  const bool startsWithZero = text.starts_with('0');
  const size_t digits = takeDigits(text);
  if (digits == 0 || (startsWithZero && digits > 1)) return false;
  if (take(text, ".") && takeDigits(text) == 0) return false;
  if (take(text, "eE")) {
    take(text, "+-");
    if (takeDigits(text) == 0) return false;
  }
  return text.empty();
}

}  // namespace cli
