// What the files about decimals share: the operations that look inside one.
//
// Every operation has a fast path on 64-bit coefficients, taken as long as the overflow-checking
// built-ins report none, and a general path on big integers. Sums, differences and products, and
// what has been rounded to 38 digits, have one on 128 bits between. All end in the same canonical
// form:
// no trailing zeros after the point, a scale of at least 0, and a big coefficient only for what
// 64 bits do not hold. So equality of values is equality of representations.
#pragma once

#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/BigInteger.h"
#include "Platform/Numbers/NSDecimal.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

namespace xquery {

class NSDecimalArithmetic {
 public:
  static constexpr int32_t maximumSmallPower = 18;
  static constexpr auto smallPowers = [] {
    std::array<int64_t, maximumSmallPower + 1> powers = {1};
    for (size_t exponent = 1; exponent < powers.size(); ++exponent) {
      powers[exponent] = powers[exponent - 1] * 10;
    }
    return powers;
  }();
  static constexpr int64_t powerOfTen(int64_t exponent) {
    return smallPowers[static_cast<size_t>(exponent)];
  }

  // The canonical forms.
  static NSDecimal small(int64_t coefficient, int32_t scale) {
    NSDecimal result(coefficient);
    if (scale == 0 || coefficient == 0) return result;
    while (scale > 0 && result._coefficient % 10 == 0) {
      result._coefficient /= 10;
      --scale;
    }
    result._scale = scale;
    return result;
  }
  using Wide = BigInteger::Wide;
  // The scale is at least 0 and within bounds.
  static NSDecimal wide(Wide coefficient, int32_t scale);
  // Brings two decimals to one scale; false when 128 bits do not hold them.
  static bool alignWide(const NSDecimal& a, const NSDecimal& b, Wide& alignedA, Wide& alignedB);
  // Of a number; false when 128 bits do not hold it.
  static bool coefficientWide(const NSDecimal& value, Wide& coefficient);
  // Throws std::length_error for more digits than a decimal holds.
  static NSDecimal big(BigInteger coefficient, int64_t scale);

  static BigInteger coefficient(const NSDecimal& value) {
    return value._state == NSDecimal::Big ? *value._big : BigInteger(value._coefficient);
  }

  // Brings two small decimals to one scale; false when 64 bits do not hold them.
  static bool align(const NSDecimal& a, const NSDecimal& b, int64_t& alignedA, int64_t& alignedB) {
    if (a._state != NSDecimal::Small || b._state != NSDecimal::Small) return false;
    alignedA = a._coefficient;
    alignedB = b._coefficient;
    const int32_t difference = a._scale - b._scale;
    if (difference == 0) return true;
    if (difference > maximumSmallPower || difference < -maximumSmallPower) return false;
    return difference > 0 ? !__builtin_mul_overflow(alignedB, powerOfTen(difference), &alignedB)
                          : !__builtin_mul_overflow(alignedA, powerOfTen(-difference), &alignedA);
  }

  static void alignBig(const NSDecimal& a, const NSDecimal& b, BigInteger& alignedA,
                       BigInteger& alignedB);

  static BigInteger::Digits leadingDigits(const NSDecimal& value);
  // The order of two magnitudes by their first digits; 0 when these do not decide it.
  static int compareLeadingDigits(const NSDecimal& a, const NSDecimal& b);
  static std::optional<double> doubleByLeadingDigits(const NSDecimal& value);
  static uint64_t hashDigits(const NSDecimal& value);

  static bool divideSmall(const NSDecimal& a, const NSDecimal& b, NSDecimal& quotient);
  static NSDecimal divideBig(const NSDecimal& a, const NSDecimal& b);
  static NSDecimal roundedSmallQuotient(int64_t numerator, uint64_t denominator);
  static NSDecimal roundedQuotient(BigInteger numerator, BigInteger denominator, int64_t point);
  static NSDecimal roundSmall(const NSDecimal& value, int64_t drop, int32_t scale,
                              NSRoundingMode mode);
  static NSDecimal roundBig(const NSDecimal& value, int64_t drop, int32_t scale,
                            NSRoundingMode mode);

  // The slowest operations take about a millisecond per 10,000 digits, that is 4,000 bytes; those
  // that only read or add take no more than copying memory does.
  static constexpr size_t bytesPerStep = 128;
  static constexpr size_t bytesPerReadingStep = size_t{16} * 1024;
  static void checkMaking(const BigInteger& a, const BigInteger& b) {
    checkWork((a.bytes() + b.bytes()) / bytesPerStep);
  }
  static void checkReading(const BigInteger& a, const BigInteger& b) {
    checkWork((a.bytes() + b.bytes()) / bytesPerReadingStep);
  }

  // The coefficient of a large decimal: counted as memory of values, and its making as work.
  static BigInteger* kept(BigInteger coefficient);

 private:
  static void checkDigits(int64_t digits);
  static void stripZeros(BigInteger& coefficient, int64_t& scale);
};

}  // namespace xquery
