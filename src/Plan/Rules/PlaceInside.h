// What stands in parentheses, and what parentheses stand around.
#pragma once

#include "Expr/XQueryLists.h"
#include "Plan/Program.h"

namespace xquery {

// The place in the innermost parentheses of those that stand in the place, as it was written.
inline XQueryPlaceID XQueryPlaceInside(const XQueryProgram& program, XQueryPlaceID place) {
  while (place != XQueryNoPlace && program[place].expr->kind() == Kind::ExprList &&
         cast<XQueryExprList>(program[place].expr)->count() == 1) {
    place = program.firstPart(place);
  }
  return place;
}

// The outermost parentheses that hold nothing but the place, or the place itself.
inline XQueryPlaceID XQueryPlaceAround(const XQueryProgram& program, XQueryPlaceID place) {
  while (program[place].parent != XQueryNoPlace) {
    const auto* list = dyn_cast<XQueryExprList>(program[program[place].parent].expr);
    if (!list || list->kind() != Kind::ExprList || list->count() != 1) break;
    place = program[place].parent;
  }
  return place;
}

}  // namespace xquery
