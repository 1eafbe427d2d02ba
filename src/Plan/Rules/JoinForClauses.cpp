// The where clause of a FLWOR picks the items of its for clauses.
//
// Pattern     for $x in X ... where ... K = P ..., also <, <=, >, >=, the value comparisons and
//             "is", on either side, among conditions that "and" joins; K follows from $x, directly,
//             through let and for clauses behind it, or as "some $y in K satisfies $y = P"; P does
//             not read $x, nor what later clauses set
// Facts       K, P, the conditions before the comparison and the clauses behind $x are repeatable;
//             a condition before it reads $x alone, or nothing that is set for $x, or cannot fail;
//             so do the clauses behind $x; what these leave in variables cannot be told
// Refused     a binding with a type, or a range; a later clause that may fail for an item that
//             would be left out, constructs or traces; "!="
// Operator    XQueryJoin: a table of the keys by their values, kept from one time that the clause
//             is evaluated over the same items to the next
// Why         see there. A tuple that is left out makes the comparison false, hence the condition:
//             what would have been evaluated for it has no effect, and fails neither
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Plan/Joins/XQueryClauseJoins.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {

void XQueryJoinForClauses(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    if (program[place].expr->kind() != Kind::FLWORExpr) continue;
    const XQueryPlaceID where = program.part(place, XQueryRole::Where);
    if (where == XQueryNoPlace) continue;
    using Picks = XQueryClauseJoins::Picks;
    XQueryClauseJoins(planning, place, where, Picks::WhereItHolds).join();
  }
}

}  // namespace xquery
