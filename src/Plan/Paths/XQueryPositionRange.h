// The positions that a predicate keeps which compares them with numbers that are the same for all
// items: "position() <= $n", "position() > 2 and position() < last()", "position() != 3".
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

  // Counted from 1, both included, but for one that is left out.
  struct Positions {
    uint64_t first = 1;
    uint64_t last = UINT64_MAX;
    uint64_t hole = 0;  // 0 for none
  };

  // Of the predicates of a step, which one it is; noPredicate for none.
  size_t predicate = noPredicate;

  // One of the comparisons that have to hold: in which order the position stands to the operand on
  // the right, or on the left, which can be repeated and reads no more of the focus than its size.
  void add(Ref<XQueryOperatorExpr> comparison, bool isWithRight, int order, bool readsSize) {
    _comparisons.push_back({std::move(comparison), isWithRight, order});
    _readsSize = _readsSize || readsSize;
  }
  // Whether the number of items has to be known.
  bool readsSize() const { return _readsSize; }

  // For the variables as they are now; nothing where the predicate has to be asked of each item:
  // what is compared with fails, or is no number. The second one is for that many items.
  std::optional<Positions> positions(XQueryContext& context) const;
  std::optional<Positions> positionsOf(size_t count, XQueryContext& context) const;

 private:
  struct Comparison {
    Ref<XQueryOperatorExpr> expr;
    bool isWithRight;
    int order;
  };

  static std::optional<Positions> positionsIn(const Comparison& comparison, XQueryContext& context);

  std::vector<Comparison> _comparisons;
  bool _readsSize = false;
};

}  // namespace xquery
