// Several conditions on a node.
//
// Pattern     A and B, A or B, not(A), where A and B are conditions on the context item that other
//             rules have found can be asked of a node as it is
// Facts       none are asked for
// Operator    XQueryNodeLogic: a step asks its nodes without making each the context item
// Why         these conditions read the node alone, leave nothing behind, and say where they cannot
//             tell, for which the expression is evaluated as a whole: what is evaluated twice has
//             done nothing the first time
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Functions/Boolean.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Operators/XQueryNodeLogic.h"
#include "Plan/Planning.h"
#include "Plan/Rules.h"
#include "Plan/Rules/PlaceInside.h"

#include <optional>

namespace xquery {
namespace {

using Joint = XQueryNodeLogic::Joint;

// How the operands of an expression are joined, if they are.
std::optional<Joint> jointOf(const XQueryExpr& expr) {
  if (const auto* operation = dyn_cast<XQueryOperatorExpr>(&expr)) {
    if (operation->operatorType() == XQueryOperatorAnd) return Joint::And;
    if (operation->operatorType() == XQueryOperatorOr) return Joint::Or;
    return std::nullopt;
  }
  const auto* call = dyn_cast<XQueryFunctionCall>(&expr);
  const bool isNot = call && call->builtIn() && call->function() == fn_not && call->args() &&
                     call->args()->count() == 1;
  return isNot ? std::optional(Joint::Not) : std::nullopt;
}

}  // namespace

void XQueryJoinConditions(XQueryPlanning& planning) {
  const XQueryProgram& program = planning.program;
  for (const XQueryPlaceID place : program.partsFirst()) {
    const auto joint = jointOf(*program[place].expr);
    if (!joint || !planning.isOpen(place)) continue;
    XQueryPlaceID part = program.firstPart(place);
    if (joint == Joint::Not && part != XQueryNoPlace) part = program.firstPart(part);
    std::vector<Ref<XQueryPlannedExpr>> operands;
    bool areQuestions = true;
    for (; part != XQueryNoPlace; part = program.nextPart(part)) {
      const Ref<XQueryExpr> there = planning.exprAt(XQueryPlaceInside(program, part));
      auto* operand = dyn_cast<XQueryPlannedExpr>(there.get());
      if (operand && operand->nodeQuestion()) {
        operands.emplace_back(operand);
      } else {
        areQuestions = false;
      }
    }
    const size_t count = joint == Joint::Not ? 1 : 2;
    if (!areQuestions || operands.size() != count) continue;
    planning.wrap(
        place, XQueryNodeLogic::exprWithPlain(planning.exprAt(place), *joint, std::move(operands)));
  }
}

}  // namespace xquery
