// Arithmetic over dates, times and the two ordered durations.
//
// Operands are of the types that a function's name says. The answer keeps the zone of the date, and
// is null when it lies beyond the 32-bit years or the durations' range. Multiplying or dividing by
// NaN or an infinity raises error 6 "invalid type for operator".
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"

#include <cstddef>

namespace xquery {

class XQueryContext;

// A day that the month reached does not have becomes its last one: 31 January and a month is 28 or
// 29 February.
Value op_add_yearMonthDuration_to_dateTime(const Value& dateTime, const Value& duration,
                                           XQueryContext& context);
Value op_add_yearMonthDuration_to_date(const Value& date, const Value& duration,
                                       XQueryContext& context);
// Keeps the distance on the clock across a change to or from daylight saving time.
Value op_add_dayTimeDuration_to_dateTime(const Value& dateTime, const Value& duration,
                                         XQueryContext& context);
Value op_add_dayTimeDuration_to_date(const Value& date, const Value& duration,
                                     XQueryContext& context);
// Wraps around midnight. Without a zone the sum is read in GMT.
Value op_add_dayTimeDuration_to_time(const Value& time, const Value& duration,
                                     XQueryContext& context);
Value op_subtract_yearMonthDuration_from_dateTime(const Value& dateTime, const Value& duration,
                                                  XQueryContext& context);
Value op_subtract_yearMonthDuration_from_date(const Value& date, const Value& duration,
                                              XQueryContext& context);
Value op_subtract_dayTimeDuration_from_dateTime(const Value& dateTime, const Value& duration,
                                                XQueryContext& context);
Value op_subtract_dayTimeDuration_from_date(const Value& date, const Value& duration,
                                            XQueryContext& context);
Value op_subtract_dayTimeDuration_from_time(const Value& time, const Value& duration,
                                            XQueryContext& context);

// Of two values of one type: the first instant minus the second, a dayTimeDuration.
Value op_subtract_dates(const Value& a, const Value& b, XQueryContext& context);

Value op_add_yearMonthDurations(const Value& a, const Value& b, XQueryContext& context);
Value op_subtract_yearMonthDurations(const Value& a, const Value& b, XQueryContext& context);
Value op_add_dayTimeDurations(const Value& a, const Value& b, XQueryContext& context);
Value op_subtract_dayTimeDurations(const Value& a, const Value& b, XQueryContext& context);

// Months are rounded, halves toward positive infinity. A divisor must not be zero.
Value op_multiply_yearMonthDuration(const Value& duration, const Value& number,
                                    XQueryContext& context);
Value op_multiply_dayTimeDuration(const Value& duration, const Value& number,
                                  XQueryContext& context);
Value op_divide_yearMonthDuration(const Value& duration, const Value& number,
                                  XQueryContext& context);
Value op_divide_dayTimeDuration(const Value& duration, const Value& number, XQueryContext& context);
// Of two durations of one kind: a decimal.
Value op_divide_durations(const Value& a, const Value& b, XQueryContext& context);

// The value, cast to `type` (dateTime, date or time), in another zone: the implicit one, or that of
// a dayTimeDuration as second argument. A value with a zone stays the same instant; one without
// keeps its fields and gets the zone. An empty second argument takes the zone away. Null unless
// there are one or two arguments.
Value adjust_dateTime_to_timezone(const Value* arguments, size_t count, XQueryContext& context,
                                  XQueryTypeID type);

}  // namespace xquery
