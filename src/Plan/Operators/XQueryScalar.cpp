#include "Plan/Operators/XQueryScalar.h"

#include "Expr/Operators/XQueryComparison.h"
#include "Plan/Operators/XQueryMachineArithmetic.h"
#include "Types/XQueryNumericOperand.h"

#include <cmath>

namespace xquery {
namespace {

using Scalar = XQueryScalar;
using Form = XQueryScalar::Form;

// An operand of arithmetic: the number that an object holds, or is cast to when it is untyped.
Scalar numberIn(const Scalar& operand, bool untypedOnes) {
  if (operand.form == Form::Truth) return {};
  if (operand.form != Form::Object) return operand;
  const auto number = XQueryNumericOperand::of(operand.object, untypedOnes);
  if (number.form == XQueryNumericOperand::Double) return Scalar::ofDouble(number.number);
  const bool isSmall = number.form == XQueryNumericOperand::Exact && number.isInteger &&
                       number.exact->isSmallInteger();
  return isSmall ? Scalar::ofInteger(number.exact->smallInteger()) : Scalar();
}

// Integers beyond these are doubles only after rounding.
bool isDoubleToo(const Scalar& number) {
  return number.form == Form::Double ||
         (number.integer <= XQueryExactIntegerBound && number.integer >= -XQueryExactIntegerBound);
}

double asDouble(const Scalar& number) {
  return number.form == Form::Double ? number.number : static_cast<double>(number.integer);
}

}  // namespace

XQueryScalar XQueryScalarArithmetic(int type, const Scalar& left, const Scalar& right) {
  // For idiv an untyped operand is an integer, which is not what a scanned double tells.
  const bool untypedOnes = type != XQueryOperatorIDiv;
  const Scalar a = numberIn(left, untypedOnes);
  const Scalar b = numberIn(right, untypedOnes);
  if (a.form == Form::Unknown || b.form == Form::Unknown) return {};
  if (a.form == Form::Integer && b.form == Form::Integer) {
    const auto result = XQueryIntegerResult(type, a.integer, b.integer);
    return result ? Scalar::ofInteger(*result) : Scalar();
  }
  if (!isDoubleToo(a) || !isDoubleToo(b)) return {};
  const auto result = XQueryDoubleResult(type, asDouble(a), asDouble(b));
  return result ? Scalar::ofDouble(*result) : Scalar();
}

namespace {

template <class T>
Scalar related(XQueryRelation relation, T a, T b) {
  return Scalar::ofTruth(relation.holds(a < b ? -1 : a > b ? 1 : 0));
}

}  // namespace

// Of typed numbers alone; no relation holds for what is not a number.
XQueryScalar XQueryScalarComparison(int code, const Scalar& left, const Scalar& right) {
  const Scalar a = numberIn(left, false);
  const Scalar b = numberIn(right, false);
  if (a.form == Form::Unknown || b.form == Form::Unknown) return {};
  const XQueryRelation relation = XQueryRelationForCode(code);
  if (a.form == Form::Integer && b.form == Form::Integer) {
    return related(relation, a.integer, b.integer);
  }
  if (!isDoubleToo(a) || !isDoubleToo(b)) return {};
  const double x = asDouble(a);
  const double y = asDouble(b);
  if (std::isnan(x) || std::isnan(y)) return Scalar::ofTruth(false);
  return related(relation, x, y);
}

XQueryScalar XQueryScalarTruth(const Scalar& value) {
  switch (value.form) {
    case Form::Truth:
      return value;
    case Form::Integer:
      return Scalar::ofTruth(value.integer != 0);
    case Form::Double:
      return Scalar::ofTruth(value.number != 0 && !std::isnan(value.number));
    default:
      return {};
  }
}

}  // namespace xquery
