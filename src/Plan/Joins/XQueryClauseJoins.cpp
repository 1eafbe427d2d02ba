#include "Plan/Joins/XQueryClauseJoins.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Joins/XQueryJoin.h"

#include <memory>
#include <utility>

namespace xquery {
namespace {

int64_t positionOf(const XQueryBindingExpr& clause) {
  const auto* forExpr = dyn_cast<XQueryForExpr>(&clause);
  return forExpr ? forExpr->posVarID() : 0;
}

bool isKnown(int64_t varID) {
  return varID > 0 && varID < XQueryVariableSet::most;
}

}  // namespace

// Whether the clause takes items of a list one after another. The integers of a range have no keys
// that a table could keep.
bool XQueryClauseJoins::walksItems(size_t index) const {
  const XQueryBindingExpr& clause = clauseAt(index);
  const XQueryPlaceID bound = boundAt(index);
  return clause.kind() != Kind::LetExpr && !clause.type() && isKnown(clause.varID()) &&
         bound != XQueryNoPlace && !XQueryOperatorExpr::rangeIn(at(bound).expr);
}

// Whether the values of a later clause follow from the item of an earlier one, so that they may be
// on the way to its keys.
bool XQueryClauseJoins::mayFollow(size_t index, size_t later) const {
  const XQueryBindingExpr& clause = clauseAt(later);
  if (clause.kind() == Kind::LetExpr) {
    return !clause.type() && isKnown(clause.varID()) && boundAt(later) != XQueryNoPlace;
  }
  if (!walksItems(later) || positionOf(clause) != 0) return false;
  // In place of a quantifier's clause without items the next one is tried.
  return clause.kind() == Kind::ForExpr || (later == index + 1 && later + 1 == _clauses.size());
}

// What the clauses behind one of them mean for leaving out its items. `scope` is that of its items.
XQueryClauseJoins::Later XQueryClauseJoins::clausesBehind(size_t index,
                                                          XQueryJoinScope& scope) const {
  Later found;
  for (size_t later = index + 1; later < _clauses.size(); ++later) {
    for (const int64_t varID : {clauseAt(later).varID(), positionOf(clauseAt(later))}) {
      scope.settled.add(varID);
      found.leftovers.add(varID);
    }
  }
  for (size_t later = index + 1; later < _clauses.size(); ++later) {
    const XQueryBindingExpr& clause = clauseAt(later);
    const XQueryFacts& known = facts(_clauses[later]);
    found.leftovers.add(known.assigns);
    const XQueryJoinReads reads = scope.readsOf(known);
    if (!known.isRepeatable()) {
      found.obstacle = "a later clause makes nodes, traces, or is not the same each time";
    } else if (reads == XQueryJoinReads::Item && mayFollow(index, later)) {
      const bool isLoop = clause.kind() != Kind::LetExpr;
      found.following.push_back({clause.varID(), _planning.exprAt(boundAt(later)), isLoop, known});
      scope.item.add(clause.varID());
    } else if (!known.does(XQueryDeeds::MayFail)) {
      continue;
    } else if (reads != XQueryJoinReads::Round || clause.type()) {
      found.obstacle = "a later clause may fail for an item that would be left out";
    } else if (boundAt(later) != XQueryNoPlace) {
      found.needed.push_back(_planning.exprAt(boundAt(later)));
    }
  }
  return found;
}

void XQueryClauseJoins::joinClause(size_t index) {
  if (!walksItems(index)) return;
  const XQueryBindingExpr& clause = clauseAt(index);
  XQueryJoinScope scope;
  scope.item.add(clause.varID());
  scope.settled.add(clause.varID());
  scope.settled.add(positionOf(clause));
  Later later = clausesBehind(index, scope);
  const XQueryJoinSearch search(_planning, scope, std::move(later.following));
  XQueryJoinCondition condition = _picks == Picks::WhereItHolds
                                      ? search.conditionIn(_condition, false)
                                      : search.complementIn(_condition);
  if (condition.terms.empty()) return;
  later.leftovers.add(condition.assigns);
  if (later.obstacle.empty() && _planning.showsLeftovers(later.leftovers, _condition)) {
    later.obstacle = "a variable that would be left with another item may be read unset";
  }
  if (!later.obstacle.empty()) return _planning.refuse(_clauses[index], later.obstacle);
  condition.isWhole = condition.isWhole && index + 1 == _clauses.size();
  condition.needed.insert(condition.needed.end(), later.needed.begin(), later.needed.end());
  _planning.choose(_clauses[index]);
  auto* joined = cast<XQueryBindingExpr>(at(_clauses[index]).expr);
  joined->setPicker(XQueryJoin::ofClause(clause, clause.varID(), std::move(condition)));
}

}  // namespace xquery
