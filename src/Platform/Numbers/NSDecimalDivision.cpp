// Quotients of decimals.
#include "Platform/Numbers/NSDecimalArithmetic.h"

#include <algorithm>
#include <cstdlib>
#include <numeric>

namespace xquery {

using Arithmetic = NSDecimalArithmetic;

namespace {

__extension__ using UInt128 = unsigned __int128;

constexpr uint32_t quotientDigits = 38;

uint32_t digitCount(uint64_t value) {
  uint32_t count = 0;
  for (; value != 0; value /= 10) ++count;
  return count;
}

// How often `factor` divides `value`, which is not zero; divides it out.
uint32_t removeSmallFactor(int64_t& value, int64_t factor) {
  uint32_t count = 0;
  for (; value % factor == 0; value /= factor) ++count;
  return count;
}

}  // namespace

// Quotients of small decimals that end within 64 bits or do not end at all; false for the others.
bool NSDecimalArithmetic::divideSmall(const NSDecimal& a, const NSDecimal& b, NSDecimal& quotient) {
  int64_t numerator = 0;
  int64_t denominator = 0;
  if (!align(a, b, numerator, denominator)) return false;
  if (numerator == INT64_MIN || denominator == INT64_MIN) return false;
  if (numerator == 0) {
    quotient = NSDecimal();
    return true;
  }
  const int64_t divisor = std::gcd(numerator, denominator);
  numerator /= denominator < 0 ? -divisor : divisor;
  denominator = std::abs(denominator) / divisor;
  int64_t rest = denominator;
  const uint32_t twos = removeSmallFactor(rest, 2);
  const uint32_t fives = removeSmallFactor(rest, 5);
  if (rest != 1) {
    quotient = roundedSmallQuotient(numerator, static_cast<uint64_t>(denominator));
    return true;
  }
  const auto scale = static_cast<int32_t>(std::max(twos, fives));
  if (scale > maximumSmallPower) return false;
  int64_t coefficient = 0;
  if (__builtin_mul_overflow(numerator, powerOfTen(scale) / denominator, &coefficient)) {
    return false;
  }
  quotient = small(coefficient, scale);
  return true;
}

// 38 significant digits, which fit 128 bits, by long division in steps of up to 18 digits. The
// quotient does not end, so that no remainder is exactly a half.
NSDecimal NSDecimalArithmetic::roundedSmallQuotient(int64_t numerator, uint64_t denominator) {
  const auto magnitude = static_cast<uint64_t>(std::abs(numerator));
  UInt128 digits = magnitude / denominator;
  uint64_t remainder = magnitude % denominator;
  uint32_t count = digitCount(static_cast<uint64_t>(digits));
  int32_t scale = 0;
  while (count < quotientDigits) {
    const uint32_t step = std::min<uint32_t>(maximumSmallPower, quotientDigits - count);
    const UInt128 dividend = UInt128{remainder} * static_cast<uint64_t>(powerOfTen(step));
    const auto next = static_cast<uint64_t>(dividend / denominator);
    remainder = static_cast<uint64_t>(dividend % denominator);
    count = digits == 0 ? digitCount(next) : count + step;
    digits = digits * static_cast<uint64_t>(powerOfTen(step)) + next;
    scale += static_cast<int32_t>(step);
  }
  if (remainder > denominator - remainder) ++digits;
  const auto coefficient = static_cast<Wide>(digits);
  return wide(numerator < 0 ? -coefficient : coefficient, scale);
}

// 38 significant digits of a quotient that does not end (or ends too late to be written out), with
// the point moved `point` places to the left.
NSDecimal NSDecimalArithmetic::roundedQuotient(BigInteger numerator, BigInteger denominator,
                                               int64_t point) {
  // The estimates of the digit counts may each be one too large; this yields 40 to 43 digits.
  const int64_t shift = int64_t{quotientDigits} + 3 +
                        static_cast<int64_t>(denominator.digitsAtMost()) -
                        static_cast<int64_t>(numerator.digitsAtMost());
  if (shift > 0) numerator.multiplyByPowerOfTen(static_cast<uint32_t>(shift));
  if (shift < 0) denominator.multiplyByPowerOfTen(static_cast<uint32_t>(-shift));
  const bool negative = numerator.sign() != denominator.sign();
  numerator.divide(denominator);
  if (numerator.sign() < 0) numerator.negate();
  // Truncated digits decide the rounding: what follows them never reaches the next half.
  const size_t drop = numerator.digits() - quotientDigits;
  const BigInteger power = BigInteger::powerOfTen(static_cast<uint32_t>(drop));
  BigInteger remainder = numerator.divide(power);
  remainder.add(BigInteger(remainder));
  if (remainder.compare(power) >= 0) numerator.add(BigInteger(int64_t{1}));
  if (negative) numerator.negate();
  return big(std::move(numerator), shift - static_cast<int64_t>(drop) + point);
}

// Works on the coefficients; the scales only move the point. When the denominator is the product of
// some twos, some fives and a rest, the quotient ends exactly when the rest divides the numerator.
// That takes one division, where reducing the fraction would take many times as long.
NSDecimal NSDecimalArithmetic::divideBig(const NSDecimal& a, const NSDecimal& b) {
  if (a.isZero()) return NSDecimal();
  const int64_t point = int64_t{a._scale} - b._scale;
  const BigInteger denominator = coefficient(b);
  BigInteger numerator = coefficient(a);
  checkMaking(numerator, denominator);
  BigInteger rest = denominator;
  int64_t twos = -int64_t{rest.removeFactor(2)};
  int64_t fives = -int64_t{rest.removeFactor(5)};
  if (!numerator.isDivisibleBy(rest)) {
    return roundedQuotient(std::move(numerator), denominator, point);
  }
  BigInteger quotient = numerator;
  quotient.divideExactly(rest);
  twos += quotient.removeFactor(2);
  fives += quotient.removeFactor(5);
  const int64_t scale = std::max<int64_t>({0, -twos, -fives});
  const auto twosLeft = static_cast<uint32_t>(twos + scale);
  const auto fivesLeft = static_cast<uint32_t>(fives + scale);
  // Three twos, and one five, make less than one digit.
  const int64_t digits =
      static_cast<int64_t>(quotient.digitsAtMost()) + twosLeft / 3 + fivesLeft + 1;
  if (std::max(digits, scale + point) > NSDecimal::maximumDigits) {
    return roundedQuotient(std::move(numerator), denominator, point);
  }
  quotient.multiply(BigInteger::power(2, twosLeft));
  quotient.multiply(BigInteger::power(5, fivesLeft));
  return big(std::move(quotient), scale + point);
}

NSDecimal NSDecimal::divide(const NSDecimal& divisor) const {
  if (isNaN() || divisor.isNaN() || divisor.isZero()) return notANumber();
  NSDecimal quotient;
  if (Arithmetic::divideSmall(*this, divisor, quotient)) return quotient;
  return Arithmetic::divideBig(*this, divisor);
}

NSDecimal NSDecimal::integerDivide(const NSDecimal& divisor) const {
  if (isNaN() || divisor.isNaN() || divisor.isZero()) return notANumber();
  int64_t a = 0;
  int64_t b = 0;
  // The one quotient that overflows is that of the least integer by -1.
  if (Arithmetic::align(*this, divisor, a, b) && (a != INT64_MIN || b != -1)) return a / b;
  BigInteger bigA;
  BigInteger bigB;
  Arithmetic::alignBig(*this, divisor, bigA, bigB);
  Arithmetic::checkMaking(bigA, bigB);
  bigA.divide(bigB);
  return Arithmetic::big(std::move(bigA), 0);
}

NSDecimal NSDecimal::remainder(const NSDecimal& divisor) const {
  if (isNaN() || divisor.isNaN() || divisor.isZero()) return notANumber();
  const int32_t scale = std::max(_scale, divisor._scale);
  int64_t a = 0;
  int64_t b = 0;
  if (Arithmetic::align(*this, divisor, a, b)) {
    return Arithmetic::small(b == -1 ? 0 : a % b, scale);
  }
  BigInteger bigA;
  BigInteger bigB;
  Arithmetic::alignBig(*this, divisor, bigA, bigB);
  Arithmetic::checkMaking(bigA, bigB);
  return Arithmetic::big(bigA.divide(bigB), scale);
}

}  // namespace xquery
