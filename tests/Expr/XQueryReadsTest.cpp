#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/PathTesting.h"
#include "Expr/XQueryReads.h"

namespace xquery {
namespace {

Ref<XQueryExpr> binary(int code, Ref<XQueryExpr> left, Ref<XQueryExpr> right) {
  auto expr = XQueryOperatorExpr::operatorExpr(code, std::move(right));
  expr->setLeftExpr(std::move(left));
  return expr;
}

Ref<XQueryExpr> listOf(Ref<XQueryExpr> element) {
  auto list = XQueryExprList::exprList();
  list->addObject(std::move(element));
  return list;
}

TEST(Repeatable, LeavesThatHaveNoEffectAre) {
  EXPECT_TRUE(XQueryIsRepeatable(*integer("1")));
  EXPECT_TRUE(XQueryIsRepeatable(*XQueryVariable::variableWithName(text("v"))));
  EXPECT_TRUE(XQueryIsRepeatable(*XQueryContextItem::contextItem()));
}

TEST(Repeatable, ReadingAVariableThatMayChangeIsNot) {
  const auto variable = XQueryVariable::variableWithName(text("v"));
  EXPECT_FALSE(XQueryIsRepeatable(*variable, true));
  EXPECT_FALSE(XQueryIsRepeatable(*binary(XQueryOperatorPlus, integer("1"), variable), true));
  EXPECT_TRUE(XQueryIsRepeatable(*integer("1"), true));
}

TEST(Repeatable, WhatIsNotKnownIsNot) {
  EXPECT_FALSE(XQueryIsRepeatable(*always(text("x"))));
}

TEST(Repeatable, OperatorsListsAndPathsAreAsTheirParts) {
  const auto unknown = always(text("x"));
  EXPECT_TRUE(XQueryIsRepeatable(*binary(XQueryOperatorEqual, path({child("a")}), integer("1"))));
  EXPECT_FALSE(XQueryIsRepeatable(*binary(XQueryOperatorEqual, unknown, integer("1"))));
  EXPECT_FALSE(XQueryIsRepeatable(*binary(XQueryOperatorEqual, integer("1"), unknown)));
  EXPECT_TRUE(
      XQueryIsRepeatable(*XQueryOperatorExpr::operatorExpr(XQueryOperatorMinus, integer("1"))));
  EXPECT_TRUE(XQueryIsRepeatable(*listOf(integer("1"))));
  EXPECT_FALSE(XQueryIsRepeatable(*listOf(unknown)));
  EXPECT_TRUE(XQueryIsRepeatable(*path({rootStep(), anyDepth(), child("a", {integer("1")})})));
  EXPECT_FALSE(XQueryIsRepeatable(*path({child("a", {unknown})})));
  EXPECT_FALSE(XQueryIsRepeatable(*path({child("a"), filterStep(unknown)})));
}

TEST(Repeatable, AVeryLargeExpressionIsNotLookedThrough) {
  const auto sum = [](int terms) {
    Ref<XQueryExpr> expr = integer("1");
    for (int i = 1; i < terms; ++i) expr = binary(XQueryOperatorPlus, expr, integer("1"));
    return expr;
  };
  EXPECT_TRUE(XQueryIsRepeatable(*sum(30)));
  EXPECT_FALSE(XQueryIsRepeatable(*sum(40)));
  Steps steps;
  for (int i = 0; i < 100; ++i) steps.push_back(child("a"));
  EXPECT_FALSE(XQueryIsRepeatable(*path(steps)));
  auto list = XQueryExprList::exprList();
  for (int i = 0; i < 100; ++i) list->addObject(integer("1"));
  EXPECT_FALSE(XQueryIsRepeatable(*list));
}

}  // namespace
}  // namespace xquery
