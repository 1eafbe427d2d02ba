#include "Expr/BindingTesting.h"
#include "Expr/Clauses/XQueryFLWOR.h"
#include "Platform/Base/StackTestSupport.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace xquery::bindingtest {
namespace {

constexpr auto Unspecified = XQueryOrderSpec::EmptyUnspecified;
constexpr auto Least = XQueryOrderSpec::EmptyLeast;
constexpr auto Greatest = XQueryOrderSpec::EmptyGreatest;

Ref<XQueryOrderSpec> spec(Ref<XQueryExpr> expr, bool ascending = true,
                          XQueryOrderSpec::EmptyOrder emptyOrder = Unspecified) {
  return XQueryOrderSpec::orderSpec(std::move(expr), ascending, emptyOrder, nullptr);
}

class FLWOR : public BindingTesting {
 protected:
  // The values of "for $x in (...) return $x".
  std::string tuplesOver(Value value) {
    return outcomeOf(flwor({forClause("x", always(std::move(value)))}, variable("x")));
  }
  // "for $x in (1, 2, 3) ... return $x" with the key that a tuple of each number has.
  std::string sortedBy(std::vector<Value> keys, bool ascending = true,
                       XQueryOrderSpec::EmptyOrder emptyOrder = Unspecified) {
    std::vector<Value> numbers;
    for (size_t i = 1; i <= keys.size(); ++i) numbers.push_back(integer(static_cast<int64_t>(i)));
    const auto key = probe([this, keys](XQueryContext&) {
      return keys[static_cast<size_t>(cast<NSNumber>(dynamic().variableForID(1))->longLongValue() -
                                      1)];
    });
    return outcomeOf(flwor({forClause("x", always(sequence(std::move(numbers))))}, variable("x"),
                           {}, {spec(key, ascending, emptyOrder)}));
  }
};

// --- the classes ---------------------------------------------------------------------------------

TEST_F(FLWOR, AClauseKeepsItsParts) {
  const auto type = atomicType("integer");
  const auto expr = always(integer(7));
  const auto forExpr = XQueryForExpr::exprWithName(text("x"), type, text("i"), expr);
  EXPECT_EQ(forExpr->type(), type.get());
  EXPECT_EQ(forExpr->varID(), 0);
  EXPECT_EQ(forExpr->posVarID(), 0);
  EXPECT_EQ(show(forExpr->evaluateWithContext(*context)), "integer 7");
  const auto letExpr = XQueryLetExpr::exprWithName(text("x"), nullptr, expr);
  EXPECT_EQ(letExpr->type(), nullptr);
  EXPECT_EQ(letExpr->varID(), 0);
  EXPECT_EQ(show(letExpr->evaluateWithContext(*context)), "integer 7");
}

TEST_F(FLWOR, AnOrderSpecKeepsItsParts) {
  const auto order = XQueryOrderSpec::orderSpec(nullptr, false, Greatest, text("urn:c"));
  EXPECT_FALSE(order->ascending());
  EXPECT_FALSE(order->emptyLeast());
  EXPECT_EQ(order->collation()->utf8(), "urn:c");
  EXPECT_EQ(order->expr(), nullptr);
  order->setExpr(always(integer(3)));
  EXPECT_EQ(show(order->evaluateWithContext(*context)), "integer 3");
  EXPECT_TRUE(spec(nullptr, true, Least)->emptyLeast());
  EXPECT_TRUE(spec(nullptr, true, Least)->ascending());
}

TEST_F(FLWOR, HandsOutItsOrderSpecs) {
  const auto first = spec(always(integer(1)));
  const auto second = spec(always(integer(2)), false);
  const auto expr = flwor({letClause("x", always(empty()))}, always(empty()), {}, {first, second});
  ASSERT_EQ(expr->orderSpecs().size(), 2U);
  EXPECT_EQ(expr->orderSpecs()[0], first);
  EXPECT_EQ(expr->orderSpecs()[1], second);
}

// --- binding -------------------------------------------------------------------------------------

TEST_F(FLWOR, BindsClausesThenWhereThenKeysThenReturn) {
  flwor({forClause("x", logged("for")), letClause("y", logged("let"))}, logged("return"),
        logged("where"), {spec(logged("first")), spec(logged("second"))})
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"for", "let", "where", "first", "second", "return"}));
}

TEST_F(FLWOR, AClauseDeclaresItsVariablesAfterItsExpression) {
  const auto forExpr =
      XQueryForExpr::exprWithName(text("x"), nullptr, text("i"), loggedWith("for", {"x", "i"}));
  const auto letExpr =
      XQueryLetExpr::exprWithName(text("y"), nullptr, loggedWith("let", {"x", "i", "y"}));
  flwor({forExpr, letExpr}, loggedWith("return", {"x", "i", "y"}), loggedWith("where", {"y"}),
        {spec(loggedWith("key", {"x", "y"}))})
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"for x=0 i=0", "let x=1 i=2 y=0", "where y=3", "key x=1 y=3",
                      "return x=1 i=2 y=3"}));
  EXPECT_EQ(forExpr->varID(), 1);
  EXPECT_EQ(forExpr->posVarID(), 2);
  EXPECT_EQ(letExpr->varID(), 3);
}

TEST_F(FLWOR, TheTypeIsBoundBeforeTheExpression) {
  const auto forType = atomicType("integer");
  const auto letType = atomicType("string");
  const auto note = [&](const Ref<XQueryTypeDeclaration>& type) {
    return onBind([this, type](XQueryProlog&) { log.push_back(std::to_string(type->typeID())); });
  };
  flwor({forClause("x", note(forType), forType), letClause("y", note(letType), letType)},
        always(empty()))
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"42", "9"}));
}

TEST_F(FLWOR, WithoutAPositionalNameNoIDIsTaken) {
  const auto noName = XQueryForExpr::exprWithName(text("x"), nullptr, nullptr, always(empty()));
  const auto emptyName = XQueryForExpr::exprWithName(text("y"), nullptr, text(""), always(empty()));
  flwor({noName, emptyName}, loggedWith("return", {"x", "y"}))->bindInfoForProlog(*prolog);
  EXPECT_EQ(noName->posVarID(), 0);
  EXPECT_EQ(emptyName->posVarID(), 0);
  EXPECT_EQ(log, (Log{"return x=1 y=2"}));
}

TEST_F(FLWOR, APositionalVariableOfTheSameNameHidesTheItem) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(sequence({string("a"), string("b")})), {}, "x")},
                            variable("x"))),
            "(double 1, double 2)");
}

TEST_F(FLWOR, RestoresTheNextIDAndTheNames) {
  prolog->newLocalVariableIDForQName(qName("x"));
  flwor({letClause("x", loggedWith("outer", {"x"})), letClause("y", always(empty()))},
        loggedWith("inner", {"x", "y"}))
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"outer x=1", "inner x=2 y=3"}));
  EXPECT_EQ(prolog->nextLocalVariableID(), 2);
  EXPECT_EQ(idOf("x"), 1);
  EXPECT_EQ(idOf("y"), 0);
}

TEST_F(FLWOR, NeighboursUseTheSameIDs) {
  for (const char* name : {"a", "b"}) {
    flwor({letClause(name, always(empty()))}, loggedWith("return", {"a", "b"}))
        ->bindInfoForProlog(*prolog);
  }
  EXPECT_EQ(log, (Log{"return a=1 b=0", "return a=0 b=1"}));
}

TEST_F(FLWOR, AnInnerOneLeavesTheOuterVariablesAlone) {
  const auto inner = flwor({letClause("x", variable("x"))}, variable("x"));
  EXPECT_EQ(outcomeOf(flwor({letClause("x", always(integer(1)))}, commas({inner, variable("x")}))),
            "(integer 1, integer 1)");
}

TEST_F(FLWOR, ANameWithAnUnknownPrefixHasNoVariable) {
  const auto forExpr =
      XQueryForExpr::exprWithName(text("p:x"), nullptr, text("p:i"), always(integers({1, 2})));
  EXPECT_EQ(
      outcomeOf(flwor({forExpr, letClause("p:y", always(integer(1)))}, loggedWith("return", {}))),
      "()");
  EXPECT_EQ(forExpr->varID(), 0);
  EXPECT_EQ(forExpr->posVarID(), 0);
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
}

TEST_F(FLWOR, AnEmptyOrderNotGivenIsThePrologs) {
  for (const bool least : {true, false}) {
    prolog->setEmptyLeast(least);
    const auto unspecified = spec(logged("key"));
    const auto least1 = spec(logged("key"), true, Least);
    const auto greatest = spec(logged("key"), true, Greatest);
    for (const auto& each : {unspecified, least1, greatest}) each->bindInfoForProlog(*prolog);
    EXPECT_EQ(unspecified->emptyLeast(), least);
    EXPECT_TRUE(least1->emptyLeast());
    EXPECT_FALSE(greatest->emptyLeast());
  }
  EXPECT_EQ(log.size(), 6U);
}

// --- tuples --------------------------------------------------------------------------------------

TEST_F(FLWOR, AForClauseTakesAValueOfAnyShape) {
  EXPECT_EQ(tuplesOver(Value()), "()");
  EXPECT_EQ(tuplesOver(empty()), "()");
  EXPECT_EQ(tuplesOver(sequence({})), "()");
  EXPECT_EQ(tuplesOver(integer(1)), "integer 1");
  EXPECT_EQ(tuplesOver(sequence({integer(1)})), "integer 1");
  EXPECT_EQ(tuplesOver(integers({1, 2})), "(integer 1, integer 2)");
}

TEST_F(FLWOR, AForClauseFlattensWhatAHostHandsIn) {
  EXPECT_EQ(tuplesOver(sequence({empty()})), "()");
  EXPECT_EQ(tuplesOver(sequence({empty(), integer(1), empty()})), "integer 1");
  EXPECT_EQ(tuplesOver(sequence({integers({1, 2}), empty(), sequence({integers({3})})})),
            "(integer 1, integer 2, integer 3)");
}

TEST_F(FLWOR, FlatteningKeepsAFlatArrayAsItIs) {
  const Value flat = integers({1, 2});
  EXPECT_EQ(flattened(flat), flat);
  const Value made = XQuerySequence::sequenceWithItem(flat);
  EXPECT_EQ(flattened(made), made);
  EXPECT_EQ(flattened(Value()), Value());
  EXPECT_EQ(flattened(empty()), empty());
  EXPECT_EQ(show(flattened(sequence({empty()}))), "()");
  EXPECT_TRUE(isa<NSArray>(flattened(sequence({empty()}))));
}

TEST_F(FLWOR, AForClauseNumbersOnlyTheItemsItHas) {
  EXPECT_EQ(
      outcomeOf(flwor({forClause("x", always(sequence({empty(), integers({7, 8})})), {}, "i")},
                      commas({variable("x"), variable("i")}))),
      "(integer 7, double 1, integer 8, double 2)");
}

TEST_F(FLWOR, APositionIsAPlainPlatformNumber) {
  flwor({forClause("x", always(string("a")), {}, "i")}, always(empty()))
      ->bindInfoForProlog(*prolog);
  const auto expr = flwor({forClause("x", always(string("a")), {}, "i")}, variable("i"));
  expr->bindInfoForProlog(*prolog);
  const Value position = expr->evaluateWithContext(*context);
  ASSERT_EQ(position->kind(), Kind::Number);
  EXPECT_EQ(cast<NSNumber>(position)->storage(), NSNumber::Storage::Int64);
}

TEST_F(FLWOR, ALetKeepsTheShapeOfItsValue) {
  const auto letOf = [this](Value value) {
    return outcomeOf(flwor({letClause("x", always(std::move(value)))}, tracedVariable("x")));
  };
  letOf(empty());
  letOf(sequence({}));
  letOf(sequence({integer(1)}));
  letOf(sequence({empty(), integers({1, 2})}));
  EXPECT_EQ(log, (Log{"()", "()", "(integer 1)", "((), (integer 1, integer 2))"}));
}

TEST_F(FLWOR, AnEmptyLetHasATuple) {
  EXPECT_EQ(outcomeOf(flwor({letClause("x", always(empty()))}, always(integer(7)))), "integer 7");
}

TEST_F(FLWOR, WithoutClausesThereIsNoTuple) {
  EXPECT_EQ(outcomeOf(flwor({}, traced("return", integer(1)))), "()");
  EXPECT_TRUE(log.empty());
}

TEST_F(FLWOR, WithoutAReturnExpressionTuplesYieldNothing) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({1, 2})))}, nullptr)), "()");
}

TEST_F(FLWOR, LaterClausesAreEvaluatedForEveryTupleOfEarlierOnes) {
  const auto expr =
      flwor({letClause("a", traced("a", integer(9))), forClause("x", traced("x", integers({1, 2}))),
             letClause("b", traced("b", integer(8))), forClause("y", traced("y", integers({3, 4}))),
             letClause("c", traced("c", integer(7)))},
            traced("return", integer(0)), traced("where", boolean(true)));
  EXPECT_EQ(outcomeOf(expr), "(integer 0, integer 0, integer 0, integer 0)");
  const Log tuple = {"c", "where", "return"};
  Log expected = {"a", "x"};
  for (int outer = 0; outer < 2; ++outer) {
    expected.insert(expected.end(), {"b", "y"});
    for (int inner = 0; inner < 2; ++inner)
      expected.insert(expected.end(), tuple.begin(), tuple.end());
  }
  EXPECT_EQ(log, expected);
}

TEST_F(FLWOR, AnEmptyForEndsTheTupleBeforeLaterClauses) {
  EXPECT_EQ(
      outcomeOf(flwor({forClause("x", always(empty())), letClause("y", traced("let", empty()))},
                      traced("return", integer(1)))),
      "()");
  EXPECT_TRUE(log.empty());
}

TEST_F(FLWOR, VariablesKeepTheirLastValuesInTheirSlots) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({1, 2})), {}, "i"),
                             letClause("y", always(integer(3)))},
                            always(empty()))),
            "()");
  EXPECT_EQ(show(dynamic().variableForID(1)), "integer 2");
  EXPECT_EQ(show(dynamic().variableForID(2)), "double 2");
  EXPECT_EQ(show(dynamic().variableForID(3)), "integer 3");
}

// --- where ---------------------------------------------------------------------------------------

TEST_F(FLWOR, OnlyFalseDropsATuple) {
  const auto where = [this](Value value) {
    return outcomeOf(
        flwor({letClause("x", always(integer(1)))}, always(integer(2)), always(std::move(value))));
  };
  for (const auto& dropping :
       {boolean(false), empty(), sequence({}), integer(0), nan(), untyped(""), string("")}) {
    EXPECT_EQ(where(dropping), "()") << show(dropping);
  }
  for (const auto& keeping : {boolean(true), integer(1), untyped("false"), integers({0, 0}),
                              elementFrom("<a/>"), error(6, "invalid type")}) {
    EXPECT_EQ(where(keeping), "integer 2") << show(keeping);
  }
  EXPECT_FALSE(dynamic().error());
}

TEST_F(FLWOR, ADroppedTupleEvaluatesNeitherReturnNorKeys) {
  EXPECT_EQ(
      outcomeOf(flwor({forClause("x", always(integers({1, 2})))}, traced("return", integer(1)),
                      always(boolean(false)), {spec(traced("key", integer(1)))})),
      "()");
  EXPECT_TRUE(log.empty());
}

TEST_F(FLWOR, AnErrorRaisedInAnyPartIsRaised) {
  const Value one = integer(1);
  EXPECT_EQ(outcomeOf(flwor({forClause("x", failing(1, "for"))}, always(one))), "error 1 for");
  EXPECT_EQ(outcomeOf(flwor({letClause("x", failing(2, "let"))}, always(one))), "error 2 let");
  const XQueryFLWORExpr::Clauses clauses = {letClause("x", always(one))};
  EXPECT_EQ(outcomeOf(flwor(clauses, always(one), failing(3, "where"))), "error 3 where");
  EXPECT_EQ(outcomeOf(flwor(clauses, failing(4, "return"))), "error 4 return");
  EXPECT_EQ(outcomeOf(flwor(clauses, always(one), {}, {spec(failing(5, "key"))})), "error 5 key");
}

TEST_F(FLWOR, AnErrorRecordIsAValueLikeAnyOther) {
  EXPECT_EQ(tuplesOver(error(6, "a")), "record 6 a");
  EXPECT_EQ(outcomeOf(flwor({letClause("x", always(error(6, "b")))}, variable("x"))), "record 6 b");
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({1, 2})))}, always(error(6, "c")))),
            "(record 6 c, record 6 c)");
}

// --- declared types ------------------------------------------------------------------------------

TEST_F(FLWOR, EveryForItemMustBeOfTheDeclaredType) {
  const auto typed = [this](Value value, Ref<XQueryTypeDeclaration> type) {
    return outcomeOf(flwor({atLine(forClause("x", always(std::move(value)), std::move(type)), 4)},
                           variable("x")));
  };
  EXPECT_EQ(typed(integers({1, 2}), atomicType("integer")), "(integer 1, integer 2)");
  EXPECT_EQ(typed(integers({1, 2}), atomicType("decimal")), "(integer 1, integer 2)");
  EXPECT_EQ(typed(sequence({integer(1), string("a")}), atomicType("integer")),
            "error 6 invalid type line 5");
  EXPECT_EQ(typed(untyped("1"), atomicType("integer")), "error 6 invalid type line 5");
  EXPECT_EQ(typed(integer(1), atomicType("integer", XQueryTypeDeclaration::OneOrMore)),
            "error 6 invalid type line 5");
  EXPECT_EQ(typed(empty(), atomicType("integer")), "()");
}

TEST_F(FLWOR, ItemsBeforeTheOneOfAnotherTypeHaveTheirTuples) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(sequence({integer(1), string("a"), integer(2)})),
                                       atomicType("integer"))},
                            tracedVariable("x"))),
            "error 6 invalid type");
  EXPECT_EQ(log, (Log{"integer 1"}));
}

TEST_F(FLWOR, ALetValueMustBeOfTheDeclaredTypeAsAWhole) {
  const auto typed = [this](Value value, Ref<XQueryTypeDeclaration> type) {
    return outcomeOf(flwor({atLine(letClause("x", always(std::move(value)), std::move(type)), 2)},
                           variable("x")));
  };
  EXPECT_EQ(typed(integers({1, 2}), atomicType("integer")), "error 6 invalid type line 3");
  EXPECT_EQ(typed(integers({1, 2}), atomicType("integer", XQueryTypeDeclaration::ZeroOrMore)),
            "(integer 1, integer 2)");
  EXPECT_EQ(typed(empty(), atomicType("integer")), "error 6 invalid type line 3");
  EXPECT_EQ(typed(empty(), atomicType("integer", XQueryTypeDeclaration::ZeroOrOne)), "()");
  EXPECT_EQ(typed(string("a"), anyItems()), "string a");
  EXPECT_EQ(typed(Value(), anyItems()), "error 6 invalid type line 3");
}

TEST_F(FLWOR, AVariableOfTheWrongTypeIsNotSet) {
  dynamic().setVariable(integer(5), 1);
  EXPECT_EQ(outcomeOf(flwor({letClause("x", always(string("a")), atomicType("integer"))},
                            always(empty()))),
            "error 6 invalid type");
  EXPECT_EQ(show(dynamic().variableForID(1)), "integer 5");
}

// --- results -------------------------------------------------------------------------------------

TEST_F(FLWOR, ReturnedValuesAreConcatenatedFlat) {
  const auto returning = [this](std::vector<Value> values) {
    auto list = std::make_shared<std::vector<Value>>(std::move(values));
    std::vector<Value> numbers(list->size(), integer(0));
    auto next = std::make_shared<size_t>(0);
    return outcomeOf(flwor({forClause("x", always(sequence(std::move(numbers))))},
                           probe([=](XQueryContext&) { return (*list)[(*next)++]; })));
  };
  EXPECT_EQ(returning({empty(), Value(), sequence({})}), "()");
  EXPECT_EQ(returning({empty(), integer(1), Value()}), "integer 1");
  EXPECT_EQ(returning({sequence({integer(1)})}), "integer 1");
  EXPECT_EQ(returning({integer(1), sequence({}), integer(2)}), "(integer 1, integer 2)");
  EXPECT_EQ(returning({integers({1, 2}), empty(), integers({3})}),
            "(integer 1, integer 2, integer 3)");
  EXPECT_EQ(returning({integer(1), sequence({empty(), integers({2, 3})})}),
            "(integer 1, integer 2, integer 3)");
}

TEST_F(FLWOR, TheOnlyValueIsHandedOnAsItIs) {
  const Value array = integers({1, 2});
  const auto expr = flwor({letClause("x", always(empty()))}, always(array));
  expr->bindInfoForProlog(*prolog);
  EXPECT_EQ(expr->evaluateWithContext(*context), array);
}

// --- order by ------------------------------------------------------------------------------------

TEST_F(FLWOR, ReturnIsEvaluatedBeforeTheKeysOfItsTuple) {
  EXPECT_EQ(
      outcomeOf(flwor({forClause("x", always(integers({1, 2})))}, traced("return", integer(0)), {},
                      {spec(traced("first", integer(1))), spec(traced("second", empty()))})),
      "(integer 0, integer 0)");
  EXPECT_EQ(log, (Log{"return", "first", "second", "return", "first", "second"}));
}

TEST_F(FLWOR, AnUntypedKeyIsAString) {
  EXPECT_EQ(sortedBy({untyped("9"), untyped("10"), string("1")}),
            "(integer 3, integer 2, integer 1)");
}

TEST_F(FLWOR, ANodeKeyIsItsText) {
  EXPECT_EQ(sortedBy({elementFrom("<a>9</a>"), elementFrom("<a>10</a>")}),
            "(integer 2, integer 1)");
}

TEST_F(FLWOR, AKeyMayHaveAnyShape) {
  EXPECT_EQ(sortedBy({sequence({integer(2)}), integer(1), sequence({}), empty()}),
            "(integer 3, integer 4, integer 2, integer 1)");
  EXPECT_EQ(sortedBy({integer(1), integers({1, 2})}), "error 6 invalid type");
  EXPECT_EQ(sortedBy({integer(1), error(6, "a")}), "error 6 invalid type");
}

TEST_F(FLWOR, ADurationIsNoKey) {
  EXPECT_EQ(sortedBy({months(1), months(2)}), "error 6 invalid type");
  EXPECT_EQ(sortedBy({months(1)}), "integer 1");
  EXPECT_EQ(sortedBy({months(1), empty()}), "(integer 2, integer 1)");
}

TEST_F(FLWOR, UnsortableKeysFailAtTheLineOfTheExpression) {
  const auto expr = flwor({forClause("x", always(integers({1, 2})))}, variable("x"), {},
                          {spec(always(seconds(1)))});
  expr->setExprLine(6);
  EXPECT_EQ(outcomeOf(expr), "error 6 invalid type line 7");
}

TEST_F(FLWOR, UnsortableKeysFailOnlyAfterEveryTuple) {
  const auto key = probe([](XQueryContext&) { return months(1); });
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({1, 2, 3})))}, tracedVariable("x"), {},
                            {spec(key)})),
            "error 6 invalid type");
  EXPECT_EQ(log, (Log{"integer 1", "integer 2", "integer 3"}));
}

TEST_F(FLWOR, EmptyKeysFollowTheFirstSpec) {
  EXPECT_EQ(sortedBy({integer(1), empty()}, true, Least), "(integer 2, integer 1)");
  EXPECT_EQ(sortedBy({empty(), integer(1)}, true, Greatest), "(integer 2, integer 1)");
  EXPECT_EQ(sortedBy({empty(), integer(1)}, false, Least), "(integer 2, integer 1)");
  EXPECT_EQ(sortedBy({integer(1), empty()}, false, Greatest), "(integer 2, integer 1)");
}

TEST_F(FLWOR, TheFirstSpecRulesAllKeys) {
  const auto expr = flwor(
      {forClause("x", always(integers({11, 21, 12, 22})))}, variable("x"), {},
      {spec(operation(XQueryOperatorIDiv, variable("x"), always(integer(10))), false, Greatest),
       spec(operation(XQueryOperatorMod, variable("x"), always(integer(10))), true, Least)});
  EXPECT_EQ(outcomeOf(expr), "(integer 22, integer 21, integer 12, integer 11)");
}

TEST_F(FLWOR, ItemsOfATupleStayTogetherAndInOrder) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({2, 1})))},
                            commas({variable("x"), always(integer(9)), variable("x")}), {},
                            {spec(variable("x"))})),
            "(integer 1, integer 9, integer 1, integer 2, integer 9, integer 2)");
}

TEST_F(FLWOR, SortedTuplesWithoutItemsLeaveNothing) {
  const auto expr = [](Ref<XQueryExpr> returns) {
    return flwor({forClause("x", always(integers({3, 2, 1})))}, std::move(returns), {},
                 {spec(variable("x"))});
  };
  EXPECT_EQ(outcomeOf(expr(always(empty()))), "()");
  EXPECT_EQ(outcomeOf(expr(always(sequence({empty()})))), "()");
  EXPECT_EQ(outcomeOf(expr(nullptr)), "()");
  const auto onlyTwo = probe([this](XQueryContext&) -> Value {
    Value x = dynamic().variableForID(1);
    return cast<NSNumber>(x)->longLongValue() == 2 ? x : Value(NSNull::null());
  });
  EXPECT_EQ(outcomeOf(expr(onlyTwo)), "integer 2");
}

TEST_F(FLWOR, SortedItemsAreFlattened) {
  EXPECT_EQ(outcomeOf(flwor({forClause("x", always(integers({2, 1})))},
                            probe([this](XQueryContext&) -> Value {
                              return sequence({empty(), sequence({dynamic().variableForID(1)})});
                            }),
                            {}, {spec(variable("x"))})),
            "(integer 1, integer 2)");
}

TEST_F(FLWOR, TheItemsOfOneTupleAreComparedWithEachOther) {
  EXPECT_EQ(outcomeOf(flwor({letClause("x", always(empty()))}, always(integers({1, 2})), {},
                            {spec(always(months(1)))})),
            "error 6 invalid type");
}

TEST_F(FLWOR, ANestedSortKeepsItsKeysApart) {
  const auto inner = [] {
    return flwor({forClause("y", always(integers({3, 1, 2})))}, variable("y"), {},
                 {spec(variable("y"))});
  };
  const auto first = XQueryOrderSpec::orderSpec(
      flwor({forClause("y", always(integers({5, 4})))},
            operation(XQueryOperatorMultiply, variable("y"), variable("x")), {},
            {spec(variable("y"))}),
      true, Least, nullptr);
  EXPECT_EQ(outcomeOf(flwor({forClause("x", inner())}, inner(), {}, {spec(variable("x"), false)})),
            "(integer 1, integer 2, integer 3, integer 1, integer 2, integer 3, integer 1, "
            "integer 2, integer 3)");
  EXPECT_EQ(outcomeOf(flwor({forClause("x", inner())}, variable("x"), {}, {first})),
            "error 6 invalid type");
}

// --- ordering mode -------------------------------------------------------------------------------

TEST_F(FLWOR, TheOrderingModeHoldsForTheOperandOnly) {
  for (const bool outside : {true, false}) {
    for (const bool inside : {true, false}) {
      dynamic().setOrdered(outside);
      const auto mode =
          probe([](XQueryContext& with) { return boolean(_internal(with).ordered()); });
      EXPECT_EQ(outcomeOf(XQueryOrderExpr::orderExpr(mode, inside)), inside ? "true" : "false");
      EXPECT_EQ(dynamic().ordered(), outside);
    }
  }
}

TEST_F(FLWOR, TheOrderingModeIsPutBackBeforeAnErrorGoesOn) {
  for (const bool outside : {true, false}) {
    dynamic().setOrdered(outside);
    EXPECT_EQ(outcomeOf(XQueryOrderExpr::orderExpr(failing(6, "a"), !outside)), "error 6 a");
    EXPECT_EQ(dynamic().ordered(), outside);
  }
}

TEST_F(FLWOR, AnOrderingExpressionBindsItsOperand) {
  XQueryOrderExpr::orderExpr(logged("operand"), true)->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"operand"}));
  EXPECT_EQ(outcomeOf(XQueryOrderExpr::orderExpr(nullptr, true)), "()");
}

// --- limits --------------------------------------------------------------------------------------

constexpr const char* tooDeep = "error 0 limit: expression nested too deeply";

Ref<XQueryExpr> nestedFLWORs(int depth, Value innermost) {
  Ref<XQueryExpr> expr = always(std::move(innermost));
  for (int i = 0; i < depth; ++i) expr = flwor({forClause("x", always(integer(1)))}, expr);
  return expr;
}

TEST_F(FLWOR, NestingBeyondTheStackIsAnErrorOfTheQuery) {
  const auto expr = nestedFLWORs(300'000, integer(7));
  expr->bindInfoForProlog(*prolog);
  ASSERT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(prolog->errors()[0]->err(), 0);
  EXPECT_EQ(prolog->errors()[0]->msg()->utf8(), "limit: expression nested too deeply");
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
  EXPECT_EQ(evaluated(*expr), tooDeep);
}

TEST_F(FLWOR, NestingInAClauseBeyondTheStackIsAnErrorOfTheQuery) {
  Ref<XQueryExpr> expr = always(integer(1));
  for (int i = 0; i < 300'000; ++i) expr = flwor({letClause("x", expr)}, variable("x"));
  expr->bindInfoForProlog(*prolog);
  EXPECT_EQ(prolog->errors().size(), 1U);
  EXPECT_EQ(evaluated(*expr), tooDeep);
}

constexpr size_t largeStack = size_t{1} << 30;  // as the command has it

TEST_F(FLWOR, AHundredThousandNestedOnesHaveAValueWhereTheStackIsLarge) {
  onStack(largeStack,
          [this] { EXPECT_EQ(outcomeOf(nestedFLWORs(100'000, integer(7))), "integer 7"); });
}

TEST_F(FLWOR, AHundredThousandNestedOnesEndOnAnyStack) {
  const auto expr = nestedFLWORs(100'000, integer(7));
  expr->bindInfoForProlog(*prolog);
  const std::string outcome = evaluated(*expr);
  EXPECT_TRUE(outcome == "integer 7" || outcome == tooDeep) << outcome;
}

TEST_F(FLWOR, TenThousandForClausesHaveTheirTuples) {
  XQueryFLWORExpr::Clauses clauses;
  for (int i = 0; i < 10'000; ++i) {
    clauses.push_back(forClause("v" + std::to_string(i), always(integer(i))));
  }
  const auto expr = flwor(std::move(clauses), commas({variable("v0"), variable("v9999")}));
  onStack(largeStack, [&] { EXPECT_EQ(outcomeOf(expr), "(integer 0, integer 9999)"); });
  EXPECT_EQ(prolog->nextLocalVariableID(), 1);
}

TEST_F(FLWOR, AMillionForClausesEndInAnError) {
  XQueryFLWORExpr::Clauses clauses(1'000'000, forClause("v", always(integer(1))));
  EXPECT_EQ(evaluated(*flwor(std::move(clauses), always(empty()))), tooDeep);
}

TEST_F(FLWOR, AMillionLetClausesTakeNoStack) {
  XQueryFLWORExpr::Clauses clauses(1'000'000, letClause("v", always(integer(1))));
  EXPECT_EQ(evaluated(*flwor(std::move(clauses), always(integer(7)))), "integer 7");
}

}  // namespace
}  // namespace xquery::bindingtest
