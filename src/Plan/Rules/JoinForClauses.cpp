// The condition of a FLWOR picks the items of its for clauses.
//
// Pattern     for $x in X ... where ... K = P ...; for $x in X ... return if (... K = P ...) then T
//             else (); sum(for $x in X ... return if (... K = P ...) then T else 0); also <, <=, >,
//             >=, the value comparisons, "is", on either side, and starts-with(K, P), among
//             conditions that "and" joins; K follows from $x, directly, through let and for clauses
//             behind it, or as "some $y in K satisfies $y = P"; P does not read $x, nor what later
//             clauses set
// Facts       K, P, the conditions before the comparison and the clauses behind $x are repeatable;
//             a condition before it reads $x alone, or nothing that is set for $x, or cannot fail;
//             so do the clauses behind $x; what these leave in variables cannot be told; in a sum
//             there is one for clause, and T answers numbers, or nodes
// Refused     a binding with a type, or a range; a later clause that may fail for an item that
//             would be left out, constructs or traces; "!="
// Operator    XQueryJoin: a table of the keys by their values, kept from one time that the clause
//             is evaluated over the same items to the next
// Why         see there. A tuple that is left out makes the comparison false, hence the condition:
//             what would have been evaluated for it has no effect, and fails neither. Of the zeros
//             of a sum two are left, since the sum of one item is that item itself
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Expr/XQueryLists.h"
#include "Functions/Aggregate.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryClauseJoins.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <algorithm>

namespace xquery {
namespace {

using Picks = XQueryClauseJoins::Picks;

// Whether all that is made of the value is its sum.
bool isSummed(const XQueryProgram& program, XQueryPlaceID place) {
  XQueryPlaceID whole = program[place].parent;
  while (whole != XQueryNoPlace && program[whole].expr->kind() == Kind::ExprList &&
         cast<XQueryExprList>(program[whole].expr)->count() == 1) {
    whole = program[whole].parent;
  }
  if (whole == XQueryNoPlace || program[whole].expr->kind() != Kind::Args) return false;
  const auto* call = dyn_cast<XQueryFunctionCall>(program[program[whole].parent].expr);
  return call && call->builtIn() && call->function() == fn_sum && call->args()->count() == 1;
}

// "return if (C) then T else ()", and "else 0" in a sum.
void joinConditional(XQueryPlanning& planning, XQueryPlaceID place, XQueryFLWORExpr& expr) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID part = program.part(place, XQueryRole::Return);
  const XQueryPlaceID conditional = XQueryPlaceInside(program, part);
  if (conditional == XQueryNoPlace || !expr.orderSpecs().empty()) return;
  if (program[conditional].expr->kind() != Kind::ConditionalExpr) return;
  const XQueryPlaceID test = program.part(conditional, XQueryRole::Test);
  if (test == XQueryNoPlace) return;
  const XQueryPlaceID then = program.nextPart(test);
  const XQueryPlaceID other = then == XQueryNoPlace ? XQueryNoPlace : program.nextPart(then);
  if (other == XQueryNoPlace) return;
  const XQueryFacts& ofOther = planning.facts[other];
  const bool isNothing = ofOther.most == 0 && ofOther.deeds == 0 && ofOther.assigns.isEmpty();
  const auto isFor = [](const auto& clause) { return clause->kind() == Kind::ForExpr; };
  const bool isZero =
      XQuerySmallIntegerIn(program[other].expr) == 0 && isSummed(program, place) &&
      planning.facts[then].are(XQueryItems::Numeric | XQueryItems::Untyped | XQueryItems::Node) &&
      std::count_if(expr.forLet().begin(), expr.forLet().end(), isFor) == 1;
  if (!isNothing && !isZero) return;
  if (!XQueryClauseJoins(planning, place, part, test, Picks::WhereItHolds).join()) return;
  expr.setReturnOfPicks(planning.exprAt(then), isZero ? planning.exprAt(other) : nullptr);
}

}  // namespace

void XQueryJoinForClauses(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    auto* expr = dyn_cast<XQueryFLWORExpr>(program[place].expr);
    if (!expr) continue;
    const XQueryPlaceID where = program.part(place, XQueryRole::Where);
    if (where != XQueryNoPlace) {
      XQueryClauseJoins(planning, place, where, where, Picks::WhereItHolds).join();
    } else {
      joinConditional(planning, place, *expr);
    }
  }
}

}  // namespace xquery
