#include "Plan/Rules/WayConditions.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/XQueryNameTest.h"
#include "Expr/Paths/XQueryPath.h"
#include "Functions/Boolean.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules/PlaceInside.h"
#include "Plan/Rules/PositionConditions.h"

#include <algorithm>
#include <array>

namespace xquery {
namespace {

constexpr int mostLevels = 16;

bool isOfWays(const XQueryProgram& program, XQueryPlaceID place, int level);

bool allAre(const XQueryProgram& program, XQueryPlaceID whole, int level) {
  XQueryPlaceID part = program.firstPart(whole);
  if (part == XQueryNoPlace) return false;
  for (; part != XQueryNoPlace; part = program.nextPart(part)) {
    if (!isOfWays(program, part, level + 1)) return false;
  }
  return true;
}

bool goesUpByName(const XQueryStep& step) {
  constexpr std::array axes = {XQueryAxisParent, XQueryAxisAncestor, XQueryAxisAncestorOrSelf,
                               XQueryAxisSelf};
  const auto* axisStep = dyn_cast<XQueryAxisStep>(&step);
  return axisStep && isa<XQueryNameTest>(axisStep->expr()) && !axisStep->testMayRaise() &&
         std::find(axes.begin(), axes.end(), axisStep->axis()) != axes.end();
}

// The nodes that it finds differ, but not how many there are.
bool isPathOfWays(const XQueryProgram& program, XQueryPlaceID place, int level) {
  const auto* path = cast<XQueryPathExpr>(program[place].expr);
  const XQueryStep* step = path->step();
  for (; step; step = step->next()) {
    if (!goesUpByName(*step)) return false;
  }
  for (XQueryPlaceID part = program.firstPart(place); part != XQueryNoPlace;
       part = program.nextPart(part)) {
    const XQueryPlace& at = program[part];
    if (at.role == XQueryRole::Predicate && !XQuerySmallIntegerIn(at.expr) &&
        !isOfWays(program, part, level + 1)) {
      return false;
    }
  }
  return path->step() != nullptr;
}

bool isCallOfWays(const XQueryProgram& program, XQueryPlaceID place, int level) {
  constexpr std::array functions = {fn_not, fn_boolean, fn_exists, fn_empty, fn_count};
  const auto* call = cast<XQueryFunctionCall>(program[place].expr);
  if (!call->builtIn() || !call->args() || call->args()->count() != 1) return false;
  const bool fits =
      std::find(functions.begin(), functions.end(), call->function()) != functions.end();
  return fits && allAre(program, program.firstPart(place), level);
}

// Of numbers, which paths are not.
bool isCountOrNumber(const XQueryProgram& program, XQueryPlaceID place) {
  const XQueryExpr* expr = program[XQueryPlaceInside(program, place)].expr;
  const auto* call = dyn_cast<XQueryFunctionCall>(expr);
  return (call && call->builtIn() && call->function() == fn_count) ||
         XQuerySmallIntegerIn(expr).has_value();
}

bool isOperationOfWays(const XQueryProgram& program, XQueryPlaceID place, int level) {
  const auto* operation = cast<XQueryOperatorExpr>(program[place].expr);
  if (!operation->left() || !operation->right()) return false;
  const int type = operation->operatorType();
  if (type == XQueryOperatorAnd || type == XQueryOperatorOr) return allAre(program, place, level);
  constexpr std::array comparisons = {
      XQueryOperatorEqual,     XQueryOperatorNotEqual, XQueryOperatorLess,
      XQueryOperatorLessEqual, XQueryOperatorGreater,  XQueryOperatorGreaterEqual,
      XQueryOperatorEq,        XQueryOperatorNe,       XQueryOperatorLt,
      XQueryOperatorLe,        XQueryOperatorGt,       XQueryOperatorGe};
  if (std::find(comparisons.begin(), comparisons.end(), type) == comparisons.end()) return false;
  const XQueryPlaceID left = program.firstPart(place);
  return isCountOrNumber(program, left) && isCountOrNumber(program, program.nextPart(left)) &&
         allAre(program, place, level);
}

bool isOfWays(const XQueryProgram& program, XQueryPlaceID place, int level) {
  place = XQueryPlaceInside(program, place);
  if (place == XQueryNoPlace || level > mostLevels) return false;
  const XQueryExpr& expr = *program[place].expr;
  if (XQuerySmallIntegerIn(&expr)) return true;
  if (isa<XQueryPathExpr>(&expr)) return isPathOfWays(program, place, level);
  if (isa<XQueryFunctionCall>(&expr)) return isCallOfWays(program, place, level);
  return isa<XQueryOperatorExpr>(&expr) && isOperationOfWays(program, place, level);
}

}  // namespace

bool XQueryIsOfWays(const XQueryProgram& program, XQueryPlaceID place) {
  return isOfWays(program, place, 0);
}

}  // namespace xquery
