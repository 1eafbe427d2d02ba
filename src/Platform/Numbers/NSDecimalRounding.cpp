// Rounding decimals to a place before or after the point.
#include "Platform/Numbers/NSDecimalArithmetic.h"

namespace xquery {

using Arithmetic = NSDecimalArithmetic;

namespace {

__extension__ using Int128 = __int128;

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

}  // namespace

NSDecimal NSDecimalArithmetic::roundSmall(const NSDecimal& value, int64_t drop, int32_t scale,
                                          NSRoundingMode mode) {
  const bool negative = value._coefficient < 0;
  const Int128 magnitude = wideMagnitude(value._coefficient);
  Int128 quotient = 0;
  CutOff cut = CutOff::BelowHalf;
  // Twenty digits and more exceed twice every 64-bit coefficient.
  if (drop < 20) {
    const Int128 power =
        drop <= maximumSmallPower ? Int128{powerOfTen(drop)} : Int128{powerOfTen(drop - 1)} * 10;
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

}  // namespace xquery
