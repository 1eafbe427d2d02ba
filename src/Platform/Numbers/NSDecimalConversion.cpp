// Decimals from and to texts, doubles and machine integers.
#include "Platform/Numbers/NSDecimalArithmetic.h"
#include "Platform/Numbers/NumberText.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>
#include <optional>

namespace xquery {

using Arithmetic = NSDecimalArithmetic;

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
  if (length <= Arithmetic::maximumSmallPower && scale >= 0) {
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
    Arithmetic::checkMaking(*_big, *_big);
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
    Arithmetic::checkMaking(*_big, *_big);
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
