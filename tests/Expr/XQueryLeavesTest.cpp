#include "Context/XQueryContextInternal.h"
#include "Expr/Evaluated.h"
#include "Expr/ProbeExpr.h"
#include "Expr/RandomChoices.h"
#include "Expr/XQueryLeaves.h"
#include "Expr/XQueryLists.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Prolog/XQueryModules.h"
#include "Prolog/XQueryProlog.h"
#include "Prolog/XQueryPrologItems.h"
#include "Types/XQueryNumber.h"
#include "Types/XQueryTypeTable.h"
#include "Types/XQueryValues.h"
#include "xquery/Exception.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace xquery {
namespace {

Ref<NSString> text(std::string_view ascii) {
  return NSString::stringWithASCII(ascii);
}
Ref<XQueryExpr> integer(std::string_view digits) {
  return XQueryLiteral::integerLiteralWithString(text(digits));
}
Ref<XQueryExpr> emptyLiteral() {
  return XQueryLiteral::literalWithValue(NSNull::null());
}
std::string printed(const Value& value) {
  return XQueryStringValue(*value)->utf8();
}

// An expression that tells when it is bound.
class BindNote : public XQueryExpr {
 public:
  explicit BindNote(std::function<void()> onBind)
      : XQueryExpr(Kind::OtherExpr), _onBind(std::move(onBind)) {}
  void bindInfoForProlog(XQueryProlog&) override { _onBind(); }
  void visitParts(XQueryPartVisitor&) override {}
  Value computeValue(XQueryContext&) const override { return NSNull::null(); }

 private:
  std::function<void()> _onBind;
};

class Leaves : public testing::Test {
 protected:
  Value evaluate(const XQueryExpr& expr) { return evaluatedOrThrown(expr, *context); }
  XQueryContextInternal& dynamic() { return _internal(*context); }
  // The error that evaluating raises.
  Ref<XQueryError> failure(const XQueryExpr& expr) {
    try {
      evaluate(expr);
    } catch (const NSException& exception) {
      EXPECT_EQ(exception.name(), "XQueryError");
      EXPECT_EQ(exception.reason()->utf8(), dynamic().error()->description()->utf8());
      return dynamic().error();
    }
    return {};
  }
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
  Ref<XQueryProlog> prolog = XQueryProlog::prologWithItems({}, nullptr, nullptr, nullptr);
};

TEST_F(Leaves, LiteralAnswersTheSameObjectEveryTime) {
  const auto literal = integer("5");
  EXPECT_EQ(evaluate(*literal).get(), evaluate(*literal).get());
  EXPECT_EQ(XQueryObjectTypeID(evaluate(*literal).get()), XQueryTypeInteger);
}

TEST_F(Leaves, IntegerLiteralHasNoMachineWordLimit) {
  EXPECT_EQ(printed(evaluate(*integer("123456789012345678901234567890"))),
            "123456789012345678901234567890");
}

TEST_F(Leaves, LiteralsOfMoreDigitsThanADecimalHoldsAreNone) {
  const std::string digits(static_cast<size_t>(NSDecimal::maximumDigits), '9');
  EXPECT_EQ(printed(evaluate(*integer(digits))), digits);
  EXPECT_FALSE(integer(digits + "9"));
  EXPECT_FALSE(XQueryLiteral::decimalLiteralWithString(text(digits + ".5")));
}

TEST_F(Leaves, DecimalLiteralIsADecimal) {
  const auto value = evaluate(*XQueryLiteral::decimalLiteralWithString(text("1.50")));
  EXPECT_EQ(XQueryObjectTypeID(value.get()), XQueryTypeDecimal);
  EXPECT_EQ(printed(value), "1.5");
}

TEST_F(Leaves, StringLiteralIsAString) {
  const auto value = evaluate(*XQueryLiteral::stringLiteralWithString(text("hi")));
  EXPECT_EQ(XQueryObjectTypeID(value.get()), XQueryTypeString);
  EXPECT_EQ(printed(value), "hi");
}

TEST_F(Leaves, DoubleLiteralIsADouble) {
  const auto value = evaluate(*XQueryLiteral::doubleLiteralWithString(text("1.5e3")));
  EXPECT_EQ(XQueryObjectTypeID(value.get()), XQueryTypeDouble);
  EXPECT_EQ(printed(value), "1500");
}

TEST_F(Leaves, DoubleLiteralThatOverflowsIsTheSharedInfinity) {
  const auto value = evaluate(*XQueryLiteral::doubleLiteralWithString(text("1e400")));
  EXPECT_EQ(value.get(), XQueryNumber::posInf());
}

TEST_F(Leaves, LiteralDescribesItself) {
  EXPECT_EQ(integer("7")->description()->utf8(), "<XQueryLiteral - 7>");
}

TEST_F(Leaves, EmptyListEvaluatesToNull) {
  EXPECT_TRUE(isNull(evaluate(*XQueryExprList::exprList())));
}

TEST_F(Leaves, ListOfTwoEmptyExpressionsIsNull) {
  auto list = XQueryExprList::exprList();
  list->addObject(emptyLiteral());
  list->addObject(emptyLiteral());
  EXPECT_TRUE(isNull(evaluate(*list)));
}

TEST_F(Leaves, ListOfAnItemAndAnEmptyExpressionIsTheItem) {
  auto list = XQueryExprList::exprList();
  list->addObject(integer("1"));
  list->addObject(emptyLiteral());
  EXPECT_EQ(printed(evaluate(*list)), "1");
}

TEST_F(Leaves, ListFlattensToOneSequence) {
  auto inner = XQueryExprList::exprList();
  inner->addObject(integer("2"));
  inner->addObject(integer("3"));
  auto list = XQueryExprList::exprList();
  list->addObject(integer("1"));
  list->addObject(inner);
  list->addObject(integer("4"));
  const Value value = evaluate(*list);
  ASSERT_TRUE(isa<NSArray>(value));
  std::string all;
  for (const Value& item : cast<NSArray>(value)->objects()) all += printed(item);
  EXPECT_EQ(all, "1234");
}

TEST_F(Leaves, ListWhoseOnlyElementYieldsAOneElementArrayAnswersThatElement) {
  const Value item = text("x");
  auto list = XQueryExprList::exprList();
  list->addObject(XQueryLiteral::literalWithValue(NSArray::arrayWithObjects({item})));
  EXPECT_EQ(evaluate(*list).get(), item.get());
}

TEST_F(Leaves, ElementsWithoutAValueAreSkippedByTheList) {
  auto alone = XQueryExprList::exprList();
  alone->addObject(XQueryContextItem::contextItem());
  EXPECT_TRUE(isNull(evaluate(*alone)));
  auto list = XQueryExprList::exprList();
  list->addObject(XQueryContextItem::contextItem());
  list->addObject(integer("1"));
  list->addObject(XQueryContextItem::contextItem());
  EXPECT_EQ(printed(evaluate(*list)), "1");
}

TEST_F(Leaves, EmptyArraysOfElementsAddNothingToTheList) {
  auto list = XQueryExprList::exprList();
  list->addObject(XQueryLiteral::literalWithValue(NSArray::array()));
  EXPECT_TRUE(isNull(evaluate(*list)));
  list->addObject(XQueryLiteral::literalWithValue(NSArray::array()));
  EXPECT_TRUE(isNull(evaluate(*list)));
  list->addObject(integer("1"));
  EXPECT_EQ(printed(evaluate(*list)), "1");
}

// --- lists within lists --------------------------------------------------------------------------

// Arrays with what is in them.
std::string shapeOf(const Value& value) {
  const auto* array = dyn_cast<NSArray>(value);
  if (!array) return isNull(value) ? "-" : printed(value);
  std::string shape = "[";
  for (const Value& element : array->objects()) shape += shapeOf(element);
  return shape + "]";
}

// What a list answers by the rule: each list within it is a value of its own.
Value valueByTheRule(const XQueryExpr& expr) {
  const auto* list = dyn_cast<XQueryExprList>(&expr);
  if (!list) return cast<XQueryLiteral>(&expr)->literalValue();
  XQueryGatherer results;
  for (size_t index = 0; index < list->count(); ++index) {
    results.add(valueByTheRule(*list->objectAtIndex(index)));
  }
  return results.value();
}

// Arrays within arrays are what a host may hand in; a sequence is flat.
Value anyValue(RandomChoices& random, int depth) {
  const size_t choice = random.below(8);
  if (choice < 3) return text(std::string(1, static_cast<char>('a' + random.below(26))));
  if (choice < 4) return NSNull::null();
  const auto array = choice < 5 ? Ref<NSArray>(XQuerySequence::sequence()) : NSArray::array();
  for (size_t count = depth > 0 ? random.below(3) : 0; count > 0; --count) {
    const Value element = anyValue(random, depth - 1);
    const bool isItem = !isNull(element) && !isa<NSArray>(element);
    if (choice >= 5 || isItem) array->objects().push_back(element);
  }
  return array;
}

Ref<XQueryExpr> anyList(RandomChoices& random, int depth) {
  const auto list = XQueryExprList::exprList();
  for (size_t count = random.below(4); count > 0; --count) {
    if (depth > 0 && random.below(2) == 0) {
      list->addObject(anyList(random, depth - 1));
    } else {
      list->addObject(XQueryLiteral::literalWithValue(anyValue(random, 3)));
    }
  }
  return list;
}

TEST_F(Leaves, ListsWithinListsAnswerWhatTheirValuesWould) {
  RandomChoices random(27);
  size_t arrays = 0;
  for (int turn = 0; turn < 20000; ++turn) {
    const auto list = anyList(random, 4);
    const Value expected = valueByTheRule(*list);
    ASSERT_EQ(shapeOf(evaluate(*list)), shapeOf(expected)) << "turn " << turn;
    arrays += isa<NSArray>(expected);
  }
  EXPECT_GT(arrays, 1000U);
}

TEST_F(Leaves, AListWithinAListAnswersTheArrayThatIsAllOfIt) {
  const Value array = NSArray::arrayWithObjects({text("a"), text("b")});
  const auto inner = XQueryExprList::exprList();
  inner->addObject(emptyLiteral());
  inner->addObject(XQueryLiteral::literalWithValue(array));
  const auto list = XQueryExprList::exprList();
  list->addObject(inner);
  list->addObject(emptyLiteral());
  EXPECT_EQ(evaluate(*list).get(), array.get());
}

TEST_F(Leaves, AnErrorInAListWithinAListEndsBoth) {
  const auto inner = XQueryExprList::exprList();
  inner->addObject(integer("1"));
  inner->addObject(failing(6, "first"));
  const auto list = XQueryExprList::exprList();
  list->addObject(integer("0"));
  list->addObject(inner);
  list->addObject(failing(6, "second"));
  EXPECT_EQ(failure(*list)->msg()->utf8(), "first");
}

// Each level of which would be copied as often as there are levels around it.
TEST_F(Leaves, ListsWithinListsTakeTimeInProportionToTheirItems) {
  constexpr int depth = 2000, width = 20;
  const auto wide = XQueryExprList::exprList();
  for (int item = 0; item < width; ++item) wide->addObject(integer("1"));
  auto nested = XQueryExprList::exprList();
  for (int level = 0; level < depth; ++level) {
    const auto around = XQueryExprList::exprList();
    around->addObject(wide);
    around->addObject(nested);
    nested = around;
  }
  constexpr int64_t plenty = int64_t{1} << 40;
  workMeter.stepsLeft = plenty;
  const Value value = evaluate(*nested);
  EXPECT_EQ(cast<NSArray>(value)->count(), size_t{depth} * width);
  const int64_t steps = plenty - std::exchange(workMeter.stepsLeft, WorkMeter::manySteps);
  EXPECT_LT(steps, 4 * depth * width);
}

TEST_F(Leaves, ListBindsItsElementsInOrder) {
  std::string bound;
  auto list = XQueryExprList::exprList();
  for (const char name : {'a', 'b', 'c'}) {
    list->addObject(make<BindNote>([&bound, name] { bound += name; }));
  }
  list->bindInfoForProlog(*prolog);
  EXPECT_EQ(bound, "abc");
}

TEST_F(Leaves, RemovingAndReplacingInALongerList) {
  auto list = XQueryExprList::exprList();
  std::vector<Ref<XQueryExpr>> parts;
  for (const char* digits : {"1", "2", "3", "4"}) {
    parts.push_back(integer(digits));
    list->addObject(parts.back());
  }
  list->removeObjectAtIndex(1);
  list->removeLastObject();
  list->replaceObjectAtIndex(1, parts[3]);
  ASSERT_EQ(list->count(), 2U);
  EXPECT_EQ(list->objectAtIndex(0), parts[0].get());
  EXPECT_EQ(list->objectAtIndex(1), parts[3].get());
  EXPECT_EQ(list->objectAtIndex(2), nullptr);
}

TEST_F(Leaves, AddingNoExpressionStoresAnEmptyLiteral) {
  auto list = XQueryExprList::exprList();
  list->addObject(nullptr);
  ASSERT_EQ(list->count(), 1U);
  ASSERT_TRUE(isa<XQueryLiteral>(list->objectAtIndex(0)));
  EXPECT_TRUE(isNull(evaluate(*list)));
}

TEST_F(Leaves, InsertingIntoAListOfOneLeavesTheElementInItTwice) {
  auto list = XQueryExprList::exprList();
  auto first = integer("1");
  auto second = integer("2");
  list->addObject(first);
  list->insertObject(second, 0);
  ASSERT_EQ(list->count(), 3U);
  EXPECT_EQ(list->objectAtIndex(0), second.get());
  EXPECT_EQ(list->objectAtIndex(1), first.get());
  EXPECT_EQ(list->objectAtIndex(2), second.get());
}

TEST_F(Leaves, InsertingIntoAnEmptyListDoesNothing) {
  auto list = XQueryExprList::exprList();
  list->insertObject(integer("1"), 0);
  EXPECT_EQ(list->count(), 0U);
}

TEST_F(Leaves, InsertingIntoALongerListInsertsOnce) {
  auto list = XQueryExprList::exprList();
  for (const char* digits : {"1", "2", "3"}) list->addObject(integer(digits));
  auto inserted = integer("9");
  list->insertObject(inserted, 1);
  ASSERT_EQ(list->count(), 4U);
  EXPECT_EQ(list->objectAtIndex(1), inserted.get());
}

TEST_F(Leaves, ListRemovesAndReplacesItsSingleElement) {
  auto list = XQueryExprList::exprList();
  list->addObject(integer("1"));
  auto other = integer("2");
  list->replaceObjectAtIndex(0, other);
  EXPECT_EQ(list->objectAtIndex(0), other.get());
  EXPECT_EQ(list->objectAtIndex(1), nullptr);
  list->removeObjectAtIndex(0);
  EXPECT_EQ(list->count(), 0U);
  list->addObject(integer("3"));
  list->removeLastObject();
  EXPECT_EQ(list->count(), 0U);
}

TEST_F(Leaves, ArgumentsKeepOneEntryEach) {
  auto pair = XQueryExprList::exprList();
  pair->addObject(integer("1"));
  pair->addObject(integer("2"));
  auto args = XQueryArgs::args();
  args->addObject(pair);
  args->addObject(emptyLiteral());
  args->addObject(integer("3"));
  const Value value = evaluate(*args);
  ASSERT_TRUE(isa<NSArray>(value));
  const auto& entries = cast<NSArray>(value)->objects();
  ASSERT_EQ(entries.size(), 3U);
  EXPECT_TRUE(isa<NSArray>(entries[0]));
  EXPECT_TRUE(isNull(entries[1]));
  EXPECT_EQ(printed(entries[2]), "3");
}

TEST_F(Leaves, LocalVariableAnswersItsSlotAsStored) {
  const auto qName = XQueryQName::qname(text("x"), nullptr);
  const int64_t id = prolog->newLocalVariableIDForQName(qName);
  auto variable = XQueryVariable::variableWithName(text("x"));
  variable->bindInfoForProlog(*prolog);
  EXPECT_EQ(variable->varID(), id);
  const Value array = NSArray::arrayWithObjects({text("a")});
  dynamic().setVariable(array, id);
  EXPECT_EQ(evaluate(*variable).get(), array.get());
}

TEST_F(Leaves, GlobalVariableIsFoundByName) {
  auto variable = XQueryVariable::variableWithName(text("g"));
  variable->bindInfoForProlog(*prolog);
  EXPECT_EQ(variable->varID(), 0);
  const Value value = text("v");
  dynamic().setGlobal(value, XQueryQName::qname(text("g"), nullptr));
  EXPECT_EQ(evaluate(*variable).get(), value.get());
}

TEST_F(Leaves, EmptyLocalSlotIsNeverLookedUpAmongTheGlobals) {
  const auto qName = XQueryQName::qname(text("x"), nullptr);
  prolog->newLocalVariableIDForQName(qName);
  auto variable = XQueryVariable::variableWithName(text("x"));
  variable->bindInfoForProlog(*prolog);
  variable->setExprLine(4);
  dynamic().setGlobal(text("global"), qName);
  const auto error = failure(*variable);
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 8);
  EXPECT_EQ(error->msg()->utf8(), "reference to undefined variable \"x\"");
  EXPECT_EQ(error->line(), 5);
}

TEST_F(Leaves, UndefinedVariableIsNamedAsWritten) {
  auto variable = XQueryVariable::variableWithName(text("nowhere:x"));
  variable->bindInfoForProlog(*prolog);
  const auto error = failure(*variable);
  ASSERT_TRUE(error);
  EXPECT_EQ(error->msg()->utf8(), "reference to undefined variable \"nowhere:x\"");
}

TEST_F(Leaves, PrefixedVariableIsTheGlobalOfItsExpandedName) {
  prolog->addPrefix(text("p"), text("urn:p"));
  auto variable = XQueryVariable::variableWithName(text("p:x"));
  variable->bindInfoForProlog(*prolog);
  dynamic().setGlobal(text("other"), XQueryQName::qname(text("x"), nullptr));
  EXPECT_TRUE(failure(*variable));
  const Value value = text("v");
  dynamic().setGlobal(value, XQueryQName::qname(text("x"), text("urn:p")));
  EXPECT_EQ(evaluate(*variable).get(), value.get());
}

TEST_F(Leaves, LineIsZeroUntilSet) {
  auto literal = integer("1");
  EXPECT_EQ(literal->exprLine(), 0);
  literal->setExprLine(3);
  EXPECT_EQ(literal->exprLine(), 3);
}

TEST_F(Leaves, ContextItemIsOneSharedExpression) {
  EXPECT_EQ(XQueryContextItem::contextItem(), XQueryContextItem::contextItem());
  EXPECT_FALSE(evaluate(*XQueryContextItem::contextItem()));
  const Value item = text("i");
  dynamic().setContextItem(item, 3);
  EXPECT_EQ(evaluate(*XQueryContextItem::contextItem()).get(), item.get());
}

TEST_F(Leaves, ResolvedQNameReferenceAnswersItsName) {
  const auto qName = XQueryQName::qname(text("p:a"), text("u"));
  const auto reference = XQueryQNameReference::qNameReferenceWithQName(qName, 2);
  EXPECT_EQ(evaluate(*reference).get(), qName.get());
  EXPECT_EQ(reference->exprLine(), 2);
}

TEST_F(Leaves, QNameReferenceResolvesInTheContextsNamespacesWithoutPrefix) {
  dynamic().addNamespace(text("urn:p"), text("p"));
  const Value value = evaluate(*XQueryQNameReference::qNameReferenceWithString(text("p:a"), 0));
  const auto* qName = dyn_cast<XQueryQName>(value);
  ASSERT_TRUE(qName);
  EXPECT_EQ(qName->namespaceURI()->utf8(), "urn:p");
  EXPECT_EQ(qName->localPart()->utf8(), "a");
  EXPECT_EQ(qName->XQueryStringValue()->utf8(), "a");
}

TEST_F(Leaves, QNameReferenceWithoutPrefixHasNoNamespace) {
  const Value value = evaluate(*XQueryQNameReference::qNameReferenceWithString(text("a"), 0));
  const auto* qName = dyn_cast<XQueryQName>(value);
  ASSERT_TRUE(qName);
  EXPECT_FALSE(qName->namespaceURI());
}

TEST_F(Leaves, QNameReferenceWithoutPrefixTakesTheContextsDefaultNamespace) {
  dynamic().addNamespace(text("urn:default"), NSString::empty());
  const Value value = evaluate(*XQueryQNameReference::qNameReferenceWithString(text("a"), 0));
  const auto* qName = dyn_cast<XQueryQName>(value);
  ASSERT_TRUE(qName);
  EXPECT_EQ(qName->namespaceURI()->utf8(), "urn:default");
}

TEST_F(Leaves, UnknownPrefixRaisesWithTheNameAndLine) {
  const auto error = failure(*XQueryQNameReference::qNameReferenceWithString(text("q:a"), 6));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->err(), 1);
  EXPECT_EQ(error->msg()->utf8(), "can't resolve QName for \"q:a\"");
  EXPECT_EQ(error->line(), 7);
}

TEST_F(Leaves, EmptyLocalPartRaises) {
  dynamic().addNamespace(text("urn:p"), text("p"));
  EXPECT_TRUE(failure(*XQueryQNameReference::qNameReferenceWithString(text("p:"), 0)));
}

}  // namespace
}  // namespace xquery
