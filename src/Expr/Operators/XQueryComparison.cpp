#include "Expr/Operators/XQueryComparison.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Operators/XQueryUntypedText.h"
#include "Expr/Paths/NodeOrder.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryCasting.h"
#include "Types/XQueryDate.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryString.h"
#include "xquery/Collection.h"

#include <array>
#include <cstdint>

namespace xquery {
namespace {

using Test = XQueryRelation::Test;

// From eq to ge.
constexpr std::array<XQueryRelation, 6> relations = {{
    {Test::Equal, false},    // eq
    {Test::Equal, true},     // ne
    {Test::Less, false},     // lt
    {Test::Greater, true},   // le
    {Test::Greater, false},  // gt
    {Test::Less, true},      // ge
}};

Value truth(bool value) {
  return NSNumber::numberWithBool(value);
}

bool isNumericPrimitive(XQueryTypeID primitive) {
  return primitive >= XQueryTypeDouble && primitive <= XQueryTypeDecimal;
}

bool eitherIsNaN(const NSNumber& a, const NSNumber& b) {
  return XQueryIsNaN(a) || XQueryIsNaN(b);
}

// By code point. The left operand is a string; anything else on the right is promoted to one.
int orderOfStrings(const Value& a, const Value& b, XQueryContext& context) {
  const Value right = isa<NSString>(b) ? b : XQueryPromoteToString(b, context);
  return cast<NSString>(a)->compare(*cast<NSString>(right));
}

// Durations are ordered within one kind only; a plain duration is not ordered at all. 2 when there
// is no answer.
constexpr int unordered = 2;
int orderOfDurations(const NSObject* a, const NSObject* b) {
  const XQueryTypeID type = XQueryObjectTypeID(a);
  if (XQueryObjectTypeID(b) != type) return unordered;
  const auto order = [](auto x, auto y) { return x < y ? -1 : x > y ? 1 : 0; };
  if (type == XQueryTypeDayTimeDuration) {
    return order(cast<NSNumber>(a)->doubleValue(), cast<NSNumber>(b)->doubleValue());
  }
  if (type == XQueryTypeYearMonthDuration) {
    return order(cast<NSNumber>(a)->integerValue(), cast<NSNumber>(b)->integerValue());
  }
  return unordered;
}

Value equalDurations(const NSObject& a, const NSObject& b) {
  const XQueryTypeID type = XQueryObjectTypeID(&a);
  if (type != XQueryTypeYearMonthDuration && type != XQueryTypeDayTimeDuration) return Value();
  return xquery_type_equal(a, b, type);
}

Value equalBooleans(const NSObject* a, const NSObject* b) {
  if (a == b) return truth(true);
  const bool bothTruths = b == NSNumber::trueValue() || b == NSNumber::falseValue();
  return bothTruths ? truth(false) : Value();
}

// Null when values of these types have no equality. The primitive type of both is `primitive`, or
// both are numbers.
Value equality(const Value& a, const Value& b, XQueryTypeID primitive, XQueryContext& context) {
  switch (primitive) {
    case XQueryTypeString:
      return truth(orderOfStrings(a, b, context) == 0);
    case XQueryTypeBoolean:
      return equalBooleans(a.get(), b.get());
    case XQueryTypeDouble:
    case XQueryTypeFloat:
    case XQueryTypeDecimal:
      return truth(op_numeric_equal(*cast<NSNumber>(a), *cast<NSNumber>(b)));
    case XQueryTypeDuration:
      return equalDurations(*a, *b);
    // The remaining types are their own primitive types, so that having this primitive type is
    // having exactly this type.
    case XQueryTypeAnyURI:
    case XQueryTypeQName:
    case XQueryTypeGYearMonth:
    case XQueryTypeGYear:
    case XQueryTypeGMonthDay:
    case XQueryTypeGDay:
    case XQueryTypeGMonth:
    case XQueryTypeDateTime:
    case XQueryTypeDate:
    case XQueryTypeTime:
    case XQueryTypeBase64Binary:
    case XQueryTypeHexBinary:
    case XQueryTypeNotation:
      return xquery_type_equal(*a, *b, primitive);
    default:
      return Value();
  }
}

// Whether a is below (or above) b; the left type alone decides how they are compared.
Value ordering(Test test, const Value& a, const Value& b, XQueryTypeID primitive,
               XQueryContext& context) {
  const auto tested = [test](int order) { return truth(XQueryRelation{test, false}.holds(order)); };
  switch (primitive) {
    case XQueryTypeString:
      return tested(orderOfStrings(a, b, context));
    case XQueryTypeBoolean: {
      const NSObject* lower = test == Test::Less ? a.get() : b.get();
      const NSObject* upper = test == Test::Less ? b.get() : a.get();
      return truth(lower == NSNumber::falseValue() && upper == NSNumber::trueValue());
    }
    case XQueryTypeDouble:
    case XQueryTypeFloat:
    case XQueryTypeDecimal: {
      if (!isa<NSNumber>(b)) return Value();
      const NSNumber& left = *cast<NSNumber>(a);
      const NSNumber& right = *cast<NSNumber>(b);
      if (eitherIsNaN(left, right)) return truth(false);
      return truth(test == Test::Less ? op_numeric_less_than(left, right)
                                      : op_numeric_greater_than(left, right));
    }
    // Any of the eight types may stand on the right: instants are compared.
    case XQueryTypeDateTime:
    case XQueryTypeDate:
    case XQueryTypeTime: {
      if (!isa<XQueryDate>(b)) return Value();
      const auto order = cast<XQueryDate>(a)->instant() <=> cast<XQueryDate>(b)->instant();
      return truth(test == Test::Less ? order < 0 : order > 0);
    }
    case XQueryTypeDuration: {
      const int order = orderOfDurations(a.get(), b.get());
      return order == unordered ? Value() : tested(order);
    }
    default:
      return Value();
  }
}

bool haveEquality(const NSObject* a, const NSObject* b, XQueryTypeID pa, XQueryTypeID pb) {
  return pa == pb ||
         XQueryLeastCommonNumericType(XQueryObjectTypeID(a), XQueryObjectTypeID(b)) != 0;
}

}  // namespace

XQueryRelation XQueryRelationForCode(int valueComparisonCode) {
  return relations[static_cast<size_t>(valueComparisonCode - XQueryOperatorEq)];
}

XQueryRelation XQueryMirrored(XQueryRelation relation) {
  if (relation.test == XQueryRelation::Less) {
    relation.test = XQueryRelation::Greater;
  } else if (relation.test == XQueryRelation::Greater) {
    relation.test = XQueryRelation::Less;
  }
  return relation;
}

Value XQueryOperatorExpr::compareValue(const Value& a, const Value& withValue, int forType,
                                       XQueryContext& withContext) {
  const Value& b = withValue;
  if (!a || !b) return Value();
  const XQueryTypeID pa = XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(a.get()));
  const XQueryTypeID pb = XQueryPrimitiveTypeForTypeID(XQueryObjectTypeID(b.get()));
  if (pa == XQueryTypeEmpty || pb == XQueryTypeEmpty) return NSNull::null();
  if (forType < XQueryOperatorEq || forType > XQueryOperatorGe) return Value();
  const XQueryRelation relation = XQueryRelationForCode(forType);
  Value answer;
  if (relation.test != Test::Equal) {
    answer = ordering(relation.test, a, b, pa, withContext);
  } else if (haveEquality(a.get(), b.get(), pa, pb)) {
    answer = equality(a, b, pa, withContext);
  }
  if (!answer || !relation.negated) return answer;
  // Not even the negated comparisons hold for NaN.
  if (isNumericPrimitive(pa) && eitherIsNaN(*cast<NSNumber>(a), *cast<NSNumber>(b))) {
    return truth(false);
  }
  return truth(!XQueryIsTrue(answer));
}

// --- value comparisons ---------------------------------------------------------------------------

namespace {

Value untypedAsString(Value atomic, XQueryContext& context) {
  if (XQueryObjectTypeID(atomic.get()) != XQueryTypeUntypedAtomic) return atomic;
  return XQueryCastAsTypeForContext(atomic, XQueryTypeString, context);
}

bool hasText(const NSObject* operand) {
  return XQueryIsUntyped(operand) || isa<XQueryString>(operand);
}

// Exactly xs:integer, in a machine word.
const NSDecimal* smallInteger(const XQueryNumber& number) {
  if (number.typeID() != XQueryTypeInteger) return nullptr;
  const NSDecimal* decimal = number.storedDecimal();
  return decimal && decimal->isSmallInteger() ? decimal : nullptr;
}

// Null unless both operands are typed numbers (which the durations are not). Numbers are compared
// by their order, no relation holding for NaN; comparing integers in a word is that for them.
Value numberShortcut(XQueryRelation relation, const NSObject* left, const NSObject* right) {
  const auto* a = dyn_cast<XQueryNumber>(left);
  const auto* b = a ? dyn_cast<XQueryNumber>(right) : nullptr;
  if (!b) return Value();
  const NSDecimal* x = smallInteger(*a);
  const NSDecimal* y = x ? smallInteger(*b) : nullptr;
  if (y) {
    const int64_t first = x->smallInteger();
    const int64_t second = y->smallInteger();
    return truth(relation.holds(first < second ? -1 : first > second ? 1 : 0));
  }
  if (!XQueryIsNumericTypeID(a->typeID()) || !XQueryIsNumericTypeID(b->typeID())) return Value();
  if (eitherIsNaN(*a, *b)) return truth(false);
  return truth(relation.holds(a->compare(*b)));
}

}  // namespace

Value XQueryValueComparisonPlainly(int type, const Value& left, const Value& right,
                                   XQueryContext& context) {
  Value a = XQueryAtomizationCheckingOccurrence(left, XQueryOccurrenceAnyAlso, context);
  Value b = XQueryAtomizationCheckingOccurrence(right, XQueryOccurrenceAnyAlso, context);
  if (isNull(a) || isNull(b)) return NSNull::null();
  a = untypedAsString(std::move(a), context);
  b = untypedAsString(std::move(b), context);
  return XQueryOperatorExpr::compareValue(a, b, type, context);
}

Value XQueryValueComparisonShortcut(int type, const NSObject* left, const NSObject* right) {
  if (type < XQueryOperatorEq || type > XQueryOperatorGe) return Value();
  const XQueryRelation relation = XQueryRelationForCode(type);
  // An untyped operand is compared as a string, and so is every string type.
  if (hasText(left) && hasText(right)) {
    const XQueryUntypedText a(*left);
    const XQueryUntypedText b(*right);
    if (relation.test == Test::Equal) {
      return truth(a.view().equals(b.view()) != relation.negated);
    }
    return truth(relation.holds(a.view().compare(b.view())));
  }
  return numberShortcut(relation, left, right);
}

Value XQueryOperatorExpr::valueComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                          const Value& right,
                                                          XQueryContext& forContext) {
  if (Value answer = XQueryValueComparisonShortcut(type, withLeft.get(), right.get())) {
    return answer;
  }
  return XQueryValueComparisonPlainly(type, withLeft, right, forContext);
}

// --- general comparisons -------------------------------------------------------------------------

XQueryPairTargets XQueryGeneralComparisonTargets(XQueryTypeID left, XQueryTypeID right) {
  const bool leftUntyped = left == XQueryTypeUntypedAtomic;
  const bool rightUntyped = right == XQueryTypeUntypedAtomic;
  if (leftUntyped && rightUntyped) return {XQueryTypeString, XQueryTypeString};
  const auto targetFor = [](XQueryTypeID other) {
    const bool numeric = isNumericPrimitive(XQueryPrimitiveTypeForTypeID(other));
    return numeric ? XQueryTypeID{XQueryTypeDouble} : other;
  };
  return {leftUntyped ? targetFor(right) : XQueryTypeNone,
          rightUntyped ? targetFor(left) : XQueryTypeNone};
}

namespace {

Value castTo(NSObject* item, XQueryTypeID target, XQueryContext& context) {
  const Value value(item);
  return target == XQueryTypeNone ? value : XQueryCastAsTypeForContext(value, target, context);
}

}  // namespace

Value XQueryGeneralComparisonPlainly(int type, const Value& left, const Value& right,
                                     XQueryContext& context) {
  const Value a = XQueryAtomization(left, context);
  const Value b = XQueryAtomization(right, context);
  if (isNull(a) || isNull(b)) return NSNull::null();
  const XQueryItemList leftItems(a.get());
  const XQueryItemList rightItems(b.get());
  const int code = type + (XQueryOperatorEq - XQueryOperatorEqual);
  for (size_t i = 0; i < leftItems.count(); ++i) {
    for (size_t j = 0; j < rightItems.count(); ++j) {
      checkWork();
      const XQueryPairTargets targets = XQueryGeneralComparisonTargets(
          XQueryObjectTypeID(leftItems[i]), XQueryObjectTypeID(rightItems[j]));
      const Value x = castTo(leftItems[i], targets.left, context);
      const Value y = castTo(rightItems[j], targets.right, context);
      Value answer = XQueryOperatorExpr::compareValue(x, y, code, context);
      if (!(answer.get() == NSNumber::falseValue())) return answer;
    }
  }
  return truth(false);
}

Value XQueryOperatorExpr::generalComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                            const Value& right,
                                                            XQueryContext& forContext) {
  // Most comparisons are of two single numbers, which need no conversion.
  if (type >= XQueryOperatorEqual && type <= XQueryOperatorGreaterEqual) {
    const int code = type + (XQueryOperatorEq - XQueryOperatorEqual);
    Value answer = numberShortcut(XQueryRelationForCode(code), withLeft.get(), right.get());
    if (answer) return answer;
  }
  if (Value answer = XQueryGeneralComparisonShortcut(type, withLeft, right, forContext)) {
    return answer;
  }
  return XQueryGeneralComparisonPlainly(type, withLeft, right, forContext);
}

// --- node comparisons ----------------------------------------------------------------------------

Value XQueryOperatorExpr::nodeComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                         const Value& right, XQueryContext&) {
  const Value a = normalised(withLeft);
  const Value b = normalised(right);
  if (!a || !b) return Value();
  if ((isNull(a) || a->isNode()) && (isNull(b) || b->isNode()) && (isNull(a) || isNull(b))) {
    return NSNull::null();
  }
  if (!a->isNode() || !b->isNode()) return Value();
  switch (type) {
    case XQueryOperatorIs:
      return truth(a == b);
    case XQueryOperatorBefore:
      return op_node_before(cast<NSXMLNode>(a), cast<NSXMLNode>(b));
    case XQueryOperatorAfter:
      return op_node_after(cast<NSXMLNode>(a), cast<NSXMLNode>(b));
    default:
      return Value();
  }
}

}  // namespace xquery
