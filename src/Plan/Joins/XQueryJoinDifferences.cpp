// Equalities that are written as that there is no difference: "compare(K, P) = 0", "K - P = 0" and
// "deep-equal(K, P)". A key that does not equal the probe does not meet them, and cannot be an
// error, where both sides are texts, or numbers. What does equal it is asked, and so are items with
// several keys.
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLists.h"
#include "Functions/DeepEqual.h"
#include "Functions/String.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Joins/XQueryJoinCondition.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <utility>

namespace xquery {
namespace {

constexpr XQueryItemKinds texts = XQueryItems::Untyped | XQueryItems::String;

bool isCallOfTwo(const XQueryExpr* expr, XQueryProcedure function) {
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  return call && call->builtIn() && call->function() == function && call->args() &&
         call->args()->count() == 2;
}

}  // namespace

XQueryJoinSearch::Comparison XQueryJoinSearch::equalityOf(XQueryPlaceID left, XQueryPlaceID right,
                                                          XQueryItemKinds kinds) const {
  for (const XQueryPlaceID side : {left, right}) {
    if (side == XQueryNoPlace || !facts(side).are(kinds)) return {};
  }
  Comparison found = comparisonOf(XQueryOperatorEq, {_planning.exprAt(left), facts(left), left},
                                  {_planning.exprAt(right), facts(right), right}, _scope);
  found.isWhole = false;
  return found;
}

XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfDifference(XQueryPlaceID place) const {
  const XQueryProgram& program = _planning.program;
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(at(place).expr);
  const bool isEquality = comparison && (comparison->operatorType() == XQueryOperatorEqual ||
                                         comparison->operatorType() == XQueryOperatorEq);
  if (!isEquality) return {};
  XQueryPlaceID difference = program.firstPart(place);
  XQueryPlaceID zero = difference == XQueryNoPlace ? difference : program.nextPart(difference);
  if (zero == XQueryNoPlace) return {};
  if (XQuerySmallIntegerIn(at(difference).expr) == 0) std::swap(difference, zero);
  if (XQuerySmallIntegerIn(at(zero).expr) != 0) return {};
  difference = XQueryPlaceInside(program, difference);
  const XQueryExpr* expr = at(difference).expr;
  const auto* minus = dyn_cast<XQueryOperatorExpr>(expr);
  const bool isMinus = minus && minus->operatorType() == XQueryOperatorMinus;
  if (!isMinus && !isCallOfTwo(expr, fn_compare)) return {};
  const XQueryPlaceID left =
      program.firstPart(isMinus ? difference : program.firstPart(difference));
  return equalityOf(left, program.nextPart(left),
                    isMinus ? XQueryItems::Numeric : XQueryItems::Node | texts);
}

// Two nodes are compared by what is below them, and no item with none is the same, too.
XQueryJoinSearch::Comparison XQueryJoinSearch::comparisonOfSame(XQueryPlaceID place) const {
  if (!isCallOfTwo(at(place).expr, fn_deep_equal)) return {};
  const XQueryPlaceID left = _planning.program.firstPart(_planning.program.firstPart(place));
  const XQueryPlaceID right = _planning.program.nextPart(left);
  const bool areThere = facts(left).least > 0 || facts(right).least > 0;
  return areThere ? equalityOf(left, right, texts) : Comparison();
}

}  // namespace xquery
