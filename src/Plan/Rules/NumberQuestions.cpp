#include "Plan/Rules/NumberQuestions.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLists.h"
#include "Functions/Boolean.h"
#include "Functions/Sequence.h"
#include "Functions/XQueryFunctionCall.h"
#include "Plan/Rules/PlaceInside.h"

#include <algorithm>
#include <array>

namespace xquery {

std::optional<XQueryNumberQuestion> XQueryNumberQuestionOf(const XQueryExpr& call) {
  struct Row {
    XQueryProcedure function;
    XQueryNumberQuestion asks;
  };
  static constexpr std::array<Row, 5> rows = {{
      {fn_count, {{0, false}, false}},
      {fn_exists, {{1, false}, false}},
      {fn_empty, {{1, true}, false}},
      {fn_boolean, {{1, false}, true}},
      {fn_not, {{1, true}, true}},
  }};
  const auto* function = dyn_cast<XQueryFunctionCall>(&call);
  if (!function || !function->builtIn() || !function->args() || function->args()->count() != 1) {
    return std::nullopt;
  }
  const auto row = std::find_if(rows.begin(), rows.end(), [&](const Row& each) {
    return each.function == function->function();
  });
  return row == rows.end() ? std::nullopt : std::optional(row->asks);
}

bool XQueryIsAskedForTruth(const XQueryProgram& program, XQueryPlaceID place) {
  switch (program[place].role) {
    case XQueryRole::Test:
    case XQueryRole::Where:
    case XQueryRole::Satisfies:
    case XQueryRole::Predicate:
      return true;
    case XQueryRole::Operand:
    case XQueryRole::LaterOperand: {
      const auto* whole = dyn_cast<XQueryOperatorExpr>(program[program[place].parent].expr);
      return whole && XQueryOperatorExpr::operatorClassification(whole->operatorType()) == 1;
    }
    default:
      return false;
  }
}

std::optional<XQueryNumberQuestion> XQueryNumberQuestionAround(const XQueryPlanning& planning,
                                                               XQueryPlaceID place) {
  const XQueryProgram& program = planning.program;
  const XQueryPlaceID whole = XQueryPlaceAround(program, place);
  std::optional<XQueryNumberQuestion> asks;
  if (XQueryIsAskedForTruth(program, whole)) {
    asks = XQueryNumberQuestion{{1, false}, true, whole};
  } else if (program[whole].role == XQueryRole::Argument) {
    const XQueryPlaceID call = program[program[whole].parent].parent;
    asks = XQueryNumberQuestionOf(*program[call].expr);
    if (asks) asks->place = call;
  }
  return asks && planning.isOpen(asks->place) ? asks : std::nullopt;
}

}  // namespace xquery
