#include "Expr/BindingTesting.h"
#include "Expr/Clauses/XQueryQuantified.h"

#include <gtest/gtest.h>

namespace xquery::bindingtest {
namespace {

using Items = XQueryQuantifiedExpr::Items;

Ref<XQueryQuantifiedExprItem> item(std::string_view name, Ref<XQueryExpr> expr,
                                   Ref<XQueryTypeDeclaration> type = {}) {
  return XQueryQuantifiedExprItem::quantifiedExpr(std::move(expr), text(name), std::move(type));
}
Ref<XQueryExpr> some(Items items, Ref<XQueryExpr> satisfies) {
  return XQueryQuantifiedExpr::someExpr(std::move(items), std::move(satisfies));
}
Ref<XQueryExpr> every(Items items, Ref<XQueryExpr> satisfies) {
  return XQueryQuantifiedExpr::everyExpr(std::move(items), std::move(satisfies));
}
Ref<XQueryExpr> equals(std::string_view name, int64_t value) {
  return operation(XQueryOperatorEq, variable(name), always(integer(value)));
}

class Quantified : public BindingTesting {
 protected:
  // Answers whether the variables' values are those given, and writes them down.
  Ref<XQueryExpr> tracedEquals(std::vector<std::string> names, std::string values) {
    std::vector<Ref<XQueryExpr>> references;
    for (const auto& name : names) references.push_back(variable(name));
    return probe(
        [this, references, values](XQueryContext& with) {
          std::string line;
          for (const auto& each : references) {
            const Value value = evaluatedOrThrown(*each, with);
            line += (line.empty() ? "" : " ") + XQueryStringValue(*value)->utf8();
          }
          log.push_back(line);
          return boolean(line == values);
        },
        [references](XQueryProlog& with) {
          for (const auto& each : references) each->bindInfoForProlog(with);
        });
  }
  std::string someOver(Value value) {
    return outcomeOf(some({item("x", always(std::move(value)))}, always(boolean(true))));
  }
};

// --- the clause ----------------------------------------------------------------------------------

TEST_F(Quantified, AClauseKeepsItsParts) {
  const auto type = atomicType("integer");
  const auto clause = item("x", always(integer(7)), type);
  EXPECT_EQ(clause->type(), type.get());
  EXPECT_EQ(clause->varID(), 0);
  EXPECT_EQ(show(clause->evaluateWithContext(*context)), "integer 7");
}

// --- binding -------------------------------------------------------------------------------------

TEST_F(Quantified, BindsEachClauseThenTheCondition) {
  some({item("x", loggedWith("first", {"x", "y"})), item("y", loggedWith("second", {"x", "y"}))},
       loggedWith("satisfies", {"x", "y"}))
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"first x=0 y=0", "second x=1 y=0", "satisfies x=1 y=2"}));
}

TEST_F(Quantified, TheExpressionIsBoundBeforeTheType) {
  const auto type = atomicType("integer");
  const auto expr =
      onBind([this, type](XQueryProlog&) { log.push_back(std::to_string(type->typeID())); });
  some({item("x", expr, type)}, always(boolean(true)))->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"0"}));
  EXPECT_EQ(type->typeID(), XQueryTypeInteger);
}

TEST_F(Quantified, VariablesKeepTheirIDsAfterwards) {
  some({item("x", always(integer(1)))}, always(boolean(true)))->bindInfoForProlog(*prolog);
  every({item("y", always(integer(1)))}, always(boolean(true)))->bindInfoForProlog(*prolog);
  EXPECT_EQ(prolog->nextLocalVariableID(), 3);
  EXPECT_EQ(idOf("x"), 1);
  EXPECT_EQ(idOf("y"), 2);
}

TEST_F(Quantified, AShadowedVariableStaysShadowed) {
  prolog->newLocalVariableIDForQName(qName("x"));
  some({item("x", loggedWith("clause", {"x"}))}, always(boolean(true)))->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"clause x=1"}));
  EXPECT_EQ(idOf("x"), 2);
}

TEST_F(Quantified, AnEnclosingFLWOREndsItsVariablesToo) {
  flwor({letClause("a", always(empty()))},
        some({item("x", always(integer(1)))}, always(boolean(true))))
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
  EXPECT_EQ(idOf("x"), 0);
}

TEST_F(Quantified, ANameWithAnUnknownPrefixHasNoVariable) {
  const auto clause = item("p:x", always(integer(1)));
  EXPECT_EQ(outcomeOf(some({clause}, always(boolean(true)))), "true");
  EXPECT_EQ(clause->varID(), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
}

// --- evaluation ----------------------------------------------------------------------------------

TEST_F(Quantified, NoItemsDecideNothing) {
  for (const auto& nothing : {empty(), sequence({}), Value()}) {
    EXPECT_EQ(outcomeOf(some({item("x", always(nothing))}, always(boolean(true)))), "false");
    EXPECT_EQ(outcomeOf(every({item("x", always(nothing))}, always(boolean(false)))), "true");
  }
}

TEST_F(Quantified, ItemsComeFromAnyShape) {
  EXPECT_EQ(someOver(integer(1)), "true");
  EXPECT_EQ(someOver(sequence({integer(1)})), "true");
  EXPECT_EQ(someOver(integers({1, 2})), "true");
}

TEST_F(Quantified, AnArrayIsWalkedOneLevelDeep) {
  const auto tracing = [this](Value value) {
    log.clear();
    outcomeOf(every({item("x", always(std::move(value)))},
                    commas({tracedVariable("x"), always(integer(1)), always(integer(1))})));
    return log;
  };
  EXPECT_EQ(tracing(sequence({empty(), integer(1)})), (Log{"()", "integer 1"}));
  EXPECT_EQ(tracing(sequence({integers({1, 2}), integer(3)})),
            (Log{"(integer 1, integer 2)", "integer 3"}));
}

TEST_F(Quantified, SomeStopsAtTheFirstThatSatisfies) {
  EXPECT_EQ(outcomeOf(some({item("x", always(integers({1, 2, 3})))}, tracedEquals({"x"}, "2"))),
            "true");
  EXPECT_EQ(log, (Log{"1", "2"}));
}

TEST_F(Quantified, SomeIsFalseWhenNoneSatisfies) {
  EXPECT_EQ(outcomeOf(some({item("x", always(integers({1, 2, 3})))}, tracedEquals({"x"}, "4"))),
            "false");
  EXPECT_EQ(log, (Log{"1", "2", "3"}));
}

TEST_F(Quantified, EveryStopsAtTheFirstThatFails) {
  EXPECT_EQ(outcomeOf(every({item("x", always(integers({1, 2, 3})))}, tracedEquals({"x"}, "1"))),
            "false");
  EXPECT_EQ(log, (Log{"1", "2"}));
}

TEST_F(Quantified, EveryIsTrueWhenAllSatisfy) {
  EXPECT_EQ(outcomeOf(every({item("x", always(integers({1, 1})))}, tracedEquals({"x"}, "1"))),
            "true");
  EXPECT_EQ(log, (Log{"1", "1"}));
}

TEST_F(Quantified, TheConditionIsAnEffectiveBooleanValue) {
  const auto answerFor = [this](Value condition) {
    return outcomeOf(some({item("x", always(integer(1)))}, always(std::move(condition))));
  };
  EXPECT_EQ(answerFor(integers({0, 0})), "true");
  EXPECT_EQ(answerFor(untyped("x")), "true");
  EXPECT_EQ(answerFor(untyped("")), "false");
  EXPECT_EQ(answerFor(empty()), "false");
  EXPECT_EQ(answerFor(nan()), "false");
}

TEST_F(Quantified, AnErrorRecordOfTheConditionIsTheAnswerAndStopsTheWalk) {
  const auto record = traced("satisfies", error(17, "a"));
  EXPECT_EQ(outcomeOf(some({item("x", always(integers({1, 2})))}, record)), "record 17 a");
  EXPECT_EQ(outcomeOf(every({item("x", always(integers({1, 2})))}, record)), "record 17 a");
  EXPECT_EQ(log, (Log{"satisfies", "satisfies"}));
  EXPECT_FALSE(dynamic().error());
}

TEST_F(Quantified, DeeperClausesAreEvaluatedForEveryBindingOfShallowerOnes) {
  EXPECT_EQ(outcomeOf(some({item("x", traced("outer", integers({1, 2}))),
                            item("y", traced("inner", integers({3, 4})))},
                           tracedEquals({"x", "y"}, "2 3"))),
            "true");
  EXPECT_EQ(log, (Log{"outer", "inner", "1 3", "1 4", "inner", "2 3"}));
}

TEST_F(Quantified, AnEmptyLastClauseDecidesNothing) {
  EXPECT_EQ(outcomeOf(some(
                {item("x", traced("outer", integers({1, 2}))), item("y", traced("inner", empty()))},
                traced("satisfies", boolean(true)))),
            "false");
  EXPECT_EQ(log, (Log{"outer", "inner", "inner"}));
}

// An empty clause hands its place to the next one, which is walked there and once more in its own.
TEST_F(Quantified, AnEmptyClauseIsPassedOver) {
  EXPECT_EQ(outcomeOf(some({item("x", traced("first", empty())),
                            item("y", traced("second", integers({1, 2})))},
                           tracedEquals({"y"}, "2"))),
            "true");
  EXPECT_EQ(log, (Log{"first", "second", "second", "1", "2"}));
}

TEST_F(Quantified, WithAnEmptyClauseEveryCombinationIsTried) {
  EXPECT_EQ(outcomeOf(every({item("x", traced("first", empty())),
                             item("y", traced("second", integers({1, 2})))},
                            traced("satisfies", boolean(true)))),
            "true");
  EXPECT_EQ(log, (Log{"first", "second", "second", "satisfies", "satisfies", "second", "satisfies",
                      "satisfies"}));
}

TEST_F(Quantified, AnEmptyClauseInTheMiddleIsPassedOver) {
  EXPECT_EQ(outcomeOf(every({item("x", traced("a", integer(1))), item("y", traced("b", empty())),
                             item("z", traced("c", integer(3)))},
                            traced("satisfies", boolean(true)))),
            "true");
  EXPECT_EQ(log, (Log{"a", "b", "c", "c", "satisfies"}));
}

TEST_F(Quantified, EmptyClausesAllAlongDecideNothing) {
  const Items items = {item("x", traced("a", empty())), item("y", traced("b", empty())),
                       item("z", traced("c", empty()))};
  EXPECT_EQ(outcomeOf(some(items, always(boolean(true)))), "false");
  EXPECT_EQ(outcomeOf(every(items, always(boolean(false)))), "true");
  EXPECT_EQ(log, (Log{"a", "b", "c", "a", "b", "c"}));
}

TEST_F(Quantified, AClauseSeesEarlierVariables) {
  EXPECT_EQ(
      outcomeOf(some({item("x", always(integers({1, 2}))),
                      item("y", operation(XQueryOperatorPlus, variable("x"), always(integer(1))))},
                     equals("y", 3))),
      "true");
}

TEST_F(Quantified, WithoutClausesTheConditionDecides) {
  EXPECT_EQ(outcomeOf(some({}, always(boolean(true)))), "true");
  EXPECT_EQ(outcomeOf(every({}, always(boolean(false)))), "false");
}

TEST_F(Quantified, TheVariableKeepsTheItemThatDecided) {
  outcomeOf(some({item("x", always(integers({1, 2, 3})))}, equals("x", 2)));
  EXPECT_EQ(show(dynamic().variableForID(1)), "integer 2");
}

// --- declared types ------------------------------------------------------------------------------

TEST_F(Quantified, AnItemOfAnotherTypeGivesTheErrorAsTheValue) {
  const auto clause =
      item("x", always(sequence({integer(1), string("a"), integer(2)})), atomicType("integer"));
  for (const bool isEvery : {true, false}) {
    log.clear();
    const auto condition = tracedEquals({"x"}, isEvery ? "1" : "2");
    EXPECT_EQ(outcomeOf(isEvery ? every({clause}, condition) : some({clause}, condition)),
              "record 6 invalid type");
    EXPECT_EQ(log, (Log{"1"}));
    EXPECT_FALSE(dynamic().error());
  }
}

TEST_F(Quantified, ADecisionBeforeTheItemOfAnotherTypeStands) {
  const auto clause = item("x", always(sequence({integer(1), string("a")})), atomicType("integer"));
  EXPECT_EQ(outcomeOf(some({clause}, equals("x", 1))), "true");
  EXPECT_EQ(outcomeOf(every({clause}, equals("x", 2))), "false");
}

TEST_F(Quantified, AnErrorOfADeeperClauseIsTheAnswer) {
  EXPECT_EQ(outcomeOf(every({item("x", traced("outer", integers({1, 2}))),
                             item("y", traced("inner", string("a")), atomicType("integer"))},
                            always(boolean(true)))),
            "record 6 invalid type");
  EXPECT_EQ(log, (Log{"outer", "inner"}));
}

TEST_F(Quantified, ItemsAreTestedOneByOne) {
  EXPECT_EQ(outcomeOf(every({item("x", always(integers({1, 2})), atomicType("integer"))},
                            always(boolean(true)))),
            "true");
  EXPECT_EQ(outcomeOf(every({item("x", always(integers({1, 2})),
                                  atomicType("integer", XQueryTypeDeclaration::OneOrMore))},
                            always(boolean(true)))),
            "record 6 invalid type");
  EXPECT_EQ(
      outcomeOf(some({item("x", always(empty()), atomicType("integer"))}, always(boolean(true)))),
      "false");
}

// --- errors and limits ---------------------------------------------------------------------------

TEST_F(Quantified, ErrorsGoOn) {
  EXPECT_EQ(outcomeOf(some({item("x", failing(1, "clause"))}, nullptr)), "error 1 clause");
  EXPECT_EQ(outcomeOf(some({item("x", always(integer(1)))}, failing(2, "satisfies"))),
            "error 2 satisfies");
}

TEST_F(Quantified, NestingBeyondTheStackIsAnErrorOfTheQuery) {
  Ref<XQueryExpr> expr = always(boolean(true));
  for (int i = 0; i < 300'000; ++i) expr = some({item("x", always(integer(1)))}, expr);
  expr->bindInfoForProlog(*prolog);
  // Binding may need no stack at all, where its last call is a jump; evaluating always does.
  EXPECT_LE(prolog->errors().size(), 1U);
  EXPECT_EQ(evaluated(*expr), "error 0 limit: expression nested too deeply");
}

TEST_F(Quantified, AMillionClausesEndInAnError) {
  const Items items(1'000'000, item("x", always(integer(1))));
  EXPECT_EQ(evaluated(*some(items, always(boolean(true)))),
            "error 0 limit: expression nested too deeply");
}

TEST_F(Quantified, AMillionEmptyClausesTakeNoStack) {
  const Items items(1'000'000, item("x", always(empty())));
  EXPECT_EQ(evaluated(*some(items, always(boolean(true)))), "false");
}

}  // namespace
}  // namespace xquery::bindingtest
