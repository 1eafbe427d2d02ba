#include "Functions/FunctionsAggregate.h"

#include "Expr/XQueryArithmetic.h"
#include "Expr/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Platform/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

// An untyped item counts as a double.
Value itemToAggregate(NSObject* item, XQueryContext& context) {
  if (XQueryObjectTypeID(item) != XQueryTypeUntypedAtomic) return item;
  return XQueryCastAsTypeForContext(item, XQueryTypeDouble, context);
}

bool isNaN(const Value& item) {
  const auto* number = dyn_cast<NSNumber>(item.get());
  return number && XQueryIsNaN(*number);
}

// The two ordered durations count as numbers.
bool isNumberOrDate(const Value& item) {
  const XQueryTypeID type = XQueryObjectTypeID(item.get());
  return XQueryIsNumericTypeID(type) || type == XQueryTypeYearMonthDuration ||
         type == XQueryTypeDayTimeDuration ||
         (type >= XQueryTypeGYearMonth && type <= XQueryTypeTime);
}

// The sum of one item or more; a NaN is the answer at once. Null when the first item cannot be
// summed.
Value sumOf(const XQueryItemList& items, XQueryContext& context) {
  Value sum;
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    Value item = itemToAggregate(items[index], context);
    if (isNaN(item)) return item;
    if (index > 0) {
      sum = XQueryOperatorExpr::evaluateOperator(XQueryOperatorPlus, sum, item, context);
    } else if (isNumberOrDate(item)) {
      sum = std::move(item);
    } else {
      return Value();
    }
  }
  return sum;
}

}  // namespace

Value fn_sum(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  const Value values = XQueryAtomization(arguments[0], context);
  const XQueryItemList items(values.get());
  if (items.count() > 0) return sumOf(items, context);
  return count == 2 ? arguments[1] : Value(XQueryNumber::zero());
}

}  // namespace xquery
