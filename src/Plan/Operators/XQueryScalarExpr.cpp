#include "Plan/Operators/XQueryScalarExpr.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryAsking.h"
#include "Plan/Operators/XQueryScalarBody.h"
#include "Types/XQueryNumber.h"

#include <array>

namespace xquery {
namespace {

using Scalar = XQueryScalar;
using Form = XQueryScalar::Form;

// A position or a size of 0 was never set.
Scalar placeInFocus(int64_t number) {
  return number == 0 ? Scalar() : Scalar::ofInteger(number);
}

}  // namespace

XQueryScalar XQueryScalarSteps::answer(const XQueryContext& context) const {
  const Scalar last = answerOrObject(context);
  return last.form == Form::Object ? Scalar() : last;
}

XQueryScalar XQueryScalarSteps::answerOrObject(const XQueryContext& context) const {
  return valueOf(static_cast<Index>(_steps.size() - 1), _internal(context));
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
      return step.kind == Kind::Arithmetic ? XQueryScalarArithmetic(step.code, left, right)
                                           : XQueryScalarComparison(step.code, left, right);
    }
    case Kind::And:
    case Kind::Or:
    case Kind::Not:
      return logic(step, context);
    case Kind::Call:
      return called(step, context);
  }
  return {};
}

// A profile counts what is evaluated.
XQueryScalar XQueryScalarSteps::called(const Step& step,
                                       const XQueryContextInternal& context) const {
  if (context.profile()) return {};
  std::array<Scalar, XQueryScalarProgram::mostSlots> arguments;
  for (size_t index = 0; index < step.code; ++index) {
    arguments[index] = operand(_operands[step.left + index], context);
    if (arguments[index].form == Form::Object) {
      arguments[index] = XQueryScalarBody::scalarOf(arguments[index].object);
    }
    if (arguments[index].form == Form::Unknown) return {};
  }
  return step.body->answer(arguments.data());
}

// The operand behind one that decides is not looked at.
XQueryScalar XQueryScalarSteps::logic(const Step& step,
                                      const XQueryContextInternal& context) const {
  if (step.kind == Kind::Not) {
    const Scalar only = XQueryScalarTruth(valueOf(step.right, context));
    return only.form == Form::Unknown ? only : Scalar::ofTruth(!only.truth);
  }
  const Scalar left = XQueryScalarTruth(valueOf(step.left, context));
  if (left.form == Form::Unknown || left.truth == (step.kind == Kind::Or)) return left;
  return XQueryScalarTruth(valueOf(step.right, context));
}

Value XQueryScalarExpr::computeValue(XQueryContext& context) const {
  const Scalar answer = _steps.answerOrObject(context);
  switch (answer.form) {
    case Form::Integer:
      return XQueryNumber::integerWithInt64(answer.integer);
    case Form::Double:
      return XQueryNumber::numberWithDouble(answer.number);
    case Form::Truth:
      return NSNumber::numberWithBool(answer.truth);
    case Form::Object:
      if (const auto* callee = _steps.callee()) {
        if (Value literal = callee->literalAnswered(answer, context)) return literal;
      }
      return plain().evaluateWithContext(context);
    default:
      return plain().evaluateWithContext(context);
  }
}

bool XQueryScalarExpr::yieldTo(XQueryItemFold& fold, XQueryContext& context) const {
  return XQueryAsk(*this, context,
                   [&] { return yieldAnswer(_steps.answer(context), fold, context); });
}

bool XQueryScalarExpr::yieldAnswer(const XQueryScalar& answer, XQueryItemFold& fold,
                                   XQueryContext& context) const {
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

std::optional<bool> XQueryScalarExpr::truth(const XQueryContext& context) const {
  const Scalar answer = XQueryScalarTruth(_steps.answer(context));
  return answer.form == Form::Truth ? std::optional(answer.truth) : std::nullopt;
}

}  // namespace xquery
