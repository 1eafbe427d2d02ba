// Escapes of URLs.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/ASCII.h"

#include <string>
#include <string_view>

namespace xquery {

inline int hexadecimalDigit(char digit) {
  if (digit >= '0' && digit <= '9') return digit - '0';
  return lowerCase(digit) - 'a' + 10;
}

// Of a part of a URI reference, where two digits follow each percent sign.
inline std::string unescaped(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  WorkPacer pacer;
  for (size_t index = 0; index < text.size(); ++index) {
    pacer.turn();
    char byte = text[index];
    if (byte == '%' && index + 2 < text.size()) {
      byte = static_cast<char>(hexadecimalDigit(text[index + 1]) * 16 +
                               hexadecimalDigit(text[index + 2]));
      index += 2;
    }
    out += byte;
  }
  return out;
}

}  // namespace xquery
