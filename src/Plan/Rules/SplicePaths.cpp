// A path that begins with another one.
//
// Pattern     (P)/a, ((P))//a[b], (P | Q)/a and (P, Q)/a where rules have made one path of the two
// Facts       P begins at the document and consists of axis steps without predicates, whose names
//             raise nothing; the steps behind it are axis steps that construct nothing, whose
//             predicates are repeatable and leave nothing in variables that can be told; results
//             are sorted
// Operator    none: the outer path takes the steps of P before its own, so that the index of the
//             tree knows the way from the document to what they lead to
// Why         each step is taken from every node that the steps before it find, and the results,
//             in document order, hold each node once, however often and from where it was found.
//             P can fail nowhere but in looking for the document, which comes first both ways
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/SplicePath.h"

#include <algorithm>

namespace xquery {
namespace {

bool isPlain(const XQueryWalkedStep& step) {
  return !step.isExpression() && !step.testMayRaise && !step.step->mayAdopt();
}

bool canBeSpliced(const XQueryWalkedPath& path) {
  if (!path.start() || !isa<XQueryRootStep>(path.start())) return false;
  if (!path.start()->predicates().empty()) return false;
  return std::all_of(path.steps().begin(), path.steps().end(), [](const auto& step) {
    return isPlain(step) && step.step->predicates().empty();
  });
}

// Whether nobody can tell of which nodes a predicate was asked first, and how often.
bool areIdlePredicates(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  XQueryVariableSet reads;
  XQueryVariableSet assigns;
  for (XQueryPlaceID part = program.firstPart(place); part != XQueryNoPlace;
       part = program.nextPart(part)) {
    if (program[part].role != XQueryRole::Predicate) continue;
    const XQueryFacts& facts = planning.facts[part];
    if (!facts.isRepeatable() || planning.showsLeftovers(facts.assigns, place)) return false;
    reads.add(facts.reads);
    assigns.add(facts.assigns);
  }
  return !reads.meets(assigns);
}

}  // namespace

void XQuerySplicePath(XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  XQueryWalkedPath* path = XQueryWalkedPathAt(planning, place);
  if (!path || !path->start() || path->steps().empty() || !program[place].isOrdered) return;
  if (!path->start()->predicates().empty()) return;
  const XQueryPlaceID first = program.part(place, XQueryRole::FirstStep);
  if (first == XQueryNoPlace || isa<XQueryRootStep>(path->start())) return;
  const XQueryPlaceID inside = XQueryPlaceInside(program, first);
  XQueryWalkedPath* inner = XQueryWalkedPathAt(planning, inside);
  if (!inner || planning.isWrapped(inside) || !canBeSpliced(*inner)) return;
  if (!std::all_of(path->steps().begin(), path->steps().end(), isPlain)) return;
  if (!areIdlePredicates(planning, place)) return;
  path->takeSteps(*inner);
  planning.leaveOut(first);
  planning.choose(place);
}

void XQuerySplicePaths(XQueryPlanning& planning) {
  // Those inside first: "((P)/a)/b".
  for (const XQueryPlaceID place : planning.program.partsFirst()) {
    if (planning.program[place].expr->kind() == Kind::PathExpr) XQuerySplicePath(planning, place);
  }
}

}  // namespace xquery
