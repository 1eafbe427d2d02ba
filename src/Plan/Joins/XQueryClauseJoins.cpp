#include "Plan/Joins/XQueryClauseJoins.h"

#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Joins/XQueryJoin.h"
#include "Plan/Joins/XQueryJoinOfSeveral.h"
#include "Plan/Joins/XQueryProbesAhead.h"

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

XQueryClauseJoins::Sides XQueryClauseJoins::sidesOf(XQueryPlaceID comparison) const {
  const auto* operation = dyn_cast<XQueryOperatorExpr>(at(comparison).expr);
  if (!operation || operation->operatorType() != XQueryOperatorEqual) return {};
  if (XQueryOperatorExpr::rangeIn(operation->right())) return {};
  const XQueryPlaceID first = _planning.program.firstPart(comparison);
  const XQueryPlaceID second =
      first == XQueryNoPlace ? XQueryNoPlace : _planning.program.nextPart(first);
  return second == XQueryNoPlace ? Sides() : Sides{first, second};
}

bool XQueryClauseJoins::readsOnly(XQueryPlaceID place, int64_t varID) const {
  using namespace XQueryDeeds;
  XQueryVariableSet own;
  own.add(varID);
  const XQueryFacts& known = facts(place);
  return known.isRepeatable() && !known.does(ReadsFocus | ReadsGlobals) && !known.reads.isEmpty() &&
         known.reads.isExact() && own.holds(known.reads);
}

// Items that a later clause has nothing for need not be walked. Of "$i/@id = $s/item and $p/@id =
// $s/buyer" the first one picks sales before $p is walked, and these pick persons. None of the
// conditions up to there may fail, so that it cannot be told which was asked first.
void XQueryClauseJoins::addTermsAhead(size_t index, const XQueryJoinScope& scope,
                                      const XQueryJoinSearch& search,
                                      XQueryJoinCondition& condition) const {
  const std::vector<XQueryPlaceID> all = search.conjuncts(_condition);
  std::vector<XQueryPlaceID> conditions;
  for (const XQueryPlaceID each : all) {
    if (!search.cannotFail(each) || !facts(each).isRepeatable()) break;
    conditions.push_back(each);
  }
  const int64_t varID = clauseAt(index).varID();
  for (size_t later = index + 1; later < _clauses.size() && all.size() > 1; ++later) {
    if (clauseAt(later).kind() != Kind::ForExpr || boundAt(later) == XQueryNoPlace) continue;
    if (scope.readsOf(facts(boundAt(later))) != XQueryJoinReads::Round) continue;
    if (walksItems(later)) addTermsAhead(later, conditions, varID, scope, condition);
    const bool isLeftAlone = condition.terms.empty() && mayLookAhead(later, all, varID, scope);
    if (isLeftAlone) _planning.refuse(_clauses[index], obstacleAhead(later));
  }
}

// Of a later clause that picks items of an earlier one.
std::string_view XQueryClauseJoins::obstacleAhead(size_t later) const {
  if (walksItems(later)) {
    return "of the conditions on a later clause, which would be asked sooner, one may fail";
  }
  return "the later clause that it is compared with declares a type, or walks a range";
}

// Whether a condition compares the variable with that of a later clause, and another one that with
// what is known sooner.
bool XQueryClauseJoins::mayLookAhead(size_t later, const std::vector<XQueryPlaceID>& conditions,
                                     int64_t varID, const XQueryJoinScope& scope) const {
  const int64_t laterID = clauseAt(later).varID();
  bool picksLater = false;
  bool picksItem = false;
  for (const XQueryPlaceID each : conditions) {
    const Sides sides = sidesOf(each);
    if (sides.first == XQueryNoPlace) continue;
    for (const auto& [key, probe] :
         {std::pair(sides.first, sides.second), std::pair(sides.second, sides.first)}) {
      const bool isKnownSooner =
          !facts(probe).reads.isEmpty() && scope.readsOf(facts(probe)) == XQueryJoinReads::Round;
      picksLater = picksLater || (readsOnly(key, laterID) && isKnownSooner);
      picksItem = picksItem || (readsOnly(key, varID) && readsOnly(probe, laterID));
    }
  }
  return picksLater && picksItem;
}

// Those of one later clause, for the items of the variable.
void XQueryClauseJoins::addTermsAhead(size_t later, const std::vector<XQueryPlaceID>& conditions,
                                      int64_t varID, const XQueryJoinScope& scope,
                                      XQueryJoinCondition& condition) const {
  constexpr int promise = 3;
  const int64_t laterID = clauseAt(later).varID();
  const auto looksOut = [&](XQueryPlaceID place) {
    return facts(place).does(XQueryDeeds::ReadsOutside);
  };
  XQueryJoinCondition ofLater;
  XQueryFacts outward;
  outward.addDeeds(facts(boundAt(later)));
  for (const XQueryPlaceID each : conditions) {
    Sides sides = sidesOf(each);
    if (sides.first == XQueryNoPlace) continue;
    if (readsOnly(sides.second, laterID)) std::swap(sides.first, sides.second);
    const XQueryFacts& probe = facts(sides.second);
    const bool picks = readsOnly(sides.first, laterID) && !probe.reads.isEmpty() &&
                       scope.readsOf(probe) == XQueryJoinReads::Round;
    if (!picks) continue;
    outward.addDeeds(probe);
    XQueryJoinTerm term;
    term.key = _planning.exprAt(sides.first);
    term.probe = _planning.exprAt(sides.second);
    term.promise = promise;
    term.looksOutOfItems = looksOut(sides.first);
    ofLater.terms.push_back(std::move(term));
  }
  if (ofLater.terms.empty()) return;
  ofLater.isWhole = true;
  for (const XQueryPlaceID each : conditions) {
    Sides sides = sidesOf(each);
    if (sides.first == XQueryNoPlace) continue;
    if (readsOnly(sides.second, varID)) std::swap(sides.first, sides.second);
    if (!readsOnly(sides.first, varID) || !readsOnly(sides.second, laterID)) continue;
    auto probe = XQueryProbesAhead::exprWithProbe(_planning.exprAt(sides.second), laterID,
                                                  _planning.exprAt(boundAt(later)));
    probe->setPicker(XQueryJoin::ofClause(*probe, laterID, ofLater));
    XQueryJoinTerm term;
    term.key = _planning.exprAt(sides.first);
    term.probe = probe;
    term.promise = promise;
    term.looksOutOfItems = looksOut(sides.first);
    outward.addDeeds(facts(sides.second));
    outward.reads.remove(laterID);
    if (outward.does(XQueryDeeds::ReadsOutside)) term.outward = outward;
    condition.terms.push_back(std::move(term));
    condition.assigns.add(facts(_condition).assigns);
    return condition.putBestFirst();
  }
}

XQueryJoinScope XQueryClauseJoins::scopeOf(size_t index) const {
  const XQueryBindingExpr& clause = clauseAt(index);
  XQueryJoinScope scope;
  scope.item.add(clause.varID());
  scope.settled.add(clause.varID());
  scope.settled.add(positionOf(clause));
  scope.itemID = clause.varID();
  return scope;
}

bool XQueryClauseJoins::seesComparison() const {
  for (size_t index = 0; index < _clauses.size(); ++index) {
    if (!walksItems(index)) continue;
    XQueryJoinScope scope = scopeOf(index);
    Later later = clausesBehind(index, scope);
    const XQueryJoinSearch search(_planning, scope, std::move(later.following));
    if (!search.conditionIn(_condition, false).terms.empty()) return true;
  }
  return false;
}

bool XQueryClauseJoins::joinClause(size_t index) {
  if (!walksItems(index)) return false;
  const XQueryBindingExpr& clause = clauseAt(index);
  XQueryJoinScope scope = scopeOf(index);
  Later later = clausesBehind(index, scope);
  const XQueryJoinSearch search(_planning, scope, std::move(later.following));
  XQueryJoinCondition condition = _picks == Picks::WhereItHolds
                                      ? search.conditionIn(_condition, false)
                                      : search.complementIn(_condition);
  if (_picks == Picks::WhereItHolds && condition.orElse.empty()) {
    addTermsAhead(index, scope, search, condition);
  }
  if (condition.terms.empty()) return false;
  later.leftovers.add(condition.assigns);
  if (later.obstacle.empty() && _planning.showsLeftovers(later.leftovers, _condition)) {
    later.obstacle = "a variable that would be left with another item may be read unset";
  }
  if (!later.obstacle.empty()) {
    _planning.refuse(_clauses[index], later.obstacle);
    return false;
  }
  if (index + 1 < _clauses.size()) condition.leaveOpen();
  condition.addNeeded(later.needed);
  _planning.choose(_clauses[index]);
  auto* joined = cast<XQueryBindingExpr>(at(_clauses[index]).expr);
  joined->setPicker(XQueryJoinsOfClause(clause, clause.varID(), std::move(condition)));
  return true;
}

}  // namespace xquery
