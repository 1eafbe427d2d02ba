// Values of every type, from and to the types of C++.
//
//   XQueryVariables variables{{"limit", XQueryMakeInteger(20)},
//                             {"since", XQueryMakeDate(2026y / 11 / 23)}};
//   for (const Value& item : XQueryItemRange(result)) {
//     if (const auto count = XQueryReadInteger(item)) use(*count);
//   }
//
// Makers. All text is UTF-8 and is copied. What is not well formed, holds a character that is none
// of XML, or is not in the lexical space or the range that XML Schema Part 2 (second edition) gives
// the type, is refused: the result is an error of number 6 and of the category Values,
//
//   the text is not well-formed UTF-8
//   the text holds the character U+0000, which XML does not have
//   "12abc" is not of the form of xs:integer
//   "300" is out of the range of xs:byte
//   month 13 of xs:date is out of range
//
// which is stricter than a cast in a query, which reads "12abc" as 12. Makers that answer a Value
// cannot fail, but for want of memory.
//
// Readers take a value of any of the four shapes that holds exactly one item, and never convert a
// text or a node: `data()`, `number()` and the constructor functions of the language do that. For
// another item, or another number of items, the result is an error of number 6 and of the category
// Types,
//
//   the item is xs:string, not an integer
//   the sequence has 2 items, not one
//   the sequence is empty, where one item is asked for
//   there is no value
//
// and where the C++ type does not hold the value one of the category Values: "18446744073709551615
// is out of the range of 64 bits". What a maker took its reader gives back.
//
// Values are immutable and may be shared by threads. Makers and readers may be called on any
// thread.
#pragma once

#include "xquery/Collection.h"
#include "xquery/Export.h"
#include "xquery/Object.h"
#include "xquery/Result.h"

#include <chrono>
#include <concepts>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

// --- types ---------------------------------------------------------------------------------------

// What an item is. The numbers stay what they are. Types derived from string are those from
// NormalizedString to NMTOKENS; the integer types are those from Integer on.
enum class XQueryItemType : uint8_t {
  None = 0,  // an error that stands among the items, raw data
  UntypedAtomic = 8,
  String,
  Boolean,
  Double,
  Float,
  Decimal,
  AnyURI,
  QName,
  GYearMonth,
  GYear,
  GMonthDay,
  GDay,
  GMonth,
  DateTime,
  Date,
  Time,
  Duration,
  Base64Binary,
  HexBinary,
  Notation,
  YearMonthDuration,
  DayTimeDuration,
  NormalizedString,
  Token,
  Language,
  Name,
  NCName,
  ID,
  IDREF,
  IDREFS,
  ENTITY,
  ENTITIES,
  NMTOKEN,
  NMTOKENS,
  Integer,
  NonNegativeInteger,
  PositiveInteger,
  NonPositiveInteger,
  NegativeInteger,
  Long,
  Int,
  Short,
  Byte,
  UnsignedLong,
  UnsignedInt,
  UnsignedShort,
  UnsignedByte,  // 54, the last atomic type

  Document = 65,
  Element,
  Attribute,
  Namespace,
  ProcessingInstruction,
  Comment,
  Text,
};

[[nodiscard]] XQUERY_EXPORT XQueryItemType XQueryTypeOfItem(const NSObject& item);
// As a query writes it: "xs:integer", "xdt:untypedAtomic", "element()", "item()" for None. This is
// what XQueryItemTypeName answers for an item.
[[nodiscard]] XQUERY_EXPORT std::string XQueryNameOfType(XQueryItemType type);
// The atomic type of that name, which is written as XQueryNameOfType writes it.
[[nodiscard]] XQUERY_EXPORT std::optional<XQueryItemType> XQueryTypeNamed(std::string_view name);

constexpr bool XQueryIsNodeType(XQueryItemType type) {
  return type >= XQueryItemType::Document;
}
constexpr bool XQueryIsAtomicItemType(XQueryItemType type) {
  return type >= XQueryItemType::UntypedAtomic && type <= XQueryItemType::UnsignedByte;
}
constexpr bool XQueryIsIntegerType(XQueryItemType type) {
  return type >= XQueryItemType::Integer && type <= XQueryItemType::UnsignedByte;
}
// xs:string and what derives from it.
constexpr bool XQueryIsStringType(XQueryItemType type) {
  return type == XQueryItemType::String ||
         (type >= XQueryItemType::NormalizedString && type <= XQueryItemType::NMTOKENS);
}
// The eight that an instant lies under: dateTime, date, time and the five that begin with g.
constexpr bool XQueryIsDateType(XQueryItemType type) {
  return type >= XQueryItemType::GYearMonth && type <= XQueryItemType::Time;
}

// --- components ----------------------------------------------------------------------------------

// What is written of a date or a time. Members that the type does not have are 0 when it is read,
// and are not looked at when it is made.
struct XQueryDateTimeParts {
  int32_t year = 0;  // of the proleptic Gregorian calendar, in which a year 0 precedes year 1
  int month = 0;     // 1 to 12
  int day = 0;     // 1 to 31, as the month and the year have it; without a year 29 February is one
  int hour = 0;    // 0 to 23
  int minute = 0;  // 0 to 59
  int second = 0;  // 0 to 59
  int nanosecond = 0;  // 0 to 999,999,999
  // East of Greenwich is positive; at most 14 hours either way. Nothing where none is written: such
  // a value is an instant of the process's own zone, and a time that its clocks skip when daylight
  // saving begins is the one an hour later, as it is in a query.
  std::optional<std::chrono::minutes> zone;

  friend bool operator==(const XQueryDateTimeParts&, const XQueryDateTimeParts&) = default;
};

// What is written of a duration, no member below 0; a member that is 0 is not written.
struct XQueryDurationParts {
  bool isNegative = false;  // the language prints an xs:duration without it
  int32_t years = 0;
  int32_t months = 0;
  int32_t days = 0;
  int32_t hours = 0;
  int32_t minutes = 0;
  double seconds = 0;  // with a fraction

  friend bool operator==(const XQueryDurationParts&, const XQueryDurationParts&) = default;
};

// A name. All in UTF-8.
struct XQueryQNameParts {
  std::string namespaceURI;  // empty for no namespace
  std::string localName;
  std::string prefix;  // for printing alone; two names that differ only here are equal

  friend bool operator==(const XQueryQNameParts&, const XQueryQNameParts&) = default;
};

// --- makers --------------------------------------------------------------------------------------

// An xs:integer of any integral type of C++.
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeSignedInteger(int64_t value);
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeUnsignedInteger(uint64_t value);
template <std::integral Integer>
requires(!std::same_as<Integer, bool>) [[nodiscard]] Value XQueryMakeInteger(Integer value) {
  if constexpr (std::signed_integral<Integer>) {
    return XQueryMakeSignedInteger(value);
  } else {
    return XQueryMakeUnsignedInteger(value);
  }
}

// An xs:decimal of its digits: "-12.50". At most 250,000 of them.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDecimal(std::string_view digits);

// NaN and infinities are the shared values of the language, which are of xs:double also where a
// float was given, as those of xs:float("INF") are.
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeDouble(double value);
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeFloat(float value);

[[nodiscard]] XQUERY_EXPORT Value XQueryMakeBoolean(bool value);

[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeString(std::string_view text);
// What a query takes for a number, a string or a date as it needs it, like the text of a node.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeUntypedAtomic(std::string_view text);
// A URI reference of RFC 3986, absolute or relative.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeAnyURI(std::string_view text);
// The local name, and the prefix unless it is empty, must be an NCName (Namespaces in XML 1.0).
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeQName(const XQueryQNameParts& name);

// Of any bytes.
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeHexBinary(std::string_view bytes);
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeBase64Binary(std::string_view bytes);

// Of the eight types of dates and times. Another type is an error: "xs:string is no type of dates
// and times".
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDateOfType(
    XQueryItemType type, const XQueryDateTimeParts& parts);

// An xs:date. The day must be one of the calendar.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDate(
    std::chrono::year_month_day day, std::optional<std::chrono::minutes> zone = std::nullopt);

// An xs:time, so long after midnight; less than a day.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeTime(
    std::chrono::nanoseconds sinceMidnight, std::optional<std::chrono::minutes> zone = {});

// The xs:dateTime of an instant, as the clocks of a zone show it; Greenwich without being told.
// From year -2,147,483,648 to 2,147,483,647.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDateTimeOf(
    std::chrono::sys_seconds second, std::chrono::nanoseconds fraction, std::chrono::minutes zone);
template <class Duration>
[[nodiscard]] XQueryResult<Value> XQueryMakeDateTime(std::chrono::sys_time<Duration> instant,
                                                     std::chrono::minutes zone = {}) {
  const auto second = std::chrono::floor<std::chrono::seconds>(instant);
  return XQueryMakeDateTimeOf(
      second, std::chrono::duration_cast<std::chrono::nanoseconds>(instant - second), zone);
}

// An xs:duration. Seconds must be finite.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDuration(
    const XQueryDurationParts& parts);
// std::chrono::years are taken as well.
[[nodiscard]] XQUERY_EXPORT Value XQueryMakeYearMonthDuration(std::chrono::months months);
// Any duration of std::chrono is taken. Kept with the precision of a double, which is below a
// nanosecond up to a hundred days; must be finite.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeDayTimeDuration(
    std::chrono::duration<double> seconds);

// A value of any atomic type but xs:QName (which takes a namespace as well) and the three lists,
// IDREFS, ENTITIES and NMTOKENS (which are no values of the language), from its lexical form. White
// space around it is taken away, or made blanks, as XML Schema says of the type. Of a fraction of a
// second the first nine digits count. Beside the forms of XML Schema the year 0000 and the form
// "--05--" of a month are taken, since the language prints them. An anyURI must be one of RFC 3986.
// An NMTOKEN is made of the characters of an NCName, as the language has it: "a:b", which XML
// Schema allows, is refused. "NOTATION" takes a lexical QName.
//
//   XQueryMakeFromText(XQueryItemType::Byte, "-128")
//   XQueryMakeFromText(XQueryItemType::DateTime, "2026-11-23T09:05:00.25+01:00")
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeFromText(XQueryItemType type,
                                                                   std::string_view text);

// The items of all of these, in their order, as one value; values that are sequences themselves
// give their items. Error 6 "there is no value" where one is null.
[[nodiscard]] XQUERY_EXPORT XQueryResult<Value> XQueryMakeSequence(
    const std::vector<Value>& values);

// --- readers -------------------------------------------------------------------------------------

// Of any integer type.
[[nodiscard]] XQUERY_EXPORT XQueryResult<int64_t> XQueryReadInteger(const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<uint64_t> XQueryReadUnsignedInteger(const Value& value);
// The digits of an xs:decimal or of any integer type: no exponent, no zeros at the end of a
// fraction.
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::string> XQueryReadDecimal(const Value& value);
// Of any numeric type: of a decimal the double nearest to it.
[[nodiscard]] XQUERY_EXPORT XQueryResult<double> XQueryReadDouble(const Value& value);
// Of xs:float, and NaN and the infinities.
[[nodiscard]] XQUERY_EXPORT XQueryResult<float> XQueryReadFloat(const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<bool> XQueryReadBoolean(const Value& value);
// The text of a string type, of xdt:untypedAtomic or xs:anyURI. (XQueryItemStringValue gives the
// string value of any item.)
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::string> XQueryReadString(const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::string> XQueryReadAnyURI(const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<XQueryQNameParts> XQueryReadQName(const Value& value);
// The bytes of either binary type, and of raw data.
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::string> XQueryReadBinary(const Value& value);

// What is written of any of the eight types of dates and times.
[[nodiscard]] XQUERY_EXPORT XQueryResult<XQueryDateTimeParts> XQueryReadDateTimeParts(
    const Value& value);
// The day of an xs:date, whatever its zone. Years beyond those of std::chrono are out of range.
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::chrono::year_month_day> XQueryReadDate(
    const Value& value);
// Since midnight, of an xs:time, whatever its zone.
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::chrono::nanoseconds> XQueryReadTime(
    const Value& value);
// The instant of an xs:dateTime; without a zone that is one of the process's own zone. Years before
// 1678 and after 2261 are out of range.
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::chrono::sys_time<std::chrono::nanoseconds>>
XQueryReadDateTime(const Value& value);

// Of an xs:duration, and of the two others those that they have. Their months and days are out of
// range beyond 32 bits.
[[nodiscard]] XQUERY_EXPORT XQueryResult<XQueryDurationParts> XQueryReadDuration(
    const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::chrono::months> XQueryReadYearMonthDuration(
    const Value& value);
[[nodiscard]] XQUERY_EXPORT XQueryResult<std::chrono::duration<double>> XQueryReadDayTimeDuration(
    const Value& value);

// --- sequences -----------------------------------------------------------------------------------

// The items of a value, whichever of the four shapes it has; of a null value none. Keeps the value,
// and with it the items, alive. Iterators are good as long as the range stays where it is.
//
//   const XQueryItemRange items(result);
//   for (const Value& item : items) use(*item);
class XQUERY_EXPORT XQueryItemRange {
 public:
  using value_type = Value;
  using const_iterator = const Value*;
  using iterator = const_iterator;

  XQueryItemRange() = default;
  XQueryItemRange(Value value) : _value(std::move(value)) {}
  template <class Object>
  XQueryItemRange(Ref<Object> value) : _value(std::move(value)) {}

  const Value* begin() const {
    const NSArray* array = dyn_cast<NSArray>(_value);
    return array ? array->objects().data() : &_value;
  }
  const Value* end() const { return begin() + count(); }
  size_t count() const {
    if (!_value || isa<NSNull>(_value)) return 0;
    const NSArray* array = dyn_cast<NSArray>(_value);
    return array ? array->count() : 1;
  }
  size_t size() const { return count(); }
  bool isEmpty() const { return count() == 0; }
  bool empty() const { return isEmpty(); }
  // Null at and past the end.
  Value at(size_t index) const { return index < count() ? begin()[index] : nullptr; }
  const Value& operator[](size_t index) const { return begin()[index]; }  // index below the count

  const Value& value() const { return _value; }

 private:
  Value _value;
};

}  // namespace xquery
