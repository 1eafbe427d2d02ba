// Where a value stands in a list.
//
// Pattern     index-of(L, V), where L is a variable or an expression that is kept
// Facts       both can be repeated
// Operator    XQueryPositionLookup: a table of L is made when L is asked again
// Why         see there
#include "Expr/XQueryLeaves.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryPositionLookup.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {

void XQueryFindPositions(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* call = dyn_cast<XQueryFunctionCall>(program[place].expr);
    if (!call || call->function() != fn_index_of || !planning.isOpen(place)) continue;
    if (!call->args() || call->args()->count() != 2) continue;
    const XQueryPlaceID list = program.firstPart(program.part(place, XQueryRole::Arguments));
    const XQueryPlaceID wanted = program.nextPart(list);
    const XQueryPlaceID inside = program.withoutParentheses(list);
    const bool comesAgain = planning.isWrapped(inside) || isa<XQueryVariable>(program[inside].expr);
    if (!comesAgain) continue;
    if (!planning.facts[list].isRepeatable() || !planning.facts[wanted].isRepeatable()) continue;
    planning.wrap(place,
                  XQueryPositionLookup::exprWithPlain(planning.exprAt(place), planning.exprAt(list),
                                                      planning.exprAt(wanted)));
  }
}

}  // namespace xquery
