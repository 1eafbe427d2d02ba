#include "Plan/Operators/XQueryScalarExpr.h"

#include "Context/XQueryContextInternal.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryAsking.h"
#include "Plan/Operators/XQueryScalarBody.h"

#include <algorithm>
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

XQueryScalar XQueryScalarSteps::answer(const XQueryContext& context, Made& made) const {
  return valueOf(static_cast<Index>(_steps.size() - 1), _internal(context), made);
}

bool XQueryScalarSteps::isConstant(const NSObject* object) const {
  return std::any_of(_steps.begin(), _steps.end(), [&](const Step& step) {
    return step.kind == Kind::Constant && step.constant.hasObject() &&
           step.constant.object == object;
  });
}

// Most operands are at hand: they are taken in place.
[[gnu::always_inline]] inline XQueryScalar XQueryScalarSteps::operand(
    Index index, const XQueryContextInternal& context, Made& made) const {
  const Step& step = _steps[index];
  if (step.kind == Kind::Constant) return step.constant;
  if (step.kind == Kind::Variable) return Scalar::ofObject(context.variableForID(step.varID));
  return valueOf(index, context, made);
}

XQueryScalar XQueryScalarSteps::valueOf(Index index, const XQueryContextInternal& context,
                                        Made& made) const {
  const Step& step = _steps[index];
  switch (step.kind) {
    case Kind::Constant:
    case Kind::Variable:
      return operand(index, context, made);
    case Kind::ContextItem:
      return Scalar::ofObject(context.contextItem().get());
    case Kind::Position:
      return placeInFocus(context.position());
    case Kind::Last:
      return placeInFocus(context.last());
    case Kind::Arithmetic:
    case Kind::Comparison: {
      const Scalar left = operand(step.left, context, made);
      if (left.form == Form::Unknown) return left;
      const Scalar right = operand(step.right, context, made);
      if (step.kind == Kind::Comparison) return XQueryScalarComparison(step.code, left, right);
      const Scalar result = XQueryScalarArithmetic(step.code, left, right);
      return result.form == Form::Unknown ? XQueryScalarLongArithmetic(step.code, left, right, made)
                                          : result;
    }
    case Kind::And:
    case Kind::Or:
    case Kind::Not:
      return logic(step, context, made);
    case Kind::Call:
      return called(step, context, made);
  }
  return {};
}

// A profile counts what is evaluated.
XQueryScalar XQueryScalarSteps::called(const Step& step, const XQueryContextInternal& context,
                                       Made& made) const {
  if (context.profile()) return {};
  std::array<Scalar, XQueryScalarProgram::mostSlots> arguments;
  for (size_t index = 0; index < step.code; ++index) {
    arguments[index] = operand(_operands[step.left + index], context, made);
    if (arguments[index].form == Form::Object) {
      arguments[index] = Scalar::ofValue(arguments[index].object);
    }
    if (arguments[index].form == Form::Unknown) return {};
  }
  Value own;
  const Scalar answer = step.body->answer(arguments.data(), own);
  if (own) XQueryScalarMade(std::move(own), made);
  return answer;
}

// The operand behind one that decides is not looked at.
XQueryScalar XQueryScalarSteps::logic(const Step& step, const XQueryContextInternal& context,
                                      Made& made) const {
  if (step.kind == Kind::Not) {
    const Scalar only = XQueryScalarTruth(valueOf(step.right, context, made));
    return only.form == Form::Unknown ? only : Scalar::ofTruth(!only.truth);
  }
  const Scalar left = XQueryScalarTruth(valueOf(step.left, context, made));
  if (left.form == Form::Unknown || left.truth == (step.kind == Kind::Or)) return left;
  return XQueryScalarTruth(valueOf(step.right, context, made));
}

// Null where the expression has to be evaluated. A literal that is passed to a function and
// answered is one that evaluating it answers.
Value XQueryScalarExpr::valueOf(const XQueryScalar& answer, XQueryContext& context) const {
  if (answer.form != Form::Object) return XQueryScalarValue(answer);
  const auto* callee = _steps.callee();
  if (!callee) return XQueryScalarValue(answer);
  if (Value literal = callee->literalAnswered(answer, context)) return literal;
  return _steps.isConstant(answer.object) ? Value() : XQueryScalarValue(answer);
}

Value XQueryScalarExpr::computeValue(XQueryContext& context) const {
  XQueryScalarSteps::Made made;
  if (Value value = valueOf(_steps.answer(context, made), context)) return value;
  return plain().evaluateWithContext(context);
}

bool XQueryScalarExpr::yieldTo(XQueryItemFold& fold, XQueryContext& context) const {
  XQueryScalarSteps::Made made;
  return XQueryAsk(*this, context,
                   [&] { return yieldAnswer(_steps.answer(context, made), fold, context); });
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
  Value value = valueOf(answer, context);
  if (!value) value = plain().evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return false;
  fold.add(std::move(value));
  return true;
}

std::optional<bool> XQueryScalarExpr::truth(const XQueryContext& context) const {
  XQueryScalarSteps::Made made;
  const Scalar answer = XQueryScalarTruth(_steps.answer(context, made));
  return answer.form == Form::Truth ? std::optional(answer.truth) : std::nullopt;
}

}  // namespace xquery
