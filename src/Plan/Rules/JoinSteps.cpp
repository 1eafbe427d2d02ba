// A predicate picks the items of a step.
//
// Pattern     a step with predicates, one of which is K = P, or joins it to others by "and", with
//             the comparisons of a where clause; K reads the context item and P does not. It is the
//             first step, or an axis step with nothing but axis steps before it, the first one
//             apart. Where a "for" walks what the last step finds, equalities of the where clause
//             behind it pick as well (XQueryTermsBehind.h).
//             Or the first step leads to siblings, and is counted, has predicates that read
//             nothing but the node, or is walked by a "for" or a "some" with such a condition
// Facts       all predicates are repeatable, read neither position nor size and answer no number:
//             then they can be asked in any order, and an error in one drops the item as well; the
//             steps before it are repeatable and read no variables
// Refused     tests that may raise an error; documents that are loaded in a predicate that is not
//             alone
// Operator    XQueryJoin; XQueryWalkedPath keeps what all siblings together find
// Why         the items depend on what the path starts with; a result of a path holds each node
//             once, in an order that does not depend on how it was found
#include "Plan/Joins/XQueryJoin.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Joins/XQueryJoinOfSeveral.h"
#include "Plan/Joins/XQueryTermsBehind.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace xquery {
namespace {

// All predicates as one condition.
XQueryJoinCondition conditionOf(const XQueryPlanning& planning,
                                const std::vector<XQueryPlaceID>& places) {
  if (!XQueryPredicatesAreOfTruth(planning, places)) return {};
  XQueryJoinScope scope;
  scope.isFocus = true;
  const XQueryJoinSearch search(planning, scope, {});
  XQueryJoinCondition condition;
  condition.isWhole = true;
  for (const XQueryPlaceID place : places) {
    checkWork();
    condition.add(search.conditionIn(place, true));
  }
  condition.putBestFirst();
  return condition;
}

// Whether they depend on what the path starts with alone.
bool isSettled(const XQueryFacts& facts) {
  const bool looksForGlobals =
      facts.does(XQueryDeeds::ReadsOutside) && facts.does(XQueryDeeds::ReadsGlobals);
  return facts.isRepeatable() && !looksForGlobals && facts.reads.isEmpty();
}

// A condition behind the clause that walks all siblings picks them.
bool joinSiblings(XQueryPlanning& planning, XQueryPlaceID place, XQueryWalkedPath& path) {
  const bool isOpen = path.beginsWithSiblings() && path.steps().size() == 1 &&
                      !path.steps().front().hasPredicates() && !path.steps().front().testMayRaise;
  if (!isOpen) return false;
  XQueryJoinCondition condition;
  condition.isWhole = true;
  XQueryAddTermsBehind(planning, place, condition);
  if (condition.terms.empty()) return false;
  const XQueryStep* step = path.steps().front().step;
  path.setPicker(XQueryJoinsOfStep(path, std::move(condition), true), step);
  planning.choose(place);
  return true;
}

// Whether the predicates read nothing but the node that they are asked of.
bool readNothingElse(const XQueryPlanning& planning, const std::vector<XQueryPlaceID>& places) {
  if (!XQueryPredicatesAreOfTruth(planning, places)) return false;
  return std::all_of(places.begin(), places.end(), [&](XQueryPlaceID place) {
    using namespace XQueryDeeds;
    const XQueryFacts& facts = planning.facts[place];
    return facts.reads.isEmpty() && facts.assigns.isEmpty() &&
           !facts.does(ReadsGlobals | LoadsDocuments);
  });
}

// What a path finds from siblings, and what it finds from there.
bool keepSiblings(XQueryPlanning& planning, XQueryPlaceID place, XQueryWalkedPath& path) {
  if (!path.beginsWithSiblings()) return false;
  const XQueryWalkedStep& step = path.steps().front();
  const bool endsThere = path.steps().size() == 1;
  const bool isNextExpression = !endsThere && path.steps()[1].isExpression();
  if (step.testMayRaise || isNextExpression) return false;
  const bool isKept = step.hasPredicates()
                          ? readNothingElse(planning, XQueryPredicatesOf(planning, place, step))
                          : endsThere && path.countsNodes();
  if (!isKept) return false;
  path.keepSiblings();
  planning.choose(place, "found for all children of a node together");
  return true;
}

void joinPath(XQueryPlanning& planning, XQueryPlaceID place, XQueryWalkedPath& path) {
  if (planning.showsLeftovers(planning.facts[place].assigns, place)) return;
  if (const XQueryStep* start = path.start()) {
    auto condition = conditionOf(planning, XQueryPredicatesOf(planning, place, *start, 0));
    if (!condition.terms.empty()) {
      if (path.steps().empty()) XQueryAddTermsBehind(planning, place, condition);
      planning.choose(place);
      return path.setPicker(XQueryJoinsOfStep(path, std::move(condition), false), start);
    }
  }
  if (joinSiblings(planning, place, path) || keepSiblings(planning, place, path)) return;
  const auto& steps = path.steps();
  XQueryPredicatesOfSteps predicates(planning, place);
  for (size_t i = 0; i < steps.size(); ++i) {
    if (steps[i].isExpression() || steps[i].testMayRaise) return;
    // What asks for nothing but names above is asked of a whole way at once.
    if (steps[i].asksForWays) continue;
    auto condition = conditionOf(planning, predicates.of(steps[i]));
    if (condition.terms.empty()) continue;
    if (i + 1 < steps.size() && steps[i + 1].isExpression()) return;
    const XQueryFacts facts = XQueryFactsUpTo(planning, place, path, steps[i]);
    if (!isSettled(facts)) return;
    const bool looksAround = facts.does(XQueryDeeds::ReadsOutside);
    if (i + 1 == steps.size()) XQueryAddTermsBehind(planning, place, condition);
    planning.choose(place);
    return path.setPicker(XQueryJoinsOfStep(path, std::move(condition), looksAround),
                          steps[i].step);
  }
}

}  // namespace

void XQueryJoinSteps(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    if (planning.program[place].expr->kind() != Kind::PathExpr) continue;
    XQueryWalkedPath* path = XQueryWalkedPathAt(planning, place);
    if (path) joinPath(planning, place, *path);
  }
}

}  // namespace xquery
