#include "Plan/Operators/XQueryScalarExpr.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryComparison.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryMachineArithmetic.h"
#include "Types/XQueryNumber.h"
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

Scalar arithmetic(int type, const Scalar& left, const Scalar& right) {
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

template <class T>
Scalar related(XQueryRelation relation, T a, T b) {
  return Scalar::ofTruth(relation.holds(a < b ? -1 : a > b ? 1 : 0));
}

// Of typed numbers alone; no relation holds for what is not a number.
Scalar comparison(int code, const Scalar& left, const Scalar& right) {
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

// The effective boolean value.
Scalar truthOf(const Scalar& value) {
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

// A position or a size of 0 was never set.
Scalar placeInFocus(int64_t number) {
  return number == 0 ? Scalar() : Scalar::ofInteger(number);
}

}  // namespace

XQueryScalar XQueryScalarSteps::answer(const XQueryContext& context) const {
  const Scalar last = valueOf(static_cast<Index>(_steps.size() - 1), _internal(context));
  return last.form == Form::Object ? Scalar() : last;
}

// Most operands are at hand: they are taken in place.
[[gnu::always_inline]] inline XQueryScalar XQueryScalarSteps::operand(
    Index index, const XQueryContextInternal& context) const {
  const Step& step = _steps[index];
  if (step.kind == Kind::Constant) return step.constant;
  if (step.kind == Kind::Variable) return Scalar::ofObject(context.variableForID(step.varID));
  return valueOf(index, context);
}

XQueryScalar XQueryScalarSteps::valueOf(Index index, const XQueryContextInternal& context) const {
  const Step& step = _steps[index];
  switch (step.kind) {
    case Kind::Constant:
    case Kind::Variable:
      return operand(index, context);
    case Kind::ContextItem:
      return Scalar::ofObject(context.contextItem().get());
    case Kind::Position:
      return placeInFocus(context.position());
    case Kind::Last:
      return placeInFocus(context.last());
    case Kind::Arithmetic:
    case Kind::Comparison: {
      const Scalar left = operand(step.left, context);
      if (left.form == Form::Unknown) return left;
      const Scalar right = operand(step.right, context);
      return step.kind == Kind::Arithmetic ? arithmetic(step.code, left, right)
                                           : comparison(step.code, left, right);
    }
    case Kind::And:
    case Kind::Or:
    case Kind::Not:
      return logic(step, context);
  }
  return {};
}

// The operand behind one that decides is not looked at.
XQueryScalar XQueryScalarSteps::logic(const Step& step,
                                      const XQueryContextInternal& context) const {
  if (step.kind == Kind::Not) {
    const Scalar only = truthOf(valueOf(step.right, context));
    return only.form == Form::Unknown ? only : Scalar::ofTruth(!only.truth);
  }
  const Scalar left = truthOf(valueOf(step.left, context));
  if (left.form == Form::Unknown || left.truth == (step.kind == Kind::Or)) return left;
  return truthOf(valueOf(step.right, context));
}

Value XQueryScalarExpr::computeValue(XQueryContext& context) const {
  const Scalar answer = _steps.answer(context);
  switch (answer.form) {
    case Form::Integer:
      return XQueryNumber::integerWithInt64(answer.integer);
    case Form::Double:
      return XQueryNumber::numberWithDouble(answer.number);
    case Form::Truth:
      return NSNumber::numberWithBool(answer.truth);
    default:
      return plain().evaluateWithContext(context);
  }
}

bool XQueryScalarExpr::yieldTo(XQueryItemFold& fold, XQueryContext& context) const {
  const Scalar answer = _steps.answer(context);
  if (answer.form == Form::Integer) {
    fold.addInteger(answer.integer);
    return true;
  }
  if (answer.form == Form::Double) {
    fold.addDouble(answer.number);
    return true;
  }
  Value value = answer.form == Form::Truth ? Value(NSNumber::numberWithBool(answer.truth))
                                           : plain().evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return false;
  fold.add(std::move(value));
  return true;
}

}  // namespace xquery
