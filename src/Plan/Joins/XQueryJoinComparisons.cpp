// The comparisons of a key with a probe, in the ways in which they may be written: which operand is
// the key, and which keys there are where it takes something between the item and its key.
#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Boolean.h"
#include "Functions/DeepEqual.h"
#include "Functions/Sequence.h"
#include "Functions/Substring.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryInnerKeys.h"
#include "Plan/Joins/XQueryJoinCondition.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Joins/XQueryPartOfCall.h"
#include "Plan/Rules/PathAt.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <optional>
#include <utility>
#include <vector>

namespace xquery {
namespace {

// Nobody can tell whether it is evaluated.
bool isIdle(const XQueryFacts& facts) {
  return facts.isRepeatable() && !facts.does(XQueryDeeds::MayFail);
}

// Whether the values of an inner clause are found below something of the round: listing a whole
// document for the probes of each round would take longer than it saves.
bool areOfRound(const XQueryExpr& bound, const XQueryFacts& facts) {
  return isa<XQueryPathExpr>(&bound) && !facts.does(XQueryDeeds::ReadsRoot) &&
         (facts.does(XQueryDeeds::ReadsItem) || !facts.reads.isEmpty());
}

}  // namespace

std::optional<int> XQueryJoinSearch::relationCode(int type) {
  if (type >= XQueryOperatorEqual && type <= XQueryOperatorGreaterEqual) {
    return type + XQueryOperatorEq - XQueryOperatorEqual;
  }
  if (type >= XQueryOperatorEq && type <= XQueryOperatorGe) return type;
  return std::nullopt;
}

XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOf(int operatorType, Operand left,
                                                            Operand right,
                                                            const XQueryJoinScope& scope) {
  Comparison found;
  const auto code = relationCode(operatorType);
  found.relation.isIdentity = operatorType == XQueryOperatorIs;
  if (!code && !found.relation.isIdentity) return found;
  if (code) found.relation.relation = XQueryRelationForCode(*code);
  found.relation.isValueComparison = operatorType >= XQueryOperatorEq;
  if (scope.readsOf(right.facts) == XQueryJoinReads::Item) {
    std::swap(left, right);
    found.relation.relation = XQueryMirrored(found.relation.relation);
  }
  const bool isJoin = scope.readsOf(left.facts) == XQueryJoinReads::Item &&
                      scope.readsOf(right.facts) == XQueryJoinReads::Round;
  if (!isJoin) return found;
  found.key = std::move(left.expr);
  found.probe = std::move(right.expr);
  found.keyFacts = left.facts;
  found.probeFacts = right.facts;
  found.keyPlace = left.place;
  return found;
}

XQueryJoinSearch::Comparison XQueryJoinSearch::operandsAt(XQueryPlaceID place,
                                                          const XQueryJoinScope& scope) const {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(place).expr);
  if (!comparison || !comparison->left() || !comparison->right()) return {};
  const XQueryPlaceID left = _planning.program.firstPart(place);
  const XQueryPlaceID right = _planning.program.nextPart(left);
  // A comparison with a range looks at its bounds; listing its integers may take all memory.
  if (XQueryOperatorExpr::rangeIn(at(right).expr)) return {};
  return comparisonOf(comparison->operatorType(), {_planning.exprAt(left), facts(left), left},
                      {_planning.exprAt(right), facts(right), right}, scope);
}

// A call of a function whose body is a comparison.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfCall(XQueryPlaceID place) const {
  const auto* call = cast<XQueryFunctionCall>(at(place).expr);
  const XQueryProgramBody* body = _planning.program.bodyOfFunction(call->functionDecl());
  if (!body) return {};
  const XQueryPlaceID whole = _planning.program.withoutParentheses(body->place);
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(whole).expr);
  if (!comparison || !comparison->left() || !comparison->right()) return {};
  if (XQueryOperatorExpr::rangeIn(comparison->right())) return {};
  const XQueryPlaceID first = _planning.program.firstPart(whole);
  Operand left;
  Operand right;
  const XQueryPlaceID second = _planning.program.nextPart(first);
  if (!describePartOfCall(place, whole, first, left)) return {};
  if (!describePartOfCall(place, whole, second, right)) return {};
  return comparisonOf(comparison->operatorType(), std::move(left), std::move(right), _scope);
}

// An operand of the comparison that is a function's body, in one call. False where it depends on
// more than arguments, or where an argument that the body does not read may fail.
bool XQueryJoinSearch::describePartOfCall(XQueryPlaceID call, XQueryPlaceID body,
                                          XQueryPlaceID part, Operand& operand) const {
  const auto* expr = cast<XQueryFunctionCall>(at(call).expr);
  const auto& params = expr->functionDecl()->params();
  const size_t count = expr->args() ? expr->args()->count() : 0;
  if (count != params.size() || facts(part).does(XQueryDeeds::ReadsFocus)) {
    return false;
  }
  operand.facts = facts(part);
  operand.facts.reads = {};
  operand.facts.assigns = {};
  XQueryVariableSet left = facts(part).reads;
  std::vector<size_t> read;
  const XQueryPlaceID list = _planning.program.part(call, XQueryRole::Arguments);
  XQueryPlaceID argument = count == 0 ? XQueryNoPlace : _planning.program.firstPart(list);
  for (size_t index = 0; index < count; ++index) {
    if (argument == XQueryNoPlace) return false;
    XQueryVariableSet own;
    own.add(params[index]->varID());
    if (!own.isExact()) return false;
    if (left.meets(own)) {
      left.remove(params[index]->varID());
      operand.facts.addDeeds(facts(argument));
      read.push_back(index);
    } else if (!facts(body).reads.meets(own) && !isIdle(facts(argument))) {
      return false;
    }
    argument = _planning.program.nextPart(argument);
  }
  if (!left.isEmpty()) return false;
  operand.expr = XQueryPartOfCall::exprWithCall(Ref<XQueryExpr>(at(call).expr),
                                                _planning.exprAt(part), std::move(read));
  return true;
}

// "some $y in ... satisfies ..." over what follows from the item: a key for each $y.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfSome(XQueryPlaceID place) const {
  const auto* some = dyn_cast<XQueryQuantifiedExpr>(at(place).expr);
  if (!some || some->every() || some->items().size() != 1) return {};
  const XQueryQuantifiedExprItem& clause = *some->items().front();
  const XQueryPlaceID clausePlace = _planning.program.part(place, XQueryRole::Clause);
  const XQueryPlaceID bound = _planning.program.part(clausePlace, XQueryRole::Bound);
  const XQueryPlaceID satisfies = _planning.program.part(place, XQueryRole::Satisfies);
  if (clause.type() || bound == XQueryNoPlace || satisfies == XQueryNoPlace) return {};
  if (clause.varID() <= 0 || clause.varID() >= XQueryVariableSet::most) return {};
  if (XQueryOperatorExpr::rangeIn(at(bound).expr)) return {};
  const XQueryJoinReads reads = _scope.readsOf(facts(bound));
  const auto all = conjuncts(satisfies);
  if (all.empty() || reads == XQueryJoinReads::Unknown) return {};
  if (reads == XQueryJoinReads::Round && !areOfRound(*at(bound).expr, facts(bound))) return {};
  XQueryJoinScope inner = _scope;
  if (reads == XQueryJoinReads::Item) {
    inner.isFocus = false;
    inner.item.add(clause.varID());
    inner.settled.add(clause.varID());
  }
  Comparison found = operandsAt(all.front(), inner);
  if (!found.key) return {};
  // What reads the focus reads the item, and is no probe.
  if (_scope.isFocus && found.probeFacts.does(XQueryDeeds::ReadsFocus)) return {};
  found.isWhole = all.size() == 1;
  found.keyPlace = XQueryNoPlace;
  // For each value of the variable there is a key, or else a probe.
  const bool ofKey = reads == XQueryJoinReads::Item;
  XQueryFacts& own = ofKey ? found.keyFacts : found.probeFacts;
  Ref<XQueryExpr>& expr = ofKey ? found.key : found.probe;
  own.reads.remove(clause.varID());
  own.addDeeds(facts(bound));
  own.assigns.add(clause.varID());
  (ofKey ? found.relation.keysAreOfEach : found.relation.probesAreOfEach) = true;
  const auto* itself = dyn_cast<XQueryVariable>(XQueryWithoutParentheses(expr.get()));
  if (itself && itself->varID() == clause.varID()) {
    expr = _planning.exprAt(bound);
    if (ofKey) found.keyPlace = bound;
  } else {
    expr = XQueryJoinKeys::exprWithClauses(
        {{clause.varID(), _planning.exprAt(bound), true, facts(clausePlace)}}, expr,
        found.relation.isValueComparison);
  }
  return found;
}

// "buyer[@person = ...]" and "$s[buyer = ...]", which are true when there is such a node: a key for
// each buyer, or for what "$s" holds.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfPath(XQueryPlaceID place) const {
  XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
  if (!path) return {};
  const XQueryStep* start = path->start();
  const bool filtersStart = start && !start->predicates().empty();
  if (!filtersStart && path->steps().empty()) return {};
  for (const XQueryWalkedStep& each : path->steps()) {
    if (each.isExpression() || each.testMayRaise) return {};
  }
  return filtersStart ? comparisonOfStart(place, *path) : comparisonOfStep(place, *path);
}

// Where no node is left of what the path starts with, none is found from there.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfStart(XQueryPlaceID place,
                                                                 XQueryWalkedPath& path) const {
  const XQueryStep& step = *path.start();
  const XQueryPlaceID start = _planning.program.part(place, XQueryRole::FirstStep);
  if (start == XQueryNoPlace || !facts(start).are(XQueryItems::Node)) return {};
  const auto places = XQueryPredicatesOf(_planning, place, step, 0);
  XQueryFacts before;
  before.addDeeds(facts(start));
  Comparison found = comparisonOfNodes(path, step, places, before, facts(start).most <= 1);
  if (!path.steps().empty()) found.isWhole = false;
  return found;
}

// The same of the first step with predicates.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfStep(XQueryPlaceID place,
                                                                XQueryWalkedPath& path) const {
  XQueryFacts before;
  if (!path.start()) {
    before.deeds |= XQueryDeeds::ReadsItem;
  } else {
    const XQueryPlaceID start = _planning.program.part(place, XQueryRole::FirstStep);
    if (start == XQueryNoPlace) return {};
    before.addDeeds(facts(start));
  }
  const auto& steps = path.steps();
  const auto step = std::find_if(steps.begin(), steps.end(), [](const XQueryWalkedStep& each) {
    return !each.step->predicates().empty();
  });
  if (step == steps.end()) return {};
  before.addDeeds(XQueryFactsUpTo(_planning, place, path, *step));
  Comparison found = comparisonOfNodes(path, *step->step,
                                       XQueryPredicatesOf(_planning, place, *step), before, false);
  if (step + 1 != steps.end()) found.isWhole = false;
  return found;
}

// One of the comparisons that the predicates of a step ask of its nodes, or of its only one; an
// error in them drops a node. `before` is what finding the nodes reads and does.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfNodes(
    XQueryWalkedPath& path, const XQueryStep& step, const std::vector<XQueryPlaceID>& predicates,
    const XQueryFacts& before, bool isOne) const {
  if (!XQueryPredicatesAreOfTruth(_planning, predicates)) return {};
  constexpr int mostLevels = 8;
  if (_scope.level >= mostLevels) return {};
  XQueryJoinScope scope;
  scope.isFocus = true;
  scope.level = _scope.level + 1;
  const XQueryJoinSearch inner(_planning, scope, {});
  for (const XQueryPlaceID predicate : predicates) {
    const auto all = conjuncts(predicate);
    for (const XQueryPlaceID each : all) {
      Comparison found = inner.comparisonAt({each, false, each});
      if (!found.key || (found.relation.isValueComparison && !isOne)) continue;
      XQueryFacts ofKeys = before;
      ofKeys.addDeedsWithin(found.keyFacts);
      found.isWhole = found.isWhole && all.size() == 1 && predicates.size() == 1;
      found.keyPlace = XQueryNoPlace;
      found.key = XQueryInnerKeys::exprWithPath(Ref<XQueryWalkedPath>(&path), step, found.key);
      found.keyFacts = ofKeys;
      if (joinsWith(found, areOfRound(path.path(), ofKeys))) return found;
    }
  }
  return {};
}

// Whether the comparison is one of the item with something of the round, its sides exchanged where
// the keys are what the round has.
bool XQueryJoinSearch::joinsWith(Comparison& found, bool mayExchange) const {
  const XQueryJoinReads keys = _scope.readsOf(found.keyFacts);
  const XQueryJoinReads probes = _scope.readsOf(found.probeFacts);
  if (keys == XQueryJoinReads::Item && probes == XQueryJoinReads::Round) return true;
  if (!mayExchange || found.relation.isPrefix || keys != XQueryJoinReads::Round ||
      probes != XQueryJoinReads::Item) {
    return false;
  }
  std::swap(found.relation.keysAreOfEach, found.relation.probesAreOfEach);
  std::swap(found.key, found.probe);
  std::swap(found.keyFacts, found.probeFacts);
  found.relation.relation = XQueryMirrored(found.relation.relation);
  return true;
}

// "starts-with(K, P)": each is one text, or the condition is asked as it was written.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfPrefix(XQueryPlaceID place) const {
  const auto* call = cast<XQueryFunctionCall>(at(place).expr);
  if (!call->args() || call->args()->count() != 2) return {};
  const XQueryPlaceID key =
      _planning.program.firstPart(_planning.program.part(place, XQueryRole::Arguments));
  const XQueryPlaceID probe = _planning.program.nextPart(key);
  const bool isJoin = _scope.readsOf(facts(key)) == XQueryJoinReads::Item &&
                      _scope.readsOf(facts(probe)) == XQueryJoinReads::Round;
  if (!isJoin) return {};
  Comparison found;
  found.relation.relation = {XQueryRelation::Less, false};
  found.relation.isPrefix = true;
  found.relation.isValueComparison = true;
  found.key = _planning.exprAt(key);
  found.probe = _planning.exprAt(probe);
  found.keyFacts = facts(key);
  found.probeFacts = facts(probe);
  return found;
}

// "not(K = P)": it is certain of one key that meets the opposite relation with one probe.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonThatFails(XQueryPlaceID place) const {
  Comparison found = operandsAt(place, _scope);
  const bool areLoops = std::any_of(_clauses.begin(), _clauses.end(),
                                    [](const XQueryJoinClause& each) { return each.isLoop; });
  if (!found.key || areLoops || found.relation.isIdentity) return {};
  found.relation.relation.negated = !found.relation.relation.negated;
  found.relation.isComplement = true;
  return found;
}

XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonAt(const XQueryConditionPart& part) const {
  const XQueryPlaceID place = part.place;
  if (part.isNegated) return comparisonThatFails(place);
  if (isa<XQueryQuantifiedExpr>(at(place).expr)) return comparisonOfSome(place);
  if (isa<XQueryPathExpr>(at(place).expr)) return comparisonOfPath(place);
  if (const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr)) {
    if (call->functionDecl()) return comparisonOfCall(place);
    if (call->function() == fn_starts_with) return comparisonOfPrefix(place);
    if (call->function() == fn_deep_equal) return comparisonOfSame(place);
    const bool asksForTruth = call->function() == fn_exists || call->function() == fn_boolean;
    if (!asksForTruth || !call->args() || call->args()->count() != 1) return {};
    const XQueryPlaceID arguments = _planning.program.part(place, XQueryRole::Arguments);
    const XQueryPlaceID only =
        _planning.program.withoutParentheses(_planning.program.firstPart(arguments));
    return isa<XQueryPathExpr>(at(only).expr) ? comparisonOfPath(only) : Comparison();
  }
  Comparison found = operandsAt(place, _scope);
  return found.key ? found : comparisonOfDifference(place);
}

}  // namespace xquery
