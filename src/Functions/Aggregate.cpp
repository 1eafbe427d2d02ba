#include "Functions/Aggregate.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
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

Value sumOf(const Value& sequence, XQueryContext& context) {
  if (Value sum = XQuerySumShortcut(sequence)) return sum;
  return XQuerySumPlainly(sequence, context);
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

// --- the shortcuts -------------------------------------------------------------------------------
//
// The numbers are kept unboxed between the steps. Two exact ones are added as decimals, which is
// what addition does in both of their types; from the first double on every sum is a double. A
// value comparison of two numbers that are not NaN is that of their order.

Value XQuerySumShortcut(const Value& sequence) {
  const XQueryItemList items(sequence.get());
  // The sum of one item is the item, whatever it is.
  if (items.count() < 2) return Value();
  NSDecimal exact;
  double number = 0;
  bool isExact = true;
  bool isInteger = true;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    const auto item = XQueryNumericOperand::of(items[index]);
    if (item.form == XQueryNumericOperand::Other) return Value();
    if (isExact && item.form == XQueryNumericOperand::Exact) {
      exact = exact.add(*item.exact);
      // The work of adding wide numbers is counted there, and may be a millisecond's.
      if (!exact.isSmallInteger()) checkWork(0);
      isInteger = isInteger && item.isInteger;
      continue;
    }
    if (item.form == XQueryNumericOperand::Double && std::isnan(item.number)) return Value();
    // The first item is taken as it is: adding it to zero would lose the sign of a negative zero.
    if (isExact && index > 0) number = XQueryNumericOperand::asDouble(exact);
    number = index == 0 ? item.asDouble() : number + item.asDouble();
    isExact = false;
  }
  if (!isExact) return XQueryNumber::numberWithDouble(number);
  return isInteger ? XQueryNumber::integerWithDecimal(std::move(exact))
                   : XQueryNumber::numberWithDecimal(std::move(exact));
}

namespace {

// One candidate for the greatest or least: a number, or an untyped item read as a double.
struct Candidate {
  NSObject* item = nullptr;
  const NSNumber* number = nullptr;
  double untyped = 0;

  double doubleValue() const { return number ? number->doubleValue() : untyped; }
  int order(const Candidate& other) const {
    if (number && other.number) return number->compare(*other.number);
    const double a = doubleValue();
    const double b = other.doubleValue();
    return a < b ? -1 : a > b ? 1 : 0;
  }
  Value value() const {
    return number ? Value(item) : Value(XQueryNumber::numberWithDouble(untyped));
  }
};

}  // namespace

Value XQueryExtremeShortcut(const Value& sequence, int comparison) {
  const int wanted = comparison == XQueryOperatorGt ? 1 : -1;
  const XQueryItemList items(sequence.get());
  Candidate best;
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    const auto operand = XQueryNumericOperand::of(items[index]);
    if (operand.form == XQueryNumericOperand::Other) return Value();
    if (operand.form == XQueryNumericOperand::Double && std::isnan(operand.number)) return Value();
    const Candidate item{items[index], dyn_cast<NSNumber>(items[index]), operand.number};
    if (index == 0 || item.order(best) == wanted) best = item;
  }
  return best.item ? best.value() : Value();
}

// --- the functions -------------------------------------------------------------------------------

Value fn_sum(const Value* arguments, size_t count, XQueryContext& context) {
  if (count < 1 || count > 2) return Value();
  if (XQueryItemList(arguments[0].get()).count() > 0) return sumOf(arguments[0], context);
  return count == 2 ? arguments[1] : Value(XQueryNumber::zero());
}

Value fn_avg(const Value* arguments, size_t count, XQueryContext& context) {
  if (count != 1) return Value();
  const size_t items = XQueryItemList(arguments[0].get()).count();
  if (items == 0) return NSNull::null();
  return XQueryAverageOf(sumOf(arguments[0], context), items, context);
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
