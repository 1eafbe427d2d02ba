#include "Types/XQueryDateArithmetic.h"

#include "Platform/Dates/GregorianCalendar.h"
#include "Types/TypesContext.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "xquery/Collection.h"
#include "xquery/XQuery.h"

#include <cmath>
#include <limits>
#include <optional>

namespace xquery {

namespace {

const XQueryDate& dateIn(const Value& value) {
  return *cast<XQueryDate>(value);
}

const NSNumber& numberIn(const Value& value) {
  return *cast<NSNumber>(value);
}

// --- months --------------------------------------------------------------------------------------

// False when the year does not fit 32 bits.
bool addMonths(NSGregorianDate& date, int64_t months) {
  int64_t year = int64_t{date.year} + months / 12;
  int64_t month = date.month + months % 12;
  if (month > 12) {
    month -= 12;
    ++year;
  } else if (month <= 0) {
    month += 12;
    --year;
  }
  if (year < std::numeric_limits<int32_t>::min() || year > std::numeric_limits<int32_t>::max()) {
    return false;
  }
  date.year = static_cast<int32_t>(year);
  date.month = static_cast<int8_t>(month);
  const int lastDay = daysInMonth(year, date.month);
  if (date.day > lastDay) date.day = static_cast<int8_t>(lastDay);
  return true;
}

Value datePlusMonths(const XQueryDate& date, int64_t months, XQueryTypeID type) {
  NSGregorianDate fields = date.gregorianDate();
  if (!addMonths(fields, months)) return nullptr;
  return XQueryDate::xqueryDateWithGregorianDate(fields, date.timeZone(), type);
}

int64_t monthsIn(const Value& duration) {
  return numberIn(duration).integerValue();
}

// What the least number of months has no counterpart for lies far beyond the years.
int64_t negated(int64_t months) {
  return months == std::numeric_limits<int64_t>::min() ? std::numeric_limits<int64_t>::max()
                                                       : -months;
}

// --- seconds -------------------------------------------------------------------------------------

Value dateTimePlusSeconds(const XQueryDate& dateTime, double seconds) {
  std::optional<NSInstant> sum = dateTime.instant().adding(seconds);
  if (!sum) return nullptr;
  const NSTimeZone& zone = dateTime.clockZone();
  const bool savedBefore = zone.isDaylightSavingTime(dateTime.instant());
  const bool savesAfter = zone.isDaylightSavingTime(*sum);
  if (savedBefore != savesAfter) sum = sum->adding(savedBefore ? 3600 : -3600);
  if (!sum) return nullptr;
  return XQueryDate::xqueryDateWithInstant(*sum, dateTime.timeZone(), XQueryTypeDateTime);
}

// The value's zone as it is at the value's instant. A sum is read with it: a day is 24 hours on the
// calendar, also where daylight saving time begins or ends on it.
Ref<NSTimeZone> steadyZone(const XQueryDate& date) {
  const int32_t offset = date.clockZone().secondsFromGMT(date.instant());
  return NSTimeZone::timeZoneForSecondsFromGMT(offset);
}

// The sum keeps only the fields of a date.
Value datePlusSeconds(const XQueryDate& date, double seconds) {
  const std::optional<NSInstant> sum = date.instant().adding(seconds);
  if (!sum) return nullptr;
  const NSGregorianDate fields = NSGregorianDateForInstant(*sum, *steadyZone(date));
  return XQueryDate::xqueryDateWithGregorianDate(xqueryFieldsForType(fields, XQueryTypeDate),
                                                 date.timeZone(), XQueryTypeDate);
}

// Goes round the clock. Without a zone the fields are counted as if they were in GMT, so that the
// zone of the process, in which such a value has its instant, does not show.
Value timePlusSeconds(const XQueryDate& time, double seconds) {
  const Ref<NSTimeZone> zone =
      time.timeZone() ? steadyZone(time) : Ref<NSTimeZone>(NSTimeZone::GMT());
  const NSInstant start = NSInstantForGregorianDate(time.gregorianDate(), *zone);
  const std::optional<NSInstant> sum = start.adding(seconds);
  if (!sum) return nullptr;
  const NSGregorianDate fields =
      xqueryFieldsForType(NSGregorianDateForInstant(*sum, *zone), XQueryTypeTime);
  return XQueryDate::xqueryDateWithGregorianDate(fields, time.timeZoneForFields(fields),
                                                 XQueryTypeTime);
}

double secondsIn(const Value& duration) {
  return numberIn(duration).doubleValue();
}

Value secondsIfFinite(double seconds) {
  if (!std::isfinite(seconds)) return nullptr;
  return XQueryNumber::dayTimeDurationWithSeconds(seconds);
}

// --- scaling -------------------------------------------------------------------------------------

void raiseIfSpecial(const Value& number, XQueryContext& context) {
  const NSNumber::Storage storage = numberIn(number).storage();
  const bool isSpecial = storage == NSNumber::Storage::Decimal
                             ? numberIn(number).storedDecimal()->isNaN()
                             : !std::isfinite(numberIn(number).doubleValue());
  if (!isSpecial) return;
  XQueryRaise(context, XQueryErrors::invalidOperand.error());
}

// Null when the months do not fit 64 bits.
Value roundedMonths(const NSDecimal& months) {
  const NSDecimal rounded = months.rounded(0, NSRoundingMode::HalfUp);
  if (!rounded.isSmallInteger()) return nullptr;
  return XQueryNumber::yearMonthDurationWithMonths(rounded.smallInteger());
}

}  // namespace

// --- dates and durations -------------------------------------------------------------------------

Value op_add_yearMonthDuration_to_dateTime(const Value& dateTime, const Value& duration,
                                           XQueryContext&) {
  return datePlusMonths(dateIn(dateTime), monthsIn(duration), XQueryTypeDateTime);
}

Value op_add_yearMonthDuration_to_date(const Value& date, const Value& duration, XQueryContext&) {
  return datePlusMonths(dateIn(date), monthsIn(duration), XQueryTypeDate);
}

Value op_add_dayTimeDuration_to_dateTime(const Value& dateTime, const Value& duration,
                                         XQueryContext&) {
  return dateTimePlusSeconds(dateIn(dateTime), secondsIn(duration));
}

Value op_add_dayTimeDuration_to_date(const Value& date, const Value& duration, XQueryContext&) {
  return datePlusSeconds(dateIn(date), secondsIn(duration));
}

Value op_add_dayTimeDuration_to_time(const Value& time, const Value& duration, XQueryContext&) {
  return timePlusSeconds(dateIn(time), secondsIn(duration));
}

Value op_subtract_yearMonthDuration_from_dateTime(const Value& dateTime, const Value& duration,
                                                  XQueryContext&) {
  return datePlusMonths(dateIn(dateTime), negated(monthsIn(duration)), XQueryTypeDateTime);
}

Value op_subtract_yearMonthDuration_from_date(const Value& date, const Value& duration,
                                              XQueryContext&) {
  return datePlusMonths(dateIn(date), negated(monthsIn(duration)), XQueryTypeDate);
}

Value op_subtract_dayTimeDuration_from_dateTime(const Value& dateTime, const Value& duration,
                                                XQueryContext&) {
  return dateTimePlusSeconds(dateIn(dateTime), -secondsIn(duration));
}

Value op_subtract_dayTimeDuration_from_date(const Value& date, const Value& duration,
                                            XQueryContext&) {
  return datePlusSeconds(dateIn(date), -secondsIn(duration));
}

Value op_subtract_dayTimeDuration_from_time(const Value& time, const Value& duration,
                                            XQueryContext&) {
  return timePlusSeconds(dateIn(time), -secondsIn(duration));
}

Value op_subtract_dates(const Value& a, const Value& b, XQueryContext&) {
  return XQueryNumber::dayTimeDurationWithSeconds(
      dateIn(a).instant().secondsSince(dateIn(b).instant()));
}

// --- durations -----------------------------------------------------------------------------------

Value op_add_yearMonthDurations(const Value& a, const Value& b, XQueryContext&) {
  int64_t sum = 0;
  if (__builtin_add_overflow(monthsIn(a), monthsIn(b), &sum)) return nullptr;
  return XQueryNumber::yearMonthDurationWithMonths(sum);
}

Value op_subtract_yearMonthDurations(const Value& a, const Value& b, XQueryContext&) {
  int64_t difference = 0;
  if (__builtin_sub_overflow(monthsIn(a), monthsIn(b), &difference)) return nullptr;
  return XQueryNumber::yearMonthDurationWithMonths(difference);
}

Value op_add_dayTimeDurations(const Value& a, const Value& b, XQueryContext&) {
  return secondsIfFinite(secondsIn(a) + secondsIn(b));
}

Value op_subtract_dayTimeDurations(const Value& a, const Value& b, XQueryContext&) {
  return secondsIfFinite(secondsIn(a) - secondsIn(b));
}

Value op_multiply_yearMonthDuration(const Value& duration, const Value& number,
                                    XQueryContext& context) {
  raiseIfSpecial(number, context);
  return roundedMonths(NSDecimal(monthsIn(duration)).multiply(numberIn(number).decimalValue()));
}

Value op_multiply_dayTimeDuration(const Value& duration, const Value& number,
                                  XQueryContext& context) {
  raiseIfSpecial(number, context);
  const double factor = numberIn(number).doubleValue();
  return secondsIfFinite(factor == 0 ? 0 : secondsIn(duration) * factor);
}

Value op_divide_yearMonthDuration(const Value& duration, const Value& number,
                                  XQueryContext& context) {
  raiseIfSpecial(number, context);
  return roundedMonths(NSDecimal(monthsIn(duration)).divide(numberIn(number).decimalValue()));
}

Value op_divide_dayTimeDuration(const Value& duration, const Value& number,
                                XQueryContext& context) {
  raiseIfSpecial(number, context);
  return secondsIfFinite(secondsIn(duration) / numberIn(number).doubleValue());
}

Value op_divide_durations(const Value& a, const Value& b, XQueryContext&) {
  return XQueryNumber::numberWithDecimal(
      numberIn(a).decimalValue().divide(numberIn(b).decimalValue()));
}

// --- zones ---------------------------------------------------------------------------------------

namespace {

// Null for an offset that is no number of seconds in 32 bits.
Ref<NSTimeZone> zoneForDuration(const Value& duration) {
  const double seconds = std::trunc(secondsIn(duration));
  if (!(std::fabs(seconds) <= std::numeric_limits<int32_t>::max())) return nullptr;
  return NSTimeZone::timeZoneForSecondsFromGMT(static_cast<int32_t>(seconds));
}

bool isEmptySequence(const Value& value) {
  const auto* array = dyn_cast<NSArray>(value);
  return isa<NSNull>(value) || (array && array->count() == 0);
}

// The fields as printed, with a suffix, read again.
Value readAgain(const XQueryDate& date, const std::string& suffix, XQueryContext& context) {
  const Ref<NSString> fields = date.localizedStringForTimeZone(nullptr);
  return XQueryCastAs(NSString::stringWithASCII(fields->utf8() + suffix), date.typeID(), context);
}

}  // namespace

Value adjust_dateTime_to_timezone(const Value* arguments, size_t count, XQueryContext& context,
                                  XQueryTypeID type) {
  if (count != 1 && count != 2) return nullptr;
  if (isEmptySequence(arguments[0])) return NSNull::null();
  const Value value = XQueryCastAsTypeForContext(arguments[0], type, context);
  // A cast that fails without raising answers an error record, which travels on.
  if (!isa<XQueryDate>(value)) return value;
  const XQueryDate& date = dateIn(value);
  Value offset = XQueryNumber::implicitTimeZone();
  if (count == 2) {
    if (isEmptySequence(arguments[1])) return readAgain(date, "", context);
    offset = XQueryCastAsTypeForContext(arguments[1], XQueryTypeDayTimeDuration, context);
    if (!isa<NSNumber>(offset)) return offset;
  }
  const Ref<NSTimeZone> zone = zoneForDuration(offset);
  if (!zone) return nullptr;
  if (date.timeZone()) return XQueryDate::xqueryDateWithInstant(date.instant(), zone, type);
  const int32_t seconds = zone->secondsFromGMT(date.instant());
  return readAgain(date, XQueryDate::suffixForSecondsFromGMT(seconds), context);
}

}  // namespace xquery
