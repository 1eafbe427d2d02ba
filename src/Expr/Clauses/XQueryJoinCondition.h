// The comparison by which a where clause or a predicate picks items: one operand, the key, is read
// from the item, the other one, the probe, is the same for all items of one round.
#pragma once

#include "Expr/Operators/XQueryComparison.h"
#include "Expr/XQueryExpr.h"
#include "Expr/XQueryReads.h"

#include <functional>
#include <vector>

namespace xquery {

// What an expression reads while items are picked.
enum class XQueryJoinReads : uint8_t {
  Item,     // the item and nothing else
  Round,    // anything but the item
  Unknown,  // both, or it is not repeatable
};

struct XQueryJoinCondition {
  const XQueryExpr* key = nullptr;  // null when there is no such comparison
  const XQueryExpr* probe = nullptr;
  XQueryRelation relation{};  // of a key to a probe; never "not equal"
  // A value comparison wants one item on each side, a general one takes any number.
  bool isValueComparison = false;
  // The comparison, filters and guards are the whole condition.
  bool isWhole = false;
  // The conditions before the comparison, all joined by "and": those that read the item only, and
  // those that do not read it.
  std::vector<const XQueryExpr*> filters;
  std::vector<const XQueryExpr*> guards;
  // Key and filters look outside the item.
  bool looksOutOfItems = false;
  // What those of the probe and the guards read that look outside the nodes they start from.
  std::vector<XQueryReads> outward;

  using Reads = std::function<XQueryJoinReads(const XQueryExpr&)>;
  // Of several comparisons joined by "and" the one that promises to exclude most. An item that it
  // excludes is excluded by the whole condition: where an error excludes as well (`errorExcludes`)
  // because what stands before it is repeatable and what stands behind it cannot tell whether there
  // was an error, and otherwise because only filters and guards stand before it.
  static XQueryJoinCondition in(const XQueryExpr* condition, bool errorExcludes,
                                const Reads& reads);

 private:
  void noteOutward();
};

}  // namespace xquery
