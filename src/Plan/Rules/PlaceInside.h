// What stands in parentheses.
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

}  // namespace xquery
