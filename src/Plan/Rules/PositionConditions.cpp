#include "Plan/Rules/PositionConditions.h"

#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Functions/Context.h"
#include "Functions/XQueryFunctionCall.h"
#include "Types/XQueryItemKinds.h"
#include "xquery/Number.h"

#include <array>
#include <utility>

namespace xquery {

bool XQueryIsPosition(const XQueryExpr* expr) {
  const auto* call = dyn_cast<XQueryFunctionCall>(XQueryWithoutParentheses(expr));
  const size_t count = call && call->args() ? call->args()->count() : 0;
  return call && call->builtIn() && call->function() == fn_position && count == 0;
}

std::optional<int64_t> XQuerySmallIntegerIn(const XQueryExpr* expr) {
  const auto* literal = dyn_cast<XQueryLiteral>(XQueryWithoutParentheses(expr));
  if (!literal || !literal->literalValue()) return std::nullopt;
  const NSObject& value = *literal->literalValue();
  if (XQueryKindsOfItem(value) != XQueryItems::Integer) return std::nullopt;
  constexpr int64_t most = 1 << 20;
  const int64_t number = cast<NSNumber>(&value)->integerValue();
  return number >= -most && number <= most ? std::optional(number) : std::nullopt;
}

int XQueryMirroredComparison(int type) {
  constexpr std::array<std::pair<int, int>, 4> pairs = {{
      {XQueryOperatorLess, XQueryOperatorGreater},
      {XQueryOperatorLessEqual, XQueryOperatorGreaterEqual},
      {XQueryOperatorLt, XQueryOperatorGt},
      {XQueryOperatorLe, XQueryOperatorGe},
  }};
  for (const auto& [one, other] : pairs) {
    if (type == one) return other;
    if (type == other) return one;
  }
  return type;
}

std::optional<XQueryPositionCondition> XQueryPositionConditionIn(const XQueryExpr& expr) {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(XQueryWithoutParentheses(&expr));
  if (!comparison) return std::nullopt;
  const int type = comparison->operatorType();
  const int operatorClass = XQueryOperatorExpr::operatorClassification(type);
  if (operatorClass != 5 && operatorClass != 6) return std::nullopt;
  const bool isOnLeft = XQueryIsPosition(comparison->left());
  if (!isOnLeft && !XQueryIsPosition(comparison->right())) return std::nullopt;
  const auto number = XQuerySmallIntegerIn(isOnLeft ? comparison->right() : comparison->left());
  if (!number) return std::nullopt;
  return XQueryPositionCondition{isOnLeft ? type : XQueryMirroredComparison(type), *number};
}

}  // namespace xquery
