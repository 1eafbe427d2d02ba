#include "Plan/Operators/XQueryScalar.h"

#include "Expr/Operators/XQueryComparison.h"
#include "Expr/XQueryListChanges.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Operators/XQueryMachineArithmetic.h"
#include "Plan/Operators/XQueryQuickArithmetic.h"
#include "Plan/Operators/XQueryScalarText.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryNumericOperand.h"
#include "Types/XQueryString.h"
#include "xquery/Collection.h"

#include <cmath>
#include <stdexcept>
#include <utility>
#include <vector>

namespace xquery {
namespace {

using Scalar = XQueryScalar;
using Form = XQueryScalar::Form;

// An operand of arithmetic: the number that an object holds, or is cast to when it is untyped.
Scalar numberIn(const Scalar& operand, bool untypedOnes) {
  if (operand.form == Form::Integer || operand.form == Form::Double) return operand;
  if (operand.form != Form::Object) return {};
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

// A number as it is; `integer` takes what is no object.
XQueryNumericOperand operandOf(const Scalar& value, bool untypedOnes, NSDecimal& integer) {
  XQueryNumericOperand operand;
  if (value.form == Form::Object) return XQueryNumericOperand::of(value.object, untypedOnes);
  if (value.form == Form::Double) {
    operand.form = XQueryNumericOperand::Double;
    operand.number = value.number;
  } else if (value.form == Form::Integer) {
    integer = NSDecimal(value.integer);
    operand.form = XQueryNumericOperand::Exact;
    operand.isInteger = true;
    operand.exact = &integer;
  }
  return operand;
}

// Of decimals and large integers.
Scalar longComparison(XQueryRelation relation, const Scalar& left, const Scalar& right) {
  NSDecimal integers[2];
  const auto a = operandOf(left, false, integers[0]);
  const auto b = operandOf(right, false, integers[1]);
  const bool areExact =
      a.form == XQueryNumericOperand::Exact && b.form == XQueryNumericOperand::Exact;
  return areExact ? Scalar::ofTruth(relation.holds(a.exact->compare(*b.exact))) : Scalar();
}

}  // namespace

// More digits than a decimal holds are an error.
XQueryScalar XQueryScalarLongArithmetic(int type, const Scalar& left, const Scalar& right,
                                        XQueryScalarsMade& made) {
  const bool untypedOnes = type != XQueryOperatorIDiv;
  NSDecimal integers[2];
  const auto a = operandOf(left, untypedOnes, integers[0]);
  const auto b = operandOf(right, untypedOnes, integers[1]);
  try {
    Value result = XQueryQuickArithmeticOf(type, a, b);
    const Scalar number = numberIn(Scalar::ofObject(result.get()), false);
    return number.form != Form::Unknown || !result ? number
                                                   : XQueryScalarMade(std::move(result), made);
  } catch (const std::length_error&) {
    return {};
  }
}

// No relation holds for what is not a number.
XQueryScalar XQueryScalarNumberComparison(int code, const Scalar& left, const Scalar& right) {
  const Scalar a = numberIn(left, false);
  const Scalar b = numberIn(right, false);
  const XQueryRelation relation = XQueryRelationForCode(code);
  if (a.form == Form::Unknown || b.form == Form::Unknown) {
    return longComparison(relation, left, right);
  }
  if (a.form == Form::Integer && b.form == Form::Integer) {
    return related(relation, a.integer, b.integer);
  }
  if (!isDoubleToo(a) || !isDoubleToo(b)) return {};
  const double x = asDouble(a);
  const double y = asDouble(b);
  if (std::isnan(x) || std::isnan(y)) return Scalar::ofTruth(false);
  return related(relation, x, y);
}

// Untyped texts and those of type xs:string are compared as strings, and so are all string types.
XQueryScalar XQueryScalarComparison(int code, const Scalar& left, const Scalar& right) {
  const bool isNumber = left.form == Form::Integer || left.form == Form::Double ||
                        (left.form == Form::Object && isa<XQueryNumber>(left.object));
  if (isNumber) return XQueryScalarNumberComparison(code, left, right);
  const XQueryScalarText a(left);
  if (!a.isItem()) return XQueryScalarNumberComparison(code, left, right);
  const XQueryScalarText b(right);
  if (!a.comparesWith(b)) return {};
  const XQueryRelation relation = XQueryRelationForCode(code);
  if (relation.test != XQueryRelation::Equal) {
    return Scalar::ofTruth(relation.holds(a.view().compare(b.view())));
  }
  return Scalar::ofTruth(a.view().equals(b.view()) != relation.negated);
}

// In the order of the pairs, of which the first one that holds decides.
XQueryScalar XQueryScalarGeneralComparison(int code, const Scalar& left, const Scalar& right) {
  if (left.form != Form::Items && right.form != Form::Items) {
    return XQueryScalarComparison(code, left, right);
  }
  if (left.form == Form::Unknown || right.form == Form::Unknown) return {};
  if (left.isNothing() || right.isNothing()) return Scalar::ofNothing();
  WorkPacer pacer;
  for (uint32_t i = 0; i < XQueryScalarCount(left); ++i) {
    const Scalar a = XQueryScalarItem(left, i);
    for (uint32_t j = 0; j < XQueryScalarCount(right); ++j) {
      pacer.turn();
      const Scalar holds = XQueryScalarComparison(code, a, XQueryScalarItem(right, j));
      if (holds.form != Form::Truth || holds.truth) return holds;
    }
  }
  return Scalar::ofTruth(false);
}

XQueryScalar XQueryScalarNumber(const Scalar& value) {
  return numberIn(value, false);
}

XQueryScalar XQueryScalarTruth(const Scalar& value) {
  switch (value.form) {
    case Form::Truth:
      return value;
    case Form::Integer:
      return Scalar::ofTruth(value.integer != 0);
    case Form::Double:
      return Scalar::ofTruth(value.number != 0 && !std::isnan(value.number));
    case Form::Text:
    case Form::Items:
      return Scalar::ofTruth(value.length != 0);
    case Form::Object: {
      if (const auto* string = dyn_cast<NSString>(value.object)) {
        return Scalar::ofTruth(string->length() != 0);
      }
      const Scalar number = numberIn(value, false);
      return number.form == Form::Unknown ? number : XQueryScalarTruth(number);
    }
    default:
      return {};
  }
}

// --- texts and lists -----------------------------------------------------------------------------

XQueryScalar XQueryScalar::ofNothing() {
  return ofItems(NSNull::null(), 0, 0);
}

// An array of fewer than two items is none of the values that variables hold.
XQueryScalar XQueryScalar::ofValue(const NSObject* value) {
  if (!value) return {};
  if (value->kind() == Kind::TypedNumber || value->isNode() || isa<NSString>(value)) {
    return ofObject(value);
  }
  if (value == NSNumber::trueValue()) return ofTruth(true);
  if (value == NSNumber::falseValue()) return ofTruth(false);
  if (value->kind() == Kind::Null) return ofNothing();
  if (const auto* array = dyn_cast<NSArray>(value)) {
    const size_t count = array->count();
    if (count < 2 || count > UINT32_MAX) return {};
    return ofItems(array, 0, static_cast<uint32_t>(count));
  }
  return XQueryIsAtomicType(value) ? ofObject(value) : XQueryScalar();
}

// What stands in an array as an item is one, but in arrays of hosts.
XQueryScalar XQueryScalarItem(const Scalar& list, uint32_t index) {
  if (list.form != Form::Items) return list;
  const auto* array = cast<NSArray>(list.object);
  const Scalar item = Scalar::ofValue(array->objectAtIndex(size_t{list.start} + index));
  return item.form == Form::Items ? Scalar() : item;
}

namespace {

Value valueOfItems(const Scalar& items) {
  if (items.length == 0) return NSNull::null();
  const auto* array = cast<NSArray>(items.object);
  if (items.length == array->count()) return const_cast<NSArray*>(array);
  std::vector<Value> part;
  XQueryAppendItems(array->objects(), items.start, items.length, part);
  if (array->kind() != Kind::Sequence) return NSArray::arrayWithObjects(std::move(part));
  auto sequence = XQuerySequence::sequence();
  sequence->objects() = std::move(part);
  return sequence;
}

}  // namespace

Value XQueryScalarValue(const Scalar& value) {
  switch (value.form) {
    case Form::Integer:
      return XQueryNumber::integerWithInt64(value.integer);
    case Form::Double:
      return XQueryNumber::numberWithDouble(value.number);
    case Form::Truth:
      return NSNumber::numberWithBool(value.truth);
    case Form::Object:
      return const_cast<NSObject*>(value.object);
    case Form::Text:
      return XQueryString::stringWithView(XQueryScalarText(value).view());
    case Form::Items:
      return valueOfItems(value);
    default:
      return {};
  }
}

}  // namespace xquery
