// Making typed numbers and printing them.
#include "Types/XQueryNumber.h"

#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Platform/Numbers/NumberText.h"
#include "Types/DurationReader.h"
#include "Types/XQueryIntegerText.h"
#include "xquery/Date.h"

#include <cmath>
#include <iterator>
#include <limits>

namespace xquery {

namespace {

enum class Stored : uint8_t { Decimal, Signed, Unsigned };

// What an integer type admits. The sign and the lower bound are asked of the value as given, the
// upper bound of the truncated one; bounds are compared as doubles, so the 64-bit upper bounds
// admit the power of two itself, which is then stored as the greatest integer.
struct IntegerRule {
  bool negative, zero, positive;
  double lowest, highest;
  Stored stored;
};

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double twoTo63 = 9223372036854775808.0;
constexpr double twoTo64 = 18446744073709551616.0;

// In the order of the types, from integer. int and unsignedInt have the bounds of the 64-bit types.
constexpr IntegerRule integerRules[] = {
    {true, true, true, -infinity, infinity, Stored::Decimal},    // integer
    {false, true, true, -infinity, infinity, Stored::Decimal},   // nonNegativeInteger
    {false, false, true, -infinity, infinity, Stored::Decimal},  // positiveInteger
    {true, true, false, -infinity, infinity, Stored::Decimal},   // nonPositiveInteger
    {true, false, false, -infinity, infinity, Stored::Decimal},  // negativeInteger
    {true, true, true, -twoTo63, twoTo63, Stored::Signed},       // long
    {true, true, true, -twoTo63, twoTo63, Stored::Signed},       // int
    {true, true, true, -32768, 32767, Stored::Signed},           // short
    {true, true, true, -128, 127, Stored::Signed},               // byte
    {true, true, true, 0, twoTo64, Stored::Unsigned},            // unsignedLong
    {true, true, true, 0, twoTo64, Stored::Unsigned},            // unsignedInt
    {true, true, true, 0, 65535, Stored::Unsigned},              // unsignedShort
    {true, true, true, 0, 255, Stored::Unsigned},                // unsignedByte
};
static_assert(std::size(integerRules) == XQueryTypeUnsignedByte - XQueryTypeInteger + 1);

bool admits(const IntegerRule& rule, double value, int sign) {
  const bool signFits = sign < 0 ? rule.negative : sign > 0 ? rule.positive : rule.zero;
  return signFits && value >= rule.lowest && std::trunc(value) <= rule.highest;
}

// A shared value is made once and never freed.
template <class Number>
XQueryNumber* sharedDouble(Number value) {
  const LastingObjects lasting;
  auto number = make<XQueryNumber>(XQueryTypeDouble, std::move(value));
  NSCounting::makeImmortal(*number);
  return number.detach();
}

XQueryNumber* sharedInfinity(bool negative) {
  return negative ? XQueryNumber::negInf() : XQueryNumber::posInf();
}

// The shared value for a NaN or an infinity, null for any other number.
XQueryNumber* specialFor(double value) {
  if (std::isnan(value)) return XQueryNumber::nan();
  return std::isinf(value) ? sharedInfinity(std::signbit(value)) : nullptr;
}

std::string yearMonthText(int64_t value) {
  const bool negative = value < 0;
  const uint64_t total =
      negative ? uint64_t{0} - static_cast<uint64_t>(value) : static_cast<uint64_t>(value);
  const uint64_t years = total / 12;
  const uint64_t months = total % 12;
  std::string text = negative ? "-P" : "P";
  if (years) text += std::to_string(years) + "Y";
  if (months || !years) text += std::to_string(months) + "M";
  return text;
}

// Below this a double has units and their fractions; from here on it is counted in decimal, from
// the digits that it prints, as the functions that answer the parts of a duration do.
constexpr double exactIntegers = 9007199254740992.0;  // 2 to the 53rd

std::string dayTimeText(double value) {
  const double magnitude = std::fabs(value);
  std::string days;
  double rest = 0;  // seconds of the day
  if (magnitude < exactIntegers) {
    rest = std::fmod(magnitude, 86400);
    days = std::to_string(static_cast<int64_t>(magnitude / 86400));
  } else {
    const NSDecimal seconds = NSDecimal::fromDouble(magnitude);
    rest = seconds.remainder(NSDecimal(86400)).doubleValue();
    days = seconds.integerDivide(NSDecimal(86400)).toString();
  }
  const auto hours = static_cast<int>(rest / 3600);
  const auto minutes = static_cast<int>(std::fmod(rest, 3600) / 60);
  const double seconds = std::fmod(rest, 60);
  std::string text = value < 0 ? "-P" : "P";
  if (days != "0") text += days + "D";
  if (rest != 0) text += "T";
  if (hours) text += std::to_string(hours) + "H";
  if (minutes) text += std::to_string(minutes) + "M";
  if (seconds != 0) {
    const bool whole = seconds == std::trunc(seconds);
    text += (whole ? std::to_string(static_cast<int>(seconds)) : formatDouble(seconds)) + "S";
  }
  if (days == "0" && rest == 0) text += "T0S";
  return text;
}

bool readMonths(DurationReader& reader, int64_t& months) {
  int64_t count = 0;
  months = 0;
  if (!reader.integer(count)) return false;
  if (reader.take('Y')) {
    if (__builtin_mul_overflow(count, int64_t{12}, &months)) return false;
    if (reader.atEnd()) return true;
    if (!reader.integer(count)) return false;
  }
  return reader.take('M') && reader.atEnd() && !__builtin_add_overflow(months, count, &months);
}

bool readSeconds(DurationReader& reader, double& seconds) {
  struct Unit {
    char16_t letter;
    double seconds;
  };
  constexpr Unit units[] = {{'H', 3600}, {'M', 60}};
  int64_t count = 0;
  seconds = 0;
  if (!reader.take('T')) {
    if (!reader.integer(count)) return false;
    if (reader.take('D')) {
      seconds = static_cast<double>(count) * 86400;
      if (reader.atEnd()) return true;
    }
    if (!reader.take('T')) return false;
  }
  if (!reader.integer(count)) return false;
  for (const Unit& unit : units) {
    if (!reader.take(unit.letter)) continue;
    seconds += static_cast<double>(count) * unit.seconds;
    if (reader.atEnd()) return true;
    if (!reader.integer(count)) return false;
  }
  double rest = static_cast<double>(count);
  if (reader.take('.') && !reader.fraction(count, rest)) return false;
  seconds += rest;
  return reader.take('S') && reader.atEnd();
}

}  // namespace

XQueryNumber* XQueryNumber::posInf() {
  static XQueryNumber* const number = sharedDouble(infinity);
  return number;
}

XQueryNumber* XQueryNumber::negInf() {
  static XQueryNumber* const number = sharedDouble(-infinity);
  return number;
}

XQueryNumber* XQueryNumber::nan() {
  static XQueryNumber* const number = sharedDouble(NSDecimal::notANumber());
  return number;
}

XQueryNumber* XQueryNumber::zero() {
  static XQueryNumber* const number = sharedDouble(NSDecimal(0));
  return number;
}

XQueryNumber* XQueryNumber::one() {
  static XQueryNumber* const number = sharedDouble(NSDecimal(1));
  return number;
}

bool XQueryNumber::isSpecial(const NSObject* object) {
  return object && (object == nan() || object == posInf() || object == negInf());
}

Ref<XQueryNumber> XQueryNumber::number(const NSNumber& withNumber, XQueryTypeID type) {
  if (type == XQueryTypeDouble) return make<XQueryNumber>(type, withNumber);
  if (type == XQueryTypeFloat) return singlePrecision(withNumber);
  if (XQueryPrimitiveTypeForTypeID(type) != XQueryTypeDecimal) return nullptr;
  if (XQueryIsKindOfType(XQueryObjectTypeID(&withNumber), type)) {
    return make<XQueryNumber>(type, withNumber);
  }
  const double value = withNumber.doubleValue();
  const bool isDecimal = withNumber.storage() == Storage::Decimal;
  if (std::isnan(value) || (std::isinf(value) && !isDecimal)) {
    // The unbounded types answer the shared value, as every constructor does; nothing else holds
    // it.
    const bool unbounded = type == XQueryTypeDecimal || type == XQueryTypeInteger;
    return unbounded ? specialFor(value) : nullptr;
  }
  NSDecimal decimal = withNumber.decimalValue();
  if (type == XQueryTypeDecimal) return make<XQueryNumber>(type, std::move(decimal));
  const IntegerRule& rule = integerRules[type - XQueryTypeInteger];
  if (!admits(rule, value, decimal.sign())) return nullptr;
  switch (rule.stored) {
    case Stored::Signed:
      return make<XQueryNumber>(type, decimal.int64Value());
    case Stored::Unsigned:
      return make<XQueryNumber>(type, decimal.uint64Value());
    case Stored::Decimal:
      break;
  }
  return make<XQueryNumber>(type, decimal.truncated());
}

// A finite number that single precision does not hold becomes the shared infinity.
Ref<XQueryNumber> XQueryNumber::singlePrecision(const NSNumber& number) {
  const double value = number.doubleValue();
  if (!std::isfinite(value) && number.storage() != Storage::Decimal) {
    return make<XQueryNumber>(XQueryTypeFloat, number);
  }
  const auto single = static_cast<float>(value);
  if (std::isinf(single)) return sharedInfinity(single < 0);
  return make<XQueryNumber>(XQueryTypeFloat, single);
}

Ref<XQueryNumber> XQueryNumber::doubleWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeDouble);
}
Ref<XQueryNumber> XQueryNumber::floatWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeFloat);
}
Ref<XQueryNumber> XQueryNumber::decimalWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeDecimal);
}
Ref<XQueryNumber> XQueryNumber::integerWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeInteger);
}
Ref<XQueryNumber> XQueryNumber::nonNegativeIntegerWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeNonNegativeInteger);
}
Ref<XQueryNumber> XQueryNumber::positiveIntegerWithNumber(const NSNumber& value) {
  return number(value, XQueryTypePositiveInteger);
}
Ref<XQueryNumber> XQueryNumber::nonPositiveIntegerWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeNonPositiveInteger);
}
Ref<XQueryNumber> XQueryNumber::negativeIntegerWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeNegativeInteger);
}
Ref<XQueryNumber> XQueryNumber::longWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeLong);
}
Ref<XQueryNumber> XQueryNumber::intWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeInt);
}
Ref<XQueryNumber> XQueryNumber::shortWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeShort);
}
Ref<XQueryNumber> XQueryNumber::byteWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeByte);
}
Ref<XQueryNumber> XQueryNumber::unsignedLongWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeUnsignedLong);
}
Ref<XQueryNumber> XQueryNumber::unsignedIntWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeUnsignedInt);
}
Ref<XQueryNumber> XQueryNumber::unsignedShortWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeUnsignedShort);
}
Ref<XQueryNumber> XQueryNumber::unsignedByteWithNumber(const NSNumber& value) {
  return number(value, XQueryTypeUnsignedByte);
}

Ref<XQueryNumber> XQueryNumber::numberWithDecimal(NSDecimal value) {
  if (value.isNaN()) return nan();
  return make<XQueryNumber>(XQueryTypeDecimal, std::move(value));
}

Ref<XQueryNumber> XQueryNumber::integerWithInt64(int64_t value) {
  return make<XQueryNumber>(XQueryTypeInteger, NSDecimal(value));
}

Ref<XQueryNumber> XQueryNumber::integerWithDecimal(NSDecimal value) {
  if (value.isNaN()) return nan();
  return make<XQueryNumber>(XQueryTypeInteger, std::move(value));
}

Ref<XQueryNumber> XQueryNumber::yearMonthDurationWithMonths(int64_t months) {
  return make<XQueryNumber>(XQueryTypeYearMonthDuration, months);
}

Ref<XQueryNumber> XQueryNumber::dayTimeDurationWithSeconds(double seconds) {
  return make<XQueryNumber>(XQueryTypeDayTimeDuration, seconds);
}

Ref<XQueryNumber> XQueryNumber::yearMonthDurationWithString(NSStringView text) {
  DurationReader reader(text);
  const bool negative = reader.take('-');
  int64_t months = 0;
  if (!reader.take('P') || !readMonths(reader, months)) return nullptr;
  return yearMonthDurationWithMonths(negative ? -months : months);
}

Ref<XQueryNumber> XQueryNumber::dayTimeDurationWithString(NSStringView text) {
  DurationReader reader(text);
  const bool negative = reader.take('-');
  double seconds = 0;
  if (!reader.take('P') || !readSeconds(reader, seconds)) return nullptr;
  return dayTimeDurationWithSeconds(negative ? -seconds : seconds);
}

Ref<XQueryNumber> XQueryNumber::implicitTimeZone() {
  return dayTimeDurationWithSeconds(NSTimeZone::localTimeZone()->secondsFromGMT(NSInstant::now()));
}

Ref<XQueryNumber> XQueryNumber::numberWithLongLong(int64_t value) {
  return make<XQueryNumber>(XQueryTypeDouble, value);
}

Ref<XQueryNumber> XQueryNumber::numberWithUnsignedLongLong(uint64_t value) {
  return make<XQueryNumber>(XQueryTypeDouble, value);
}

Ref<XQueryNumber> XQueryNumber::numberWithBool(bool value) {
  // A number like any other, printed 1 or 0: only the two shared booleans are truth values.
  return make<XQueryNumber>(XQueryTypeDouble, static_cast<int64_t>(value));
}

Ref<XQueryNumber> XQueryNumber::numberWithFloat(float value) {
  if (XQueryNumber* special = specialFor(static_cast<double>(value))) return special;
  return make<XQueryNumber>(XQueryTypeDouble, value);
}

Ref<XQueryNumber> XQueryNumber::numberWithDouble(double value) {
  if (XQueryNumber* special = specialFor(value)) return special;
  return make<XQueryNumber>(XQueryTypeDouble, value);
}

Ref<NSString> XQueryNumber::XQueryStringValue() const {
  switch (typeID()) {
    case XQueryTypeYearMonthDuration:
      return NSString::stringWithASCII(yearMonthText(longLongValue()));
    case XQueryTypeDayTimeDuration:
      return NSString::stringWithASCII(dayTimeText(doubleValue()));
    default:
      if (XQueryIntegerText::isFor(*this)) {
        return NSString::stringWithView(XQueryIntegerText(*this).view());
      }
      return NSString::stringWithASCII(stringValue());
  }
}

}  // namespace xquery
