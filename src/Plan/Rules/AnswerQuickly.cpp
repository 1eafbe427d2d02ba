// Arithmetic and comparisons of the commonest operands.
//
// Pattern     every arithmetic operator, sign, value comparison and general comparison
// Facts       none are asked for: the operands themselves are looked at, at each use
// Operator    none: the expression asks XQueryQuickArithmetic or XQueryQuickComparison first
// Why         see there; what they do not know, and what may fail, is left to the plain algorithm
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/Operators/XQueryQuickArithmetic.h"
#include "Plan/Operators/XQueryQuickComparison.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"

namespace xquery {
namespace {

// Null where there is none.
XQueryQuickAnswer quickAnswerFor(const XQueryOperatorExpr& expr) {
  switch (XQueryOperatorExpr::operatorClassification(expr.operatorType())) {
    case 2:
      return expr.isSign() ? XQueryQuickSign : XQueryQuickArithmetic;
    case 5:
      return XQueryQuickValueComparison;
    case 6:
      return XQueryQuickGeneralComparison;
    default:
      return nullptr;
  }
}

}  // namespace

void XQueryAnswerQuickly(XQueryPlanning& planning) {
  for (XQueryPlaceID place = 0; place < planning.program.placeCount(); ++place) {
    auto* expr = dyn_cast<XQueryOperatorExpr>(planning.program[place].expr);
    const XQueryQuickAnswer quickly = expr ? quickAnswerFor(*expr) : nullptr;
    if (!quickly) continue;
    expr->answerQuickly(quickly);
    if (planning.isOpen(place)) planning.choose(place);
  }
}

}  // namespace xquery
