// Reads the lexical forms of durations: letters as written, numbers of digits only.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/NumberText.h"
#include "xquery/Number.h"
#include "xquery/String.h"

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
  // Fails on more than 64 bits hold, with all the digits behind it.
  bool integer(int64_t& out) {
    const uint32_t from = _position;
    bool fits = true;
    out = 0;
    WorkPacer pacer;
    for (int64_t next = digit(); next >= 0; next = digit()) {
      pacer.turn();
      fits = fits && !__builtin_mul_overflow(out, int64_t{10}, &out) &&
             !__builtin_add_overflow(out, next, &out);
      ++_position;
    }
    return fits && _position > from;
  }
  // The digits after a "." that followed `whole`. They are read as an integer, so that their
  // leading zeros are lost: 1.05 reads as 1.5.
  bool fraction(int64_t whole, double& out) {
    const NSStringView number = digits();
    if (number.isEmpty()) return false;
    uint32_t zeros = 0;
    WorkPacer pacer;
    while (zeros + 1 < number.length() && number[zeros] == '0') {
      pacer.turn();
      ++zeros;
    }
    std::string text = std::to_string(whole) + '.';
    for (uint32_t index = zeros; index < number.length(); ++index) {
      pacer.turn();
      text += static_cast<char>(number[index]);
    }
    return scanDouble(NSStringView::ascii(text), out);
  }

 private:
  // The next character as a digit; negative when it is none.
  int64_t digit() const {
    const char16_t unit = atEnd() ? u' ' : _text[_position];
    return unit >= u'0' && unit <= u'9' ? unit - u'0' : -1;
  }
  // As many as there are, which may be none or millions.
  NSStringView digits() {
    const uint32_t from = _position;
    WorkPacer pacer;
    for (; digit() >= 0; ++_position) pacer.turn();
    return _text.substring(from, _position - from);
  }

  NSStringView _text;
  uint32_t _position = 0;
};

}  // namespace xquery
