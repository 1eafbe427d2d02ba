#include "Plan/Rules/ReadsAbove.h"

#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules/PlaceInside.h"

#include <algorithm>
#include <cstddef>

namespace xquery {
namespace {

constexpr uint8_t mostSteps = 16;

// A test or a predicate of such a step looks at the parent, and at what is around that.
uint8_t leadingParents(const XQueryStep* step) {
  uint8_t count = 0;
  for (; step && count < mostSteps; step = step->next()) {
    const auto* axisStep = dyn_cast<XQueryAxisStep>(step);
    if (!axisStep || axisStep->axis() != XQueryAxisParent) break;
    ++count;
  }
  return count;
}

// From what a reference to the item on.
uint8_t stepsBehind(const XQueryProgram& program, XQueryPlaceID reference) {
  const XQueryPlaceID around = XQueryPlaceAround(program, reference);
  if (program[around].role != XQueryRole::FirstStep) return 0;
  const auto* path = dyn_cast<XQueryPathExpr>(program[program[around].parent].expr);
  const bool goesOn = path && path->step() && path->step()->predicates().empty();
  return goesOn ? leadingParents(path->step()->next()) : 0;
}

size_t argumentCount(const XQueryProgram& program, XQueryPlaceID call) {
  const XQueryPlaceID list = program.part(call, XQueryRole::Arguments);
  XQueryPlaceID each = list == XQueryNoPlace ? list : program.firstPart(list);
  size_t count = 0;
  for (; each != XQueryNoPlace; each = program.nextPart(each)) ++count;
  return count;
}

// Whether an expression in the focus of the item reads that through its parts alone.
bool readsThroughParts(const XQueryProgram& program, XQueryPlaceID place) {
  if (const auto* call = dyn_cast<XQueryFunctionCall>(program[place].expr)) {
    const XQueryBuiltInFunction* builtIn = call->builtIn();
    return builtIn && !builtIn->row().readsContextItem(argumentCount(program, place));
  }
  const Kind kind = program[place].expr->kind();
  return kind == Kind::PathExpr || kind == Kind::ExprList || kind == Kind::Args ||
         kind == Kind::OperatorExpr;
}

}  // namespace

uint8_t XQueryStepsToWhatIsRead(const XQueryPlanning& planning, XQueryPlaceID place,
                                int64_t varID) {
  // Longer expressions are not looked through, so that all of them together take no more time than
  // in proportion to the query.
  constexpr XQueryPlaceID mostPlaces = 64;
  const XQueryProgram& program = planning.program;
  if (program[place].end - place > mostPlaces) return 0;
  uint8_t steps = mostSteps;
  for (XQueryPlaceID each = place; each < program[place].end && steps > 0; ++each) {
    const XQueryExpr& expr = *program[each].expr;
    if (varID != 0) {
      const auto* variable = dyn_cast<XQueryVariable>(&expr);
      const bool isRead = variable && variable->varID() == varID;
      if (isRead) steps = std::min(steps, stepsBehind(program, each));
      continue;
    }
    const bool isInFocus = program[each].focus == program[place].focus;
    if (!isInFocus || !planning.facts[each].does(XQueryDeeds::ReadsItem)) continue;
    if (expr.kind() == Kind::ContextItemExpr) {
      steps = std::min(steps, stepsBehind(program, each));
    } else if (!readsThroughParts(program, each)) {
      return 0;
    } else if (const auto* path = dyn_cast<XQueryPathExpr>(&expr)) {
      const bool beginsAtItem = !path->step() || isa<XQueryAxisStep>(path->step());
      if (beginsAtItem) steps = std::min(steps, leadingParents(path->step()));
    }
  }
  return steps == mostSteps ? 0 : steps;
}

}  // namespace xquery
