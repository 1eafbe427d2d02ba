// Values from their lexical forms, as XML Schema Part 2 has them. The casts of the language are
// another matter: they are more lenient about numbers and less about white space, give xs:int 64
// bits, and lose the zeros that begin the fraction of a duration's seconds.
#include "Platform/Dates/GregorianCalendar.h"
#include "Platform/Numbers/NumberText.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Types/LexicalForms.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNotation.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValueErrors.h"
#include "Types/XQueryValueText.h"

#include <charconv>
#include <iterator>
#include <limits>

namespace xquery {

namespace {

using Type = XQueryItemType;
using Result = XQueryResult<Value>;

Result malformed(Type type, std::string_view text) {
  return XQueryErrors::notOfTheForm.error(XQueryShownText(text), XQueryNameOfType(type));
}

Result outOfRange(Type type, std::string_view text) {
  return XQueryErrors::outOfTheRange.error("\"" + XQueryShownText(text) + "\"",
                                           XQueryNameOfType(type));
}

// --- strings -------------------------------------------------------------------------------------

// What the facet whiteSpace of the type makes of a text: normalizedString replaces each by a blank,
// what derives from it has one blank between words and none around them.
std::string withWhiteSpaceOf(Type type, std::string_view text) {
  const bool collapses = type != Type::NormalizedString;
  std::string made;
  made.reserve(text.size());
  for (const char byte : text) {
    const bool isSpace = isXMLSpace(byte);
    if (isSpace && collapses && (made.empty() || made.back() == ' ')) continue;
    made += isSpace ? ' ' : byte;
  }
  if (collapses && !made.empty() && made.back() == ' ') made.pop_back();
  return made;
}

Result fromString(Type type, std::string_view text) {
  if (type == Type::UntypedAtomic) return XQueryMakeUntypedAtomic(text);
  if (type == Type::String) return XQueryMakeString(text);
  if (auto error = XQueryTextError(text)) return error;
  const std::string made = withWhiteSpaceOf(type, text);
  if (type == Type::Language && !XQueryIsLanguageForm(made)) return malformed(type, text);
  const auto typeID = static_cast<XQueryTypeID>(type);
  if (auto string = XQueryString::stringOfType(typeID, *NSString::stringWithUTF8(made))) {
    return string;
  }
  return malformed(type, text);
}

// --- numbers -------------------------------------------------------------------------------------

struct IntegerRange {
  std::optional<int64_t> lowest;
  std::optional<uint64_t> highest;  // no type ends below 0 but those that end at it and at -1
};

template <class Number>
constexpr IntegerRange rangeOf = {std::numeric_limits<Number>::min(),
                                  static_cast<uint64_t>(std::numeric_limits<Number>::max())};

// By type, from integer on.
constexpr IntegerRange integerRanges[] = {
    {std::nullopt, std::nullopt},  // integer
    {0, std::nullopt},             // nonNegativeInteger
    {1, std::nullopt},             // positiveInteger
    {std::nullopt, 0},             // nonPositiveInteger
    {std::nullopt, 0},             // negativeInteger
    rangeOf<int64_t>,              // long
    rangeOf<int32_t>,              // int
    rangeOf<int16_t>,              // short
    rangeOf<int8_t>,               // byte
    rangeOf<uint64_t>,             // unsignedLong
    rangeOf<uint32_t>,             // unsignedInt
    rangeOf<uint16_t>,             // unsignedShort
    rangeOf<uint8_t>,              // unsignedByte
};
static_assert(std::size(integerRanges) == XQueryTypeUnsignedByte - XQueryTypeInteger + 1);

bool isInRange(Type type, const NSDecimal& value) {
  const IntegerRange& range = integerRanges[static_cast<XQueryTypeID>(type) - XQueryTypeInteger];
  if (range.lowest && value.compare(NSDecimal(*range.lowest)) < 0) return false;
  if (range.highest && value.compare(NSDecimal::fromUnsigned(*range.highest)) > 0) return false;
  return type != Type::NegativeInteger || !value.isZero();
}

Result fromDecimal(Type type, std::string_view text) {
  const bool isInteger = XQueryIsIntegerType(type);
  if (!(isInteger ? XQueryIsIntegerForm(text) : XQueryIsDecimalForm(text))) {
    return malformed(type, text);
  }
  NSDecimal value;
  if (text.size() > UINT32_MAX || !NSDecimal::scan(NSStringView::ascii(text), value)) {
    return outOfRange(type, text);
  }
  if (!isInteger) return XQueryNumber::numberWithDecimal(std::move(value));
  if (!isInRange(type, value)) return outOfRange(type, text);
  const Ref<XQueryNumber> integer = XQueryNumber::integerWithDecimal(std::move(value));
  if (type == Type::Integer) return integer;
  return XQueryNumber::number(*integer, static_cast<XQueryTypeID>(type));
}

// Read in single precision, not by way of a double, which would round twice. What overflows or
// underflows does so as a double as well, or is so far from the border that rounding twice does
// not matter.
float singleOf(std::string_view text, double value) {
  if (text.starts_with('+')) text.remove_prefix(1);
  float single = 0;
  const auto [end, failure] = std::from_chars(text.data(), text.data() + text.size(), single);
  return failure == std::errc() ? single : static_cast<float>(value);
}

Result fromDouble(Type type, std::string_view text) {
  double value = 0;
  if (text == "NaN") {
    value = std::numeric_limits<double>::quiet_NaN();
  } else if (text == "INF" || text == "-INF") {
    value = std::numeric_limits<double>::infinity() * (text.front() == '-' ? -1 : 1);
  } else if (!XQueryIsDoubleForm(text) || text.size() > UINT32_MAX ||
             !scanDouble(NSStringView::ascii(text), value)) {
    return malformed(type, text);
  } else if (type == Type::Float) {
    return XQueryMakeFloat(singleOf(text, value));
  }
  return XQueryMakeDouble(value);
}

Result fromBoolean(std::string_view text) {
  if (text == "true" || text == "1") return XQueryMakeBoolean(true);
  if (text == "false" || text == "0") return XQueryMakeBoolean(false);
  return malformed(Type::Boolean, text);
}

// --- dates and durations -------------------------------------------------------------------------

Result fromDate(Type type, std::string_view text) {
  XQueryDateTimeParts parts;
  switch (XQueryReadDateForm(type, text, parts)) {
    case XQueryFormOutcome::Malformed:
      return malformed(type, text);
    case XQueryFormOutcome::OutOfRange:
      return outOfRange(type, text);
    case XQueryFormOutcome::Good:
      break;
  }
  const bool isEndOfDay =
      parts.hour == 24 && parts.minute == 0 && parts.second == 0 && parts.nanosecond == 0;
  if (!isEndOfDay) return XQueryMakeDateOfType(type, parts);
  // 24 o'clock is 0 o'clock of the next day; a time of day has no other day.
  parts.hour = 0;
  Result made = XQueryMakeDateOfType(type, parts);
  if (!made || type == Type::Time) return made;
  const CalendarDay next = calendarDay(dayNumber(parts.year, parts.month, parts.day) + 1);
  if (next.year > std::numeric_limits<int32_t>::max()) return outOfRange(type, text);
  parts.year = static_cast<int32_t>(next.year);
  parts.month = next.month;
  parts.day = next.day;
  return XQueryMakeDateOfType(type, parts);
}

Result fromDuration(Type type, std::string_view text) {
  XQueryDurationForm form;
  switch (XQueryReadDurationForm(type, text, form)) {
    case XQueryFormOutcome::Malformed:
      return malformed(type, text);
    case XQueryFormOutcome::OutOfRange:
      return outOfRange(type, text);
    case XQueryFormOutcome::Good:
      break;
  }
  if (type == Type::YearMonthDuration) {
    int64_t months = 0;
    if (__builtin_mul_overflow(form.years, int64_t{12}, &months) ||
        __builtin_add_overflow(months, form.months, &months)) {
      return outOfRange(type, text);
    }
    return XQueryMakeYearMonthDuration(std::chrono::months(form.isNegative ? -months : months));
  }
  if (type == Type::DayTimeDuration) {
    const double seconds = static_cast<double>(form.days) * 86400 +
                           static_cast<double>(form.hours) * 3600 +
                           static_cast<double>(form.minutes) * 60 + form.seconds;
    return XQueryMakeDayTimeDuration(
        std::chrono::duration<double>(form.isNegative ? -seconds : seconds));
  }
  for (const int64_t field : {form.years, form.months, form.days, form.hours, form.minutes}) {
    if (field > std::numeric_limits<int32_t>::max()) return outOfRange(type, text);
  }
  const auto field = [](int64_t value) { return static_cast<int32_t>(value); };
  return XQueryMakeDuration({form.isNegative, field(form.years), field(form.months),
                             field(form.days), field(form.hours), field(form.minutes),
                             form.seconds});
}

// --- the rest ------------------------------------------------------------------------------------

Result fromBinary(Type type, std::string_view text) {
  const bool isHex = type == Type::HexBinary;
  if (!(isHex ? XQueryIsHexForm(text) : XQueryIsBase64Form(text)) || text.size() > UINT32_MAX) {
    return malformed(type, text);
  }
  const NSStringView view = NSStringView::ascii(text);
  if (isHex) return XQueryHexBinary::binaryWithString(view);
  return XQueryBase64Binary::binaryWithString(view);
}

Result fromNotation(std::string_view text) {
  if (!shapeOfXMLName(text).isName) return malformed(Type::Notation, text);
  return XQueryNotation::notationWithString(NSString::stringWithUTF8(text));
}

}  // namespace

XQueryResult<Value> XQueryMakeFromText(XQueryItemType type, std::string_view text) {
  const bool isList = type == Type::IDREFS || type == Type::ENTITIES || type == Type::NMTOKENS;
  if (!XQueryIsAtomicItemType(type) || isList || type == Type::QName) {
    return XQueryErrors::notMadeFromText.error(XQueryNameOfType(type));
  }
  if (type == Type::UntypedAtomic || XQueryIsStringType(type)) return fromString(type, text);
  if (auto error = XQueryTextError(text)) return error;
  const std::string_view form = XQueryTrimmedForm(text);
  if (type == Type::Decimal || XQueryIsIntegerType(type)) return fromDecimal(type, form);
  if (XQueryIsDateType(type)) return fromDate(type, form);
  switch (type) {
    case Type::Boolean:
      return fromBoolean(form);
    case Type::Double:
    case Type::Float:
      return fromDouble(type, form);
    case Type::AnyURI:
      return XQueryMakeAnyURI(form);
    case Type::HexBinary:
    case Type::Base64Binary:
      return fromBinary(type, form);
    case Type::Notation:
      return fromNotation(form);
    default:
      return fromDuration(type, form);
  }
}

}  // namespace xquery
