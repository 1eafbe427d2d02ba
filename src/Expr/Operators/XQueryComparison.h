// Value and general comparisons.
#pragma once

#include "Types/XQueryTypeTable.h"
#include "xquery/Object.h"

#include <cstdint>

namespace xquery {

class XQueryContext;

// How a comparison code follows from the order of two values.
struct XQueryRelation {
  enum Test : uint8_t { Equal, Less, Greater };
  Test test;
  bool negated;  // ne is not eq, le is not gt, ge is not lt

  // `order` is -1, 0 or 1.
  bool holds(int order) const {
    const bool met = test == Equal ? order == 0 : test == Less ? order < 0 : order > 0;
    return met != negated;
  }
};
// For a value comparison code, 19 to 24.
XQueryRelation XQueryRelationForCode(int valueComparisonCode);
// The relation with its sides exchanged: a < b is b > a, and not (a < b) is not (b > a).
XQueryRelation XQueryMirrored(XQueryRelation relation);

// The types to which a pair is cast before a general comparison; 0 leaves an item as it is.
struct XQueryPairTargets {
  XQueryTypeID left;
  XQueryTypeID right;
};
XQueryPairTargets XQueryGeneralComparisonTargets(XQueryTypeID left, XQueryTypeID right);

// The comparison operators without shortcuts: what they answer is the definition.
Value XQueryValueComparisonPlainly(int type, const Value& left, const Value& right,
                                   XQueryContext& context);
Value XQueryGeneralComparisonPlainly(int type, const Value& left, const Value& right,
                                     XQueryContext& context);

// The same answers for the commonest operands; null when the shortcut does not apply.
Value XQueryValueComparisonShortcut(int type, const NSObject* left, const NSObject* right);
Value XQueryGeneralComparisonShortcut(int type, const Value& left, const Value& right,
                                      XQueryContext& context);
// A general comparison with all the integers from `first` to `last`, which are not made for it.
Value XQueryGeneralComparisonWithRange(int type, const Value& left, int64_t first, int64_t last);

}  // namespace xquery
