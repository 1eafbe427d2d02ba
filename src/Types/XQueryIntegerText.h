// What an integer of a machine word prints, without memory of its own: most numbers that become
// texts are such.
#pragma once

#include "Types/XQueryNumber.h"
#include "xquery/String.h"

#include <charconv>
#include <cstdint>
#include <iterator>

namespace xquery {

class XQueryIntegerText {
 public:
  explicit XQueryIntegerText(int64_t value)
      : _length(
            static_cast<size_t>(std::to_chars(_digits, std::end(_digits), value).ptr - _digits)) {}

  // Whether the number is a decimal, of any type, whose text this gives.
  static bool isFor(const NSNumber& number) {
    const NSDecimal* exact = number.storedDecimal();
    return exact && exact->isSmallInteger();
  }
  explicit XQueryIntegerText(const NSNumber& number)
      : XQueryIntegerText(number.storedDecimal()->smallInteger()) {}

  NSStringView view() const { return NSStringView::ascii({_digits, _length}); }

 private:
  char _digits[24];
  size_t _length;
};

}  // namespace xquery
