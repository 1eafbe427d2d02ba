#include "Expr/BindingTesting.h"
#include "Expr/TypeTests/XQueryTypeExprs.h"

#include <gtest/gtest.h>

namespace xquery::bindingtest {
namespace {

constexpr auto One = XQueryTypeDeclaration::ExactlyOne;
constexpr auto Optional = XQueryTypeDeclaration::ZeroOrOne;
constexpr auto Star = XQueryTypeDeclaration::ZeroOrMore;
constexpr auto Plus = XQueryTypeDeclaration::OneOrMore;

constexpr const char* invalidType = "error 6 invalid type";
constexpr const char* invalidConversion = "error 6 invalid type conversion";
constexpr const char* tooDeep = "error 0 limit: expression nested too deeply";

using Type = Ref<XQueryTypeDeclaration>;

Type with(Type type, int32_t occurrence) {
  type->setOccuranceType(occurrence);
  return type;
}

class TypeExprs : public BindingTesting {
 protected:
  std::string instanceOf(Value value, Type type) {
    return outcomeOf(
        XQueryInstanceOfExpr::instanceOfExpr(always(std::move(value)), std::move(type)));
  }
  std::string treatAs(Value value, Type type) {
    return outcomeOf(XQueryTreatExpr::treatExpr(always(std::move(value)), std::move(type)));
  }
  std::string castAs(Value value, Type type) {
    return outcomeOf(XQueryCastExpr::castExpr(always(std::move(value)), std::move(type)));
  }
  std::string castableAs(Value value, Type type) {
    return outcomeOf(XQueryCastableExpr::castableExpr(always(std::move(value)), std::move(type)));
  }
  Type integerType(int32_t occurrence = One) { return atomicType("integer", occurrence); }
  const Value element = elementFrom("<a/>");
};

// --- binding -------------------------------------------------------------------------------------

TEST_F(TypeExprs, TheTypeIsBoundBeforeTheOperand) {
  const auto note = [this](const Type& type) {
    return onBind([this, type](XQueryProlog&) { log.push_back(std::to_string(type->typeID())); });
  };
  const Type types[] = {integerType(), atomicType("string"), atomicType("boolean"),
                        atomicType("double")};
  XQueryInstanceOfExpr::instanceOfExpr(note(types[0]), types[0])->bindInfoForProlog(*prolog);
  XQueryTreatExpr::treatExpr(note(types[1]), types[1])->bindInfoForProlog(*prolog);
  XQueryCastExpr::castExpr(note(types[2]), types[2])->bindInfoForProlog(*prolog);
  XQueryCastableExpr::castableExpr(note(types[3]), types[3])->bindInfoForProlog(*prolog);
  EXPECT_EQ(log, (Log{"42", "9", "10", "11"}));
}

TEST_F(TypeExprs, EachEvaluatesItsOperandOnce) {
  const auto operand = traced("operand", integer(1));
  EXPECT_EQ(outcomeOf(XQueryInstanceOfExpr::instanceOfExpr(operand, integerType())), "true");
  EXPECT_EQ(outcomeOf(XQueryTreatExpr::treatExpr(operand, integerType())), "integer 1");
  EXPECT_EQ(outcomeOf(XQueryCastExpr::castExpr(operand, integerType())), "integer 1");
  EXPECT_EQ(outcomeOf(XQueryCastableExpr::castableExpr(operand, integerType())), "true");
  EXPECT_EQ(log.size(), 4U);
}

TEST_F(TypeExprs, AnAbsentOperandIsTheEmptySequence) {
  EXPECT_EQ(outcomeOf(XQueryInstanceOfExpr::instanceOfExpr(nullptr, integerType(Optional))),
            "true");
  EXPECT_EQ(outcomeOf(XQueryTreatExpr::treatExpr(nullptr, integerType(Optional))), "()");
  EXPECT_EQ(outcomeOf(XQueryCastExpr::castExpr(nullptr, integerType(Optional))), "()");
  EXPECT_EQ(outcomeOf(XQueryCastableExpr::castableExpr(nullptr, integerType())), "false");
}

TEST_F(TypeExprs, AnErrorOfTheOperandGoesOn) {
  EXPECT_EQ(outcomeOf(XQueryInstanceOfExpr::instanceOfExpr(failing(1, "a"), integerType())),
            "error 1 a");
  EXPECT_EQ(outcomeOf(XQueryTreatExpr::treatExpr(failing(2, "b"), integerType())), "error 2 b");
  EXPECT_EQ(outcomeOf(XQueryCastExpr::castExpr(failing(3, "c"), integerType())), "error 3 c");
  EXPECT_EQ(outcomeOf(XQueryCastableExpr::castableExpr(failing(4, "d"), integerType())),
            "error 4 d");
}

// --- instance of ---------------------------------------------------------------------------------

TEST_F(TypeExprs, TheEmptySequenceIsMatchedByOccurrence) {
  for (const auto& nothing : {empty(), sequence({})}) {
    EXPECT_EQ(instanceOf(nothing, XQueryTypeDeclaration::empty()), "true");
    EXPECT_EQ(instanceOf(nothing, integerType(Optional)), "true");
    EXPECT_EQ(instanceOf(nothing, with(XQueryTypeDeclaration::anyKind(), Star)), "true");
    EXPECT_EQ(instanceOf(nothing, XQueryTypeDeclaration::item()), "false");
    EXPECT_EQ(instanceOf(nothing, with(XQueryTypeDeclaration::item(), Plus)), "false");
  }
}

TEST_F(TypeExprs, OnlyTheEmptySequenceIsEmpty) {
  EXPECT_EQ(instanceOf(integer(1), XQueryTypeDeclaration::empty()), "false");
  EXPECT_EQ(instanceOf(integer(1), with(XQueryTypeDeclaration::empty(), Star)), "false");
  EXPECT_EQ(instanceOf(integers({1, 2}), with(XQueryTypeDeclaration::empty(), Star)), "false");
}

TEST_F(TypeExprs, PlusAsksForMoreThanOneItem) {
  EXPECT_EQ(instanceOf(integer(5), integerType(Plus)), "false");
  EXPECT_EQ(instanceOf(sequence({integer(5)}), integerType(Plus)), "false");
  EXPECT_EQ(instanceOf(integers({5, 6}), integerType(Plus)), "true");
  EXPECT_EQ(instanceOf(integer(5), with(XQueryTypeDeclaration::item(), Plus)), "false");
  EXPECT_EQ(instanceOf(integers({5, 6}), with(XQueryTypeDeclaration::item(), Plus)), "true");
}

TEST_F(TypeExprs, OccurrencesCountItems) {
  EXPECT_EQ(instanceOf(integers({5, 6}), integerType(Star)), "true");
  EXPECT_EQ(instanceOf(integers({5, 6}), integerType(Optional)), "false");
  EXPECT_EQ(instanceOf(integers({5, 6}), integerType()), "false");
  EXPECT_EQ(instanceOf(sequence({integer(5)}), integerType()), "true");
  EXPECT_EQ(instanceOf(sequence({integer(5)}), integerType(Optional)), "true");
}

TEST_F(TypeExprs, SubtypesMatchTheirBases) {
  EXPECT_EQ(instanceOf(integer(1), atomicType("decimal")), "true");
  EXPECT_EQ(instanceOf(decimal("1"), integerType()), "false");
  EXPECT_EQ(instanceOf(typed(XQueryTypeByte, "1"), integerType()), "true");
  EXPECT_EQ(instanceOf(typed(XQueryTypeByte, "1"), atomicType("long")), "true");
  EXPECT_EQ(instanceOf(untyped("a"), atomicType("string")), "false");
  const auto anyAtomic = [] { return XQueryTypeDeclaration::atomic(text("xdt:anyAtomicType")); };
  EXPECT_EQ(instanceOf(untyped("a"), anyAtomic()), "true");
  EXPECT_EQ(instanceOf(element, anyAtomic()), "false");
}

TEST_F(TypeExprs, OneMemberOfAnotherTypeIsEnoughToFail) {
  EXPECT_EQ(instanceOf(sequence({integer(1), string("a")}), integerType(Star)), "false");
  EXPECT_EQ(instanceOf(sequence({integer(1), empty()}), integerType(Star)), "false");
  EXPECT_EQ(instanceOf(sequence({integer(1), integers({1, 2})}), integerType(Star)), "false");
}

TEST_F(TypeExprs, AnArrayInsideAnArrayIsNoAtomicValue) {
  EXPECT_EQ(instanceOf(sequence({integers({1, 2})}), integerType(Star)), "false");
  EXPECT_EQ(instanceOf(sequence({sequence({integer(1)})}), integerType()), "false");
  EXPECT_EQ(instanceOf(sequence({integers({1, 2})}), XQueryTypeDeclaration::item()), "true");
}

TEST_F(TypeExprs, AnErrorRecordIsAnItemOfNoType) {
  EXPECT_EQ(instanceOf(error(6, "a"), XQueryTypeDeclaration::item()), "true");
  EXPECT_EQ(instanceOf(error(6, "a"), integerType(Star)), "false");
  EXPECT_EQ(instanceOf(error(6, "a"), XQueryTypeDeclaration::anyKind()), "false");
}

TEST_F(TypeExprs, SeveralNodesMatchNoNodeTest) {
  const Value nodes = sequence({element, elementFrom("<b/>")});
  EXPECT_EQ(instanceOf(nodes, with(XQueryTypeDeclaration::element({}), Star)), "false");
  EXPECT_EQ(instanceOf(element, with(XQueryTypeDeclaration::element({}), Star)), "true");
  EXPECT_EQ(instanceOf(sequence({element}), with(XQueryTypeDeclaration::element({}), Star)),
            "true");
  EXPECT_EQ(instanceOf(nodes, with(XQueryTypeDeclaration::item(), Star)), "true");
}

TEST_F(TypeExprs, TheClassMethodAnswersATruthValue) {
  const auto type = integerType();
  type->bindInfoForProlog(*prolog);
  EXPECT_EQ(XQueryInstanceOfExpr::object(integer(1), *type, nullptr), NSNumber::trueValue());
  EXPECT_EQ(XQueryInstanceOfExpr::object(string("a"), *type, context.get()),
            NSNumber::falseValue());
}

// --- treat as ------------------------------------------------------------------------------------

TEST_F(TypeExprs, TreatAsHandsTheValueOnAsItIs) {
  for (const auto& value : {integer(1), empty(), sequence({}), sequence({integer(1)}),
                            integers({1, 2}), error(6, "a"), element}) {
    const auto expr = XQueryTreatExpr::treatExpr(always(value), anyItems());
    expr->bindInfoForProlog(*prolog);
    EXPECT_EQ(expr->evaluateWithContext(*context), value) << show(value);
  }
}

TEST_F(TypeExprs, TreatAsRefusesWhatDoesNotMatch) {
  EXPECT_EQ(treatAs(string("a"), integerType()), invalidType);
  EXPECT_EQ(treatAs(integers({1, 2}), integerType()), invalidType);
  EXPECT_EQ(treatAs(integer(1), integerType(Plus)), invalidType);
  EXPECT_EQ(treatAs(empty(), integerType()), invalidType);
  EXPECT_EQ(treatAs(Value(), anyItems()), invalidType);
}

TEST_F(TypeExprs, TreatAsDoesNotConvert) {
  EXPECT_EQ(treatAs(untyped("1"), integerType()), invalidType);
  EXPECT_EQ(treatAs(typed(XQueryTypeByte, "1"), integerType()), "byte 1");
}

// --- cast as -------------------------------------------------------------------------------------

TEST_F(TypeExprs, CastAsConverts) {
  EXPECT_EQ(castAs(string("5"), integerType()), "integer 5");
  EXPECT_EQ(castAs(decimal("2.7"), integerType()), "integer 2");
  EXPECT_EQ(castAs(integer(1), atomicType("string")), "string 1");
  EXPECT_EQ(castAs(untyped("12abc"), atomicType("double")), "double 12");
  EXPECT_EQ(castAs(elementFrom("<a>7</a>"), integerType()), "integer 7");
  EXPECT_EQ(castAs(sequence({string("5")}), integerType()), "integer 5");
}

TEST_F(TypeExprs, CastAsTheSameTypeGivesTheValueItself) {
  const Value value = integer(1);
  const auto expr = XQueryCastExpr::castExpr(always(value), integerType());
  expr->bindInfoForProlog(*prolog);
  EXPECT_EQ(expr->evaluateWithContext(*context), value);
}

TEST_F(TypeExprs, CastAsOfNothingNeedsAQuestionMark) {
  constexpr const char* wrongCount = "error 6 invalid type for automization";
  for (const auto& nothing : {empty(), sequence({})}) {
    EXPECT_EQ(castAs(nothing, integerType(Optional)), "()");
    EXPECT_EQ(castAs(nothing, integerType(One)), wrongCount);
    EXPECT_EQ(castAs(nothing, integerType(Star)), wrongCount);
    EXPECT_EQ(castAs(nothing, integerType(Plus)), wrongCount);
  }
}

TEST_F(TypeExprs, CastAsOfSeveralItemsFails) {
  EXPECT_EQ(castAs(integers({1, 2}), integerType()), "error 6 invalid type for automization");
  // With a question mark any number is atomized, and several items are no value to cast.
  EXPECT_EQ(castAs(integers({1, 2}), integerType(Optional)), invalidConversion);
}

TEST_F(TypeExprs, CastAsAnythingButAnAtomicTypeFails) {
  for (const auto& type : {XQueryTypeDeclaration::empty(), XQueryTypeDeclaration::item(),
                           XQueryTypeDeclaration::document({}), XQueryTypeDeclaration::element({}),
                           XQueryTypeDeclaration::pi({}), XQueryTypeDeclaration::attribute({}),
                           XQueryTypeDeclaration::comment(), XQueryTypeDeclaration::text(),
                           XQueryTypeDeclaration::anyKind()}) {
    const auto expr = XQueryCastExpr::castExpr(always(integer(1)), type);
    expr->setExprLine(2);
    EXPECT_EQ(outcomeOf(expr), std::string(invalidConversion) + " line 3") << type->type();
  }
}

TEST_F(TypeExprs, CastAsEvaluatesItsOperandBeforeItLooksAtTheType) {
  EXPECT_EQ(
      outcomeOf(XQueryCastExpr::castExpr(failing(1, "operand"), XQueryTypeDeclaration::item())),
      "error 1 operand");
}

TEST_F(TypeExprs, CastAsAnUnknownTypeFails) {
  EXPECT_EQ(castAs(string("5"), atomicType("nothing")), invalidCast);
  EXPECT_EQ(castAs(string("5"), XQueryTypeDeclaration::atomic(text("p:unknown"))), invalidCast);
}

TEST_F(TypeExprs, CastAsOfWhatHasNoTypedValueFails) {
  EXPECT_EQ(castAs(error(17, "a"), integerType()), invalidType);
  EXPECT_EQ(castAs(Value(), integerType()), invalidType);
  EXPECT_EQ(castAs(sequence({empty()}), integerType()), invalidType);
  EXPECT_EQ(castAs(sequence({empty()}), integerType(Optional)), invalidType);
}

TEST_F(TypeExprs, CastAsReportsWhatDoesNotFit) {
  EXPECT_EQ(castAs(string("x"), integerType()), invalidCast);
  EXPECT_EQ(castAs(integer(300), atomicType("byte")), invalidCast);
  EXPECT_EQ(castAs(string("TRUE"), atomicType("boolean")), invalidCast);
}

TEST_F(TypeExprs, AURIThatCannotBeCastTravelsOnAsAnError) {
  EXPECT_EQ(castAs(typed(XQueryTypeAnyURI, "urn:a"), integerType()),
            "record 6 value does not match a required type");
  EXPECT_FALSE(dynamic().error());
}

TEST_F(TypeExprs, CastObjectTakesTheEmptySequenceWhereItIsAllowed) {
  EXPECT_EQ(show(XQueryCastExpr::castObject(empty(), XQueryTypeInteger, *context, true)), "()");
  EXPECT_EQ(show(XQueryCastExpr::castObject(string("5"), XQueryTypeInteger, *context, true)),
            "integer 5");
  EXPECT_EQ(show(XQueryCastExpr::castObject(string("5"), XQueryTypeInteger, *context, false)),
            "integer 5");
  EXPECT_EQ(outcome([](XQueryContext& fresh) {
              return XQueryCastExpr::castObject(empty(), XQueryTypeInteger, fresh, false);
            }),
            "error 6 invalid type for automization");
}

// --- castable as ---------------------------------------------------------------------------------

TEST_F(TypeExprs, CastableAsAnswersWhetherACastGivesTheType) {
  EXPECT_EQ(castableAs(string("5"), integerType()), "true");
  EXPECT_EQ(castableAs(string("x"), integerType()), "false");
  EXPECT_EQ(castableAs(integer(300), atomicType("byte")), "false");
  EXPECT_EQ(castableAs(elementFrom("<a>7</a>"), integerType()), "true");
  EXPECT_EQ(castableAs(string("5"), atomicType("nothing")), "false");
}

// The infinity that every cast gives is shared and of type double.
TEST_F(TypeExprs, AnInfinityIsNoFloat) {
  EXPECT_EQ(castableAs(string("INF"), atomicType("float")), "false");
  EXPECT_EQ(castableAs(string("INF"), atomicType("double")), "true");
}

TEST_F(TypeExprs, CastableAsOfNothingNeedsAQuestionMark) {
  for (const auto& nothing : {empty(), sequence({})}) {
    EXPECT_EQ(castableAs(nothing, integerType()), "false");
    EXPECT_EQ(castableAs(nothing, integerType(Optional)), "true");
  }
}

TEST_F(TypeExprs, CastableAsOfSeveralItemsFails) {
  const auto expr = XQueryCastableExpr::castableExpr(always(integers({1, 2})), integerType());
  expr->setExprLine(2);
  EXPECT_EQ(outcomeOf(expr), std::string(invalidConversion) + " line 3");
  EXPECT_EQ(castableAs(integers({1, 2}), integerType(Optional)), invalidConversion);
  EXPECT_EQ(castableAs(sequence({integers({1, 2})}), integerType()), invalidConversion);
}

TEST_F(TypeExprs, CastableAsOfAnArrayOfOneItemLooksAtTheItem) {
  EXPECT_EQ(castableAs(sequence({string("5")}), integerType()), "true");
  EXPECT_EQ(castableAs(sequence({string("x")}), integerType()), "false");
}

TEST_F(TypeExprs, CastableAsAnythingButAnAtomicTypeFails) {
  EXPECT_EQ(castableAs(integer(1), XQueryTypeDeclaration::item()), invalidConversion);
  EXPECT_EQ(castableAs(element, XQueryTypeDeclaration::element({})), invalidConversion);
  EXPECT_EQ(castableAs(empty(), XQueryTypeDeclaration::empty()), invalidConversion);
}

TEST_F(TypeExprs, AFailedCastLeavesNoError) {
  EXPECT_EQ(castableAs(string("x"), integerType()), "false");
  EXPECT_FALSE(dynamic().error());
  EXPECT_EQ(castableAs(error(17, "a"), integerType()), "false");
  EXPECT_FALSE(dynamic().error());
}

TEST_F(TypeExprs, AURIThatCannotBeCastIsNotCastable) {
  EXPECT_EQ(castableAs(typed(XQueryTypeAnyURI, "urn:a"), integerType()), "false");
  EXPECT_EQ(castableAs(typed(XQueryTypeAnyURI, "urn:a"), atomicType("string")), "true");
}

TEST_F(TypeExprs, ALimitIsNoAnswer) {
  EXPECT_EQ(
      outcomeOf(XQueryCastableExpr::castableExpr(failing(0, "limit: out of time"), integerType())),
      "error 0 limit: out of time");
}

// --- nesting -------------------------------------------------------------------------------------

TEST_F(TypeExprs, NestingBeyondTheStackIsAnErrorOfTheQuery) {
  Ref<XQueryExpr> chains[] = {always(integer(1)), always(integer(1)), always(integer(1)),
                              always(integer(1))};
  const auto type = integerType();
  for (int i = 0; i < 300'000; ++i) {
    chains[0] = XQueryInstanceOfExpr::instanceOfExpr(chains[0], type);
    chains[1] = XQueryTreatExpr::treatExpr(chains[1], type);
    chains[2] = XQueryCastExpr::castExpr(chains[2], type);
    chains[3] = XQueryCastableExpr::castableExpr(chains[3], type);
  }
  for (const auto& chain : chains) {
    chain->bindInfoForProlog(*prolog);
    EXPECT_EQ(evaluated(*chain), tooDeep);
  }
  // Binding may need no stack at all, where its last call is a jump; evaluating always does.
  EXPECT_LE(prolog->errors().size(), 1U);
}

}  // namespace
}  // namespace xquery::bindingtest
