#include "Expr/XQueryJoinCondition.h"

#include "Expr/XQueryLists.h"
#include "Expr/XQueryOperatorExpr.h"

#include <optional>

namespace xquery {
namespace {

// Bounds the work on a long chain of conditions.
constexpr int mostConditions = 16;

const XQueryExpr* withoutParentheses(const XQueryExpr* expr) {
  const auto* list = dyn_cast<XQueryExprList>(expr);
  while (list && list->kind() == Kind::ExprList && list->count() == 1) {
    expr = list->objectAtIndex(0);
    list = dyn_cast<XQueryExprList>(expr);
  }
  return expr;
}

// The value comparison code whose relation the operator asks for.
std::optional<int> relationCode(int type) {
  switch (type) {
    case XQueryOperatorEqual:
    case XQueryOperatorLess:
    case XQueryOperatorLessEqual:
    case XQueryOperatorGreater:
    case XQueryOperatorGreaterEqual:
      return type + XQueryOperatorEq - XQueryOperatorEqual;
    case XQueryOperatorEq:
    case XQueryOperatorLt:
    case XQueryOperatorLe:
    case XQueryOperatorGt:
    case XQueryOperatorGe:
      return type;
    default:
      return std::nullopt;
  }
}

// a < b is b > a, and not (a < b) is not (b > a).
XQueryRelation mirrored(XQueryRelation relation) {
  if (relation.test == XQueryRelation::Less) {
    relation.test = XQueryRelation::Greater;
  } else if (relation.test == XQueryRelation::Greater) {
    relation.test = XQueryRelation::Less;
  }
  return relation;
}

XQueryJoinCondition conditionOf(const XQueryOperatorExpr& comparison,
                                const XQueryJoinCondition::Accepts& isKey,
                                const XQueryJoinCondition::Accepts& isProbe) {
  XQueryJoinCondition found;
  const auto code = relationCode(comparison.operatorType());
  const XQueryExpr* left = comparison.left();
  const XQueryExpr* right = comparison.right();
  if (!code || !left || !right) return found;
  found.relation = XQueryRelationForCode(*code);
  found.isValueComparison = comparison.operatorType() >= XQueryOperatorEq;
  if (isKey(*left) && isProbe(*right)) {
    found.key = left;
    found.probe = right;
  } else if (isKey(*right) && isProbe(*left)) {
    found.key = right;
    found.probe = left;
    found.relation = mirrored(found.relation);
  }
  return found;
}

}  // namespace

XQueryJoinCondition XQueryJoinCondition::in(const XQueryExpr* condition, bool errorExcludes,
                                            const Accepts& isKey, const Accepts& isProbe) {
  const auto* whole = dyn_cast<XQueryOperatorExpr>(withoutParentheses(condition));
  const auto* rest = whole;
  for (int looked = 0; rest && looked < mostConditions; ++looked) {
    const bool isAnd = rest->operatorType() == XQueryOperatorAnd;
    const auto* candidate = isAnd && errorExcludes
                                ? dyn_cast<XQueryOperatorExpr>(withoutParentheses(rest->right()))
                                : rest;
    if (candidate && (!isAnd || errorExcludes)) {
      XQueryJoinCondition found = conditionOf(*candidate, isKey, isProbe);
      found.isWhole = candidate == whole;
      if (found.key) return found;
    }
    if (!isAnd) break;
    rest = dyn_cast<XQueryOperatorExpr>(withoutParentheses(rest->left()));
  }
  return {};
}

}  // namespace xquery
