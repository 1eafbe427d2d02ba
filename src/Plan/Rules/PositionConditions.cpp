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
namespace {

bool isCallWithoutArguments(const XQueryExpr* expr, XQueryProcedure function) {
  const auto* call = dyn_cast<XQueryFunctionCall>(XQueryWithoutParentheses(expr));
  const size_t count = call && call->args() ? call->args()->count() : 0;
  return call && call->builtIn() && call->function() == function && count == 0;
}

// Of "last()" and "last() - 1".
std::optional<uint64_t> takenFromLast(const XQueryExpr* expr) {
  if (isCallWithoutArguments(expr, fn_last)) return 0;
  const auto* difference = dyn_cast<XQueryOperatorExpr>(XQueryWithoutParentheses(expr));
  if (!difference || difference->operatorType() != XQueryOperatorMinus) return std::nullopt;
  if (!isCallWithoutArguments(difference->left(), fn_last)) return std::nullopt;
  const auto number = XQuerySmallIntegerIn(difference->right());
  return number && *number >= 0 ? std::optional(static_cast<uint64_t>(*number)) : std::nullopt;
}

bool isEquality(int type) {
  return type == XQueryOperatorEqual || type == XQueryOperatorEq;
}

}  // namespace

bool XQueryIsPosition(const XQueryExpr* expr) {
  return isCallWithoutArguments(expr, fn_position);
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

std::optional<uint64_t> XQueryItemsBehindAskedFor(const XQueryExpr& predicate) {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(XQueryWithoutParentheses(&predicate));
  if (!comparison || !isEquality(comparison->operatorType())) return takenFromLast(&predicate);
  if (XQueryIsPosition(comparison->left())) return takenFromLast(comparison->right());
  return XQueryIsPosition(comparison->right()) ? takenFromLast(comparison->left()) : std::nullopt;
}

std::optional<uint64_t> XQueryItemsAskedFor(const XQueryExpr& predicate) {
  const auto* comparison = dyn_cast<XQueryOperatorExpr>(XQueryWithoutParentheses(&predicate));
  if (!comparison) return std::nullopt;
  const bool isOnLeft = isCallWithoutArguments(comparison->left(), fn_last);
  if (!isOnLeft && !isCallWithoutArguments(comparison->right(), fn_last)) return std::nullopt;
  const auto number = XQuerySmallIntegerIn(isOnLeft ? comparison->right() : comparison->left());
  if (!number || *number < 1) return std::nullopt;
  const auto least = static_cast<uint64_t>(*number);
  const int type = comparison->operatorType();
  switch (isOnLeft ? type : XQueryMirroredComparison(type)) {
    case XQueryOperatorGreater:
    case XQueryOperatorGt:
      return least + 1;
    case XQueryOperatorGreaterEqual:
    case XQueryOperatorGe:
      return least;
    default:
      return std::nullopt;
  }
}

}  // namespace xquery
