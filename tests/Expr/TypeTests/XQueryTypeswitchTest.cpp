#include "Expr/BindingTesting.h"
#include "Expr/TypeTests/XQueryTypeswitch.h"

#include <gtest/gtest.h>

namespace xquery::bindingtest {
namespace {

using Clauses = XQueryTypeswitchExpr::CaseClauses;

Ref<XQueryCaseClauseExpr> clause(std::string_view name, Ref<XQueryTypeDeclaration> type,
                                 Ref<XQueryExpr> expr) {
  return XQueryCaseClauseExpr::exprWithName(text(name), std::move(type), std::move(expr));
}
Ref<XQueryCaseClauseExpr> defaultClause(Ref<XQueryExpr> expr, std::string_view name = {}) {
  return clause(name, nullptr, std::move(expr));
}
Ref<XQueryExpr> typeswitch(Ref<XQueryExpr> operand, Clauses clauses) {
  return XQueryTypeswitchExpr::expr(std::move(operand), std::move(clauses));
}

class Typeswitch : public BindingTesting {
 protected:
  // The name of the case that the value selects.
  std::string caseFor(Value value) {
    const auto answer = [](std::string_view name) { return always(string(name)); };
    return outcomeOf(typeswitch(
        always(std::move(value)),
        {clause("", XQueryTypeDeclaration::empty(), answer("empty")),
         clause("", atomicType("integer"), answer("integer")),
         clause("", atomicType("decimal"), answer("decimal")),
         clause("", atomicType("integer", XQueryTypeDeclaration::ZeroOrMore), answer("integers")),
         clause("", XQueryTypeDeclaration::element({}), answer("element")),
         clause("", XQueryTypeDeclaration::anyKind(), answer("node")),
         defaultClause(answer("default"))}));
  }
};

TEST_F(Typeswitch, AClauseKeepsItsParts) {
  const auto type = atomicType("integer");
  const auto made = clause("x", type, always(integer(7)));
  EXPECT_EQ(made->type(), type.get());
  EXPECT_EQ(made->varID(), 0);
  EXPECT_EQ(show(made->evaluateWithContext(*context)), "integer 7");
}

// --- binding -------------------------------------------------------------------------------------

TEST_F(Typeswitch, BindsTheOperandThenEachClause) {
  typeswitch(loggedWith("operand", {"a", "b", "d"}),
             {clause("a", atomicType("integer"), loggedWith("first", {"a", "b", "d"})),
              clause("", atomicType("string"), loggedWith("second", {"a", "b", "d"})),
              clause("b", atomicType("string"), loggedWith("third", {"a", "b", "d"})),
              defaultClause(loggedWith("default", {"a", "b", "d"}), "d")})
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"operand a=0 b=0 d=0", "first a=1 b=0 d=0", "second a=1 b=0 d=0",
                      "third a=1 b=2 d=0", "default a=1 b=2 d=3"}));
}

TEST_F(Typeswitch, AClauseBindsItsTypeBeforeItsExpression) {
  const auto type = atomicType("integer");
  const auto expr =
      onBind([this, type](XQueryProlog&) { log.push_back(std::to_string(type->typeID())); });
  typeswitch(always(empty()), {clause("x", type, expr), defaultClause(always(empty()))})
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"42"}));
}

TEST_F(Typeswitch, VariablesKeepTheirIDsAfterwards) {
  const auto first = clause("x", atomicType("integer"), always(empty()));
  const auto last = defaultClause(always(empty()), "y");
  typeswitch(always(empty()), {first, last})->bindInfoForProlog(*prolog);
  EXPECT_EQ(first->varID(), 1);
  EXPECT_EQ(last->varID(), 2);
  EXPECT_EQ(prolog->nextLocalVariableID(), 3);
  EXPECT_EQ(idOf("x"), 1);
  EXPECT_EQ(idOf("y"), 2);
}

TEST_F(Typeswitch, OneNameInSeveralClausesHasSeveralIDs) {
  const auto first = clause("x", atomicType("integer"), loggedWith("first", {"x"}));
  const auto last = defaultClause(loggedWith("last", {"x"}), "x");
  typeswitch(loggedWith("operand", {"x"}), {first, last})->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"operand x=0", "first x=1", "last x=2"}));
}

TEST_F(Typeswitch, ANameWithAnUnknownPrefixHasNoVariable) {
  const auto last = defaultClause(always(integer(1)), "p:x");
  EXPECT_EQ(outcomeOf(typeswitch(always(empty()), {last})), "integer 1");
  EXPECT_EQ(last->varID(), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
}

// --- the choice ----------------------------------------------------------------------------------

TEST_F(Typeswitch, TheFirstClauseThatMatchesIsTaken) {
  EXPECT_EQ(caseFor(empty()), "string empty");
  EXPECT_EQ(caseFor(sequence({})), "string empty");
  EXPECT_EQ(caseFor(integer(1)), "string integer");
  EXPECT_EQ(caseFor(sequence({integer(1)})), "string integer");
  EXPECT_EQ(caseFor(decimal("1.5")), "string decimal");
  EXPECT_EQ(caseFor(integers({1, 2})), "string integers");
  EXPECT_EQ(caseFor(elementFrom("<a/>")), "string element");
  EXPECT_EQ(caseFor(string("a")), "string default");
  EXPECT_EQ(caseFor(sequence({integer(1), string("a")})), "string default");
}

TEST_F(Typeswitch, TheLastClauseIsTakenWithoutATest) {
  EXPECT_EQ(outcomeOf(typeswitch(always(integer(1)),
                                 {clause("", atomicType("string"), always(integer(2)))})),
            "integer 2");
  EXPECT_EQ(outcomeOf(typeswitch(always(Value()), {defaultClause(always(integer(3)))})),
            "integer 3");
}

TEST_F(Typeswitch, AClauseWithoutATypeMatchesNothing) {
  EXPECT_EQ(outcomeOf(typeswitch(always(integer(1)), {clause("", nullptr, always(integer(2))),
                                                      defaultClause(always(integer(3)))})),
            "integer 3");
}

TEST_F(Typeswitch, OnlyTheChosenClauseIsEvaluated) {
  outcomeOf(typeswitch(traced("operand", integer(1)),
                       {clause("", atomicType("string"), failing()),
                        clause("", atomicType("integer"), traced("chosen", integer(1))),
                        clause("", atomicType("integer"), failing()), defaultClause(failing())}));
  EXPECT_EQ(log, (Log{"operand", "chosen"}));
}

TEST_F(Typeswitch, AnErrorRecordIsTheResult) {
  EXPECT_EQ(outcomeOf(typeswitch(
                always(error(17, "a")),
                {clause("x", XQueryTypeDeclaration::item(), failing()), defaultClause(failing())})),
            "record 17 a");
  EXPECT_EQ(dynamic().variableForID(1), nullptr);
}

TEST_F(Typeswitch, AnErrorRecordAmongItemsIsAnItem) {
  EXPECT_EQ(caseFor(sequence({error(17, "a"), integer(1)})), "string default");
}

TEST_F(Typeswitch, AClauseWithoutAValueFails) {
  const auto expr = typeswitch(always(integer(1)), {defaultClause(always(Value()))});
  expr->setExprLine(4);
  EXPECT_EQ(outcomeOf(expr), "error 6 invalid type line 5");
}

TEST_F(Typeswitch, WithoutClausesThereIsNoValue) {
  EXPECT_EQ(outcomeOf(typeswitch(always(integer(1)), {})), "error 6 invalid type");
}

TEST_F(Typeswitch, AValueOfAnyShapeIsHandedOnAsItIs) {
  for (const auto& value :
       {empty(), sequence({}), sequence({integer(1)}), integers({1, 2}), error(6, "a")}) {
    const auto expr = typeswitch(always(integer(1)), {defaultClause(always(value))});
    expr->bindInfoForProlog(*prolog);
    EXPECT_EQ(expr->evaluateWithContext(*context), value) << show(value);
  }
}

// --- the variable --------------------------------------------------------------------------------

TEST_F(Typeswitch, TheVariableHoldsTheOperandAsItIs) {
  for (const auto& value : {integer(1), empty(), sequence({}), integers({1, 2})}) {
    outcomeOf(typeswitch(always(value), {defaultClause(tracedVariable("x"), "x")}));
  }
  EXPECT_EQ(log, (Log{"integer 1", "()", "()", "(integer 1, integer 2)"}));
}

TEST_F(Typeswitch, OnlyTheChosenClausesVariableIsSet) {
  outcomeOf(typeswitch(always(integer(1)), {clause("a", atomicType("string"), always(empty())),
                                            clause("b", atomicType("integer"), always(empty())),
                                            defaultClause(always(empty()), "c")}));
  EXPECT_EQ(show(dynamic().variableForID(1)), "()");  // the slot below the one that was set
  EXPECT_EQ(show(dynamic().variableForID(2)), "integer 1");
  EXPECT_EQ(dynamic().variableForID(3), nullptr);
}

TEST_F(Typeswitch, AVariableThatHadNoValueKeepsTheOperand) {
  outcomeOf(typeswitch(always(integer(1)), {defaultClause(always(empty()), "x")}));
  EXPECT_EQ(show(dynamic().variableForID(1)), "integer 1");
}

TEST_F(Typeswitch, AVariableThatHadAValueGetsItBack) {
  for (const auto& former : {integer(5), empty(), integers({1, 2})}) {
    prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
    dynamic().setVariable(former, 1);
    outcomeOf(typeswitch(always(integer(1)), {defaultClause(tracedVariable("x"), "x")}));
    EXPECT_EQ(show(dynamic().variableForID(1)), show(former));
  }
  EXPECT_EQ(log, (Log{"integer 1", "integer 1", "integer 1"}));
}

TEST_F(Typeswitch, AVariableStaysWithTheOperandWhenTheClauseFails) {
  dynamic().setVariable(integer(5), 1);
  EXPECT_EQ(outcomeOf(typeswitch(always(integer(1)), {defaultClause(failing(), "x")})),
            "error 6 invalid type");
  EXPECT_EQ(show(dynamic().variableForID(1)), "integer 1");
}

TEST_F(Typeswitch, ARunAgainFindsTheFormerOperand) {
  const auto expr = typeswitch(tracedVariable("v"), {defaultClause(tracedVariable("x"), "x")});
  outcomeOf(flwor({forClause("v", always(integers({1, 2})))}, commas({expr, always(integer(0))})));
  EXPECT_EQ(log, (Log{"integer 1", "integer 1", "integer 2", "integer 2"}));
  EXPECT_EQ(show(dynamic().variableForID(2)), "integer 1");
}

// --- errors and limits ---------------------------------------------------------------------------

TEST_F(Typeswitch, ErrorsGoOn) {
  EXPECT_EQ(outcomeOf(typeswitch(failing(1, "operand"), {defaultClause(always(empty()))})),
            "error 1 operand");
  EXPECT_EQ(outcomeOf(typeswitch(always(empty()), {defaultClause(failing(2, "clause"))})),
            "error 2 clause");
}

TEST_F(Typeswitch, NestingBeyondTheStackIsAnErrorOfTheQuery) {
  Ref<XQueryExpr> inOperand = always(integer(1));
  Ref<XQueryExpr> inClause = always(integer(1));
  for (int i = 0; i < 300'000; ++i) {
    inOperand = typeswitch(inOperand, {defaultClause(always(integer(1)))});
    inClause = typeswitch(always(integer(1)), {defaultClause(inClause, "x")});
  }
  for (const auto& expr : {inOperand, inClause}) {
    expr->bindInfoForProlog(*prolog);
    EXPECT_EQ(evaluated(*expr), "error 0 limit: expression nested too deeply");
  }
  EXPECT_EQ(prolog->errors().size(), 1U);
}

TEST_F(Typeswitch, AHundredThousandClausesTakeNoStack) {
  Clauses clauses(100'000, clause("", atomicType("string"), failing()));
  clauses.push_back(defaultClause(always(integer(7))));
  EXPECT_EQ(outcomeOf(typeswitch(always(integer(1)), std::move(clauses))), "integer 7");
}

}  // namespace
}  // namespace xquery::bindingtest
