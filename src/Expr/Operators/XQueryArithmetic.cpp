#include "Expr/Operators/XQueryArithmetic.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQuerySequence.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDateArithmetic.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"
#include "xquery/Collection.h"

#include <array>
#include <cmath>
#include <cstdint>

namespace xquery {
namespace {

// One operation in the three representations. Functions, so that each row below is one fact.
struct NumericWork {
  NSDecimal (*exact)(const NSDecimal&, const NSDecimal&);
  float (*single)(float, float);
  double (*wide)(double, double);
};

constexpr NumericWork addition = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.add(b); },
    [](float a, float b) { return a + b; },
    [](double a, double b) { return a + b; },
};
constexpr NumericWork subtraction = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.subtract(b); },
    [](float a, float b) { return a - b; },
    [](double a, double b) { return a - b; },
};
constexpr NumericWork multiplication = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.multiply(b); },
    [](float a, float b) { return a * b; },
    [](double a, double b) { return a * b; },
};
constexpr NumericWork division = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.divide(b); },
    [](float a, float b) { return XQueryQuotient(a, b); },
    [](double a, double b) { return XQueryQuotient(a, b); },
};
constexpr NumericWork remainder = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.remainder(b); },
    [](float a, float b) { return std::fmod(a, b); },
    [](double a, double b) { return std::fmod(a, b); },
};
constexpr NumericWork integerDivision = {
    [](const NSDecimal& a, const NSDecimal& b) { return a.integerDivide(b); },
    [](float a, float b) { return std::trunc(XQueryQuotient(a, b)); },
    [](double a, double b) { return std::trunc(XQueryQuotient(a, b)); },
};

const NSNumber& numberIn(const Value& value) {
  return *cast<NSNumber>(value.get());
}

// Not yet of the type: a decimal or a double, which the caller casts. Null when the type is not
// numeric.
Value compute(const NumericWork& work, const NSNumber& a, const NSNumber& b, XQueryTypeID type) {
  switch (XQueryPrimitiveTypeForTypeID(type)) {
    case XQueryTypeDecimal:
      return XQueryNumber::numberWithDecimal(work.exact(a.decimalValue(), b.decimalValue()));
    case XQueryTypeFloat:
      return XQueryNumber::numberWithFloat(work.single(a.floatValue(), b.floatValue()));
    case XQueryTypeDouble:
      return XQueryNumber::numberWithDouble(work.wide(a.doubleValue(), b.doubleValue()));
    default:
      return Value();
  }
}

struct Operands {
  XQueryTypeID type;  // 0 when there is no common numeric type
  Value left;
  Value right;
};

// Both operands in one type: `type`.
Operands castBoth(const Value& a, const Value& b, XQueryTypeID type, XQueryContext& context) {
  return {type, XQueryCastAsTypeForContext(a, type, context),
          XQueryCastAsTypeForContext(b, type, context)};
}

XQueryTypeID commonType(const Value& a, const Value& b) {
  return XQueryLeastCommonNumericType(XQueryObjectTypeID(a.get()), XQueryObjectTypeID(b.get()));
}

// The common type for the operators whose result is not of the operands' integer type: any two
// integers meet in decimal.
XQueryTypeID commonTypeForDivision(const Value& a, const Value& b) {
  const XQueryTypeID type = commonType(a, b);
  return type >= XQueryTypeInteger ? XQueryTypeDecimal : type;
}

bool isZero(const Value& number) {
  return numberIn(number).compare(*XQueryNumber::zero()) == 0;
}

bool isExact(XQueryTypeID type) {
  return XQueryPrimitiveTypeForTypeID(type) == XQueryTypeDecimal;
}

Value divisionByZero() {
  return XQueryErrors::divisionByZero.error();
}

Value calculateInCommonType(const NumericWork& work, const Value& a, const Value& b,
                            XQueryContext& context) {
  const XQueryTypeID type = commonType(a, b);
  if (type == XQueryTypeNone) return Value();
  const Operands operands = castBoth(a, b, type, context);
  const Value result =
      compute(work, numberIn(operands.left), numberIn(operands.right), operands.type);
  return XQueryCastAsTypeForContext(result, type, context);
}

// --- products of special numbers -----------------------------------------------------------------

enum Magnitude : size_t {
  NotANumber,
  NegativeInfinity,
  Negative,
  Zero,
  Positive,
  PositiveInfinity
};

Magnitude magnitudeOf(const NSNumber& number) {
  const double value = number.doubleValue();
  if (std::isnan(value)) return NotANumber;
  if (std::isinf(value)) return value < 0 ? NegativeInfinity : PositiveInfinity;
  return value < 0 ? Negative : value > 0 ? Positive : Zero;
}

enum Special : uint8_t { N, M, P, X };  // NaN, minus and plus infinity; X: no special operand

// Rows: the left operand; columns: the right one; both in the order of Magnitude.
constexpr std::array<std::array<Special, 6>, 6> specialProducts = {{
    {N, N, N, N, N, N},  // NaN
    {N, P, P, N, M, M},  // minus infinity
    {N, P, X, X, X, M},  // negative
    {N, N, X, X, X, N},  // zero
    {N, M, X, X, X, P},  // positive
    {N, M, M, N, P, P},  // plus infinity
}};

// Null when neither operand is special after all.
Value specialProduct(const NSNumber& a, const NSNumber& b) {
  switch (specialProducts[magnitudeOf(a)][magnitudeOf(b)]) {
    case N:
      return XQueryNumber::nan();
    case M:
      return XQueryNumber::negInf();
    case P:
      return XQueryNumber::posInf();
    case X:
      break;
  }
  return Value();
}

}  // namespace

// --- the numeric helpers -------------------------------------------------------------------------

double XQueryQuotient(double a, double b) {
  if (b != 0) return a / b;
  if (a < 0) return -INFINITY;
  return a > 0 ? INFINITY : NAN;
}

float XQueryQuotient(float a, float b) {
  if (b != 0) return a / b;
  if (a < 0) return -INFINITY;
  return a > 0 ? INFINITY : NAN;
}

Value op_numeric_add(const Value& a, const Value& b, XQueryContext& context) {
  return calculateInCommonType(addition, a, b, context);
}

Value op_numeric_subtract(const Value& a, const Value& b, XQueryContext& context) {
  return calculateInCommonType(subtraction, a, b, context);
}

Value op_numeric_multiply(const Value& a, const Value& b, XQueryContext& context) {
  const XQueryTypeID type = commonType(a, b);
  if (type == XQueryTypeNone) return Value();
  const Operands operands = castBoth(a, b, type, context);
  const NSNumber& left = numberIn(operands.left);
  const NSNumber& right = numberIn(operands.right);
  if (XQueryNumber::isSpecial(&left) || XQueryNumber::isSpecial(&right)) {
    return specialProduct(left, right);
  }
  return XQueryCastAsTypeForContext(compute(multiplication, left, right, type), type, context);
}

Value op_numeric_divide(const Value& a, const Value& b, XQueryContext& context) {
  const XQueryTypeID type = commonTypeForDivision(a, b);
  if (type == XQueryTypeNone) return Value();
  const Operands operands = castBoth(a, b, type, context);
  if (isExact(type) && isZero(operands.right)) return divisionByZero();
  const Value result = compute(division, numberIn(operands.left), numberIn(operands.right), type);
  return XQueryCastAsTypeForContext(result, type, context);
}

Value op_numeric_integer_divide(const Value& a, const Value& b, XQueryContext& context) {
  const XQueryTypeID type = commonTypeForDivision(a, b);
  if (type == XQueryTypeNone) return Value();
  const Operands operands = castBoth(a, b, type, context);
  if (isZero(operands.right)) return divisionByZero();
  const Value result =
      compute(integerDivision, numberIn(operands.left), numberIn(operands.right), type);
  return XQueryCastAsTypeForContext(result, XQueryTypeInteger, context);
}

Value op_numeric_mod(const Value& a, const Value& b, XQueryContext& context) {
  const XQueryTypeID type = commonType(a, b);
  if (type == XQueryTypeNone) return Value();
  if (isExact(type) && isZero(b)) return divisionByZero();
  return calculateInCommonType(remainder, a, b, context);
}

bool XQueryIsNaN(const NSNumber& number) {
  return number.compare(*XQueryNumber::nan()) == 0;
}

bool op_numeric_equal(const NSNumber& a, const NSNumber& b) {
  return a.compare(b) == 0 && !XQueryIsNaN(a);
}

bool op_numeric_less_than(const NSNumber& a, const NSNumber& b) {
  return a.compare(b) < 0 && !XQueryIsNaN(a);
}

bool op_numeric_greater_than(const NSNumber& a, const NSNumber& b) {
  // NaN is below every other number, so it can only be the right operand here.
  return a.compare(b) > 0 && !XQueryIsNaN(b);
}

// --- the dispatcher ------------------------------------------------------------------------------

namespace {

// What a row of the dispatch table asks of an operand: to be numeric, or of exactly one type.
bool isNumeric(XQueryTypeID type) {
  return XQueryIsNumericTypeID(type);
}

template <XQueryTypeID wanted>
bool is(XQueryTypeID type) {
  return type == wanted;
}

constexpr auto isDateTime = is<XQueryTypeDateTime>;
constexpr auto isDate = is<XQueryTypeDate>;
constexpr auto isTime = is<XQueryTypeTime>;
constexpr auto isMonths = is<XQueryTypeYearMonthDuration>;
constexpr auto isSeconds = is<XQueryTypeDayTimeDuration>;

using Work = Value (*)(const Value&, const Value&, XQueryContext&);

// The same with the operands in the other order.
template <Work work>
Value swapped(const Value& a, const Value& b, XQueryContext& context) {
  return work(b, a, context);
}

struct Row {
  int type;
  bool (*left)(XQueryTypeID);
  bool (*right)(XQueryTypeID);
  Work work;
};

constexpr Row rows[] = {
    {XQueryOperatorPlus, isNumeric, isNumeric, op_numeric_add},
    {XQueryOperatorMinus, isNumeric, isNumeric, op_numeric_subtract},
    {XQueryOperatorMultiply, isNumeric, isNumeric, op_numeric_multiply},
    {XQueryOperatorDiv, isNumeric, isNumeric, op_numeric_divide},
    {XQueryOperatorIDiv, isNumeric, isNumeric, op_numeric_integer_divide},
    {XQueryOperatorMod, isNumeric, isNumeric, op_numeric_mod},

    {XQueryOperatorPlus, isDateTime, isSeconds, op_add_dayTimeDuration_to_dateTime},
    {XQueryOperatorPlus, isDateTime, isMonths, op_add_yearMonthDuration_to_dateTime},
    {XQueryOperatorPlus, isDate, isSeconds, op_add_dayTimeDuration_to_date},
    {XQueryOperatorPlus, isDate, isMonths, op_add_yearMonthDuration_to_date},
    {XQueryOperatorPlus, isTime, isSeconds, op_add_dayTimeDuration_to_time},
    {XQueryOperatorPlus, isSeconds, isDateTime, swapped<op_add_dayTimeDuration_to_dateTime>},
    {XQueryOperatorPlus, isMonths, isDateTime, swapped<op_add_yearMonthDuration_to_dateTime>},
    {XQueryOperatorPlus, isSeconds, isDate, swapped<op_add_dayTimeDuration_to_date>},
    {XQueryOperatorPlus, isMonths, isDate, swapped<op_add_yearMonthDuration_to_date>},
    {XQueryOperatorPlus, isSeconds, isTime, swapped<op_add_dayTimeDuration_to_time>},
    {XQueryOperatorPlus, isMonths, isMonths, op_add_yearMonthDurations},
    {XQueryOperatorPlus, isSeconds, isSeconds, op_add_dayTimeDurations},

    {XQueryOperatorMinus, isDateTime, isMonths, op_subtract_yearMonthDuration_from_dateTime},
    {XQueryOperatorMinus, isDateTime, isSeconds, op_subtract_dayTimeDuration_from_dateTime},
    {XQueryOperatorMinus, isDate, isMonths, op_subtract_yearMonthDuration_from_date},
    {XQueryOperatorMinus, isDate, isSeconds, op_subtract_dayTimeDuration_from_date},
    {XQueryOperatorMinus, isTime, isSeconds, op_subtract_dayTimeDuration_from_time},
    {XQueryOperatorMinus, isDateTime, isDateTime, op_subtract_dates},
    {XQueryOperatorMinus, isDate, isDate, op_subtract_dates},
    {XQueryOperatorMinus, isTime, isTime, op_subtract_dates},
    {XQueryOperatorMinus, isMonths, isMonths, op_subtract_yearMonthDurations},
    {XQueryOperatorMinus, isSeconds, isSeconds, op_subtract_dayTimeDurations},

    {XQueryOperatorMultiply, isMonths, isNumeric, op_multiply_yearMonthDuration},
    {XQueryOperatorMultiply, isSeconds, isNumeric, op_multiply_dayTimeDuration},
    {XQueryOperatorMultiply, isNumeric, isMonths, swapped<op_multiply_yearMonthDuration>},
    {XQueryOperatorMultiply, isNumeric, isSeconds, swapped<op_multiply_dayTimeDuration>},

    {XQueryOperatorDiv, isMonths, isNumeric, op_divide_yearMonthDuration},
    {XQueryOperatorDiv, isSeconds, isNumeric, op_divide_dayTimeDuration},
    {XQueryOperatorDiv, isMonths, isMonths, op_divide_durations},
    {XQueryOperatorDiv, isSeconds, isSeconds, op_divide_durations},
};

// An operand as it stands, or the number that it becomes. What stands is held by whoever gave it: a
// count here would be one more of a constant that other threads count as well.
class Operand {
 public:
  explicit Operand(const Value& given) : _value(&normalisedIn(given)) {}
  Operand(const Operand&) = delete;
  Operand& operator=(const Operand&) = delete;

  const Value& operator*() const { return *_value; }

  // A node becomes its untyped value, and an untyped value a number.
  void makeNumberIfUntyped(XQueryTypeID numberType, XQueryContext& context) {
    if (XQueryIsNode(_value->get())) become(XQueryAtomization(*_value, context));
    if (XQueryObjectTypeID(_value->get()) != XQueryTypeUntypedAtomic) return;
    become(XQueryCastAsTypeForContext(*_value, numberType, context));
  }

 private:
  void become(Value value) {
    _own = std::move(value);
    _value = &_own;
  }

  const Value* _value;
  Value _own;
};

bool isOrderedDuration(const Value& value) {
  return XQueryIsKindOfType(XQueryObjectTypeID(value.get()), XQueryTypeDuration) &&
         isa<NSNumber>(value);
}

// idiv has no answer for a zero divisor whatever the type; mod has one in floating point. A
// duration has none either.
bool dividesByZero(int type, const Value& left, const Value& right) {
  const auto* divisor = dyn_cast<NSNumber>(right.get());
  if (!divisor || divisor->compare(*XQueryNumber::zero()) != 0) return false;
  if (type == XQueryOperatorDiv && isOrderedDuration(left)) {
    return !isOrderedDuration(right) ||
           XQueryObjectTypeID(left.get()) == XQueryObjectTypeID(right.get());
  }
  const XQueryTypeID common = commonType(left, right);
  if (common == XQueryTypeNone) return false;
  return type == XQueryOperatorIDiv || (type == XQueryOperatorMod && isExact(common));
}

}  // namespace

Value XQueryOperatorExpr::arithmeticOperatorEvaluate(int type, const Value& withLeft,
                                                     const Value& right,
                                                     XQueryContext& forContext) {
  Operand a(withLeft);
  Operand b(right);
  if (!*a || !*b) return Value();
  if (isNull(*a) || isNull(*b)) return NSNull::null();
  if (isa<NSArray>(*a) || isa<NSArray>(*b)) return Value();
  const XQueryTypeID untypedAs = type == XQueryOperatorIDiv ? XQueryTypeInteger : XQueryTypeDouble;
  a.makeNumberIfUntyped(untypedAs, forContext);
  b.makeNumberIfUntyped(untypedAs, forContext);
  if (dividesByZero(type, *a, *b)) return XQueryErrors::divideByZero.error();
  const XQueryTypeID leftType = XQueryObjectTypeID((*a).get());
  const XQueryTypeID rightType = XQueryObjectTypeID((*b).get());
  for (const Row& row : rows) {
    if (row.type == type && row.left(leftType) && row.right(rightType)) {
      return row.work(*a, *b, forContext);
    }
  }
  return Value();
}

Value XQueryUnarySign(int type, const Value& operand, XQueryContext& context) {
  Operand number(operand);
  if (!*number) return Value();
  if (isNull(*number)) return NSNull::null();
  if (isa<NSArray>(*number)) return Value();
  number.makeNumberIfUntyped(XQueryTypeDouble, context);
  const XQueryTypeID numberType = XQueryObjectTypeID((*number).get());
  if (!XQueryIsNumericTypeID(numberType)) return Value();
  const NumericWork& work = type == XQueryOperatorMinus ? subtraction : addition;
  // The zero is not asked to be of the type: some derived integer types have none.
  const Value result = compute(work, *XQueryNumber::zero(), numberIn(*number), numberType);
  return XQueryCastAsTypeForContext(result, numberType, context);
}

}  // namespace xquery
