// The comparison by which a where clause or a predicate picks items: one operand, the key, is read
// from the item, the other one, the probe, is the same for all items of one round.
#pragma once

#include "Expr/XQueryComparison.h"
#include "Expr/XQueryExpr.h"

#include <functional>

namespace xquery {

struct XQueryJoinCondition {
  const XQueryExpr* key = nullptr;
  const XQueryExpr* probe = nullptr;
  XQueryRelation relation{};  // of a key to a probe; never "not equal"
  // A value comparison wants one item on each side, a general one takes any number.
  bool isValueComparison = false;
  // The condition is nothing but this comparison; otherwise it is one of several joined by "and".
  bool isWhole = false;

  using Accepts = std::function<bool(const XQueryExpr&)>;
  // Finds the comparison in a condition. An item that it excludes must be excluded by the whole:
  // of several comparisons the first one is asked, or any one where an error excludes as well. The
  // key is null when there is none.
  static XQueryJoinCondition in(const XQueryExpr* condition, bool errorExcludes,
                                const Accepts& isKey, const Accepts& isProbe);
};

}  // namespace xquery
