// Sums, averages and extremes of what a loop yields.
//
// Pattern     sum(E), sum(E, Z), avg(E), max(E), min(E), where E is a FLWOR without order specs, or
//             a range
// Facts       none are asked for: what is no number turns what has been kept into a list
// Operator    XQueryFoldedCall: each value is added as it comes, and one that the return clause
//             computes with machine numbers is never made an object
// Why         adding short numbers cannot fail, so that it does not matter whether it is done
//             before the loop goes on or at its end; the functions go through a list from its
//             beginning, so that what they have got from the first items can stand for these
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryFoldedCall.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"

namespace xquery {
namespace {

// What the return clause is, where that can be added without being made.
void yieldReturned(const XQueryPlanning& planning, XQueryPlaceID place, XQueryFLWORExpr& flwor) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID returned =
      XQueryPlaceInside(program, program.part(place, XQueryRole::Return));
  if (returned == XQueryNoPlace) return;
  const Ref<XQueryExpr> expr = planning.exprAt(returned);
  const auto* planned = dyn_cast<XQueryPlannedExpr>(expr.get());
  if (planned && planned->itemYielder()) flwor.setYielder(expr, planned->itemYielder());
}

}  // namespace

void XQueryFoldNumbers(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    auto* call = dyn_cast<XQueryFunctionCall>(program[place].expr);
    if (!call || !XQueryFoldedCall::isFor(*call) || !planning.isOpen(place)) continue;
    const XQueryPlaceID folded =
        XQueryPlaceInside(program, program.firstPart(program.firstPart(place)));
    const Ref<XQueryExpr> expr = planning.exprAt(folded);
    if (auto* flwor = dyn_cast<XQueryFLWORExpr>(expr.get())) {
      if (!flwor->orderSpecs().empty()) continue;
      yieldReturned(planning, folded, *flwor);
    } else if (XQueryOperatorExpr::rangeIn(expr.get()) != expr.get()) {
      continue;
    }
    planning.wrap(place, XQueryFoldedCall::exprWithCall(Ref<XQueryFunctionCall>(call), expr));
  }
}

}  // namespace xquery
