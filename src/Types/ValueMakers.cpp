// Makers of values for hosts: what C++ has, as the engine keeps it.
#include "Platform/Dates/GregorianCalendar.h"
#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Text/UTF8.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValueErrors.h"
#include "Types/XQueryValueText.h"
#include "xquery/URL.h"
#include "xquery/Values.h"

#include <cmath>
#include <cstdio>

namespace xquery {

// --- text ----------------------------------------------------------------------------------------

Ref<XQueryError> XQueryTextError(std::string_view text) {
  const auto* at = reinterpret_cast<const unsigned char*>(text.data());
  const unsigned char* const end = at + text.size();
  while (at < end) {
    if (*at >= 0x20 && *at < 0x7F) {
      ++at;
      continue;
    }
    const char32_t point = readUTF8(at, end);
    if (point == invalidCodePoint) return XQueryErrors::textNotUTF8.error();
    if (isXMLCharacter(point)) continue;
    char digits[16];
    std::snprintf(digits, sizeof digits, "%04X", static_cast<unsigned>(point));
    return XQueryErrors::notACharacterOfXML.error(digits);
  }
  return nullptr;
}

XQueryResult<Value> XQueryMakeString(std::string_view text) {
  if (auto error = XQueryTextError(text)) return error;
  return XQueryString::stringWithString(*NSString::stringWithUTF8(text));
}

XQueryResult<Value> XQueryMakeUntypedAtomic(std::string_view text) {
  if (auto error = XQueryTextError(text)) return error;
  return NSString::stringWithUTF8(text);
}

XQueryResult<Value> XQueryMakeAnyURI(std::string_view text) {
  if (auto error = XQueryTextError(text)) return error;
  if (auto URL = NSURL::URLWithString(NSString::stringWithUTF8(text))) return URL;
  return XQueryErrors::notOfTheForm.error(XQueryShownText(text), "xs:anyURI");
}

XQueryResult<Value> XQueryMakeQName(const XQueryQNameParts& name) {
  const auto isNCName = [](std::string_view text) {
    const XMLNameShape shape = shapeOfXMLName(text);
    return shape.isName && shape.colon == 0;
  };
  for (const std::string* text : {&name.namespaceURI, &name.localName, &name.prefix}) {
    if (auto error = XQueryTextError(*text)) return error;
  }
  for (const std::string* text : {&name.localName, &name.prefix}) {
    if (isNCName(*text) || (text == &name.prefix && text->empty())) continue;
    return XQueryErrors::notOfTheForm.error(XQueryShownText(*text), "xs:NCName");
  }
  const auto string = [](const std::string& text) { return NSString::stringWithUTF8(text); };
  const auto URI = name.namespaceURI.empty() ? nullptr : string(name.namespaceURI);
  if (name.prefix.empty()) return XQueryQName::qnameWithLocalPart(string(name.localName), URI);
  return XQueryQName::qname(string(name.prefix + ":" + name.localName), URI);
}

// --- numbers -------------------------------------------------------------------------------------

Value XQueryMakeSignedInteger(int64_t value) {
  return XQueryNumber::integerWithInt64(value);
}

Value XQueryMakeUnsignedInteger(uint64_t value) {
  return XQueryNumber::integerWithDecimal(NSDecimal::fromUnsigned(value));
}

XQueryResult<Value> XQueryMakeDecimal(std::string_view digits) {
  return XQueryMakeFromText(XQueryItemType::Decimal, digits);
}

Value XQueryMakeDouble(double value) {
  return XQueryNumber::numberWithDouble(value);
}

// The shared special values are never retyped.
Value XQueryMakeFloat(float value) {
  Ref<XQueryNumber> number = XQueryNumber::numberWithFloat(value);
  if (!XQueryNumber::isSpecial(number.get())) number->setType(XQueryTypeFloat);
  return number;
}

Value XQueryMakeBoolean(bool value) {
  return NSNumber::numberWithBool(value);
}

// --- binaries ------------------------------------------------------------------------------------

Value XQueryMakeHexBinary(std::string_view bytes) {
  return XQueryHexBinary::binaryWithData(NSData::dataWithBytes(std::string(bytes)));
}

Value XQueryMakeBase64Binary(std::string_view bytes) {
  return XQueryBase64Binary::binaryWithData(NSData::dataWithBytes(std::string(bytes)));
}

// --- dates and times -----------------------------------------------------------------------------

namespace {

constexpr std::chrono::minutes widestZone = std::chrono::hours(14);

// A field that is to be in a range, where the type has it.
struct FieldCheck {
  std::string_view name;
  bool isAsked;
  int64_t value, first, last;
};

Ref<XQueryError> fieldError(XQueryItemType type, const XQueryDateTimeParts& parts) {
  const int units = xqueryUnitsOfType(static_cast<XQueryTypeID>(type));
  const bool hasMonth = (units & NSGregorianMonth) != 0;
  const bool hasDay = (units & NSGregorianDay) != 0;
  const bool hasTime = (units & NSGregorianTime) != 0;
  const int year = units & NSGregorianYear ? parts.year : 0;
  const bool monthFits = parts.month >= 1 && parts.month <= 12;
  const int lastDay = hasMonth && monthFits ? daysInMonth(year, parts.month) : 31;
  const int64_t zone = parts.zone ? parts.zone->count() : 0;
  const FieldCheck checks[] = {
      {"month", hasMonth, parts.month, 1, 12},
      {"day", hasDay, parts.day, 1, lastDay},
      {"hour", hasTime, parts.hour, 0, 23},
      {"minute", hasTime, parts.minute, 0, 59},
      {"second", hasTime, parts.second, 0, 59},
      {"nanosecond", hasTime, parts.nanosecond, 0, 999'999'999},
      {"zone of minutes", true, zone, -widestZone.count(), widestZone.count()},
  };
  for (const FieldCheck& check : checks) {
    if (!check.isAsked || (check.value >= check.first && check.value <= check.last)) continue;
    return XQueryErrors::fieldOutOfRange.error(check.name, check.value, XQueryNameOfType(type));
  }
  return nullptr;
}

}  // namespace

XQueryResult<Value> XQueryMakeDateOfType(XQueryItemType type, const XQueryDateTimeParts& parts) {
  if (!XQueryIsDateType(type)) return XQueryErrors::notADateType.error(XQueryNameOfType(type));
  if (auto error = fieldError(type, parts)) return error;
  NSGregorianDate date;
  date.year = parts.year;
  date.month = static_cast<int8_t>(parts.month);
  date.day = static_cast<int8_t>(parts.day);
  date.hour = static_cast<int8_t>(parts.hour);
  date.minute = static_cast<int8_t>(parts.minute);
  date.second = parts.second + parts.nanosecond / 1e9;
  Ref<NSTimeZone> zone;
  if (parts.zone) {
    const auto seconds = static_cast<int32_t>(std::chrono::seconds(*parts.zone).count());
    zone = seconds == 0 ? Ref<NSTimeZone>(XQueryDate::timeZoneGMT())
                        : NSTimeZone::timeZoneForSecondsFromGMT(seconds);
  }
  const auto typeID = static_cast<XQueryTypeID>(type);
  return XQueryDate::xqueryDateWithGregorianDate(xqueryFieldsForType(date, typeID), std::move(zone),
                                                 typeID);
}

XQueryResult<Value> XQueryMakeDate(std::chrono::year_month_day day,
                                   std::optional<std::chrono::minutes> zone) {
  XQueryDateTimeParts parts;
  parts.year = static_cast<int>(day.year());
  parts.month = static_cast<int>(static_cast<unsigned>(day.month()));
  parts.day = static_cast<int>(static_cast<unsigned>(day.day()));
  parts.zone = zone;
  return XQueryMakeDateOfType(XQueryItemType::Date, parts);
}

XQueryResult<Value> XQueryMakeTime(std::chrono::nanoseconds sinceMidnight,
                                   std::optional<std::chrono::minutes> zone) {
  using namespace std::chrono;
  if (sinceMidnight < nanoseconds(0) || sinceMidnight >= hours(24)) {
    return XQueryErrors::fieldOutOfRange.error("nanosecond", int64_t{sinceMidnight.count()},
                                               "xs:time");
  }
  const hh_mm_ss<nanoseconds> time(sinceMidnight);
  XQueryDateTimeParts parts;
  parts.hour = static_cast<int>(time.hours().count());
  parts.minute = static_cast<int>(time.minutes().count());
  parts.second = static_cast<int>(time.seconds().count());
  parts.nanosecond = static_cast<int>(time.subseconds().count());
  parts.zone = zone;
  return XQueryMakeDateOfType(XQueryItemType::Time, parts);
}

XQueryResult<Value> XQueryMakeDateTimeOf(std::chrono::sys_seconds second,
                                         std::chrono::nanoseconds fraction,
                                         std::chrono::minutes zone) {
  using namespace std::chrono;
  constexpr int64_t years = int64_t{1} << 31;
  // In seconds the years of 32 bits take 57.
  constexpr int64_t most = years * 366 * secondsPerDay;
  const int64_t given = second.time_since_epoch().count();
  const bool isNear = given > -most && given < most && zone >= -widestZone && zone <= widestZone;
  const int64_t clock = isNear ? given + seconds(zone).count() : 0;
  constexpr int64_t epoch = dayNumber(1970, 1, 1);
  const CalendarDay day = calendarDay(floorDivide(clock, secondsPerDay) + epoch);
  if (given <= -most || given >= most || day.year < -years || day.year >= years) {
    return XQueryErrors::outOfTheRange.error(std::to_string(given) + " seconds", "xs:dateTime");
  }
  if (fraction < nanoseconds(0) || fraction >= std::chrono::seconds(1)) {
    return XQueryErrors::fieldOutOfRange.error("nanosecond", int64_t{fraction.count()},
                                               "xs:dateTime");
  }
  const int64_t time = floorRemainder(clock, secondsPerDay);
  XQueryDateTimeParts parts;
  parts.year = static_cast<int32_t>(day.year);
  parts.month = day.month;
  parts.day = day.day;
  parts.hour = static_cast<int>(time / 3600);
  parts.minute = static_cast<int>(time / 60 % 60);
  parts.second = static_cast<int>(time % 60);
  parts.nanosecond = static_cast<int>(fraction.count());
  parts.zone = zone;
  return XQueryMakeDateOfType(XQueryItemType::DateTime, parts);
}

// --- durations -----------------------------------------------------------------------------------

namespace {

Ref<XQueryError> secondsError(double seconds, std::string_view type) {
  const std::string text = NSNumber::numberWithDouble(seconds)->stringValue();
  return XQueryErrors::fieldOutOfRange.error("seconds", text, type);
}

}  // namespace

XQueryResult<Value> XQueryMakeDuration(const XQueryDurationParts& parts) {
  const std::pair<std::string_view, int64_t> fields[] = {
      {"years", parts.years}, {"months", parts.months},   {"days", parts.days},
      {"hours", parts.hours}, {"minutes", parts.minutes},
  };
  for (const auto& [name, value] : fields) {
    if (value < 0) return XQueryErrors::fieldOutOfRange.error(name, value, "xs:duration");
  }
  if (!(parts.seconds >= 0) || std::isinf(parts.seconds)) {
    return secondsError(parts.seconds, "xs:duration");
  }
  return XQueryDuration::durationWithParts(parts);
}

Value XQueryMakeYearMonthDuration(std::chrono::months months) {
  return XQueryNumber::yearMonthDurationWithMonths(months.count());
}

XQueryResult<Value> XQueryMakeDayTimeDuration(std::chrono::duration<double> seconds) {
  if (std::isfinite(seconds.count())) {
    return XQueryNumber::dayTimeDurationWithSeconds(seconds.count());
  }
  return secondsError(seconds.count(), "xdt:dayTimeDuration");
}

// --- sequences -----------------------------------------------------------------------------------

XQueryResult<Value> XQueryMakeSequence(const std::vector<Value>& values) {
  std::vector<Value> items;
  for (const Value& value : values) {
    if (!value) return XQueryErrors::noValue.error();
    const XQueryItemRange range(value);
    items.insert(items.end(), range.begin(), range.end());
  }
  if (items.empty()) return NSNull::null();
  if (items.size() == 1) return items.front();
  return NSArray::arrayWithObjects(std::move(items));
}

}  // namespace xquery
