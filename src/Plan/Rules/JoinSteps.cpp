// A predicate picks the items of a step.
//
// Pattern     a step with predicates, one of which is K = P, or joins it to others by "and", with
//             the comparisons of a where clause; K reads the context item and P does not. It is the
//             first step, or an axis step with nothing but axis steps before it, the first one
//             apart
// Facts       all predicates are repeatable, read neither position nor size and answer no number:
//             then they can be asked in any order, and an error in one drops the item as well; the
//             steps before it are repeatable and read no variables
// Refused     tests that may raise an error; documents that are loaded in a predicate that is not
//             alone
// Operator    XQueryJoin
// Why         the items depend on what the path starts with; a result of a path holds each node
//             once, in an order that does not depend on how it was found
#include "Expr/Paths/XQueryPath.h"
#include "Plan/Joins/XQueryJoin.h"
#include "Plan/Joins/XQueryJoinedSteps.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

#include <utility>
#include <vector>

namespace xquery {
namespace {

// Of the predicates the one that joins best.
XQueryJoinCondition conditionOf(const XQueryPlanning& planning, const XQueryStep& step,
                                const std::vector<XQueryPlaceID>& places) {
  XQueryJoinCondition best;
  if (!XQueryPredicatesAreOfTruth(planning, step, places)) return best;
  XQueryJoinScope scope;
  scope.isFocus = true;
  const XQueryJoinSearch search(planning, scope, {});
  for (const XQueryPlaceID place : places) {
    XQueryJoinCondition found = search.conditionIn(place, true);
    if (found.promise > best.promise) best = std::move(found);
  }
  best.isWhole = best.isWhole && places.size() == 1;
  return best;
}

// Whether they depend on what the path starts with alone.
bool isSettled(const XQueryFacts& facts) {
  const bool looksForGlobals =
      facts.does(XQueryDeeds::ReadsOutside) && facts.does(XQueryDeeds::ReadsGlobals);
  return facts.isRepeatable() && !looksForGlobals && facts.reads.isEmpty();
}

void joinPath(XQueryPlanning& planning, XQueryPlaceID place, XQueryPathExpr& path) {
  if (planning.showsLeftovers(planning.facts[place].assigns, place)) return;
  const XQueryStep* firstAxisStep = nullptr;
  for (const XQueryStep* step = path.step(); step; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep && step != path.step()) return;
    if (axisStep && axisStep->testMayRaise()) return;
    if (axisStep && !firstAxisStep) firstAxisStep = step;
    if (step->predicates().empty()) continue;
    auto condition = conditionOf(planning, *step, XQueryPredicatesOf(planning, place, *step));
    if (!condition.key) continue;
    bool looksAround = false;
    if (axisStep) {
      if (step->next() && !isa<XQueryAxisStep>(step->next())) return;
      const XQueryFacts facts = XQueryFactsUpTo(planning, place, *firstAxisStep, *step);
      if (!isSettled(facts)) return;
      looksAround = facts.does(XQueryDeeds::ReadsOutside);
    }
    planning.choose(place);
    return path.setPicker(XQueryJoin::ofStep(path, std::move(condition), looksAround), step);
  }
}

}  // namespace

void XQueryJoinSteps(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    auto* path = dyn_cast<XQueryPathExpr>(planning.program[place].expr);
    if (path) joinPath(planning, place, *path);
  }
}

}  // namespace xquery
