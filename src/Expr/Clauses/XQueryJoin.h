// Joins: a for clause whose where clause, or a step of a path whose predicate, picks items by a
// comparison of a key with a probe finds them in a table of the keys when it is evaluated again
// over the same items. The plain way evaluates the comparison for every item each time, which makes
// a join of two lists take as many comparisons as there are pairs.
//
// Nobody can tell the difference. Key, probe and items are repeatable expressions (XQueryReads.h),
// so how often they are evaluated does not matter; items and keys are found where nothing changes
// while a query is evaluated, which is inside a node and, for nodes of documents, around it; an
// item whose comparison may be an error is compared the plain way when its turn comes; and where
// the probe itself fails, or anything else is unusual, the whole round is done the plain way. With
// diagnostics on, when evaluating writes to the log, there are no joins.
#pragma once

#include "Expr/Clauses/XQueryJoinCondition.h"
#include "Expr/Clauses/XQueryJoinTable.h"
#include "Expr/XQueryReads.h"

#include <memory>
#include <utility>

namespace xquery {

class XQueryForExpr;
class XQueryStep;

// The join of a FLWOR's last for clause with its where clause.
class XQueryForJoin {
 public:
  // Null when the two make none. They must be bound.
  static std::unique_ptr<const XQueryForJoin> joinOf(const XQueryForExpr& clause,
                                                     const XQueryExpr* where);

  // The table and what it selects for the values that the variables have now; null for the plain
  // way. `owner` is the FLWOR.
  std::shared_ptr<XQueryJoinTable> select(const XQueryExpr& owner, XQueryContext& context,
                                          XQueryJoinTable::Selection& selection) const;
  // Whether a tuple needs no look at the where clause.
  bool decides(const XQueryJoinTable::Match& match) const {
    return match.isSure && _condition.isWhole;
  }

 private:
  XQueryForJoin(const XQueryForExpr& clause, XQueryJoinCondition condition, XQueryReads itemReads)
      : _clause(clause), _condition(std::move(condition)), _itemReads(std::move(itemReads)) {}
  std::shared_ptr<XQueryJoinTable> makeTable(XQueryContext& context) const;

  const XQueryForExpr& _clause;
  XQueryJoinCondition _condition;
  XQueryReads _itemReads;
};

// The join of a path's step that has one predicate.
class XQueryPathJoin {
 public:
  // The first one among the steps, which must be bound, without those before it being anything but
  // axis steps, apart from the first one; null when there is none.
  static std::unique_ptr<const XQueryPathJoin> joinOf(const XQueryStep* firstStep);

  const XQueryStep* step() const { return &_step; }
  // Lists the items that the predicate is asked for, in order; false when there are unusual ones.
  using ItemLister = std::function<bool(std::vector<Value>& items)>;
  // As above. The items depend on `start` only.
  std::shared_ptr<XQueryJoinTable> select(const XQueryExpr& owner, const Value& start,
                                          const ItemLister& listItems, XQueryContext& context,
                                          XQueryJoinTable::Selection& selection) const;
  bool decides(const XQueryJoinTable::Match& match) const {
    return match.isSure && _condition.isWhole;
  }

 private:
  XQueryPathJoin(const XQueryStep& step, XQueryJoinCondition condition, bool looksOutOfStart)
      : _step(step), _condition(std::move(condition)), _looksOutOfStart(looksOutOfStart) {}

  const XQueryStep& _step;
  XQueryJoinCondition _condition;
  bool _looksOutOfStart;  // to find the items
};

}  // namespace xquery
