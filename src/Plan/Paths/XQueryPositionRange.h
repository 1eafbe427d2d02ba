// The positions that a predicate keeps which compares them with numbers that are the same for all
// items: "position() <= $n", "position() > 2 and position() < count($a)".
#pragma once

#include "Expr/Operators/XQueryOperatorExpr.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {

class XQueryContext;

class XQueryPositionRange {
 public:
  static constexpr size_t noPredicate = SIZE_MAX;

  // Counted from 1, both included.
  struct Positions {
    uint64_t first = 1;
    uint64_t last = UINT64_MAX;
  };

  // Of the predicates of a step, which one it is; noPredicate for none.
  size_t predicate = noPredicate;

  // One of the comparisons that have to hold: in which order the position stands to the operand on
  // the right, or on the left, which can be repeated and reads no focus.
  void add(Ref<XQueryOperatorExpr> comparison, bool isWithRight, int order) {
    _comparisons.push_back({std::move(comparison), isWithRight, order});
  }

  // For the variables as they are now; nothing where the predicate has to be asked of each item:
  // what is compared with fails, or is no number.
  std::optional<Positions> positions(XQueryContext& context) const;

 private:
  struct Comparison {
    Ref<XQueryOperatorExpr> expr;
    bool isWithRight;
    int order;
  };

  std::vector<Comparison> _comparisons;
};

}  // namespace xquery
