#include "Plan/Rules/TupleConditions.h"

#include "Expr/Clauses/XQueryConditional.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Paths/XQueryPath.h"
#include "Plan/Rules/PlaceInside.h"

namespace xquery {

bool XQueryIsNothing(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryFacts& facts = planning.facts[place];
  return facts.most == 0 && facts.deeds == 0 && facts.assigns.isEmpty();
}

XQueryPlaceID XQueryFilterOfTuples(const XQueryPlanning& planning, XQueryPlaceID flwor) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID place = XQueryPlaceInside(program, program.part(flwor, XQueryRole::Return));
  const auto* path =
      place == XQueryNoPlace ? nullptr : dyn_cast<XQueryPathExpr>(program[place].expr);
  for (const XQueryStep* step = path ? path->step() : nullptr; step; step = step->next()) {
    if (!step->predicates().empty()) return place;
  }
  return XQueryNoPlace;
}

// What is sorted by is evaluated for tuples that yield nothing, too, but for those that a where
// clause drops.
XQueryPlaceID XQueryConditionOfTuples(const XQueryPlanning& planning, XQueryPlaceID flwor) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID where = program.part(flwor, XQueryRole::Where);
  if (where != XQueryNoPlace) return where;
  if (!cast<XQueryFLWORExpr>(program[flwor].expr)->orderSpecs().empty()) return XQueryNoPlace;
  const XQueryPlaceID place = XQueryPlaceInside(program, program.part(flwor, XQueryRole::Return));
  if (place == XQueryNoPlace || program[place].expr->kind() != Kind::ConditionalExpr) {
    return XQueryFilterOfTuples(planning, flwor);
  }
  const XQueryPlaceID test = program.part(place, XQueryRole::Test);
  const XQueryPlaceID then = test == XQueryNoPlace ? test : program.nextPart(test);
  const XQueryPlaceID other = then == XQueryNoPlace ? then : program.nextPart(then);
  return other != XQueryNoPlace && XQueryIsNothing(planning, other) ? test : XQueryNoPlace;
}

}  // namespace xquery
