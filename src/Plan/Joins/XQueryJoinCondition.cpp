#include "Plan/Joins/XQueryJoinCondition.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Rules/ValueConditions.h"

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <optional>
#include <utility>

namespace xquery {
namespace {

// Longer chains of conditions are left alone.
constexpr size_t mostConditions = 16;

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
bool XQueryJoinSearch::pass(const XQueryConditionPart& part, Before& before) const {
  const XQueryPlaceID place = part.place;
  const XQueryFacts& parts = facts(place);
  const bool looksOut = parts.does(XQueryDeeds::ReadsOutside);
  XQueryJoinCondition& others = before.others;
  if (before.holdsAnswer) {
    before.holdsMore = true;
    return cannotFail(place);
  }
  const XQueryJoinScope itemOnly = ofItemOnly();
  const bool isWritten = part.whole != XQueryNoPlace;
  switch (isWritten ? itemOnly.readsOf(parts) : XQueryJoinReads::Unknown) {
    case XQueryJoinReads::Item:
      others.filters.push_back(_planning.exprAt(part.whole));
      others.filtersMayFail = others.filtersMayFail || !cannotFail(place);
      others.looksOutOfItems = others.looksOutOfItems || looksOut;
      return true;
    case XQueryJoinReads::Round:
      others.guards.push_back(_planning.exprAt(part.whole));
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
  return conditionOf(XQueryWholeCondition(place, false), errorExcludes);
}

XQueryJoinCondition XQueryJoinSearch::complementIn(XQueryPlaceID place) const {
  return conditionOf(XQueryWholeCondition(place, true), false);
}

XQueryJoinCondition XQueryJoinSearch::conditionOf(const XQueryConditionPart& whole,
                                                  bool errorExcludes) const {
  XQueryJoinCondition found = conditionOf(XQueryJoinedByAnd(_planning, whole), errorExcludes);
  found.assigns = facts(whole.place).assigns;
  return found;
}

XQueryJoinCondition XQueryJoinSearch::conditionOf(const XQueryConditionParts& parts,
                                                  bool errorExcludes) const {
  // What is compared with the same in every round is asked once of each item, unless there is
  // nothing else to find items by.
  XQueryJoinCondition found = termsIn(parts, errorExcludes, false);
  if (found.terms.empty()) found = termsIn(parts, errorExcludes, true);
  return found.terms.empty() ? alternativesIn(parts, errorExcludes) : found;
}

// "A and (B or C)" is "(A and B) or (A and C)".
XQueryJoinCondition XQueryJoinSearch::alternativesIn(const XQueryConditionParts& parts,
                                                     bool errorExcludes) const {
  for (size_t index = 0; index < parts.size(); ++index) {
    XQueryJoinCondition found = alternativesOf(parts, index, errorExcludes);
    if (!found.terms.empty()) return found;
  }
  return {};
}

// An item that none of them lets in is left out: each has been asked, up to what excludes the item,
// without an error. One that is in by one of them is sure if those before exclude it, which an
// error may do as well where that is allowed.
XQueryJoinCondition XQueryJoinSearch::alternativesOf(const XQueryConditionParts& parts,
                                                     size_t index, bool errorExcludes) const {
  constexpr size_t mostAlternatives = 4;
  const auto each = XQueryJoinedByOr(_planning, parts[index]);
  if (each.size() < 2 || each.size() > mostAlternatives) return {};
  XQueryJoinCondition all;
  for (const XQueryConditionPart& alternative : each) {
    const auto inner = XQueryJoinedByAnd(_planning, alternative);
    if (inner.empty()) return {};
    XQueryConditionParts own(parts.begin(), parts.begin() + static_cast<std::ptrdiff_t>(index));
    own.insert(own.end(), inner.begin(), inner.end());
    own.insert(own.end(), parts.begin() + static_cast<std::ptrdiff_t>(index) + 1, parts.end());
    XQueryJoinCondition found = termsIn(own, errorExcludes, false);
    if (found.terms.empty()) found = termsIn(own, errorExcludes, true);
    if (found.terms.empty()) return {};
    if (errorExcludes) found.isWhole = false;
    if (all.terms.empty()) {
      all = std::move(found);
    } else {
      all.orElse.push_back(std::move(found));
    }
  }
  return all;
}

XQueryJoinCondition XQueryJoinSearch::termsIn(const XQueryConditionParts& all, bool errorExcludes,
                                              bool takesConstants) const {
  const XQueryJoinScope itemOnly = ofItemOnly();
  XQueryJoinCondition found;
  Before before;
  bool areAllPassed = !all.empty();
  for (const XQueryConditionPart& conjunct : all) {
    const bool isFirst = &conjunct == &all.front();
    const bool isLast = &conjunct == &all.back();
    const XQueryFacts& parts = facts(conjunct.place);
    // The plain way, which came first, has fetched what the first condition asks for of each item,
    // and may not have come to the others.
    const bool loads = parts.does(XQueryDeeds::LoadsDocuments);
    areAllPassed = parts.isRepeatable() && (!loads || isFirst);
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
    } else if (!isLast && !cannotFail(conjunct.place)) {
      areAllPassed = passTerm(conjunct.place, comparison, found, before);
    }
    if (!areAllPassed) break;
  }
  if (found.terms.empty()) return found;
  // What is behind the last term excludes items as well where that makes the condition whole.
  found.isWhole = areAllPassed && !before.holdsMore;
  if (found.isWhole) before.addTo(found);
  found.putBestFirst();
  return found;
}

void XQueryJoinCondition::putBestFirst() {
  if (std::any_of(terms.begin(), terms.end(), [](const auto& term) { return term.mustAnswer; })) {
    return;
  }
  std::stable_sort(terms.begin(), terms.end(),
                   [](const auto& a, const auto& b) { return a.promise > b.promise; });
}

void XQueryJoinCondition::leaveOpen() {
  isWhole = false;
  for (XQueryJoinCondition& each : orElse) each.isWhole = false;
}

void XQueryJoinCondition::addNeeded(const std::vector<Ref<XQueryExpr>>& more) {
  needed.insert(needed.end(), more.begin(), more.end());
  for (XQueryJoinCondition& each : orElse) each.addNeeded(more);
}

void XQueryJoinCondition::add(XQueryJoinCondition other) {
  assigns.add(other.assigns);
  // One that asks for one of several is joined with no other.
  if (!orElse.empty() || !other.orElse.empty()) {
    const bool isOther =
        terms.empty() || (!orElse.empty() && !other.terms.empty() && other.orElse.empty());
    if (isOther) {
      other.assigns = assigns;
      const bool mayBeWhole = isWhole && terms.empty();
      *this = std::move(other);
      if (mayBeWhole) return;
    }
    return leaveOpen();
  }
  isWhole = isWhole && other.isWhole;
  std::move(other.terms.begin(), other.terms.end(), std::back_inserter(terms));
}

}  // namespace xquery
