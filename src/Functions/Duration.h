// The components of the two ordered durations, with the sign of the duration.
#pragma once

#include "Functions/XQueryBuiltInFunction.h"
#include "Types/XQueryTypeTable.h"

namespace xquery {

enum class XQueryDurationField : uint8_t { Years, Months, Days, Hours, Minutes, Seconds };

// Casts its one argument to the type that has the field, and reads it: seconds as a decimal, the
// others as an integer. The empty sequence stays empty.
Value XQueryDurationComponent(XQueryDurationField field, const Value* arguments, size_t count,
                              XQueryContext& context);

template <XQueryDurationField field>
Value XQueryDurationAccessor(const Value* arguments, size_t count, XQueryContext& context) {
  return XQueryDurationComponent(field, arguments, count, context);
}

inline constexpr XQueryProcedure fn_years_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Years>;
inline constexpr XQueryProcedure fn_months_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Months>;
inline constexpr XQueryProcedure fn_days_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Days>;
inline constexpr XQueryProcedure fn_hours_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Hours>;
inline constexpr XQueryProcedure fn_minutes_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Minutes>;
inline constexpr XQueryProcedure fn_seconds_from_duration =
    XQueryDurationAccessor<XQueryDurationField::Seconds>;

}  // namespace xquery
