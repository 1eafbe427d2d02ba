#include "Functions/Date.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryDateArithmetic.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

// Of a value with a zone.
int32_t offsetOf(const XQueryDate& date) {
  return date.timeZone()->secondsFromGMT(date.instant());
}

Value timezoneOf(const XQueryDate& date) {
  if (!date.timeZone()) return NSNull::null();
  return XQueryNumber::dayTimeDurationWithSeconds(offsetOf(date));
}

Value fieldOf(const XQueryDate& date, XQueryDateField field) {
  if (field == XQueryDateField::Timezone) return timezoneOf(date);
  const NSGregorianDate fields = date.gregorianDate();
  switch (field) {
    case XQueryDateField::Year:
      return XQueryNumber::integerWithInt64(fields.year);
    case XQueryDateField::Month:
      return XQueryNumber::integerWithInt64(fields.month);
    case XQueryDateField::Day:
      return XQueryNumber::integerWithInt64(fields.day);
    case XQueryDateField::Hours:
      return XQueryNumber::integerWithInt64(fields.hour);
    case XQueryDateField::Minutes:
      return XQueryNumber::integerWithInt64(fields.minute);
    default:
      return XQueryNumber::numberWithDecimal(NSDecimal::fromDouble(fields.second));
  }
}

// Two arguments cast to a type each. When a cast answers an error record, as that of a URI does,
// the record.
struct DatePair {
  Value failure;
  Value first;
  Value second;

  DatePair(const Value* arguments, XQueryTypeID firstType, XQueryTypeID secondType,
           XQueryContext& context)
      : first(XQueryCastAsTypeForContext(arguments[0], firstType, context)),
        second(XQueryCastAsTypeForContext(arguments[1], secondType, context)) {
    if (!isa<XQueryDate>(second)) failure = second;
    if (!isa<XQueryDate>(first)) failure = first;
  }
};

}  // namespace

Value XQueryDateComponent(XQueryTypeID type, XQueryDateField field, const Value* arguments,
                          size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const Value value = XQueryCastAsTypeForContext(arguments[0], type, context);
  // The failed cast of a URI travels on.
  const auto* date = dyn_cast<XQueryDate>(value);
  return date ? fieldOf(*date, field) : value;
}

Value XQueryDateDifference(XQueryTypeID type, const Value* arguments, size_t count,
                           XQueryContext& context) {
  if (count != 2) return Value();
  const DatePair dates(arguments, type, type, context);
  return dates.failure ? dates.failure : op_subtract_dates(dates.first, dates.second, context);
}

Value XQueryDateOfPresent(XQueryTypeID type, size_t count, XQueryContext& context) {
  if (count != 0) return Value();
  return XQueryDate::xqueryDateWithInstant(_internal(context).currentDateTime()->instant(),
                                           NSTimeZone::localTimeZone(), type);
}

Value fn_dateTime(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 2) return Value();
  const DatePair pair(arguments, XQueryTypeDate, XQueryTypeTime, context);
  if (pair.failure) return pair.failure;
  const XQueryDate& date = *cast<XQueryDate>(pair.first);
  const XQueryDate& time = *cast<XQueryDate>(pair.second);
  if (date.timeZone() && time.timeZone() && offsetOf(date) != offsetOf(time)) return Value();
  NSGregorianDate fields = date.gregorianDate();
  const NSGregorianDate clock = time.gregorianDate();
  fields.hour = clock.hour;
  fields.minute = clock.minute;
  fields.second = clock.second;
  const XQueryDate& zoned = date.timeZone() ? date : time;
  return XQueryDate::xqueryDateWithGregorianDate(fields, zoned.timeZoneForFields(fields),
                                                 XQueryTypeDateTime);
}

}  // namespace xquery
