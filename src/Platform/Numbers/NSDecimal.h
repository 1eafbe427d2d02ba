// Decimals as the library computes with them.
//
// A decimal is an integer coefficient times a power of ten: a 64-bit coefficient inline in the
// common case, arbitrary precision beyond it. Addition, subtraction and multiplication are exact; a
// quotient that does not end is rounded half away from zero to 38 significant digits.
//
// A decimal has at most 250,000 digits, before and after the point taken together, which keeps
// every single operation well below a tenth of a second. Text that needs more is no number to the
// scanner; arithmetic that needs more throws std::length_error.
#pragma once

#include "xquery/Number.h"

#include <cstdint>
#include <limits>
#include <string>
#include <utility>

namespace xquery {

class BigInteger;

enum class NSRoundingMode : uint8_t {
  TowardZero,
  Floor,
  Ceiling,
  HalfAwayFromZero,
  HalfUp,  // halves toward positive infinity
  HalfEven,
};

class NSDecimal {
 public:
  static constexpr int32_t maximumDigits = 250000;

  NSDecimal() = default;
  NSDecimal(int64_t value) : _coefficient(value) {}
  static NSDecimal fromUnsigned(uint64_t value);
  // The exact value of the shortest digits that read back to `value` (0 for NaN and infinities).
  static NSDecimal fromDouble(double value);
  static NSDecimal notANumber();
  NSDecimal(const NSDecimal& other)
      : _coefficient(other._coefficient), _scale(other._scale), _state(other._state) {
    if (_state == Big) copyBig(other);
  }
  // Leaves zero behind.
  NSDecimal(NSDecimal&& other) noexcept
      : _coefficient(other._coefficient), _scale(other._scale), _state(other._state) {
    other._state = Small;
    other._coefficient = 0;
    other._scale = 0;
  }
  NSDecimal& operator=(const NSDecimal& other) { return *this = NSDecimal(other); }
  NSDecimal& operator=(NSDecimal&& other) noexcept {
    std::swap(_coefficient, other._coefficient);
    std::swap(_scale, other._scale);
    std::swap(_state, other._state);
    return *this;
  }
  ~NSDecimal() { freeBig(); }

  // Numeric scanning: skips leading white space, accepts a sign, digits, a fraction and an
  // exponent, takes the longest prefix. False (and `out` untouched) when there is no number, or
  // one of more digits than a decimal holds.
  static bool scan(NSStringView text, NSDecimal& out);

  bool isNaN() const { return _state == NaN; }
  bool isZero() const { return _state == Small && _coefficient == 0; }
  int sign() const;  // -1, 0, 1
  bool isInteger() const;

  NSDecimal add(const NSDecimal& other) const;
  NSDecimal subtract(const NSDecimal& other) const;
  NSDecimal multiply(const NSDecimal& other) const;
  // The divisor must not be zero. Exact when the quotient ends, else 38 significant digits.
  NSDecimal divide(const NSDecimal& divisor) const;
  // Truncated quotient, and the remainder with the sign of the dividend. Divisor not zero.
  NSDecimal integerDivide(const NSDecimal& divisor) const;
  NSDecimal remainder(const NSDecimal& divisor) const;
  NSDecimal negate() const;
  NSDecimal truncated() const { return rounded(0, NSRoundingMode::TowardZero); }
  NSDecimal floor() const { return rounded(0, NSRoundingMode::Floor); }
  NSDecimal ceiling() const { return rounded(0, NSRoundingMode::Ceiling); }
  // Rounds to `scale` digits after the point (negative: before it), halves away from zero.
  NSDecimal roundedPlain(int32_t scale) const {
    return rounded(scale, NSRoundingMode::HalfAwayFromZero);
  }
  NSDecimal rounded(int32_t scale, NSRoundingMode mode) const;

  // Exact; NaN equals NaN and is below every other value.
  int compare(const NSDecimal& other) const;
  uint32_t hash() const;  // agrees with the hash of an equal double

  double doubleValue() const;
  // Truncated; saturate outside the range.
  int64_t int64Value() const;
  uint64_t uint64Value() const;
  // Whether the value is an integer within int64; the fast paths ask this.
  bool isSmallInteger() const { return _state == Small && _scale == 0; }
  int64_t smallInteger() const { return _coefficient; }
  // Whether it has so few digits that adding it to another one of these cannot take too many.
  bool isShort() const {
    return _state == Small && _scale <= std::numeric_limits<int64_t>::digits10;
  }

  // Plain digits: no exponent, no trailing fractional zeros.
  std::string toString() const;

 private:
  enum State : uint8_t { Small, Big, NaN };
  void freeBig() {
    if (_state == Big) destroyBig();
  }
  void destroyBig();
  void copyBig(const NSDecimal& other);

  union {
    int64_t _coefficient = 0;
    BigInteger* _big;  // the same size, so that moving the coefficient moves either
  };
  int32_t _scale = 0;  // value = coefficient * 10^-scale; normalised: no trailing zeros, >= 0
  State _state = Small;
  // Canonical, so that equal decimals are equal member by member: Big only when the coefficient
  // does not fit 64 bits.
  friend class NSDecimalArithmetic;
};

}  // namespace xquery
