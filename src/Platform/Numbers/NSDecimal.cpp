// Decimals: their canonical form, sums and products, their order. Division, rounding and conversion
// are in files of their own.
#include "Platform/Numbers/NSDecimal.h"

#include "Platform/Numbers/NSDecimalArithmetic.h"
#include "Platform/Numbers/NumberText.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <memory>
#include <stdexcept>
#include <utility>

namespace xquery {

using Arithmetic = NSDecimalArithmetic;

// --- the canonical form --------------------------------------------------------------------------

BigInteger* NSDecimalArithmetic::kept(BigInteger coefficient) {
  const size_t bytes = coefficient.bytes();
  auto owned = std::make_unique<BigInteger>(std::move(coefficient));
  countValueBlock(bytes);
  chargeWork(bytes / bytesPerStep);
  return owned.release();
}

void NSDecimalArithmetic::checkDigits(int64_t digits) {
  if (digits > NSDecimal::maximumDigits) throw std::length_error("decimal too long");
}

void NSDecimalArithmetic::stripZeros(BigInteger& coefficient, int64_t& scale) {
  if (!coefficient.isDivisibleBy(10)) return;
  // Only zeros after the point go, those before it are put back.
  const int64_t zeros = coefficient.removeFactor(10);
  if (zeros > scale) coefficient.multiplyByPowerOfTen(static_cast<uint32_t>(zeros - scale));
  scale -= std::min(zeros, scale);
}

NSDecimal NSDecimalArithmetic::big(BigInteger coefficient, int64_t scale) {
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

namespace {

using Wide = NSDecimalArithmetic::Wide;
__extension__ using Magnitude = unsigned __int128;

constexpr int32_t maximumWidePower = 38;

constexpr auto widePowers = [] {
  std::array<Wide, maximumWidePower + 1> powers = {1};
  for (size_t exponent = 1; exponent < powers.size(); ++exponent) {
    powers[exponent] = powers[exponent - 1] * 10;
  }
  return powers;
}();

// By halves, since two to the power of 64 leaves 6.
bool endsWithZero(Wide value) {
  if ((value & 1) != 0) return false;
  const Magnitude magnitude = value < 0 ? -static_cast<Magnitude>(value) : Magnitude(value);
  const auto high = static_cast<uint64_t>(magnitude >> 64);
  return (high % 10 * 6 + static_cast<uint64_t>(magnitude) % 10) % 10 == 0;
}

}  // namespace

NSDecimal NSDecimalArithmetic::wide(Wide coefficient, int32_t scale) {
  for (; scale > 0 && endsWithZero(coefficient); --scale) {
    if (coefficient == 0) return NSDecimal();
    coefficient /= 10;
  }
  if (coefficient >= INT64_MIN && coefficient <= INT64_MAX) {
    return small(static_cast<int64_t>(coefficient), scale);
  }
  NSDecimal result;
  result._big = kept(BigInteger::fromWide(coefficient));
  result._scale = scale;
  result._state = NSDecimal::Big;
  return result;
}

bool NSDecimalArithmetic::coefficientWide(const NSDecimal& value, Wide& coefficient) {
  if (value._state == NSDecimal::Small) {
    coefficient = value._coefficient;
    return true;
  }
  if (value._state != NSDecimal::Big || !value._big->fitsWide()) return false;
  coefficient = value._big->wide();
  return true;
}

bool NSDecimalArithmetic::alignWide(const NSDecimal& a, const NSDecimal& b, Wide& alignedA,
                                    Wide& alignedB) {
  if (!coefficientWide(a, alignedA) || !coefficientWide(b, alignedB)) return false;
  const int32_t difference = a._scale - b._scale;
  if (difference > maximumWidePower || difference < -maximumWidePower) return false;
  const Wide power = widePowers[static_cast<size_t>(std::abs(difference))];
  Wide& toMove = difference > 0 ? alignedB : alignedA;
  return !__builtin_mul_overflow(toMove, power, &toMove);
}

void NSDecimal::destroyBig() {
  uncountValueBytes(_big->bytes());
  std::unique_ptr<BigInteger>{_big}.reset();
}

void NSDecimal::copyBig(const NSDecimal& other) {
  _state = Small;  // in case the copy fails
  _big = Arithmetic::kept(*other._big);
  _state = Big;
}

NSDecimal NSDecimal::fromUnsigned(uint64_t value) {
  if (value <= INT64_MAX) return NSDecimal(static_cast<int64_t>(value));
  return Arithmetic::big(BigInteger::fromUnsigned(value), 0);
}

NSDecimal NSDecimal::notANumber() {
  NSDecimal result;
  result._state = NaN;
  return result;
}

// --- sums and products ---------------------------------------------------------------------------

void NSDecimalArithmetic::alignBig(const NSDecimal& a, const NSDecimal& b, BigInteger& alignedA,
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
  Wide wideA = 0;
  Wide wideB = 0;
  if (Arithmetic::alignWide(*this, other, wideA, wideB) &&
      !__builtin_add_overflow(wideA, wideB, &wideA)) {
    return Arithmetic::wide(wideA, std::max(_scale, other._scale));
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
  Wide wideA = 0;
  Wide wideB = 0;
  if (Arithmetic::alignWide(*this, other, wideA, wideB) &&
      !__builtin_sub_overflow(wideA, wideB, &wideA)) {
    return Arithmetic::wide(wideA, std::max(_scale, other._scale));
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
  Wide wideA = 0;
  Wide wideB = 0;
  if (Arithmetic::coefficientWide(*this, wideA) && Arithmetic::coefficientWide(other, wideB) &&
      !__builtin_mul_overflow(wideA, wideB, &wideA) && _scale + other._scale <= maximumDigits) {
    return Arithmetic::wide(wideA, _scale + other._scale);
  }
  if (isNaN() || other.isNaN()) return notANumber();
  BigInteger result = Arithmetic::coefficient(*this);
  result.multiply(Arithmetic::coefficient(other));
  return Arithmetic::big(std::move(result), int64_t{_scale} + other._scale);
}

NSDecimal NSDecimal::negate() const {
  return NSDecimal().subtract(*this);
}

// --- order ---------------------------------------------------------------------------------------

BigInteger::Digits NSDecimalArithmetic::leadingDigits(const NSDecimal& value) {
  const auto scale = static_cast<uint32_t>(value._scale);
  if (value._state == NSDecimal::Big) return value._big->leadingDigits(scale);
  return BigInteger(value._coefficient).leadingDigits(scale);
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
    Arithmetic::checkReading(*_big, *other._big);
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

uint64_t NSDecimalArithmetic::hashDigits(const NSDecimal& value) {
  if (value._state != NSDecimal::Big) {
    return static_cast<uint64_t>(value._coefficient) * 31 + static_cast<uint64_t>(value._scale);
  }
  checkReading(*value._big, *value._big);
  return value._big->hash() * 31 + static_cast<uint64_t>(value._scale);
}

uint64_t hashDigits(const NSDecimal& value) {
  return NSDecimalArithmetic::hashDigits(value);
}

}  // namespace xquery
