// Positions that a step could have been asked for by number.
//
// Pattern     a[position() = 3], a[3 eq position()]
// Facts       the number is an integer, 1 or more; nothing shows the focus that the comparison
//             leaves (StepsAround.h)
// Operator    none: the predicate is the number, so that the step walks no further than that
// Why         a number in a predicate asks for that position
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PathAt.h"
#include "Plan/Rules/PositionConditions.h"
#include "Plan/Rules/StepsAround.h"
#include "Types/XQueryNumber.h"

namespace xquery {

void XQueryTakePositions(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    const XQueryPlace& here = planning.program[place];
    if (here.role != XQueryRole::Predicate || !planning.isOpen(place)) continue;
    const XQueryWalkedPath* path =
        here.parent == XQueryNoPlace ? nullptr : XQueryWalkedPathAt(planning, here.parent);
    const auto asked = XQueryPositionConditionIn(*here.expr);
    const bool isEqual = asked && (asked->comparison == XQueryOperatorEqual ||
                                   asked->comparison == XQueryOperatorEq);
    if (!path || !isEqual || asked->number < 1) continue;
    if (!here.step || !XQueryHidesFocusOf(*here.step, *path, here.parent, planning)) continue;
    auto number = XQueryLiteral::literalWithValue(XQueryNumber::integerWithInt64(asked->number));
    number->setExprLine(here.expr->exprLine());
    planning.replace(place, std::move(number));
    const_cast<XQueryPathExpr&>(path->path()).notePositions();
  }
}

}  // namespace xquery
