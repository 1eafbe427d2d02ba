// Reads the lexical forms of durations: letters as written, numbers of digits only.
#pragma once

#include "xquery/Number.h"
#include "xquery/String.h"

#include <algorithm>
#include <cstdint>
#include <string>

namespace xquery {

class DurationReader {
 public:
  explicit DurationReader(NSStringView text) : _text(text) {}

  bool atEnd() const { return _position >= _text.length(); }
  bool take(char16_t letter) {
    if (atEnd() || _text[_position] != letter) return false;
    ++_position;
    return true;
  }
  // Fails on more than 64 bits hold.
  bool integer(int64_t& out) {
    std::string text;
    if (!digits(text)) return false;
    out = 0;
    for (const char digit : text) {
      if (__builtin_mul_overflow(out, int64_t{10}, &out) ||
          __builtin_add_overflow(out, int64_t{digit - '0'}, &out)) {
        return false;
      }
    }
    return true;
  }
  // The digits after a "." that followed `whole`. They are read as an integer, so that their
  // leading zeros are lost: 1.05 reads as 1.5.
  bool fraction(int64_t whole, double& out) {
    std::string text;
    if (!digits(text)) return false;
    text.erase(0, std::min(text.find_first_not_of('0'), text.size() - 1));
    return scanDouble(NSStringView::ascii(std::to_string(whole) + "." + text), out);
  }

 private:
  // At least one digit, kept as written.
  bool digits(std::string& out) {
    out.clear();
    for (; !atEnd() && _text[_position] >= '0' && _text[_position] <= '9'; ++_position) {
      out += static_cast<char>(_text[_position]);
    }
    return !out.empty();
  }

  NSStringView _text;
  uint32_t _position = 0;
};

}  // namespace xquery
