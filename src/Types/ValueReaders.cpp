// Readers of values for hosts: what the engine keeps, as C++ has it.
#include "Platform/Dates/GregorianCalendar.h"
#include "Types/XQueryBinary.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDuration.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryQName.h"
#include "Types/XQueryString.h"
#include "Types/XQueryValueErrors.h"
#include "xquery/Data.h"
#include "xquery/URL.h"
#include "xquery/Values.h"
#include "xquery/XQuery.h"

#include <cmath>
#include <limits>

namespace xquery {

namespace {

using Type = XQueryItemType;

// The one item of a value, with its type; or why there is none.
struct OneItem {
  explicit OneItem(const Value& value) {
    if (!value) {
      error = XQueryErrors::noValue.error();
      return;
    }
    item = value.get();
    if (const NSArray* array = dyn_cast<NSArray>(value)) {
      if (array->count() > 1) {
        error = XQueryErrors::severalItems.error(static_cast<int64_t>(array->count()));
        return;
      }
      item = array->objectAtIndex(0);
    }
    if (!item || isa<NSNull>(item)) {
      error = XQueryErrors::emptySequence.error();
      return;
    }
    type = XQueryTypeOfItem(*item);
  }

  Ref<XQueryError> otherThan(std::string_view wanted) const {
    if (error) return error;
    return XQueryErrors::itemOfAnotherType.error(XQueryNameOfType(type), wanted);
  }
  Ref<XQueryError> outOfRange(std::string_view range) const {
    return XQueryErrors::outOfTheRange.error(XQueryShownText(XQueryItemStringValue(*item)), range);
  }

  const NSObject* item = nullptr;
  Type type = Type::None;
  Ref<XQueryError> error;
};

bool isDecimal(Type type) {
  return type == Type::Decimal || XQueryIsIntegerType(type);
}

constexpr std::string_view range64 = "64 bits";
constexpr std::string_view range32 = "32 bits";

}  // namespace

// --- numbers -------------------------------------------------------------------------------------

XQueryResult<int64_t> XQueryReadInteger(const Value& value) {
  const OneItem one(value);
  if (!XQueryIsIntegerType(one.type)) return one.otherThan("an integer");
  const NSDecimal number = cast<NSNumber>(one.item)->decimalValue();
  const int64_t read = number.int64Value();
  if (number.compare(NSDecimal(read)) != 0) return one.outOfRange(range64);
  return read;
}

XQueryResult<uint64_t> XQueryReadUnsignedInteger(const Value& value) {
  const OneItem one(value);
  if (!XQueryIsIntegerType(one.type)) return one.otherThan("an integer");
  const NSDecimal number = cast<NSNumber>(one.item)->decimalValue();
  const uint64_t read = number.uint64Value();
  if (number.compare(NSDecimal::fromUnsigned(read)) != 0) return one.outOfRange("unsigned 64 bits");
  return read;
}

XQueryResult<std::string> XQueryReadDecimal(const Value& value) {
  const OneItem one(value);
  if (!isDecimal(one.type)) return one.otherThan("a decimal");
  return cast<NSNumber>(one.item)->stringValue();
}

XQueryResult<double> XQueryReadDouble(const Value& value) {
  const OneItem one(value);
  const bool isNumber = isDecimal(one.type) || one.type == Type::Double || one.type == Type::Float;
  if (!isNumber) return one.otherThan("a number");
  return cast<NSNumber>(one.item)->doubleValue();
}

XQueryResult<float> XQueryReadFloat(const Value& value) {
  const OneItem one(value);
  const NSNumber* number = dyn_cast<NSNumber>(one.item);
  const bool isSpecial = one.type == Type::Double && !std::isfinite(number->doubleValue());
  if (one.type != Type::Float && !isSpecial) return one.otherThan("a float");
  return number->floatValue();
}

XQueryResult<bool> XQueryReadBoolean(const Value& value) {
  const OneItem one(value);
  if (one.type != Type::Boolean) return one.otherThan("a boolean");
  return cast<NSNumber>(one.item)->boolValue();
}

// --- text ----------------------------------------------------------------------------------------

XQueryResult<std::string> XQueryReadString(const Value& value) {
  const OneItem one(value);
  if (one.type == Type::AnyURI) return XQueryReadAnyURI(value);
  const bool isText = one.type == Type::UntypedAtomic || XQueryIsStringType(one.type);
  if (!isText) return one.otherThan("a string");
  return XQueryItemStringValue(*one.item);
}

XQueryResult<std::string> XQueryReadAnyURI(const Value& value) {
  const OneItem one(value);
  if (one.type != Type::AnyURI) return one.otherThan("a URI");
  return cast<NSURL>(one.item)->absoluteString()->utf8();
}

XQueryResult<XQueryQNameParts> XQueryReadQName(const Value& value) {
  const OneItem one(value);
  if (one.type != Type::QName) return one.otherThan("a QName");
  const XQueryQName& name = *cast<XQueryQName>(one.item);
  const auto text = [](const Ref<NSString>& string) {
    return string ? string->utf8() : std::string();
  };
  return XQueryQNameParts{text(name.namespaceURI()), text(name.localPart()),
                          text(name.prefixHint())};
}

XQueryResult<std::string> XQueryReadBinary(const Value& value) {
  const OneItem one(value);
  if (const NSData* data = dyn_cast<NSData>(one.item)) return std::string(data->bytes());
  const XQueryBinary* binary = dyn_cast<XQueryBinary>(one.item);
  if (!binary) return one.otherThan("a binary");
  return std::string(binary->data()->bytes());
}

// --- dates and times -----------------------------------------------------------------------------

namespace {

// The fields that the type has.
XQueryDateTimeParts partsOf(const XQueryDate& date) {
  const int units = xqueryUnitsOfType(date.typeID());
  const NSGregorianDate fields = date.gregorianDate();
  XQueryDateTimeParts parts;
  if (units & NSGregorianYear) parts.year = fields.year;
  if (units & NSGregorianMonth) parts.month = fields.month;
  if (units & NSGregorianDay) parts.day = fields.day;
  if (units & NSGregorianTime) {
    parts.hour = fields.hour;
    parts.minute = fields.minute;
    parts.second = static_cast<int>(fields.second);
    parts.nanosecond = date.instant().nanoseconds;
  }
  if (const Ref<NSTimeZone>& zone = date.timeZone()) {
    parts.zone = std::chrono::minutes(zone->secondsFromGMT(date.instant()) / 60);
  }
  return parts;
}

}  // namespace

XQueryResult<XQueryDateTimeParts> XQueryReadDateTimeParts(const Value& value) {
  const OneItem one(value);
  if (!XQueryIsDateType(one.type)) return one.otherThan("a date or time");
  return partsOf(*cast<XQueryDate>(one.item));
}

XQueryResult<std::chrono::year_month_day> XQueryReadDate(const Value& value) {
  using namespace std::chrono;
  const OneItem one(value);
  if (one.type != Type::Date) return one.otherThan("a date");
  const XQueryDateTimeParts parts = partsOf(*cast<XQueryDate>(one.item));
  if (parts.year < static_cast<int>(year::min()) || parts.year > static_cast<int>(year::max())) {
    return one.outOfRange("std::chrono::year");
  }
  return year_month_day(year(parts.year), month(static_cast<unsigned>(parts.month)),
                        day(static_cast<unsigned>(parts.day)));
}

XQueryResult<std::chrono::nanoseconds> XQueryReadTime(const Value& value) {
  using namespace std::chrono;
  const OneItem one(value);
  if (one.type != Type::Time) return one.otherThan("a time");
  const XQueryDateTimeParts parts = partsOf(*cast<XQueryDate>(one.item));
  return hours(parts.hour) + minutes(parts.minute) + seconds(parts.second) +
         nanoseconds(parts.nanosecond);
}

XQueryResult<std::chrono::sys_time<std::chrono::nanoseconds>> XQueryReadDateTime(
    const Value& value) {
  using namespace std::chrono;
  const OneItem one(value);
  if (one.type != Type::DateTime) return one.otherThan("a dateTime");
  const NSInstant& instant = cast<XQueryDate>(one.item)->instant();
  constexpr int64_t epoch = dayNumber(1970, 1, 1) * secondsPerDay;
  int64_t second = instant.seconds - epoch;
  int64_t fraction = instant.nanoseconds;
  if (second < 0 && fraction > 0) {  // of one sign, so that no step overflows but the result does
    ++second;
    fraction -= 1'000'000'000;
  }
  int64_t total = 0;
  if (__builtin_mul_overflow(second, int64_t{1'000'000'000}, &total) ||
      __builtin_add_overflow(total, fraction, &total)) {
    return one.outOfRange("64 bits of nanoseconds");
  }
  return sys_time<nanoseconds>(nanoseconds(total));
}

// --- durations -----------------------------------------------------------------------------------

namespace {

XQueryResult<XQueryDurationParts> partsOfMonths(const OneItem& one) {
  const int64_t months = cast<NSNumber>(one.item)->longLongValue();
  XQueryDurationParts parts;
  parts.isNegative = months < 0;
  const int64_t years = std::abs(months / 12);
  if (years > std::numeric_limits<int32_t>::max()) return one.outOfRange(range32);
  parts.years = static_cast<int32_t>(years);
  parts.months = static_cast<int32_t>(std::abs(months % 12));
  return parts;
}

XQueryResult<XQueryDurationParts> partsOfSeconds(const OneItem& one) {
  const double seconds = cast<NSNumber>(one.item)->doubleValue();
  const double magnitude = std::fabs(seconds);
  const double days = std::floor(magnitude / secondsPerDay);
  if (!(days <= std::numeric_limits<int32_t>::max())) return one.outOfRange(range32);
  const double rest = std::fmod(magnitude, secondsPerDay);
  XQueryDurationParts parts;
  parts.isNegative = seconds < 0;
  parts.days = static_cast<int32_t>(days);
  parts.hours = static_cast<int32_t>(rest / 3600);
  parts.minutes = static_cast<int32_t>(std::fmod(rest, 3600) / 60);
  parts.seconds = std::fmod(rest, 60);
  return parts;
}

}  // namespace

XQueryResult<XQueryDurationParts> XQueryReadDuration(const Value& value) {
  const OneItem one(value);
  if (one.type == Type::YearMonthDuration) return partsOfMonths(one);
  if (one.type == Type::DayTimeDuration) return partsOfSeconds(one);
  if (one.type != Type::Duration) return one.otherThan("a duration");
  const XQueryDuration& duration = *cast<XQueryDuration>(one.item);
  return XQueryDurationParts{duration.isNeg(), duration.year(),   duration.month(), duration.day(),
                             duration.hour(),  duration.minute(), duration.second()};
}

XQueryResult<std::chrono::months> XQueryReadYearMonthDuration(const Value& value) {
  const OneItem one(value);
  if (one.type != Type::YearMonthDuration) return one.otherThan("a yearMonthDuration");
  return std::chrono::months(cast<NSNumber>(one.item)->longLongValue());
}

XQueryResult<std::chrono::duration<double>> XQueryReadDayTimeDuration(const Value& value) {
  const OneItem one(value);
  if (one.type != Type::DayTimeDuration) return one.otherThan("a dayTimeDuration");
  return std::chrono::duration<double>(cast<NSNumber>(one.item)->doubleValue());
}

}  // namespace xquery
