#include "Plan/Operators/XQueryScalarProgram.h"

#include "Context/StackGuard.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryMachineArithmetic.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <utility>

namespace xquery {
namespace {

using Scalar = XQueryScalar;
using Form = XQueryScalar::Form;

// The commonest operations, which are most of what such functions do.
[[gnu::always_inline]] inline Scalar arithmetic(int type, const Scalar& left, const Scalar& right) {
  if (left.form == Form::Integer && right.form == Form::Integer) {
    const auto result = XQueryIntegerResult(type, left.integer, right.integer);
    return result ? Scalar::ofInteger(*result) : Scalar();
  }
  if (left.form == Form::Double && right.form == Form::Double) {
    const auto result = XQueryDoubleResult(type, left.number, right.number);
    return result ? Scalar::ofDouble(*result) : Scalar();
  }
  return XQueryScalarArithmetic(type, left, right);
}

[[gnu::always_inline]] inline Scalar comparison(int code, const Scalar& left, const Scalar& right) {
  if (left.form != Form::Integer || right.form != Form::Integer) {
    return XQueryScalarComparison(code, left, right);
  }
  switch (code) {
    case XQueryOperatorEq:
      return Scalar::ofTruth(left.integer == right.integer);
    case XQueryOperatorNe:
      return Scalar::ofTruth(left.integer != right.integer);
    case XQueryOperatorLt:
      return Scalar::ofTruth(left.integer < right.integer);
    case XQueryOperatorLe:
      return Scalar::ofTruth(left.integer <= right.integer);
    case XQueryOperatorGt:
      return Scalar::ofTruth(left.integer > right.integer);
    case XQueryOperatorGe:
      return Scalar::ofTruth(left.integer >= right.integer);
    default:
      return {};
  }
}

}  // namespace

struct XQueryScalarProgram::Run {
  // More calls in a row, each the last thing that the one before does, are left to the plain way,
  // which ends with an error if they do not.
  static constexpr int mostLastCalls = 100'000;

  // So many objects are made by calls in a row before those are dropped that none refers to.
  static constexpr size_t manyObjects = 64;

  const XQueryScalarProgram& program;
  bool outOfStack = false;
  XQueryScalarsMade made;

  // Slots and terms are those of one call, whose answer is that of its last term.
  Scalar call(const Function* function, Scalar* slots) {
    int lastCalls = 0;
    const size_t begin = made.size();
    const Term* term = &program._terms[function->body];
    while (true) {
      switch (term->kind) {
        case Kind::Conditional:
          term = branchOf(*term, slots);
          break;
        case Kind::Let:
          term = behindLet(*term, slots);
          break;
        case Kind::Call: {
          if (++lastCalls > mostLastCalls) outOfStack = true;
          checkWork();
          Scalar arguments[mostSlots];
          if (outOfStack || !evaluateOperands(*term, slots, arguments)) return {};
          if (made.size() > begin + manyObjects) keepFor(arguments, term->code, begin);
          std::copy_n(arguments, term->code, slots);
          function = &program._functions[term->left];
          term = &program._terms[function->body];
          break;
        }
        default:
          return value(*term, slots);
      }
      if (!term) return {};
    }
  }

  // Drops the objects behind the first ones but for what these values refer to.
  [[gnu::noinline]] void keepFor(const Scalar* values, size_t count, size_t begin) {
    const auto isUnused = [&](const Value& object) {
      return std::none_of(values, values + count, [&](const Scalar& value) {
        return value.hasObject() && value.object == object.get();
      });
    };
    const auto first = made.begin() + static_cast<std::ptrdiff_t>(begin);
    made.erase(std::remove_if(first, made.end(), isUnused), made.end());
  }

  // Null where nothing is known.
  const Term* branchOf(const Term& conditional, Scalar* slots) {
    Scalar truth = value(program._terms[conditional.left], slots);
    if (truth.form != Form::Truth) truth = XQueryScalarTruth(truth);
    if (truth.form == Form::Unknown) return nullptr;
    return &program._terms[truth.truth ? conditional.right : conditional.third];
  }

  const Term* behindLet(const Term& let, Scalar* slots) {
    const Scalar bound = value(program._terms[let.left], slots);
    if (bound.form == Form::Unknown) return nullptr;
    slots[let.code] = bound;
    return &program._terms[let.right];
  }

  bool evaluateOperands(const Term& call, Scalar* slots, Scalar* arguments) {
    for (size_t index = 0; index < call.code; ++index) {
      const Index operand = program._operands[call.right + index];
      arguments[index] = value(program._terms[operand], slots);
      if (arguments[index].form == Form::Unknown) return false;
    }
    return true;
  }

  Scalar value(const Term& term, Scalar* slots) {
    switch (term.kind) {
      case Kind::Constant:
        return term.constant;
      case Kind::Slot:
        return slots[term.code];
      case Kind::Arithmetic:
      case Kind::Comparison: {
        const Scalar left = value(program._terms[term.left], slots);
        if (left.form == Form::Unknown) return left;
        const Scalar right = value(program._terms[term.right], slots);
        if (right.form == Form::Unknown) return right;
        if (term.kind == Kind::Comparison) return comparison(term.code, left, right);
        const Scalar result = arithmetic(term.code, left, right);
        return result.form == Form::Unknown
                   ? XQueryScalarLongArithmetic(term.code, left, right, made)
                   : result;
      }
      case Kind::General: {
        const Scalar left = value(program._terms[term.left], slots);
        if (left.form == Form::Unknown) return left;
        const Scalar right = value(program._terms[term.right], slots);
        return left.form == Form::Integer && right.form == Form::Integer
                   ? comparison(term.code, left, right)
                   : XQueryScalarGeneralComparison(term.code, left, right);
      }
      case Kind::And:
      case Kind::Or:
      case Kind::Not:
        return logic(term, slots);
      case Kind::BuiltIn:
        return builtIn(term, slots);
      case Kind::Conditional: {
        const Term* branch = branchOf(term, slots);
        return branch ? value(*branch, slots) : Scalar();
      }
      case Kind::Let: {
        const Term* behind = behindLet(term, slots);
        return behind ? value(*behind, slots) : Scalar();
      }
      case Kind::Call:
        return nested(term, slots);
      case Kind::Quantifier:
        return quantified(term, slots);
    }
    return {};
  }

  Scalar quantified(const Term& term, Scalar* slots) {
    // A longer range may be refused.
    constexpr int64_t mostIntegers = 10'000'000;
    const Scalar first = value(program._terms[term.left], slots);
    if (first.form != Form::Integer) return {};
    const Scalar last = value(program._terms[term.right], slots);
    if (last.form != Form::Integer) return {};
    const bool ofEvery = term.constant.truth;
    if (first.integer > last.integer) return Scalar::ofTruth(ofEvery);
    int64_t distance = 0;
    const bool isFar = __builtin_sub_overflow(last.integer, first.integer, &distance);
    if (isFar || distance > mostIntegers) return {};
    const size_t begin = made.size();
    // Counted by distance: the last integer may be the greatest there is.
    for (int64_t offset = 0; offset <= distance; ++offset) {
      checkWork();
      made.resize(begin);
      slots[term.code] = Scalar::ofInteger(first.integer + offset);
      const Scalar holds = XQueryScalarTruth(value(program._terms[term.third], slots));
      if (holds.form == Form::Unknown || holds.truth != ofEvery) return holds;
    }
    return Scalar::ofTruth(ofEvery);
  }

  // Most have few operands.
  Scalar builtIn(const Term& term, Scalar* slots) {
    return term.right <= 2 ? builtInOf<2>(term, slots)
                           : builtInOf<XQueryMostScalarArguments>(term, slots);
  }

  template <size_t most>
  [[gnu::noinline]] Scalar builtInOf(const Term& term, Scalar* slots) {
    Scalar operands[most];
    for (size_t index = 0; index < term.right; ++index) {
      operands[index] = value(program._terms[program._operands[term.left + index]], slots);
      if (operands[index].form == Form::Unknown) return {};
    }
    return XQueryScalarAnswer(static_cast<XQueryScalarFunction>(term.code),
                              {operands, size_t{term.right}}, made);
  }

  // The operand behind one that decides is not looked at.
  Scalar logic(const Term& term, Scalar* slots) {
    const Scalar left = XQueryScalarTruth(value(program._terms[term.left], slots));
    if (left.form == Form::Unknown) return left;
    if (term.kind == Kind::Not) return Scalar::ofTruth(!left.truth);
    if (left.truth == (term.kind == Kind::Or)) return left;
    return XQueryScalarTruth(value(program._terms[term.right], slots));
  }

  [[gnu::noinline]] Scalar nested(const Term& term, Scalar* slots) {
    if (outOfStack || XQueryStackAddress() <= workMeter.stackLimit) {
      outOfStack = outOfStack || !XQueryStackHasRoom();
      if (outOfStack) return {};
    }
    checkWork();
    const size_t begin = made.size();
    Scalar arguments[mostSlots];
    if (!evaluateOperands(term, slots, arguments)) return {};
    const Scalar answer = call(&program._functions[term.left], arguments);
    if (made.size() > begin) keepFor(&answer, 1, begin);
    return answer;
  }
};

XQueryScalar XQueryScalarProgram::answer(Index function, XQueryScalar* slots, Value& made,
                                         bool& outOfStack) const {
  Run run{*this, false, {}};
  const Scalar answer = run.call(&_functions[function], slots);
  outOfStack = run.outOfStack;
  if (!run.made.empty() && answer.hasObject()) {
    run.keepFor(&answer, 1, 0);
    if (!run.made.empty()) made = std::move(run.made.front());
  }
  return answer;
}

}  // namespace xquery
