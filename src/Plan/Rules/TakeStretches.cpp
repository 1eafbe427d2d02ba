// What lies below a node, of a list of nodes.
//
// Pattern     a filter whose first predicate is, or joins to others by "and", what asks for a node
//             above: "$items[ancestor::a intersect $a]"
// Facts       the items are nodes in document order, and of one tree; that there is one node to ask
//             for is seen at each use
// Operator    none: the path is told that its items are in order (XQueryWalkedPath)
// Why         what lies in the subtree of a node stands in a row in document order, and is found by
//             binary search; the condition cannot fail, and does not hold for the others
#include "Plan/Operators/XQueryNodeQuestion.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"

namespace xquery {

void XQueryTakeStretches(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const XQueryPlace& start = program[place];
    const bool isFilter = start.role == XQueryRole::FirstStep && start.step &&
                          !start.step->predicates().empty() && planning.facts[place].inOrder &&
                          planning.facts[place].most > 1;
    XQueryWalkedPath* path = isFilter ? XQueryWalkedPathAt(planning, start.parent) : nullptr;
    if (!path || path->start() != start.step) continue;
    const auto* question = XQueryNodeQuestionIn(start.step->predicates().front().get());
    if (!question || !question->asksForNodeAbove()) continue;
    path->noteStartInOrder();
    planning.choose(start.parent);
  }
}

}  // namespace xquery
