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

}  // namespace xquery
