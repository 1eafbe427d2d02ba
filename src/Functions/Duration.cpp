#include "Functions/Duration.h"

#include "Expr/XQuerySequence.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

Value yearMonthField(XQueryDurationField field, int64_t months) {
  const bool years = field == XQueryDurationField::Years;
  return XQueryNumber::integerWithInt64(years ? months / 12 : months % 12);
}

// In decimal, so that the seconds of 61.1 seconds are 1.1.
Value dayTimeField(XQueryDurationField field, const NSDecimal& seconds) {
  const NSDecimal day(86400);
  const NSDecimal hour(3600);
  const NSDecimal minute(60);
  const auto whole = [](const NSDecimal& value, const NSDecimal& unit) {
    return XQueryNumber::integerWithDecimal(value.integerDivide(unit));
  };
  switch (field) {
    case XQueryDurationField::Days:
      return whole(seconds, day);
    case XQueryDurationField::Hours:
      return whole(seconds.remainder(day), hour);
    case XQueryDurationField::Minutes:
      return whole(seconds.remainder(hour), minute);
    default:
      return XQueryNumber::numberWithDecimal(seconds.remainder(minute));
  }
}

}  // namespace

Value XQueryDurationComponent(XQueryDurationField field, const Value* arguments, size_t count,
                              XQueryContext& context) {
  if (count != 1) return Value();
  if (isNull(arguments[0])) return arguments[0];
  const bool yearMonth =
      field == XQueryDurationField::Years || field == XQueryDurationField::Months;
  const XQueryTypeID type = yearMonth ? XQueryTypeYearMonthDuration : XQueryTypeDayTimeDuration;
  const Value duration = XQueryCastAsTypeForContext(arguments[0], type, context);
  // The failed cast of a URI travels on.
  const auto* number = dyn_cast<NSNumber>(duration);
  if (!number) return duration;
  return yearMonth ? yearMonthField(field, number->integerValue())
                   : dayTimeField(field, number->decimalValue());
}

}  // namespace xquery
