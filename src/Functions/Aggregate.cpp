#include "Functions/Aggregate.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Functions/NumberFold.h"
#include "Functions/XQueryTextArgument.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryNumericOperand.h"

#include <cmath>

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

bool isComparable(const Value& item) {
  const XQueryTypeID primitive = XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(item.get()));
  return isNumberOrDate(item) || primitive == XQueryTypeString || primitive == XQueryTypeBoolean;
}

Value extremeOf(const Value* arguments, size_t count, int comparison, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  XQueryCheckCollation(arguments, count, 1, context);
  const Value& sequence = arguments[0];
  if (XQueryItemList(sequence.get()).count() == 0) return NSNull::null();
  if (Value extreme = XQueryExtremeShortcut(sequence, comparison)) return extreme;
  return XQueryExtremePlainly(sequence, comparison, context);
}

}  // namespace

// --- the definitions -----------------------------------------------------------------------------

Value XQuerySumPlainly(const Value& sequence, XQueryContext& context) {
  const Value values = XQueryAtomization(sequence, context);
  const XQueryItemList items(values.get());
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

Value XQueryExtremePlainly(const Value& sequence, int comparison, XQueryContext& context) {
  const Value values = XQueryAtomization(sequence, context);
  const XQueryItemList items(values.get());
  Value best;
  for (size_t index = 0; index < items.count(); ++index) {
    checkWork();
    Value item = itemToAggregate(items[index], context);
    if (isNaN(item)) return item;
    if (index == 0) {
      if (!isComparable(item)) return Value();
      best = std::move(item);
    } else if (XQueryIsTrue(
                   XQueryOperatorExpr::evaluateOperator(comparison, item, best, context))) {
      best = std::move(item);
    }
  }
  return best;
}

Value XQuerySumOf(const Value& sequence, XQueryContext& context) {
  if (Value sum = XQuerySumShortcut(sequence)) return sum;
  return XQuerySumPlainly(sequence, context);
}

// --- the shortcuts -------------------------------------------------------------------------------
//
// The numbers are kept unboxed between the steps. A value comparison of two numbers that are not
// NaN is that of their order.

Value XQuerySumShortcut(const Value& sequence) {
  const XQueryItemList items(sequence.get());
  // The sum of one item is the item, whatever it is.
  if (items.count() < 2) return Value();
  XQuerySumming sum;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    const auto item = XQueryNumericOperand::of(items[index]);
    if (item.form == XQueryNumericOperand::Other) return Value();
    if (item.form == XQueryNumericOperand::Double && std::isnan(item.number)) return Value();
    sum.add(item);
    // The work of adding wide numbers is counted there, and may be a millisecond's.
    if (!sum.isShort()) checkWork(0);
  }
  return sum.value();
}

Value XQueryExtremeShortcut(const Value& sequence, int comparison) {
  const int wanted = comparison == XQueryOperatorGt ? 1 : -1;
  const XQueryItemList items(sequence.get());
  XQueryCandidate best;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    const auto operand = XQueryNumericOperand::of(items[index]);
    if (operand.form == XQueryNumericOperand::Other) return Value();
    if (operand.form == XQueryNumericOperand::Double && std::isnan(operand.number)) return Value();
    const auto item = XQueryCandidate::of(items[index], operand);
    if (index == 0 || item.order(best) == wanted) best = item;
  }
  return best.item ? best.value() : Value();
}

// --- the functions -------------------------------------------------------------------------------

Value fn_sum(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  if (XQueryItemList(arguments[0].get()).count() > 0) return XQuerySumOf(arguments[0], context);
  return count == 2 ? arguments[1] : Value(XQueryNumber::zero());
}

Value fn_avg(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const size_t items = XQueryItemList(arguments[0].get()).count();
  if (items == 0) return NSNull::null();
  return XQueryAverageOf(XQuerySumOf(arguments[0], context), items, context);
}

Value XQueryAverageOf(Value sum, size_t items, XQueryContext& context) {
  if (!sum || items == 1 || isNaN(sum)) return sum;
  return XQueryOperatorExpr::evaluateOperator(
      XQueryOperatorDiv, sum, XQueryNumber::integerWithInt64(static_cast<int64_t>(items)), context);
}

Value fn_max(const Value* arguments, size_t count, XQueryContext& context) {
  return extremeOf(arguments, count, XQueryOperatorGt, context);
}

Value fn_min(const Value* arguments, size_t count, XQueryContext& context) {
  return extremeOf(arguments, count, XQueryOperatorLt, context);
}

}  // namespace xquery
