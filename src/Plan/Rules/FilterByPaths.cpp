// A set and a path.
//
// Pattern     S intersect P, P intersect S, S except P, where P is a path down from the document
//             (XQueryPathPattern); of both sides of an "intersect" that are such paths, one
// Facts       P counts its nodes: it can be repeated and cannot fail once the document is there. It
//             is not kept from elsewhere. Where it stands on the left, S is repeatable and leaves
//             nothing in variables
// Operator    XQueryPathFilter: each node of S is asked whether P finds it, by its name, its
//             parents and the predicates of P, where S turns out to be small beside what P is
//             walked to
// Why         P finds a node by that way alone, wherever it is looked for, and nobody can tell how
//             far P was walked. Its predicates are asked of no node that they would not have been
//             asked of. What S is and how it fails comes as before, P's document before or after it
#include "Plan/Operators/XQueryPathFilter.h"
#include "Plan/Paths/XQueryPathPattern.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PlaceInside.h"

#include <utility>

namespace xquery {
namespace {

// The path that stands there by itself and can be asked; null for none.
Ref<XQueryWalkedPath> patternAt(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryPlaceID inside = XQueryPlaceInside(planning.program, place);
  for (XQueryPlaceID around = place; around != inside;
       around = planning.program.firstPart(around)) {
    if (planning.isWrapped(around)) return nullptr;
  }
  XQueryWalkedPath* path = XQueryWalkedPathAt(planning, inside);
  const bool isAlone = path && path == planning.exprAt(inside).get();
  return Ref<XQueryWalkedPath>(isAlone && XQueryPathPattern::fits(*path) ? path : nullptr);
}

bool canComeFirst(const XQueryFacts& facts) {
  return facts.isRepeatable() && facts.assigns.isEmpty();
}

}  // namespace

void XQueryFilterByPaths(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    auto* operation = dyn_cast<XQueryOperatorExpr>(program[place].expr);
    if (!operation || !planning.isOpen(place) || !operation->left() || !operation->right()) {
      continue;
    }
    const bool isIntersection = operation->operatorType() == XQueryOperatorIntersect;
    if (!isIntersection && operation->operatorType() != XQueryOperatorExcept) continue;
    // A chain of operators is evaluated from its head, however long it is.
    if (isa<XQueryOperatorExpr>(operation->left())) continue;
    const XQueryPlaceID left = program.firstPart(place);
    const XQueryPlaceID right = program.nextPart(left);
    XQueryPathFilter::Paths paths;
    paths.right = patternAt(planning, right);
    if (isIntersection && canComeFirst(planning.facts[right])) {
      paths.left = patternAt(planning, left);
    }
    if (!paths.left && !paths.right) continue;
    planning.wrap(place, XQueryPathFilter::exprWithPlain(Ref<XQueryOperatorExpr>(operation),
                                                         std::move(paths)));
  }
}

}  // namespace xquery
