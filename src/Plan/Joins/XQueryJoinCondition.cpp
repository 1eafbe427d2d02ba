#include "Plan/Joins/XQueryJoinCondition.h"

#include "Expr/Clauses/XQueryQuantified.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Boolean.h"
#include "Functions/Sequence.h"
#include "Functions/Substring.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryInnerKeys.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Joins/XQueryPartOfCall.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/ValueConditions.h"
#include "Prolog/XQueryDeclarations.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <optional>
#include <utility>

namespace xquery {
namespace {

// Longer chains of conditions are left alone.
constexpr size_t mostConditions = 16;

// The value comparison code whose relation the operator asks for.
std::optional<int> relationCode(int type) {
  if (type >= XQueryOperatorEqual && type <= XQueryOperatorGreaterEqual) {
    return type + XQueryOperatorEq - XQueryOperatorEqual;
  }
  if (type >= XQueryOperatorEq && type <= XQueryOperatorGe) return type;
  return std::nullopt;
}

bool isNotEqual(const XQueryRelation& relation) {
  return relation.test == XQueryRelation::Equal && relation.negated;
}

// How much a comparison promises to exclude. One that is the same in every round excludes the same
// items each time, which says nothing about how many.
int promiseOf(const XQueryJoinRelation& by, const XQueryFacts& probe) {
  if (isNotEqual(by.relation)) return 0;
  if (by.relation.test != XQueryRelation::Equal && !by.isPrefix) return 1;
  const bool differs =
      probe.does(XQueryDeeds::ReadsFocus | XQueryDeeds::ReadsGlobals) || !probe.reads.isEmpty();
  return differs ? 3 : 2;
}

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

XQueryJoinReads XQueryJoinScope::readsOf(const XQueryFacts& facts) const {
  using namespace XQueryDeeds;
  if (!facts.isRepeatable()) return XQueryJoinReads::Unknown;
  if (isFocus) {
    if (!facts.does(ReadsFocus)) return XQueryJoinReads::Round;
    // Values of variables set for the item by a clause within it come from the item.
    const bool readsMore =
        facts.does(ReadsGlobals | ReadsPosition | ReadsSize) || !facts.reads.isEmpty();
    return readsMore ? XQueryJoinReads::Unknown : XQueryJoinReads::Item;
  }
  if (!facts.reads.meets(settled)) return XQueryJoinReads::Round;
  const bool readsMore =
      facts.does(ReadsGlobals | ReadsFocus) || !facts.reads.isExact() || !item.holds(facts.reads);
  return readsMore ? XQueryJoinReads::Unknown : XQueryJoinReads::Item;
}

struct XQueryJoinSearch::Comparison {
  XQueryJoinRelation relation;
  Ref<XQueryExpr> key;  // null for none
  Ref<XQueryExpr> probe;
  XQueryFacts keyFacts;
  XQueryFacts probeFacts;
  XQueryPlaceID keyPlace = XQueryNoPlace;  // where the key is written, if it is
  bool isWhole = true;
};

std::vector<XQueryPlaceID> XQueryJoinSearch::conjuncts(XQueryPlaceID condition) const {
  std::vector<XQueryPlaceID> found;
  std::vector<XQueryPlaceID> waiting = {condition};
  while (!waiting.empty()) {
    const XQueryPlaceID next = _planning.program.withoutParentheses(waiting.back());
    waiting.pop_back();
    const auto* both = dyn_cast<XQueryOperatorExpr>(at(next).expr);
    const XQueryPlaceID left = _planning.program.firstPart(next);
    const XQueryPlaceID right =
        left == XQueryNoPlace ? XQueryNoPlace : _planning.program.nextPart(left);
    if (both && both->operatorType() == XQueryOperatorAnd) {
      if (right == XQueryNoPlace) return {};
      waiting.push_back(right);
      waiting.push_back(left);
    } else {
      found.push_back(next);
    }
    if (found.size() + waiting.size() > mostConditions) return {};
  }
  return found;
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

// "buyer[@person = ...]", which is true when there is such a node: a key for each buyer.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfPath(XQueryPlaceID place) const {
  XQueryWalkedPath* path = XQueryWalkedPathAt(_planning, place);
  if (!path || path->steps().empty()) return {};
  XQueryFacts pathFacts;
  if (!path->start()) {
    pathFacts.deeds |= XQueryDeeds::ReadsItem;
  } else {
    const XQueryPlaceID start = _planning.program.part(place, XQueryRole::FirstStep);
    if (start == XQueryNoPlace || !path->start()->predicates().empty()) return {};
    pathFacts.addDeeds(facts(start));
  }
  const XQueryWalkedStep& last = path->steps().back();
  for (const XQueryWalkedStep& each : path->steps()) {
    if (each.isExpression() || each.testMayRaise) return {};
    if (&each != &last && !each.step->predicates().empty()) return {};
  }
  if (last.step->predicates().size() != 1) return {};
  const auto places = XQueryPredicatesOf(_planning, place, last);
  if (!XQueryPredicatesAreOfTruth(_planning, places)) return {};
  const auto all = conjuncts(places.front());
  if (all.empty()) return {};
  XQueryJoinScope inner;
  inner.isFocus = true;
  Comparison found = operandsAt(all.front(), inner);
  if (!found.key || found.relation.isValueComparison) return {};
  pathFacts.addDeeds(XQueryFactsUpTo(_planning, place, *path, last));
  pathFacts.addDeedsWithin(found.keyFacts);
  found.isWhole = all.size() == 1;
  found.keyPlace = XQueryNoPlace;
  found.key = XQueryInnerKeys::exprWithPath(Ref<XQueryWalkedPath>(path), *last.step, found.key);
  found.keyFacts = pathFacts;
  const XQueryJoinReads reads = _scope.readsOf(pathFacts);
  const XQueryJoinReads others = _scope.readsOf(found.probeFacts);
  if (reads == XQueryJoinReads::Round && others == XQueryJoinReads::Item) {
    if (!areOfRound(path->path(), pathFacts)) return {};
    std::swap(found.key, found.probe);
    std::swap(found.keyFacts, found.probeFacts);
    found.relation.relation = XQueryMirrored(found.relation.relation);
    return found;
  }
  const bool isJoin = reads == XQueryJoinReads::Item && others == XQueryJoinReads::Round;
  return isJoin ? found : Comparison();
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

XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonAt(XQueryPlaceID place) const {
  if (isa<XQueryQuantifiedExpr>(at(place).expr)) return comparisonOfSome(place);
  if (isa<XQueryPathExpr>(at(place).expr)) return comparisonOfPath(place);
  if (const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr)) {
    if (call->functionDecl()) return comparisonOfCall(place);
    if (call->function() == fn_starts_with) return comparisonOfPrefix(place);
    const bool asksForTruth = call->function() == fn_exists || call->function() == fn_boolean;
    if (!asksForTruth || !call->args() || call->args()->count() != 1) return {};
    const XQueryPlaceID arguments = _planning.program.part(place, XQueryRole::Arguments);
    const XQueryPlaceID only =
        _planning.program.withoutParentheses(_planning.program.firstPart(arguments));
    return isa<XQueryPathExpr>(at(only).expr) ? comparisonOfPath(only) : Comparison();
  }
  return operandsAt(place, _scope);
}

bool XQueryJoinSearch::cannotFail(XQueryPlaceID place) const {
  return !facts(place).does(XQueryDeeds::MayFail) &&
         (facts(place).are(XQueryItems::Boolean) || facts(place).are(XQueryItems::Node));
}

// Those that the key follows from, and those whose failure must come up where it always does.
std::vector<XQueryJoinClause> XQueryJoinSearch::clausesBefore(const XQueryFacts& key) const {
  std::vector<XQueryJoinClause> found;
  XQueryVariableSet reads = key.reads;
  for (size_t i = _clauses.size(); i-- > 0;) {
    XQueryVariableSet own;
    own.add(_clauses[i].varID);
    if (!reads.meets(own) && !_clauses[i].facts.does(XQueryDeeds::MayFail)) continue;
    reads.add(_clauses[i].facts.reads);
    found.insert(found.begin(), _clauses[i]);
  }
  return found;
}

// What has been passed on the way to a comparison.
struct XQueryJoinSearch::Before {
  XQueryJoinCondition others;
  // Terms with operands that may fail, by their numbers.
  std::vector<size_t> failing;
  // There is something else, which cannot make a difference for items that are left out.
  bool holdsMore = false;
  // There is a term that must answer.
  bool holdsAnswer = false;

  // The condition has a term behind all this.
  void addTo(XQueryJoinCondition& condition) const {
    condition.filters = others.filters;
    condition.filtersMayFail = others.filtersMayFail;
    condition.guards = others.guards;
    condition.checks = others.checks;
    condition.needed = others.needed;
    condition.looksOutOfItems = others.looksOutOfItems;
    condition.outward = others.outward;
    for (const size_t term : failing) condition.terms[term].mustNotFail = true;
  }
};

// Another comparison of the item, which fails only where one of its operands does.
bool XQueryJoinSearch::passComparison(XQueryPlaceID place, const XQueryJoinScope& scope,
                                      Before& before) const {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(place).expr);
  if (!comparison || !relationCode(comparison->operatorType())) return false;
  const XQueryPlaceID left = _planning.program.firstPart(place);
  const XQueryPlaceID right = _planning.program.nextPart(left);
  if (right == XQueryNoPlace || XQueryOperatorExpr::rangeIn(comparison->right())) return false;
  if (XQueryOperatorMayFail(comparison->operatorType(), facts(left), facts(right))) return false;
  XQueryJoinCondition& others = before.others;
  for (const XQueryPlaceID operand : {left, right}) {
    const XQueryJoinReads reads = scope.readsOf(facts(operand));
    if (reads == XQueryJoinReads::Unknown) return false;
    if (!facts(operand).does(XQueryDeeds::MayFail)) continue;
    const bool looksOut = facts(operand).does(XQueryDeeds::ReadsOutside);
    if (reads == XQueryJoinReads::Item) {
      others.checks.push_back(_planning.exprAt(operand));
      others.looksOutOfItems = others.looksOutOfItems || looksOut;
    } else {
      others.needed.push_back(_planning.exprAt(operand));
      if (looksOut) others.outward.push_back(facts(operand));
    }
  }
  return true;
}

// A condition is asked of the item before the clauses that follow from it.
XQueryJoinScope XQueryJoinSearch::ofItemOnly() const {
  XQueryJoinScope scope = _scope;
  for (const XQueryJoinClause& clause : _clauses) scope.item.remove(clause.varID);
  return scope;
}

// Whether what is behind a condition may exclude items; adds what has to be asked beforehand.
bool XQueryJoinSearch::pass(XQueryPlaceID place, Before& before) const {
  const XQueryFacts& parts = facts(place);
  const bool looksOut = parts.does(XQueryDeeds::ReadsOutside);
  XQueryJoinCondition& others = before.others;
  if (before.holdsAnswer) {
    before.holdsMore = true;
    return cannotFail(place);
  }
  const XQueryJoinScope itemOnly = ofItemOnly();
  switch (itemOnly.readsOf(parts)) {
    case XQueryJoinReads::Item:
      others.filters.push_back(_planning.exprAt(place));
      others.filtersMayFail = others.filtersMayFail || !cannotFail(place);
      others.looksOutOfItems = others.looksOutOfItems || looksOut;
      return true;
    case XQueryJoinReads::Round:
      others.guards.push_back(_planning.exprAt(place));
      if (looksOut) others.outward.push_back(parts);
      return true;
    default:
      before.holdsMore = true;
      return cannotFail(place) || passComparison(place, itemOnly, before);
  }
}

// The same for the comparison of the last term.
bool XQueryJoinSearch::passTerm(XQueryPlaceID place, const Comparison& comparison,
                                XQueryJoinCondition& condition, Before& before) const {
  Before ofTerm;
  if (passComparison(place, _scope, ofTerm)) {
    const bool mayFail = !ofTerm.others.checks.empty() || !ofTerm.others.needed.empty();
    if (mayFail) before.failing.push_back(condition.terms.size() - 1);
    return true;
  }
  if (!comparison.isWhole) return false;
  condition.terms.back().mustAnswer = true;
  before.holdsAnswer = true;
  return true;
}

XQueryJoinTerm XQueryJoinSearch::made(const Comparison& comparison) const {
  XQueryJoinTerm term;
  term.key = comparison.key;
  term.relation = comparison.relation;
  auto clauses = clausesBefore(comparison.keyFacts);
  for (const XQueryJoinClause& clause : clauses) {
    const bool looksOut = clause.facts.does(XQueryDeeds::ReadsOutside);
    term.looksOutOfItems = term.looksOutOfItems || looksOut;
  }
  if (!clauses.empty()) {
    const bool hasLoops = std::any_of(clauses.begin(), clauses.end(),
                                      [](const auto& clause) { return clause.isLoop; });
    const bool isOfEach = hasLoops && comparison.relation.isValueComparison;
    term.relation.keysAreOfEach = term.relation.keysAreOfEach || isOfEach;
    term.key = XQueryJoinKeys::exprWithClauses(std::move(clauses), term.key, isOfEach);
  }
  term.probe = comparison.probe;
  term.promise = promiseOf(comparison.relation, comparison.probeFacts);
  term.looksOutOfItems =
      term.looksOutOfItems || comparison.keyFacts.does(XQueryDeeds::ReadsOutside);
  if (comparison.probeFacts.does(XQueryDeeds::ReadsOutside)) term.outward = comparison.probeFacts;
  if (clauses.empty()) term.way = wayOf(comparison);
  return term;
}

// Of "@id", "$s/buyer/@person" and the like. A value comparison with several keys is an error.
std::optional<XQueryValueWay> XQueryJoinSearch::wayOf(const Comparison& comparison) const {
  const XQueryJoinRelation& by = comparison.relation;
  const bool isEquality = by.relation.test == XQueryRelation::Equal && !by.relation.negated &&
                          !by.isPrefix && !by.isIdentity && !by.isComplement;
  const bool isOfOne = by.isValueComparison && comparison.keyFacts.most > 1;
  const bool hasItem = _scope.isFocus || _scope.itemID != 0;
  if (!isEquality || isOfOne || !hasItem || comparison.keyPlace == XQueryNoPlace) {
    return std::nullopt;
  }
  return XQueryWayFrom(_planning, comparison.keyPlace, _scope.isFocus ? 0 : _scope.itemID);
}

XQueryJoinCondition XQueryJoinSearch::conditionIn(XQueryPlaceID place, bool errorExcludes) const {
  // What is compared with the same in every round is asked once of each item, unless there is
  // nothing else to find items by.
  XQueryJoinCondition found = termsIn(place, errorExcludes, false);
  return found.terms.empty() ? termsIn(place, errorExcludes, true) : found;
}

XQueryJoinCondition XQueryJoinSearch::termsIn(XQueryPlaceID place, bool errorExcludes,
                                              bool takesConstants) const {
  const XQueryJoinScope itemOnly = ofItemOnly();
  const auto all = conjuncts(place);
  XQueryJoinCondition found;
  Before before;
  bool areAllPassed = !all.empty();
  for (const XQueryPlaceID conjunct : all) {
    const XQueryFacts& parts = facts(conjunct);
    // The plain way, which came first, has fetched what the first condition asks for of each item,
    // and may not have come to the others.
    const bool loads = parts.does(XQueryDeeds::LoadsDocuments);
    areAllPassed = parts.isRepeatable() && (!loads || conjunct == all.front());
    if (!areAllPassed) break;
    const Comparison comparison = comparisonAt(conjunct);
    XQueryJoinTerm term;
    if (comparison.key) term = made(comparison);
    const bool isFilter =
        !takesConstants && !errorExcludes && itemOnly.readsOf(parts) == XQueryJoinReads::Item;
    const bool isTerm = term.promise > 0 && !isFilter;
    if (isTerm) {
      before.addTo(found);
      before.holdsMore = before.holdsMore || !comparison.isWhole;
      found.terms.push_back(std::move(term));
    }
    if (errorExcludes) {
      before.holdsMore = before.holdsMore || !isTerm;
      areAllPassed = !loads || all.size() == 1;
      if (loads) break;
      continue;
    }
    if (!isTerm) {
      areAllPassed = pass(conjunct, before);
    } else if (conjunct != all.back() && !cannotFail(conjunct)) {
      areAllPassed = passTerm(conjunct, comparison, found, before);
    }
    if (!areAllPassed) break;
  }
  if (found.terms.empty()) return found;
  // What is behind the last term excludes items as well where that makes the condition whole.
  found.isWhole = areAllPassed && !before.holdsMore;
  if (found.isWhole) before.addTo(found);
  found.putBestFirst();
  found.assigns = facts(place).assigns;
  return found;
}

void XQueryJoinCondition::putBestFirst() {
  if (std::any_of(terms.begin(), terms.end(), [](const auto& term) { return term.mustAnswer; })) {
    return;
  }
  std::stable_sort(terms.begin(), terms.end(),
                   [](const auto& a, const auto& b) { return a.promise > b.promise; });
}

void XQueryJoinCondition::join(XQueryJoinCondition other) {
  isWhole = isWhole && other.isWhole;
  std::move(other.terms.begin(), other.terms.end(), std::back_inserter(terms));
  putBestFirst();
}

XQueryJoinCondition XQueryJoinSearch::complementIn(XQueryPlaceID place) const {
  place = _planning.program.withoutParentheses(place);
  if (const auto* call = dyn_cast<XQueryFunctionCall>(at(place).expr)) {
    const bool isNot = call->function() == fn_not && call->args() && call->args()->count() == 1;
    if (!isNot) return {};
    const XQueryPlaceID arguments = _planning.program.part(place, XQueryRole::Arguments);
    return conditionIn(_planning.program.firstPart(arguments), false);
  }
  Comparison found = operandsAt(place, _scope);
  if (!found.key || !_clauses.empty() || found.relation.isIdentity) return {};
  found.relation.relation.negated = !found.relation.relation.negated;
  found.relation.isComplement = true;
  XQueryJoinCondition condition;
  condition.terms.push_back(made(found));
  if (condition.terms.front().promise == 0) return {};
  condition.isWhole = true;
  condition.assigns = facts(place).assigns;
  return condition;
}

}  // namespace xquery
