#include "PathTesting.h"
#include "Types/XQueryErrors.h"
#include "Types/XQueryNumber.h"
#include "xquery/Number.h"

namespace xquery {
namespace {

class PredicatesTest : public PathTesting {
 protected:
  std::string kept(const Value& items, Predicates predicates, size_t fromIndex = 0) {
    const auto holder = filterStep(nullptr, std::move(predicates));
    const Value value = holder->handlePreicatesFromIndex(fromIndex, items, *context);
    if (XQueryHasFailed(value, *context)) _internal(*context).throwFailure();
    return shown(value);
  }
  // Predicates over nodes, through a step.
  std::string keptChildren(std::string_view childName, Predicates predicates) {
    return shownFrom(document->rootElement(), {child(childName, std::move(predicates))});
  }
  // The position of the focus, as a number.
  static Ref<XQueryExpr> position() {
    return probe([](XQueryContext& c) -> Value {
      return XQueryNumber::integerWithInt64(_internal(c).position());
    });
  }
  static Ref<XQueryExpr> last() {
    return probe([](XQueryContext& c) -> Value {
      return XQueryNumber::integerWithInt64(_internal(c).last());
    });
  }
  static Ref<XQueryExpr> isLast() {
    return probe([](XQueryContext& c) -> Value {
      return NSNumber::numberWithBool(_internal(c).position() == _internal(c).last());
    });
  }
  static Ref<XQueryExpr> whenItemIs(std::string_view id, Value then, Value otherwise) {
    return probe([=](XQueryContext& c) -> Value {
      return shown(_internal(c).contextItem()) == id ? then : otherwise;
    });
  }
  static Ref<XQueryExpr> listOf(Ref<XQueryExpr> element) {
    auto list = XQueryExprList::exprList();
    list->addObject(std::move(element));
    return list;
  }

  const Value yes = NSNumber::trueValue();
  const Value no = NSNumber::falseValue();
  Ref<NSXMLDocument> document = parsed("<r><a id='1'/><a id='2'/><a id='3'/><b id='4'/></r>");
  const Value x = text("x");
  const Value y = text("y");
  const Value z = text("z");
  const Value xyz = array({x, y, z});
};

TEST_F(PredicatesTest, ALiteralNumberSelectsByPosition) {
  EXPECT_EQ(kept(xyz, {integer("1")}), "x");
  EXPECT_EQ(kept(xyz, {integer("3")}), "z");
  EXPECT_EQ(keptChildren("a", {integer("2")}), "2");
}

TEST_F(PredicatesTest, PositionsOutsideTheSequenceSelectNothing) {
  for (const auto* digits : {"0", "4", "99999999999999999999999"}) {
    EXPECT_EQ(kept(xyz, {integer(digits)}), "()") << digits;
    EXPECT_EQ(keptChildren("a", {integer(digits)}), "()") << digits;
  }
}

TEST_F(PredicatesTest, AFractionIsCutOff) {
  const auto fraction = XQueryLiteral::decimalLiteralWithString(text("2.5"));
  EXPECT_EQ(kept(xyz, {fraction}), "y");
  EXPECT_EQ(keptChildren("a", {fraction}), "2");
  EXPECT_EQ(kept(xyz, {XQueryLiteral::doubleLiteralWithString(text("2.9e0"))}), "y");
  EXPECT_EQ(kept(xyz, {XQueryLiteral::decimalLiteralWithString(text("0.5"))}), "()");
}

TEST_F(PredicatesTest, ANegativeLiteralSelectsNothing) {
  const auto negative = XQueryLiteral::literalWithValue(XQueryNumber::integerWithInt64(-1));
  EXPECT_EQ(kept(xyz, {negative}), "()");
  EXPECT_EQ(kept(x, {negative}), "()");
  EXPECT_EQ(keptChildren("a", {negative}), "()");
}

TEST_F(PredicatesTest, ASingleItemIsAtPositionOne) {
  EXPECT_EQ(kept(x, {integer("1")}), "x");
  EXPECT_EQ(kept(x, {integer("2")}), "()");
  EXPECT_EQ(kept(NSNull::null(), {integer("1")}), "()");
}

TEST_F(PredicatesTest, AListOfOneLiteralIsThatLiteral) {
  EXPECT_EQ(kept(xyz, {listOf(integer("2"))}), "y");
  EXPECT_EQ(keptChildren("a", {listOf(integer("2"))}), "2");
}

TEST_F(PredicatesTest, ALiteralNumberLeavesTheFocusAlone) {
  focusOn(z, 5);
  _internal(*context).setLast(7);
  kept(xyz, {integer("2")});
  EXPECT_EQ(_internal(*context).contextItem(), z);
  EXPECT_EQ(_internal(*context).position(), 5);
  EXPECT_EQ(_internal(*context).last(), 7);
}

TEST_F(PredicatesTest, ALiteralStringIsEvaluatedForItsTruth) {
  EXPECT_EQ(kept(xyz, {string("true")}), "x y z");
  EXPECT_EQ(kept(xyz, {string("")}), "()");
}

TEST_F(PredicatesTest, AComputedNumberSelectsByPosition) {
  EXPECT_EQ(kept(xyz, {last()}), "z");
  EXPECT_EQ(kept(xyz, {position()}), "x y z");
  EXPECT_EQ(kept(xyz, {always(XQueryNumber::numberWithDouble(2.5))}), "y");
  EXPECT_EQ(kept(xyz, {always(XQueryNumber::integerWithInt64(-1))}), "()");
  EXPECT_EQ(kept(xyz, {always(XQueryNumber::integerWithInt64(0))}), "()");
  EXPECT_EQ(kept(xyz, {always(XQueryNumber::nan())}), "()");
  EXPECT_EQ(keptChildren("a", {last()}), "3");
}

TEST_F(PredicatesTest, AnythingElseSelectsByItsTruth) {
  EXPECT_EQ(kept(xyz, {always(yes)}), "x y z");
  EXPECT_EQ(kept(xyz, {always(no)}), "()");
  EXPECT_EQ(kept(xyz, {always(NSNull::null())}), "()");
  EXPECT_EQ(kept(xyz, {always(document)}), "x y z");
  EXPECT_EQ(kept(xyz, {isLast()}), "z");
  EXPECT_EQ(keptChildren("a", {isLast()}), "3");
}

TEST_F(PredicatesTest, AnOrderedDurationIsNoPosition) {
  EXPECT_EQ(kept(xyz, {always(XQueryNumber::yearMonthDurationWithMonths(2))}), "x y z");
}

TEST_F(PredicatesTest, LaterPredicatesCountWhatEarlierOnesKept) {
  EXPECT_EQ(kept(xyz, {whenItemIs("x", no, yes), integer("1")}), "y");
  EXPECT_EQ(kept(xyz, {integer("2"), integer("2")}), "()");
  EXPECT_EQ(kept(xyz, {integer("2"), last()}), "y");
  EXPECT_EQ(keptChildren("a", {whenItemIs("1", no, yes), isLast()}), "3");
  EXPECT_EQ(keptChildren("a", {integer("2"), isLast()}), "2");
}

TEST_F(PredicatesTest, FilteringBeginsAtTheGivenPredicate) {
  EXPECT_EQ(kept(xyz, {integer("1"), integer("2")}, 1), "y");
  EXPECT_EQ(kept(xyz, {integer("1")}, 1), "x y z");
  EXPECT_EQ(kept(xyz, {}, 7), "x y z");
}

TEST_F(PredicatesTest, AMissingPredicateEndsTheFiltering) {
  EXPECT_EQ(kept(xyz, {nullptr, integer("1")}), "x y z");
  EXPECT_EQ(keptChildren("a", {integer("2"), nullptr, integer("2")}), "2");
  EXPECT_EQ(keptChildren("a", {nullptr, integer("2")}), "1 2 3");
}

TEST_F(PredicatesTest, NullStaysNull) {
  EXPECT_EQ(kept(nullptr, {integer("1")}), "(none)");
}

TEST_F(PredicatesTest, WhatIsKeptIsNormalised) {
  EXPECT_EQ(kept(array({x}), {always(yes)}), "x");
  EXPECT_EQ(kept(array({}), {always(yes)}), "()");
  EXPECT_EQ(kept(array({x, NSNull::null()}), {always(yes)}), "x");
}

TEST_F(PredicatesTest, AnErrorDropsTheItemItAroseFor) {
  const auto failingForY = probe([this](XQueryContext& c) -> Value {
    if (_internal(c).contextItem() == y) {
      _internal(c).raise(XQueryError::error(6, "invalid type"));
    }
    return yes;
  });
  EXPECT_EQ(kept(xyz, {failingForY}), "x z");
  EXPECT_FALSE(_internal(*context).error());
  EXPECT_EQ(kept(xyz, {failing()}), "()");
  EXPECT_EQ(keptChildren("a", {failing()}), "()");
}

TEST_F(PredicatesTest, ADroppedItemKeepsItsPosition) {
  const auto failingForX = probe([this](XQueryContext& c) -> Value {
    if (_internal(c).contextItem() == x) {
      _internal(c).raise(XQueryError::error(6, "invalid type"));
    }
    return XQueryNumber::integerWithInt64(2);
  });
  EXPECT_EQ(kept(xyz, {failingForX}), "y");
}

TEST_F(PredicatesTest, AnEngineLimitIsNotSwallowed) {
  const auto late = probe(
      [](XQueryContext& c) -> Value { _internal(c).raise(XQueryErrors::deadlinePassed.error()); });
  EXPECT_EQ(errorOf([&] { kept(xyz, {late}); }), "0: limit: deadline passed");
}

TEST_F(PredicatesTest, WhatOnlyReadsLikeALimitIsSwallowed) {
  EXPECT_EQ(kept(xyz, {failing(0, "limit: deadline passed")}), "()");
  EXPECT_EQ(kept(xyz, {failing(0, "urn:e#x - limit: none")}), "()");
}

TEST_F(PredicatesTest, TheSizeIsSetOnceForAllItems) {
  // A predicate that leaves another size behind is seen by the items after it.
  const auto spoiling = probe([](XQueryContext& c) -> Value {
    const bool first = _internal(c).last() == 3;
    _internal(c).setLast(1);
    return NSNumber::numberWithBool(first);
  });
  EXPECT_EQ(kept(xyz, {spoiling}), "x");
}

TEST_F(PredicatesTest, TheFocusStaysAtTheLastItem) {
  kept(xyz, {always(yes)});
  EXPECT_EQ(_internal(*context).contextItem(), z);
  EXPECT_EQ(_internal(*context).position(), 3);
  EXPECT_EQ(_internal(*context).last(), 3);
}

TEST_F(PredicatesTest, ALiteralPositionEndsTheWalkButChangesNoAnswer) {
  for (int axis = 1; axis <= 12; ++axis) {
    for (const auto* digits : {"1", "2", "3", "9"}) {
      const Value item = byID(document.get(), "2");
      const auto short_ = shownFrom(item, {step(axis, anyNode(), {integer(digits)})});
      const auto number = XQueryNumber::integerWithInt64(*digits - '0');
      EXPECT_EQ(short_, shownFrom(item, {step(axis, anyNode(), {always(number)})}))
          << axis << " " << digits;
    }
  }
}

}  // namespace
}  // namespace xquery
