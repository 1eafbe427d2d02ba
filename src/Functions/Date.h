// Functions over dates and times.
#pragma once

#include "Functions/XQueryBuiltInFunction.h"
#include "Types/XQueryDateArithmetic.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {

enum class XQueryDateField : uint8_t { Year, Month, Day, Hours, Minutes, Seconds, Timezone };

// Casts its one argument to the type and reads the field as the value's own zone shows it: seconds
// as a decimal, the zone as a dayTimeDuration, the others as an integer. The empty sequence stays
// empty, and so is the zone of a value without one.
Value XQueryDateComponent(XQueryTypeID type, XQueryDateField field, const Value* arguments,
                          size_t count, XQueryContext& context);
// Of two values: the first instant minus the second, as a dayTimeDuration.
Value XQueryDateDifference(XQueryTypeID type, const Value* arguments, size_t count,
                           XQueryContext& context);
// The present of the evaluation, with all the fields of its instant whatever the type.
Value XQueryDateOfPresent(XQueryTypeID type, size_t count, XQueryContext& context);

// The fields of a date followed by those of a time, in the zone of either. Null when each has a
// zone and these differ.
Value fn_dateTime(const Value* arguments, size_t count, XQueryContext& context);

template <XQueryTypeID type, XQueryDateField field>
Value XQueryDateAccessor(const Value* arguments, size_t count, XQueryContext& context) {
  return XQueryDateComponent(type, field, arguments, count, context);
}

template <XQueryTypeID type>
Value XQueryDateAdjustment(const Value* arguments, size_t count, XQueryContext& context) {
  return adjust_dateTime_to_timezone(arguments, count, context, type);
}

template <XQueryTypeID type>
Value XQueryDateSubtraction(const Value* arguments, size_t count, XQueryContext& context) {
  return XQueryDateDifference(type, arguments, count, context);
}

template <XQueryTypeID type>
Value XQueryPresent(const Value*, size_t count, XQueryContext& context) {
  return XQueryDateOfPresent(type, count, context);
}

inline constexpr XQueryProcedure fn_year_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Year>;
inline constexpr XQueryProcedure fn_month_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Month>;
inline constexpr XQueryProcedure fn_day_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Day>;
inline constexpr XQueryProcedure fn_hours_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Hours>;
inline constexpr XQueryProcedure fn_minutes_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Minutes>;
inline constexpr XQueryProcedure fn_seconds_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Seconds>;
inline constexpr XQueryProcedure fn_timezone_from_dateTime =
    XQueryDateAccessor<XQueryTypeDateTime, XQueryDateField::Timezone>;

inline constexpr XQueryProcedure fn_year_from_date =
    XQueryDateAccessor<XQueryTypeDate, XQueryDateField::Year>;
inline constexpr XQueryProcedure fn_month_from_date =
    XQueryDateAccessor<XQueryTypeDate, XQueryDateField::Month>;
inline constexpr XQueryProcedure fn_day_from_date =
    XQueryDateAccessor<XQueryTypeDate, XQueryDateField::Day>;
inline constexpr XQueryProcedure fn_timezone_from_date =
    XQueryDateAccessor<XQueryTypeDate, XQueryDateField::Timezone>;

inline constexpr XQueryProcedure fn_hours_from_time =
    XQueryDateAccessor<XQueryTypeTime, XQueryDateField::Hours>;
inline constexpr XQueryProcedure fn_minutes_from_time =
    XQueryDateAccessor<XQueryTypeTime, XQueryDateField::Minutes>;
inline constexpr XQueryProcedure fn_seconds_from_time =
    XQueryDateAccessor<XQueryTypeTime, XQueryDateField::Seconds>;
inline constexpr XQueryProcedure fn_timezone_from_time =
    XQueryDateAccessor<XQueryTypeTime, XQueryDateField::Timezone>;

inline constexpr XQueryProcedure fn_adjust_dateTime_to_timezone =
    XQueryDateAdjustment<XQueryTypeDateTime>;
inline constexpr XQueryProcedure fn_adjust_date_to_timezone = XQueryDateAdjustment<XQueryTypeDate>;
inline constexpr XQueryProcedure fn_adjust_time_to_timezone = XQueryDateAdjustment<XQueryTypeTime>;

inline constexpr XQueryProcedure fn_subtract_dateTimes_yielding_dayTimeDuration =
    XQueryDateSubtraction<XQueryTypeDateTime>;
inline constexpr XQueryProcedure fn_subtract_dates_yielding_dayTimeDuration =
    XQueryDateSubtraction<XQueryTypeDate>;
inline constexpr XQueryProcedure fn_subtract_times = XQueryDateSubtraction<XQueryTypeTime>;

inline constexpr XQueryProcedure fn_current_dateTime = XQueryPresent<XQueryTypeDateTime>;
inline constexpr XQueryProcedure fn_current_date = XQueryPresent<XQueryTypeDate>;
inline constexpr XQueryProcedure fn_current_time = XQueryPresent<XQueryTypeTime>;

}  // namespace xquery
