// The condition of a FLWOR picks the items of its for clauses.
//
// Pattern     for $x in X ... where ... K = P ...; for $x in X ... return if (... K = P ...) then T
//             else (); for $x in X ... return $x[... K = P ...]/a; sum(for $x in X ... return if
//             (... K = P ...) then T else 0); also <, <=, >, >=, the value comparisons, "is", on
//             either side, not(K != P), and starts-with(K, P), among conditions that "and" joins,
//             one of which may be several joined by "or", however these are written
//             (XQueryConditionParts); K follows from $x, directly, through let and for clauses
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
#include "Expr/XQueryLeaves.h"
#include "Functions/Aggregate.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryClauseJoins.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"
#include "Plan/Rules/TupleConditions.h"

#include <algorithm>
#include <string_view>
#include <utility>

namespace xquery {
namespace {

using Picks = XQueryClauseJoins::Picks;

// Whether all that is made of the value is its sum. What stands for the sum of nothing may be given
// as a second argument.
enum class Sum : uint8_t { None, Plain, OrZero };
Sum sumOf(const XQueryProgram& program, XQueryPlaceID place) {
  place = XQueryPlaceAround(program, place);
  const XQueryPlaceID list = program[place].parent;
  if (list == XQueryNoPlace || program[list].expr->kind() != Kind::Args) return Sum::None;
  const auto* call = dyn_cast<XQueryFunctionCall>(program[program[list].parent].expr);
  const bool isSum = call && call->builtIn() && call->function() == fn_sum;
  if (!isSum || program.firstPart(list) != place) return Sum::None;
  return call->args()->count() == 1 ? Sum::Plain : Sum::OrZero;
}

// Whether the expression answers one item, and nobody can tell whether it is evaluated.
bool isOneItem(const XQueryPlanning& planning, XQueryPlaceID place) {
  const XQueryFacts& facts = planning.facts[place];
  const auto* variable = dyn_cast<XQueryVariable>(planning.program[place].expr);
  const XQueryPlaceID binder = planning.program[place].binder;
  const bool isItem =
      variable && binder != XQueryNoPlace && planning.program[binder].expr->kind() == Kind::ForExpr;
  using namespace XQueryDeeds;
  return facts.least == 1 && facts.most == 1 && (isItem || !facts.mayBe(XQueryItems::Other)) &&
         facts.isRepeatable() && !facts.does(MayFail | LoadsDocuments) && facts.assigns.isEmpty();
}

// What is known of the items that are picked, of which each yields what is written there.
void describeYield(const XQueryPlanning& planning, XQueryPlaceID place, XQueryPlaceID answer,
                   XQueryFLWORExpr& expr) {
  if (!expr.orderSpecs().empty()) return;
  XQueryFLWORExpr::Yield yield;
  yield.isOneItem = isOneItem(planning, answer);
  if (sumOf(planning.program, place) != Sum::None) {
    yield.summand = XQuerySmallIntegerIn(planning.program[answer].expr);
  }
  expr.setYieldOfPicks(yield);
}

// Why the zeros of a sum cannot be left out; empty for nothing.
std::string_view obstacleToSum(const XQueryFLWORExpr& expr, const XQueryFacts& summed) {
  const auto isFor = [](const auto& clause) { return clause->kind() == Kind::ForExpr; };
  if (std::count_if(expr.forLet().begin(), expr.forLet().end(), isFor) != 1) {
    return "it is not told how many zeros several for clauses sum up";
  }
  if (!summed.are(XQueryItems::Numeric | XQueryItems::Untyped | XQueryItems::Node)) {
    return "what is summed up may be no number, and an error together with a zero";
  }
  return {};
}

// "return if (C) then T else ()", and "else 0" in a sum; or "if (C) then () else T".
void joinConditional(XQueryPlanning& planning, XQueryPlaceID place, XQueryFLWORExpr& expr) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID part = program.part(place, XQueryRole::Return);
  const XQueryPlaceID conditional = XQueryPlaceInside(program, part);
  if (conditional == XQueryNoPlace) return;
  if (program[conditional].expr->kind() != Kind::ConditionalExpr) return;
  const XQueryPlaceID test = program.part(conditional, XQueryRole::Test);
  if (test == XQueryNoPlace) return;
  XQueryPlaceID then = program.nextPart(test);
  XQueryPlaceID other = then == XQueryNoPlace ? XQueryNoPlace : program.nextPart(then);
  if (other == XQueryNoPlace) return;
  const bool isReversed = XQueryIsNothing(planning, then) && !XQueryIsNothing(planning, other);
  if (isReversed) std::swap(then, other);
  const bool isNothing = XQueryIsNothing(planning, other);
  const bool isZero = !isNothing && XQuerySmallIntegerIn(program[other].expr) == 0 &&
                      sumOf(program, place) == Sum::Plain;
  XQueryClauseJoins joins(planning, place, part, test,
                          isReversed ? Picks::WhereItFails : Picks::WhereItHolds);
  std::string_view obstacle;
  if (!expr.orderSpecs().empty()) {
    obstacle = "what is ordered by may fail for an item that would be left out";
  } else if (isZero) {
    obstacle = obstacleToSum(expr, planning.facts[then]);
  } else if (!isNothing) {
    obstacle =
        "where the condition does not hold, the \"if\" answers something, and no zero of a sum";
  }
  if (!obstacle.empty()) {
    if (joins.seesComparison()) planning.refuse(place, obstacle);
    return;
  }
  if (!joins.join()) return;
  expr.setReturnOfPicks(planning.exprAt(then), isZero ? planning.exprAt(other) : nullptr);
  describeYield(planning, place, then, expr);
}

// "return $x[C]/a" and "return $x/b[C]", which answer nothing where nothing is left.
void joinFilter(XQueryPlanning& planning, XQueryPlaceID place, XQueryFLWORExpr& expr) {
  const XQueryPlaceID path = XQueryFilterOfTuples(planning, place);
  if (path == XQueryNoPlace) return;
  const XQueryPlaceID part = planning.program.part(place, XQueryRole::Return);
  XQueryClauseJoins joins(planning, place, part, path, Picks::WhereItHolds);
  if (expr.orderSpecs().empty()) {
    joins.join();
  } else if (joins.seesComparison()) {
    planning.refuse(place, "what is ordered by may fail for an item that would be left out");
  }
}

}  // namespace

void XQueryJoinForClauses(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    auto* expr = dyn_cast<XQueryFLWORExpr>(program[place].expr);
    if (!expr) continue;
    const XQueryPlaceID where = program.part(place, XQueryRole::Where);
    if (where != XQueryNoPlace) {
      const bool joins =
          XQueryClauseJoins(planning, place, where, where, Picks::WhereItHolds).join();
      const XQueryPlaceID answer = program.part(place, XQueryRole::Return);
      if (joins && answer != XQueryNoPlace) describeYield(planning, place, answer, *expr);
    } else {
      joinConditional(planning, place, *expr);
      joinFilter(planning, place, *expr);
    }
  }
}

}  // namespace xquery
