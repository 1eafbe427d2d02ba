// Arithmetic over the commonest operands without casts and without values in between.
//
// Three cases, each equal to the plain algorithm for the reason given; everything else, and every
// case that ends in an error, is left to the plain algorithm:
//
//   integer, decimal   Both operands are exactly xs:integer or xs:decimal and hold a decimal.
//                      Casting them to their common type keeps their value, and casting the result
//                      back to it keeps the result, so the decimals can be computed with directly.
//   small integers     The same with both values in a machine word and no overflow, where machine
//                      arithmetic is exact.
//   double             One operand is exactly xs:double, or untyped with a number for a text, and
//                      the other one of these or exactly xs:integer or xs:decimal. The common type
//                      is xs:double; an untyped operand is cast by scanning its text, and an exact
//                      one by scanning what it prints.
#include "Plan/Operators/XQueryQuickArithmetic.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryMachineArithmetic.h"
#include "Platform/Base/Counting.h"
#include "Platform/Base/LastingObjects.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryNumericOperand.h"

#include <cmath>
#include <cstdint>

namespace xquery {
namespace {

// --- small integers ------------------------------------------------------------------------------

Value smallIntegerAnswer(int type, int64_t a, int64_t b) {
  if (type == XQueryOperatorDiv) {
    if (b == 0 || b == -1 || a % b != 0) return Value();
    return XQueryNumber::numberWithDecimal(NSDecimal(a / b));
  }
  const auto result = XQueryIntegerResult(type, a, b);
  return result ? Value(XQueryNumber::integerWithInt64(*result)) : Value();
}

// --- decimals of any size ------------------------------------------------------------------------

Value exactAnswer(int type, const NSDecimal& a, const NSDecimal& b, bool bothIntegers) {
  const auto inCommonType = [bothIntegers](NSDecimal value) -> Value {
    return bothIntegers ? XQueryNumber::integerWithDecimal(std::move(value))
                        : XQueryNumber::numberWithDecimal(std::move(value));
  };
  switch (type) {
    case XQueryOperatorPlus:
      return inCommonType(a.add(b));
    case XQueryOperatorMinus:
      return inCommonType(a.subtract(b));
    case XQueryOperatorMultiply:
      return inCommonType(a.multiply(b));
    default:
      break;
  }
  if (b.isZero()) return Value();
  switch (type) {
    case XQueryOperatorDiv:
      return XQueryNumber::numberWithDecimal(a.divide(b));
    case XQueryOperatorIDiv:
      return XQueryNumber::integerWithDecimal(a.integerDivide(b));
    case XQueryOperatorMod:
      return inCommonType(a.remainder(b));
    default:
      return Value();
  }
}

// --- doubles -------------------------------------------------------------------------------------

Value doubleAnswer(int type, double a, double b) {
  if (const auto result = XQueryDoubleResult(type, a, b)) {
    return XQueryNumber::numberWithDouble(*result);
  }
  if (type != XQueryOperatorIDiv || b == 0) return Value();
  const double quotient = std::trunc(a / b);
  if (!(std::fabs(quotient) < static_cast<double>(XQueryExactIntegerBound))) return Value();
  return XQueryNumber::integerWithInt64(static_cast<int64_t>(quotient));
}

Value answerFor(int type, const NSObject* left, const NSObject* right) {
  // For idiv an untyped operand is an integer, which is not what a scanned double tells.
  const bool untypedOnes = type != XQueryOperatorIDiv;
  const auto a = XQueryNumericOperand::of(left, untypedOnes);
  if (a.form == XQueryNumericOperand::Other) return Value();
  return XQueryQuickArithmeticOf(type, a, XQueryNumericOperand::of(right, untypedOnes));
}

}  // namespace

Value XQueryQuickArithmeticOf(int type, const XQueryNumericOperand& a,
                              const XQueryNumericOperand& b) {
  if (a.form == XQueryNumericOperand::Other || b.form == XQueryNumericOperand::Other) {
    return Value();
  }
  if (a.form == XQueryNumericOperand::Double || b.form == XQueryNumericOperand::Double) {
    return doubleAnswer(type, a.asDouble(), b.asDouble());
  }
  const bool bothIntegers = a.isInteger && b.isInteger;
  if (bothIntegers && a.exact->isSmallInteger() && b.exact->isSmallInteger()) {
    Value answer = smallIntegerAnswer(type, a.exact->smallInteger(), b.exact->smallInteger());
    if (answer) return answer;
  }
  return exactAnswer(type, *a.exact, *b.exact, bothIntegers);
}

Value XQueryQuickArithmetic(int type, const Value& left, const Value& right, XQueryContext&) {
  return answerFor(type, left.get(), right.get());
}

Value XQueryQuickSign(int type, const Value&, const Value& operand, XQueryContext&) {
  // Adding to an integer leaves each of these operands in its own type.
  static const Ref<XQueryNumber> zero = [] {
    const LastingObjects lasting;
    Ref<XQueryNumber> integer = XQueryNumber::integerWithInt64(0);
    NSCounting::makeImmortal(*integer);
    return integer;
  }();
  return answerFor(type, zero.get(), operand.get());
}

}  // namespace xquery
