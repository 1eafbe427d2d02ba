// Decimal arithmetic.
//
// Every operation has a fast path on 64-bit coefficients, taken as long as the overflow-checking
// built-ins report none, and a general path on big integers. Both end in the same canonical form:
// no trailing zeros after the point, a scale of at least 0, and a big coefficient only for what
// 64 bits do not hold. So equality of values is equality of representations.
#include "Platform/Numbers/NSDecimal.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Numbers/BigInteger.h"
#include "Platform/Numbers/NumberText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <memory>
#include <numeric>
#include <optional>
#include <stdexcept>

namespace xquery {

namespace {

constexpr int32_t maximumSmallPower = 18;
constexpr int64_t smallPowers[maximumSmallPower + 1] = {1,
                                                        10,
                                                        100,
                                                        1000,
                                                        10000,
                                                        100000,
                                                        1000000,
                                                        10000000,
                                                        100000000,
                                                        1000000000,
                                                        10000000000,
                                                        100000000000,
                                                        1000000000000,
                                                        10000000000000,
                                                        100000000000000,
                                                        1000000000000000,
                                                        10000000000000000,
                                                        100000000000000000,
                                                        1000000000000000000};
constexpr uint32_t quotientDigits = 38;

__extension__ using Int128 = __int128;
__extension__ using UInt128 = unsigned __int128;

Int128 wideMagnitude(int64_t value) {
  return value < 0 ? -Int128{value} : Int128{value};
}

// What truncation cut off, compared with half a unit of what is left.
enum class CutOff : uint8_t { Nothing, BelowHalf, Half, AboveHalf };

CutOff cutOff(int comparedWithHalf) {
  return comparedWithHalf < 0   ? CutOff::BelowHalf
         : comparedWithHalf > 0 ? CutOff::AboveHalf
                                : CutOff::Half;
}

// Whether the truncated magnitude grows by one; `odd` is about that magnitude.
bool roundsAway(NSRoundingMode mode, bool negative, CutOff cut, bool odd) {
  if (cut == CutOff::Nothing) return false;
  switch (mode) {
    case NSRoundingMode::TowardZero:
      return false;
    case NSRoundingMode::Floor:
      return negative;
    case NSRoundingMode::Ceiling:
      return !negative;
    case NSRoundingMode::HalfAwayFromZero:
      return cut >= CutOff::Half;
    case NSRoundingMode::HalfUp:
      return negative ? cut > CutOff::Half : cut >= CutOff::Half;
    case NSRoundingMode::HalfEven:
      return odd ? cut >= CutOff::Half : cut > CutOff::Half;
  }
  return false;
}

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

// The slowest operations take about a millisecond per 10,000 digits, that is 4,000 bytes; those
// that only read or add take no more than copying memory does.
constexpr size_t bytesPerStep = 128;
constexpr size_t bytesPerReadingStep = size_t{16} * 1024;

void checkMaking(const BigInteger& a, const BigInteger& b) {
  checkWork((a.bytes() + b.bytes()) / bytesPerStep);
}
void checkReading(const BigInteger& a, const BigInteger& b) {
  checkWork((a.bytes() + b.bytes()) / bytesPerReadingStep);
}

// The coefficient of a large decimal: counted as memory of values, and its making as work.
BigInteger* kept(BigInteger coefficient) {
  const size_t bytes = coefficient.bytes();
  auto owned = std::make_unique<BigInteger>(std::move(coefficient));
  countValueBlock(bytes);
  chargeWork(bytes / bytesPerStep);
  return owned.release();
}

}  // namespace

// The operations that look inside.
class NSDecimalArithmetic {
 public:
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

  static NSDecimal big(BigInteger coefficient, int64_t scale) {
    if (coefficient.sign() == 0) return NSDecimal();
    if (scale < 0) {
      checkDigits(-scale);
      coefficient.multiplyByPowerOfTen(static_cast<uint32_t>(-scale));
      scale = 0;
    } else if (scale > 0 && !coefficient.isOdd()) {
      stripZeros(coefficient, scale);
    }
    checkDigits(scale);
    if (coefficient.fitsInt64()) return small(coefficient.int64(), static_cast<int32_t>(scale));
    // One more than the bound may be an overestimate, and does no harm.
    checkDigits(static_cast<int64_t>(coefficient.digitsAtMost()) - 1);
    NSDecimal result;
    result._big = kept(std::move(coefficient));
    result._scale = static_cast<int32_t>(scale);
    result._state = NSDecimal::Big;
    return result;
  }

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
    return difference > 0 ? !__builtin_mul_overflow(alignedB, smallPowers[difference], &alignedB)
                          : !__builtin_mul_overflow(alignedA, smallPowers[-difference], &alignedA);
  }

  static void alignBig(const NSDecimal& a, const NSDecimal& b, BigInteger& alignedA,
                       BigInteger& alignedB) {
    alignedA = coefficient(a);
    alignedB = coefficient(b);
    const int32_t difference = a._scale - b._scale;
    if (difference > 0) alignedB.multiplyByPowerOfTen(static_cast<uint32_t>(difference));
    if (difference < 0) alignedA.multiplyByPowerOfTen(static_cast<uint32_t>(-difference));
    if (difference == 0) {
      checkReading(alignedA, alignedB);
    } else {
      checkMaking(alignedA, alignedB);
    }
  }

  static BigInteger::Digits leadingDigits(const NSDecimal& value) {
    const auto scale = static_cast<uint32_t>(value._scale);
    if (value._state == NSDecimal::Big) return value._big->leadingDigits(scale);
    return BigInteger(value._coefficient).leadingDigits(scale);
  }
  // The order of two magnitudes by their first digits; 0 when these do not decide it.
  static int compareLeadingDigits(const NSDecimal& a, const NSDecimal& b);
  static std::optional<double> doubleByLeadingDigits(const NSDecimal& value);
  static uint64_t hashDigits(const NSDecimal& value) {
    if (value._state != NSDecimal::Big) {
      return static_cast<uint64_t>(value._coefficient) * 31 + static_cast<uint64_t>(value._scale);
    }
    checkReading(*value._big, *value._big);
    return value._big->hash() * 31 + static_cast<uint64_t>(value._scale);
  }

  static bool divideSmall(const NSDecimal& a, const NSDecimal& b, NSDecimal& quotient);
  static NSDecimal divideBig(const NSDecimal& a, const NSDecimal& b);
  static NSDecimal roundedSmallQuotient(int64_t numerator, uint64_t denominator);
  static NSDecimal roundedQuotient(BigInteger numerator, BigInteger denominator, int64_t point);
  static NSDecimal roundSmall(const NSDecimal& value, int64_t drop, int32_t scale,
                              NSRoundingMode mode);
  static NSDecimal roundBig(const NSDecimal& value, int64_t drop, int32_t scale,
                            NSRoundingMode mode);

 private:
  static void checkDigits(int64_t digits) {
    if (digits > NSDecimal::maximumDigits) throw std::length_error("decimal too long");
  }

  static void stripZeros(BigInteger& coefficient, int64_t& scale) {
    if (!coefficient.isDivisibleBy(10)) return;
    // Only zeros after the point go, those before it are put back.
    const int64_t zeros = coefficient.removeFactor(10);
    if (zeros > scale) coefficient.multiplyByPowerOfTen(static_cast<uint32_t>(zeros - scale));
    scale -= std::min(zeros, scale);
  }
};

using Arithmetic = NSDecimalArithmetic;

void NSDecimal::destroyBig() {
  uncountValueBytes(_big->bytes());
  std::unique_ptr<BigInteger>{_big}.reset();
}

void NSDecimal::copyBig(const NSDecimal& other) {
  _state = Small;  // in case the copy fails
  _big = kept(*other._big);
  _state = Big;
}

NSDecimal NSDecimal::fromUnsigned(uint64_t value) {
  if (value <= INT64_MAX) return NSDecimal(static_cast<int64_t>(value));
  return Arithmetic::big(BigInteger::fromUnsigned(value), 0);
}

NSDecimal NSDecimal::fromDouble(double value) {
  constexpr double exactIntegers = 9007199254740992.0;  // 2 to the 53rd
  if (!std::isfinite(value)) return NSDecimal();
  if (value == std::trunc(value) && std::fabs(value) <= exactIntegers) {
    return NSDecimal(static_cast<int64_t>(value));
  }
  NSDecimal result;
  char buffer[64];
  const std::to_chars_result written =
      std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::scientific);
  scan({buffer, static_cast<uint32_t>(written.ptr - buffer)}, result);
  return result;
}

NSDecimal NSDecimal::notANumber() {
  NSDecimal result;
  result._state = NaN;
  return result;
}

namespace {

// The digits of a mantissa from the first to the last that is not zero, as positions in the text.
struct SignificantDigits {
  uint32_t first, end;
  uint32_t point;

  SignificantDigits(NSStringView text, const NumberExtent& extent)
      : first(extent.digits), end(extent.mantissaEnd), point(extent.point) {
    const auto isNoPart = [&](uint32_t at) { return at == point || text[at] == '0'; };
    WorkPacer pacer;
    for (; first < end && isNoPart(first); ++first) pacer.turn();
    for (; end > first && isNoPart(end - 1); --end) pacer.turn();
  }
  bool isEmpty() const { return first == end; }
  int64_t count() const { return int64_t{end} - first - (holdsPoint() ? 1 : 0); }
  // Of the last digit: how far behind the point it stands, negative before the point.
  int64_t scale() const {
    const int64_t places = int64_t{end} - 1 - point;
    return places < 0 ? places + 1 : places;
  }
  std::string digits(NSStringView text) const {
    std::string digits;
    digits.reserve(static_cast<size_t>(count()));
    for (uint32_t at = first; at < end; ++at) {
      if (at != point) digits += static_cast<char>(text[at]);
    }
    return digits;
  }

 private:
  bool holdsPoint() const { return point > first && point < end; }
};

}  // namespace

bool NSDecimal::scan(NSStringView text, NSDecimal& out) {
  NumberExtent extent;
  if (!findNumber(text, extent)) return false;
  const SignificantDigits significant(text, extent);
  if (significant.isEmpty()) {
    out = NSDecimal();
    return true;
  }
  const int64_t scale = significant.scale() - extent.exponent;
  const int64_t length = significant.count() - std::min<int64_t>(scale, 0);
  if (length > maximumDigits || scale > maximumDigits) return false;
  const std::string digits = significant.digits(text);
  if (length <= maximumSmallPower && scale >= 0) {
    int64_t coefficient = 0;
    std::from_chars(digits.data(), digits.data() + digits.size(), coefficient);
    out = Arithmetic::small(extent.negative ? -coefficient : coefficient,
                            static_cast<int32_t>(scale));
    return true;
  }
  BigInteger coefficient = BigInteger::fromDigits(digits);
  if (extent.negative) coefficient.negate();
  out = Arithmetic::big(std::move(coefficient), scale);
  return true;
}

int NSDecimal::sign() const {
  if (_state == NaN) return 0;
  if (_state == Big) return _big->sign();
  return _coefficient < 0 ? -1 : _coefficient > 0 ? 1 : 0;
}

bool NSDecimal::isInteger() const {
  return _state != NaN && _scale == 0;
}

NSDecimal NSDecimal::add(const NSDecimal& other) const {
  int64_t a = 0;
  int64_t b = 0;
  if (Arithmetic::align(*this, other, a, b) && !__builtin_add_overflow(a, b, &a)) {
    return Arithmetic::small(a, std::max(_scale, other._scale));
  }
  if (isNaN() || other.isNaN()) return notANumber();
  BigInteger bigA;
  BigInteger bigB;
  Arithmetic::alignBig(*this, other, bigA, bigB);
  bigA.add(bigB);
  return Arithmetic::big(std::move(bigA), std::max(_scale, other._scale));
}

NSDecimal NSDecimal::subtract(const NSDecimal& other) const {
  int64_t a = 0;
  int64_t b = 0;
  if (Arithmetic::align(*this, other, a, b) && !__builtin_sub_overflow(a, b, &a)) {
    return Arithmetic::small(a, std::max(_scale, other._scale));
  }
  if (isNaN() || other.isNaN()) return notANumber();
  BigInteger bigA;
  BigInteger bigB;
  Arithmetic::alignBig(*this, other, bigA, bigB);
  bigA.subtract(bigB);
  return Arithmetic::big(std::move(bigA), std::max(_scale, other._scale));
}

NSDecimal NSDecimal::multiply(const NSDecimal& other) const {
  int64_t product = 0;
  if (_state == Small && other._state == Small &&
      !__builtin_mul_overflow(_coefficient, other._coefficient, &product) &&
      _scale + other._scale <= maximumDigits) {
    return Arithmetic::small(product, _scale + other._scale);
  }
  if (isNaN() || other.isNaN()) return notANumber();
  BigInteger result = Arithmetic::coefficient(*this);
  result.multiply(Arithmetic::coefficient(other));
  return Arithmetic::big(std::move(result), int64_t{_scale} + other._scale);
}

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
  if (__builtin_mul_overflow(numerator, smallPowers[scale] / denominator, &coefficient)) {
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
    const UInt128 dividend = UInt128{remainder} * static_cast<uint64_t>(smallPowers[step]);
    const auto next = static_cast<uint64_t>(dividend / denominator);
    remainder = static_cast<uint64_t>(dividend % denominator);
    count = digits == 0 ? digitCount(next) : count + step;
    digits = digits * static_cast<uint64_t>(smallPowers[step]) + next;
    scale += static_cast<int32_t>(step);
  }
  if (remainder > denominator - remainder) ++digits;
  BigInteger coefficient =
      BigInteger::fromHalves(static_cast<uint64_t>(digits >> 64), static_cast<uint64_t>(digits));
  if (numerator < 0) coefficient.negate();
  return big(std::move(coefficient), scale);
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
  checkMaking(bigA, bigB);
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
  checkMaking(bigA, bigB);
  return Arithmetic::big(bigA.divide(bigB), scale);
}

NSDecimal NSDecimal::negate() const {
  return NSDecimal().subtract(*this);
}

NSDecimal NSDecimalArithmetic::roundSmall(const NSDecimal& value, int64_t drop, int32_t scale,
                                          NSRoundingMode mode) {
  const bool negative = value._coefficient < 0;
  const Int128 magnitude = wideMagnitude(value._coefficient);
  Int128 quotient = 0;
  CutOff cut = CutOff::BelowHalf;
  // Twenty digits and more exceed twice every 64-bit coefficient.
  if (drop < 20) {
    const Int128 power =
        drop <= maximumSmallPower ? Int128{smallPowers[drop]} : Int128{smallPowers[drop - 1]} * 10;
    quotient = magnitude / power;
    const Int128 twice = (magnitude % power) * 2;
    cut = twice == 0 ? CutOff::Nothing : cutOff(twice < power ? -1 : twice > power ? 1 : 0);
  }
  if (roundsAway(mode, negative, cut, quotient % 2 != 0)) ++quotient;
  const auto result = static_cast<int64_t>(negative ? -quotient : quotient);
  return scale >= 0 ? small(result, scale) : big(BigInteger(result), scale);
}

NSDecimal NSDecimalArithmetic::roundBig(const NSDecimal& value, int64_t drop, int32_t scale,
                                        NSRoundingMode mode) {
  BigInteger quotient = *value._big;
  checkMaking(quotient, quotient);
  const bool negative = quotient.sign() < 0;
  if (negative) quotient.negate();
  CutOff cut = CutOff::BelowHalf;
  if (drop > static_cast<int64_t>(quotient.digitsAtMost())) {
    quotient = BigInteger();
  } else {
    const BigInteger power = BigInteger::powerOfTen(static_cast<uint32_t>(drop));
    BigInteger remainder = quotient.divide(power);
    const bool exact = remainder.sign() == 0;
    remainder.add(BigInteger(remainder));
    cut = exact ? CutOff::Nothing : cutOff(remainder.compare(power));
  }
  if (roundsAway(mode, negative, cut, quotient.isOdd())) {
    quotient.add(BigInteger(int64_t{1}));
  }
  if (negative) quotient.negate();
  return big(std::move(quotient), scale);
}

NSDecimal NSDecimal::rounded(int32_t scale, NSRoundingMode mode) const {
  const int64_t drop = int64_t{_scale} - scale;
  if (isNaN() || isZero() || drop <= 0) return *this;
  return _state == Small ? Arithmetic::roundSmall(*this, drop, scale, mode)
                         : Arithmetic::roundBig(*this, drop, scale, mode);
}

// The two may be off by one in the last digit each.
int NSDecimalArithmetic::compareLeadingDigits(const NSDecimal& a, const NSDecimal& b) {
  const BigInteger::Digits first = leadingDigits(a);
  const BigInteger::Digits second = leadingDigits(b);
  const int64_t difference = first.exponent - second.exponent;
  if (difference > 1 || difference < -1) return difference > 0 ? 1 : -1;
  // One more digit for what is ten times as large, as it is next to a power of ten.
  BigInteger distance = BigInteger::fromDigits(first.text + (difference > 0 ? "0" : ""));
  distance.subtract(BigInteger::fromDigits(second.text + (difference < 0 ? "0" : "")));
  constexpr size_t uncertainDigits = 2;
  return distance.digitsAtMost() > uncertainDigits + 1 ? distance.sign() : 0;
}

int NSDecimal::compare(const NSDecimal& other) const {
  int64_t a = 0;
  int64_t b = 0;
  if (Arithmetic::align(*this, other, a, b)) return a < b ? -1 : a > b ? 1 : 0;
  if (isNaN() || other.isNaN()) return (other.isNaN() ? 1 : 0) - (isNaN() ? 1 : 0);
  if (sign() != other.sign()) return sign() < other.sign() ? -1 : 1;
  if (_state == Big && other._state == Big && _scale == other._scale) {
    checkReading(*_big, *other._big);
    const int order = _big->compare(*other._big);
    return order < 0 ? -1 : order > 0 ? 1 : 0;
  }
  // What is not nearly equal is ordered without the powers of ten in between.
  if (const int order = Arithmetic::compareLeadingDigits(*this, other)) return order * sign();
  BigInteger bigA;
  BigInteger bigB;
  Arithmetic::alignBig(*this, other, bigA, bigB);
  const int order = bigA.compare(bigB);
  return order < 0 ? -1 : order > 0 ? 1 : 0;
}

uint32_t NSDecimal::hash() const {
  return hashDouble(doubleValue());
}

uint64_t hashDigits(const NSDecimal& value) {
  return NSDecimalArithmetic::hashDigits(value);
}

// The double nearest to all that begins with the digits, where these decide it.
std::optional<double> NSDecimalArithmetic::doubleByLeadingDigits(const NSDecimal& value) {
  const BigInteger::Digits digits = leadingDigits(value);
  const std::string exponent =
      "e" + std::to_string(digits.exponent - static_cast<int64_t>(BigInteger::Digits::count));
  const auto nearestTo = [&](int64_t off) {
    BigInteger number = BigInteger::fromDigits(digits.text);
    number.add(BigInteger(off));
    const std::string text = number.toString() + exponent;
    double nearest = 0;
    scanDouble(NSStringView::ascii(text), nearest);
    return nearest;
  };
  const double below = nearestTo(-2);
  if (below != nearestTo(2)) return std::nullopt;
  return value.sign() < 0 ? -below : below;
}

double NSDecimal::doubleValue() const {
  constexpr int32_t exactPowers = 22;  // powers of ten that a double holds exactly
  constexpr double powers[exactPowers + 1] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                              1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                                              1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};
  constexpr int64_t exactIntegers = int64_t{1} << 53;
  if (_state == NaN) return std::numeric_limits<double>::quiet_NaN();
  if (_state == Small) {
    const auto value = static_cast<double>(_coefficient);
    if (_scale == 0) return value;
    // One division of exact operands is rounded correctly.
    if (_scale <= exactPowers && _coefficient <= exactIntegers && _coefficient >= -exactIntegers) {
      return value / powers[_scale];
    }
  }
  if (_state == Big) {
    if (const auto nearest = Arithmetic::doubleByLeadingDigits(*this)) return *nearest;
    checkMaking(*_big, *_big);
  }
  const std::string digits = _state == Big ? _big->toString() : std::to_string(_coefficient);
  double value = 0;
  scanDouble(NSStringView::ascii(digits + "e-" + std::to_string(_scale)), value);
  return value;
}

int64_t NSDecimal::int64Value() const {
  if (_state == NaN) return 0;
  const NSDecimal whole = truncated();
  if (whole._state == Small) return whole._coefficient;
  return whole.sign() < 0 ? INT64_MIN : INT64_MAX;
}

uint64_t NSDecimal::uint64Value() const {
  if (sign() <= 0) return 0;
  const NSDecimal whole = truncated();
  if (whole._state == Small) return static_cast<uint64_t>(whole._coefficient);
  return whole._big->fitsUInt64() ? whole._big->uint64() : UINT64_MAX;
}

std::string NSDecimal::toString() const {
  if (_state == NaN) return "NaN";
  std::string text;
  if (_state == Small) {
    char buffer[24];
    text.assign(buffer, std::to_chars(buffer, buffer + sizeof buffer, _coefficient).ptr);
  } else {
    checkMaking(*_big, *_big);
    text = _big->toString();
  }
  if (_scale == 0) return text;
  const size_t first = text[0] == '-' ? 1 : 0;
  const auto scale = static_cast<size_t>(_scale);
  const size_t digits = text.size() - first;
  if (digits <= scale) text.insert(first, scale - digits + 1, '0');
  return text.insert(text.size() - scale, 1, '.');
}

}  // namespace xquery
