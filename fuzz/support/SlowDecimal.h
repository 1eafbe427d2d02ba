// Decimal numbers as one learns them at school, digit by digit: what the engine's are compared
// with.
#pragma once

#include <compare>
#include <cstddef>
#include <string>
#include <string_view>

namespace xquery::fuzz {

class SlowDecimal {
 public:
  SlowDecimal() = default;

  // The longest prefix of the text that is a number; false where there is none. `tooLong` where it
  // has an exponent that this model does not want to write out.
  static bool scan(std::string_view text, SlowDecimal& out, bool& tooLong);

  bool isZero() const { return _digits == "0"; }
  bool isNegative() const { return _negative; }
  // Digits before and behind the point.
  size_t length() const { return _digits.size() + _scale; }
  SlowDecimal negated() const;
  SlowDecimal plus(const SlowDecimal& other) const;
  SlowDecimal minus(const SlowDecimal& other) const { return plus(other.negated()); }
  SlowDecimal times(const SlowDecimal& other) const;
  // The divisors are not zero. A quotient that does not end has 38 significant digits, halves
  // rounded away from zero.
  SlowDecimal dividedBy(const SlowDecimal& divisor) const;
  SlowDecimal wholeQuotient(const SlowDecimal& divisor) const;
  SlowDecimal remainder(const SlowDecimal& divisor) const {
    return minus(wholeQuotient(divisor).times(divisor));
  }

  enum class Rounding { TowardZero, Floor, Ceiling, HalfAwayFromZero, HalfUp, HalfEven };
  // To so many digits behind the point; negative: before it.
  SlowDecimal rounded(int scale, Rounding rounding) const;

  int compare(const SlowDecimal& other) const;
  std::string text() const;

 private:
  SlowDecimal(bool negative, std::string digits, size_t scale);
  // The digits as they are when the number has that scale, which is not less than its own.
  std::string digitsAtScale(size_t scale) const {
    return isZero() ? "0" : _digits + std::string(scale - _scale, '0');
  }

  bool _negative = false;
  std::string _digits = "0";  // without leading zeros
  size_t _scale = 0;  // so many of them stand behind the point, the last of which is no zero
};

}  // namespace xquery::fuzz
