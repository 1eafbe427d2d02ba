#include "Expr/BindingTesting.h"
#include "Expr/Clauses/XQueryConditional.h"

#include <gtest/gtest.h>

namespace xquery::bindingtest {
namespace {

Ref<XQueryExpr> conditional(Ref<XQueryExpr> test, Ref<XQueryExpr> thenExpr,
                            Ref<XQueryExpr> elseExpr) {
  return XQueryConditionalExpr::condionalExpr(std::move(test), std::move(thenExpr),
                                              std::move(elseExpr));
}

class Conditional : public BindingTesting {
 protected:
  std::string chosenBy(Value test) {
    return outcomeOf(conditional(always(std::move(test)), always(integer(1)), always(integer(2))));
  }
};

TEST_F(Conditional, BindsTestThenElseInThatOrder) {
  conditional(logged("test"), logged("then"), logged("else"))->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"test", "then", "else"}));
}

TEST_F(Conditional, BindsWhatThereIs) {
  conditional(nullptr, nullptr, logged("else"))->bindInfoForProlog(*prolog);
  conditional(logged("test"), logged("then"), nullptr)->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"else", "test", "then"}));
}

TEST_F(Conditional, KeepsNoScopeOfItsOwn) {
  const auto declaring = [this](const char* name) {
    return onBind(
        [this, name](XQueryProlog& with) { with.newLocalVariableIDForQName(qName(name)); });
  };
  conditional(declaring("a"), declaring("b"), loggedWith("else", {"a", "b"}))
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"else a=1 b=2"}));
  EXPECT_EQ(prolog->nextLocalVariableID(), 3);
}

TEST_F(Conditional, ATrueValueChoosesThen) {
  for (const auto& test :
       {boolean(true), integer(1), number(-0.5), string("x"), untyped("false"), untyped("0"),
        integers({0, 0}), sequence({empty(), empty()}), elementFrom("<a/>"),
        Value(XQueryQName::qname(text("a"), nullptr)), infinity()}) {
    EXPECT_EQ(chosenBy(test), "integer 1") << show(test);
  }
}

TEST_F(Conditional, AFalseValueChoosesElse) {
  for (const auto& test : {boolean(false), empty(), sequence({}), integer(0), number(0),
                           number(-0.0), nan(), string(""), untyped(""), sequence({integer(0)}),
                           sequence({boolean(false)}), sequence({sequence({})})}) {
    EXPECT_EQ(chosenBy(test), "integer 2") << show(test);
  }
}

TEST_F(Conditional, AnErrorRecordChoosesNeither) {
  const auto expr = conditional(always(error(17, "other")), traced("then", integer(1)),
                                traced("else", integer(2)));
  expr->setExprLine(3);
  EXPECT_EQ(outcomeOf(expr), "error 6 invalid type conversion line 4");
  EXPECT_EQ(chosenBy(sequence({error(17, "other")})), "error 6 invalid type conversion");
  EXPECT_TRUE(log.empty());
}

TEST_F(Conditional, OnlyTheChosenBranchIsEvaluated) {
  outcomeOf(conditional(always(boolean(true)), traced("then", integer(1)), failing()));
  outcomeOf(conditional(always(boolean(false)), failing(), traced("else", integer(1))));
  EXPECT_EQ(log, (Log{"then", "else"}));
}

TEST_F(Conditional, AMissingBranchIsTheEmptySequence) {
  EXPECT_EQ(outcomeOf(conditional(always(boolean(false)), always(integer(1)), nullptr)), "()");
  EXPECT_EQ(outcomeOf(conditional(always(boolean(true)), nullptr, always(integer(1)))), "()");
}

TEST_F(Conditional, ABranchValueOfAnyShapeIsHandedOnAsItIs) {
  for (const auto& value : {empty(), sequence({}), sequence({integer(1)}), integers({1, 2}),
                            sequence({empty()}), error(6, "a")}) {
    const auto expr = conditional(always(boolean(true)), always(value), nullptr);
    expr->bindInfoForProlog(*prolog);
    EXPECT_EQ(expr->evaluateWithContext(*context), value) << show(value);
  }
}

TEST_F(Conditional, ABranchWithoutAValueFails) {
  for (const bool test : {true, false}) {
    EXPECT_EQ(outcomeOf(conditional(always(boolean(test)), always(Value()), always(Value()))),
              "error 6 invalid type conversion");
  }
}

TEST_F(Conditional, ErrorsGoOn) {
  EXPECT_EQ(outcomeOf(conditional(failing(1, "test"), nullptr, nullptr)), "error 1 test");
  EXPECT_EQ(outcomeOf(conditional(always(boolean(true)), failing(2, "then"), nullptr)),
            "error 2 then");
  EXPECT_EQ(outcomeOf(conditional(always(boolean(false)), nullptr, failing(3, "else"))),
            "error 3 else");
}

TEST_F(Conditional, NestingBeyondTheStackIsAnErrorOfTheQuery) {
  Ref<XQueryExpr> inTest = always(boolean(true));
  Ref<XQueryExpr> inThen = always(integer(1));
  for (int i = 0; i < 300'000; ++i) {
    inTest = conditional(inTest, always(boolean(true)), nullptr);
    inThen = conditional(always(boolean(true)), inThen, nullptr);
  }
  for (const auto& expr : {inTest, inThen}) {
    expr->bindInfoForProlog(*prolog);
    EXPECT_EQ(evaluated(*expr), "error 0 limit: expression nested too deeply");
  }
  EXPECT_EQ(prolog->errors().size(), 1U);
}

}  // namespace
}  // namespace xquery::bindingtest
