// The condition of a quantifier picks the items of its clauses.
//
// Pattern     some $x in X ... satisfies ... K = P ..., with the comparisons of a where clause;
//             every $x in X ... satisfies not(...) of the same; every $x in X ... satisfies K != P
//             and the other comparisons, where an item is left out that meets it for certain
// Facts       those of a where clause
// Refused     as for a where clause; "every" with several conditions
// Operator    XQueryJoin
// Why         an item that is left out answers what leaves the question open, and the last item is
//             what the variable is left with. For "every" the items are found whose comparison may
//             fail to hold: those with one key, which is no NaN, that meets the opposite relation
//             with a single probe, and all those with none or several
#include "Expr/Clauses/XQueryQuantified.h"
#include "Plan/Joins/XQueryClauseJoins.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {

void XQueryJoinQuantifiers(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* quantifier = dyn_cast<XQueryQuantifiedExpr>(program[place].expr);
    if (!quantifier) continue;
    const XQueryPlaceID satisfies = program.part(place, XQueryRole::Satisfies);
    if (satisfies == XQueryNoPlace) continue;
    using Picks = XQueryClauseJoins::Picks;
    const Picks picks = quantifier->every() ? Picks::WhereItFails : Picks::WhereItHolds;
    XQueryClauseJoins(planning, place, satisfies, satisfies, picks).join();
  }
}

}  // namespace xquery
