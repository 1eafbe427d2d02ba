#include "Expr/Operators/XQueryComparison.h"

#include "Expr/Operators/XQueryArithmetic.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
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

}  // namespace

Value XQueryOperatorExpr::valueComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                          const Value& right,
                                                          XQueryContext& forContext) {
  Value a = XQueryAtomizationCheckingOccurrence(withLeft, XQueryOccurrenceAnyAlso, forContext);
  Value b = XQueryAtomizationCheckingOccurrence(right, XQueryOccurrenceAnyAlso, forContext);
  if (isNull(a) || isNull(b)) return NSNull::null();
  a = untypedAsString(std::move(a), forContext);
  b = untypedAsString(std::move(b), forContext);
  return compareValue(a, b, type, forContext);
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

Value XQueryOperatorExpr::generalComparisonOperatorEvaluate(int type, const Value& withLeft,
                                                            const Value& right,
                                                            XQueryContext& forContext) {
  const Value a = XQueryAtomization(withLeft, forContext);
  const Value b = XQueryAtomization(right, forContext);
  if (isNull(a) || isNull(b)) return NSNull::null();
  const XQueryItemList leftItems(a.get());
  const XQueryItemList rightItems(b.get());
  const int code = type + (XQueryOperatorEq - XQueryOperatorEqual);
  for (size_t i = 0; i < leftItems.count(); ++i) {
    for (size_t j = 0; j < rightItems.count(); ++j) {
      checkWork();
      const XQueryPairTargets targets = XQueryGeneralComparisonTargets(
          XQueryObjectTypeID(leftItems[i]), XQueryObjectTypeID(rightItems[j]));
      const Value x = castTo(leftItems[i], targets.left, forContext);
      const Value y = castTo(rightItems[j], targets.right, forContext);
      Value answer = compareValue(x, y, code, forContext);
      if (!(answer.get() == NSNumber::falseValue())) return answer;
    }
  }
  return truth(false);
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
