#include "Expr/Paths/XQueryPath.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/XQuerySequence.h"
#include "PathTesting.h"
#include "xquery/Number.h"

namespace xquery {
namespace {

constexpr std::string_view sample =
    "<r id='r'>"
    "<a id='a1'><b id='b1'/><b id='b2' x='1' y='2'>t</b></a>"
    "<a id='a2'><c id='c1'><d id='d1'/></c></a>"
    "<!--k--><?p q?>"
    "<e id='e1'><f id='f1'/><f id='f2'><g id='g1'/></f></e>"
    "</r>";

class Path : public PathTesting {
 protected:
  Value at(std::string_view id) { return byID(document.get(), id); }
  Value attribute(std::string_view id, std::string_view attributeName) {
    return cast<NSXMLElement>(byID(document.get(), id))
        ->attributeForName(NSStringView::ascii(attributeName));
  }
  // The nodes on the axis in the order in which the walk finds them.
  std::string walked(const Value& item, int axis) {
    _internal(*context).setOrdered(false);
    return shownFrom(item, {step(axis, anyNode())});
  }

  Ref<NSXMLDocument> document = parsed(sample);
};

// --- axes ----------------------------------------------------------------------------------------

TEST_F(Path, ChildAxisGivesTheChildrenInOrder) {
  EXPECT_EQ(walked(at("r"), XQueryAxisChild), "a1 a2 comment(k) pi(p) e1");
  EXPECT_EQ(walked(document, XQueryAxisChild), "r");
  EXPECT_EQ(walked(at("b1"), XQueryAxisChild), "()");
}

TEST_F(Path, ChildAxisNeverSeesAttributes) {
  EXPECT_EQ(walked(at("b2"), XQueryAxisChild), "text(t)");
  EXPECT_EQ(shownFrom(at("b2"), {step(XQueryAxisChild, anyName())}), "()");
}

TEST_F(Path, DescendantAxisEndsAtTheNextSibling) {
  EXPECT_EQ(walked(at("a1"), XQueryAxisDescendant), "b1 b2 text(t)");
}

TEST_F(Path, DescendantAxisOfALastChildEndsAtTheParentsNextSibling) {
  EXPECT_EQ(walked(at("b2"), XQueryAxisDescendant), "text(t)");
  EXPECT_EQ(walked(at("c1"), XQueryAxisDescendant), "d1");
}

TEST_F(Path, DescendantAxisOfALastChildOfALastChildRunsToTheEndOfTheDocument) {
  // d1 has no next sibling and neither has its parent c1.
  EXPECT_EQ(walked(at("d1"), XQueryAxisDescendant), "comment(k) pi(p) e1 f1 f2 g1");
  EXPECT_EQ(walked(at("d1"), XQueryAxisDescendantOrSelf), "d1 comment(k) pi(p) e1 f1 f2 g1");
}

TEST_F(Path, DescendantAxisOfTheRootGivesTheWholeTree) {
  EXPECT_EQ(walked(document, XQueryAxisDescendant),
            "r a1 b1 b2 text(t) a2 c1 d1 comment(k) pi(p) e1 f1 f2 g1");
  EXPECT_EQ(walked(at("e1"), XQueryAxisDescendant), "f1 f2 g1");
}

TEST_F(Path, DescendantOrSelfAxisBeginsWithTheNode) {
  EXPECT_EQ(walked(at("a1"), XQueryAxisDescendantOrSelf), "a1 b1 b2 text(t)");
}

TEST_F(Path, DescendantAxisOfAnAttributeIsEmpty) {
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisDescendant), "()");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisDescendantOrSelf), "@x");
}

TEST_F(Path, AttributeAxisGivesTheAttributesOfAnElement) {
  EXPECT_EQ(walked(at("b2"), XQueryAxisAttribute), "@id @x @y");
  EXPECT_EQ(walked(document, XQueryAxisAttribute), "()");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisAttribute), "()");
}

TEST_F(Path, AttributeAxisLeavesNamespacesOut) {
  const auto declaring = parsed("<p:a xmlns:p='urn:p' id='a' p:x='1'/>");
  EXPECT_EQ(walked(declaring->rootElement(), XQueryAxisAttribute), "@id @p:x");
}

TEST_F(Path, SelfAxisGivesTheNode) {
  EXPECT_EQ(walked(at("b2"), XQueryAxisSelf), "b2");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisSelf), "@x");
}

TEST_F(Path, FollowingSiblingAxisGivesTheLaterSiblings) {
  EXPECT_EQ(walked(at("a1"), XQueryAxisFollowingSibling), "a2 comment(k) pi(p) e1");
  EXPECT_EQ(walked(at("e1"), XQueryAxisFollowingSibling), "()");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisFollowingSibling), "()");
}

TEST_F(Path, FollowingAxisBeginsWithTheNextSiblingOfTheNodeOrAnAncestor) {
  EXPECT_EQ(walked(at("b1"), XQueryAxisFollowing),
            "b2 text(t) a2 c1 d1 comment(k) pi(p) e1 f1 f2 g1");
  EXPECT_EQ(walked(at("d1"), XQueryAxisFollowing), "comment(k) pi(p) e1 f1 f2 g1");
  EXPECT_EQ(walked(at("g1"), XQueryAxisFollowing), "()");
}

TEST_F(Path, FollowingAxisOfAnAttributeBeginsAfterItsElement) {
  EXPECT_EQ(walked(attribute("b1", "id"), XQueryAxisFollowing),
            "b2 text(t) a2 c1 d1 comment(k) pi(p) e1 f1 f2 g1");
}

TEST_F(Path, AncestorAxisGoesUpToTheRoot) {
  EXPECT_EQ(walked(at("d1"), XQueryAxisAncestor), "c1 a2 r doc");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisAncestor), "b2 a1 r doc");
  EXPECT_EQ(walked(document, XQueryAxisAncestor), "()");
}

TEST_F(Path, ParentAxisGivesTheParent) {
  EXPECT_EQ(walked(at("d1"), XQueryAxisParent), "c1");
  EXPECT_EQ(walked(attribute("b2", "x"), XQueryAxisParent), "b2");
  EXPECT_EQ(walked(document, XQueryAxisParent), "()");
}

TEST_F(Path, PrecedingAxisLeavesAncestorsOutAndRunsInDocumentOrder) {
  EXPECT_EQ(walked(at("d1"), XQueryAxisPreceding), "a1 b1 b2 text(t)");
  EXPECT_EQ(walked(at("f2"), XQueryAxisPreceding), "a1 b1 b2 text(t) a2 c1 d1 comment(k) pi(p) f1");
  EXPECT_EQ(walked(document, XQueryAxisPreceding), "()");
  EXPECT_EQ(walked(at("r"), XQueryAxisPreceding), "()");
}

TEST_F(Path, PrecedingAxisOfAnAttributeEndsAtItsElement) {
  EXPECT_EQ(walked(attribute("a2", "id"), XQueryAxisPreceding), "a1 b1 b2 text(t)");
  EXPECT_EQ(walked(attribute("b1", "id"), XQueryAxisPreceding), "()");
}

TEST_F(Path, PrecedingSiblingAxisGoesNearestFirst) {
  EXPECT_EQ(walked(at("e1"), XQueryAxisPrecedingSibling), "pi(p) comment(k) a2 a1");
  EXPECT_EQ(walked(at("a1"), XQueryAxisPrecedingSibling), "()");
}

TEST_F(Path, AncestorOrSelfAxisBeginsWithTheNode) {
  EXPECT_EQ(walked(at("d1"), XQueryAxisAncestorOrSelf), "d1 c1 a2 r doc");
}

TEST_F(Path, AxisCodesOutsideTheTableWalkNothing) {
  for (const int axis : {0, -1, 13, 100}) EXPECT_EQ(walked(at("a1"), axis), "()") << axis;
}

TEST_F(Path, ANodeWithoutParentHasNoSiblingsAndNoParent) {
  const Value lone = NSXMLElement::elementWithName(NSStringView::ascii("lone"));
  for (int axis = XQueryAxisFollowingSibling; axis < XQueryAxisAncestorOrSelf; ++axis) {
    EXPECT_EQ(walked(lone, axis), "()") << axis;
  }
}

// --- direction of the results --------------------------------------------------------------------

TEST_F(Path, ExactlyTheAxesFromAncestorOnAreReverse) {
  for (int axis = 1; axis <= 12; ++axis) {
    const auto last = XQueryAxisStep::axisStepWithAxis(axis, anyNode());
    EXPECT_EQ(last->isReverse(), axis >= 8) << axis;
    XQueryPathResults results;
    last->processItems(at("a2"), results, *context, true);
    EXPECT_EQ(results.isReversed(), axis >= 8) << axis;
  }
}

TEST_F(Path, OnlyALastStepWithoutPredicatesReversesTheResults) {
  EXPECT_EQ(shownFrom(at("d1"), {step(XQueryAxisAncestor, anyName())}), "c1 a2 r");
  EXPECT_EQ(shownFrom(at("d1"), {step(XQueryAxisAncestor, anyName(), {always(text("x"))})}),
            "r a2 c1");
  EXPECT_EQ(
      shownFrom(at("d1"), {step(XQueryAxisAncestor, anyName()), step(XQueryAxisSelf, anyName())}),
      "r a2 c1");
}

TEST_F(Path, PrecedingAsTheLastStepGivesTheNearestFirst) {
  EXPECT_EQ(shownFrom(at("d1"), {step(XQueryAxisPreceding, anyName())}), "b2 b1 a1");
}

// --- chains --------------------------------------------------------------------------------------

TEST_F(Path, SetLastAppendsAtTheEndOfTheChain) {
  const auto first = child("a");
  const auto second = child("b");
  const auto third = child("c");
  first->setLast(second);
  first->setLast(third);
  EXPECT_EQ(first->next(), second.get());
  EXPECT_EQ(second->next(), third.get());
  EXPECT_EQ(third->next(), nullptr);
}

TEST_F(Path, SetLastAppendsBehindAnAppendedChain) {
  const auto first = child("a");
  const auto second = child("b");
  second->setLast(child("c"));
  first->setLast(second);
  first->setLast(child("d"));
  EXPECT_EQ(cast<XQueryNameTest>(first->next()->next()->next()->expr())->name()->utf8(), "d");
}

TEST_F(Path, SetNextReplacesTheRestOfTheChain) {
  const auto first = child("a");
  first->setLast(child("b"));
  const auto other = child("c");
  first->setNext(other);
  first->setLast(child("d"));
  EXPECT_EQ(first->next(), other.get());
  EXPECT_TRUE(other->next());
}

TEST_F(Path, SetLastSeesWhatSetNextReplacedInTheMiddle) {
  const auto first = child("a");
  const auto second = child("b");
  first->setLast(second);
  first->setLast(child("c"));
  const auto other = child("d");
  second->setNext(other);
  const auto last = child("e");
  first->setLast(last);
  EXPECT_EQ(second->next(), other.get());
  EXPECT_EQ(other->next(), last.get());
}

TEST_F(Path, StepsAndPredicatesAreBoundInOrder) {
  std::string order;
  const auto noting = [&](char letter) {
    return probe([](XQueryContext&) -> Value { return NSNull::null(); },
                 [&order, letter](XQueryProlog&) { order += letter; });
  };
  path({filterStep(noting('a'), {noting('b'), noting('c')}), filterStep(noting('d'))})
      ->bindInfoForProlog(*prolog);
  EXPECT_EQ(order, "abcd");
}

TEST_F(Path, BindingStopsAtAMissingPredicate) {
  int bound = 0;
  const auto counting = probe([](XQueryContext&) -> Value { return NSNull::null(); },
                              [&](XQueryProlog&) { ++bound; });
  step(XQueryAxisChild, anyNode(), {counting, nullptr, counting})->bindInfoForProlog(*prolog);
  EXPECT_EQ(bound, 1);
}

TEST_F(Path, BindingAnAttributeStepMarksItsNameTest) {
  const auto attributeTest = XQueryNameTest::nameTest(text("x"));
  const auto elementTest = XQueryNameTest::nameTest(text("x"));
  step(XQueryAxisAttribute, attributeTest)->bindInfoForProlog(*prolog);
  step(XQueryAxisChild, elementTest)->bindInfoForProlog(*prolog);
  EXPECT_TRUE(attributeTest->attribute());
  EXPECT_FALSE(elementTest->attribute());
}

// --- whole paths ---------------------------------------------------------------------------------

TEST_F(Path, RootStepGivesTheDocument) {
  EXPECT_EQ(shownFrom(at("d1"), {rootStep()}), "doc");
  EXPECT_EQ(shownFrom(attribute("b2", "x"), {rootStep(), child("r")}), "r");
}

TEST_F(Path, RootStepNeedsANode) {
  EXPECT_EQ(errorOf([&] { evaluateFrom(text("atom"), {rootStep()}); }),
            "20: context item not a node");
  EXPECT_EQ(errorOf([&] { evaluateFrom(nullptr, {rootStep()}); }), "20: context item not a node");
}

TEST_F(Path, RootStepNeedsADocumentAtTheTop) {
  const Value lone = NSXMLElement::elementWithName(NSStringView::ascii("lone"));
  EXPECT_EQ(errorOf([&] { evaluateFrom(lone, {rootStep()}); }), "6: invalid type");
}

TEST_F(Path, DoubleSlashFindsAtAnyDepth) {
  EXPECT_EQ(shownFrom(at("d1"), {rootStep(), anyDepth(), child("b")}), "b1 b2");
  EXPECT_EQ(shownFrom(document, {rootStep(), anyDepth(), step(XQueryAxisChild, anyName())}),
            "r a1 b1 b2 a2 c1 d1 pi(p) e1 f1 f2 g1");
  EXPECT_EQ(shownFrom(document, {rootStep(), anyDepth(), step(XQueryAxisAttribute, name("x"))}),
            "@x");
}

TEST_F(Path, DoubleSlashOnAnAtomicValueRaises) {
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(text("atom"), {rootStep(), anyDepth(), child("x")});
            }),
            "20: context item not a node");
}

TEST_F(Path, SiblingsYieldTheirParentOnce) {
  EXPECT_EQ(
      shownFrom(document, {rootStep(), anyDepth(), child("f"), step(XQueryAxisParent, anyNode())}),
      "e1");
}

TEST_F(Path, UnorderedResultsKeepTheOrderOfTheWalkWithoutDuplicates) {
  const Steps everyChild = {rootStep(), anyDepth(), step(XQueryAxisChild, anyName())};
  _internal(*context).setOrdered(false);
  EXPECT_EQ(shownFrom(document, everyChild), "r a1 a2 pi(p) e1 b1 b2 c1 d1 f1 f2 g1");
  const Steps ancestors = {rootStep(), anyDepth(), child("f"),
                           step(XQueryAxisAncestorOrSelf, anyName())};
  EXPECT_EQ(shownFrom(document, ancestors), "f1 e1 r f2");
}

TEST_F(Path, ANumberInAForwardAndAReverseStepCountsAlongTheAxis) {
  EXPECT_EQ(shownFrom(at("r"), {step(XQueryAxisChild, anyName(), {integer("1")})}), "a1");
  EXPECT_EQ(shownFrom(at("d1"), {step(XQueryAxisAncestor, anyName(), {integer("1")})}), "c1");
  EXPECT_EQ(shownFrom(at("d1"), {step(XQueryAxisPreceding, anyName(), {integer("1")})}), "b2");
  EXPECT_EQ(shownFrom(at("e1"), {step(XQueryAxisPrecedingSibling, anyName(), {integer("2")})}),
            "a2");
}

TEST_F(Path, PredicatesCountPerContextItem) {
  EXPECT_EQ(shownFrom(document,
                      {rootStep(), anyDepth(), step(XQueryAxisChild, anyName(), {integer("1")})}),
            "r a1 b1 c1 d1 f1 g1");
}

TEST_F(Path, WithoutAContextItemARelativePathIsEmpty) {
  EXPECT_EQ(shownFrom(nullptr, {child("a")}), "()");
}

TEST_F(Path, TheEmptySequenceIsNotWalked) {
  EXPECT_EQ(shownFrom(document, {filterStep(always(NSNull::null())), child("a")}), "()");
  EXPECT_EQ(shownFrom(document, {filterStep(nullptr), child("a")}), "()");
  EXPECT_EQ(shownFrom(document, {filterStep(nullptr)}), "()");
}

TEST_F(Path, ALoneFirstStepIsHandedOutAsItIs) {
  const Value items = array({document, document});
  EXPECT_EQ(evaluateFrom(document, {filterStep(always(items))}).get(), items.get());
}

TEST_F(Path, AFirstStepThatYieldsAnAtomicValueStopsTheAxisStepAfterIt) {
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(document, {filterStep(integer("1")), child("a")});
            }),
            "20: context item not a node");
}

// --- filter steps --------------------------------------------------------------------------------

TEST_F(Path, AFilterStepSeesEachItemWithItsPositionAndTheSize) {
  std::string seen;
  const auto noting = probe([&](XQueryContext& c) -> Value {
    auto& focus = _internal(c);
    seen += shown(focus.contextItem()) + ":" + std::to_string(focus.position()) + "/" +
            std::to_string(focus.last()) + " ";
    return NSNull::null();
  });
  const Value items = array({at("a1"), at("a2"), text("s")});
  evaluateFrom(document, {filterStep(always(items)), filterStep(noting)});
  EXPECT_EQ(seen, "a1:1/3 a2:2/3 s:3/3 ");
  seen.clear();
  // A step without predicates hands its nodes on one by one, one with predicates as a list.
  evaluateFrom(at("r"), {child("a"), filterStep(noting)});
  EXPECT_EQ(seen, "a1:1/1 a2:1/1 ");
  seen.clear();
  evaluateFrom(at("r"), {child("a", {always(text("x"))}), filterStep(noting)});
  EXPECT_EQ(seen, "a1:1/2 a2:2/2 ");
}

TEST_F(Path, AFilterStepAtTheEndMayGiveAtomicValues) {
  const auto freshValue =
      probe([](XQueryContext& c) -> Value { return text(shown(_internal(c).contextItem())); });
  EXPECT_EQ(shownFrom(at("r"), {child("a"), filterStep(freshValue)}), "a1 a2");
}

TEST_F(Path, TheSameLiteralForEveryContextNodeCountsOnce) {
  EXPECT_EQ(shownFrom(at("r"), {child("a"), filterStep(integer("7"))}), "7");
}

TEST_F(Path, AFilterStepThatYieldsANonNodeStopsTheStepAfterIt) {
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(at("r"), {child("a"), filterStep(integer("7")), child("b")});
            }),
            "19: item not a node");
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(document,
                           {filterStep(integer("1")), filterStep(always(document)), child("b")});
            }),
            "19: item not a node");
}

TEST_F(Path, NothingIsWalkedFromAFilterStepThatYieldsANonNode) {
  int visits = 0;
  const auto counting = filterStep(probe([&](XQueryContext&) -> Value {
    ++visits;
    return NSNull::null();
  }));
  const Value mixed = array({at("a1"), text("s")});
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(at("r"), {child("a"), filterStep(always(mixed)), counting});
            }),
            "19: item not a node");
  EXPECT_EQ(visits, 0);
}

TEST_F(Path, AFilterStepAppliesItsPredicatesPerItem) {
  const Value items = array({at("b1"), at("b2"), at("c1")});
  EXPECT_EQ(shownFrom(at("r"), {child("a"), filterStep(always(items), {integer("2")})}), "b2");
  EXPECT_EQ(shownFrom(at("r"), {filterStep(always(items), {integer("3")}), child("d")}), "d1");
}

TEST_F(Path, NodesAndAtomicValuesDoNotMixInAResult) {
  int calls = 0;
  const auto alternating = filterStep(probe(
      [&](XQueryContext&) -> Value { return ++calls == 1 ? Value(document) : Value(text("v")); }));
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(at("r"), {child("a"), alternating});
            }),
            "19: item not a node");
}

// --- the focus -----------------------------------------------------------------------------------

TEST_F(Path, TheFocusIsRestoredAtTheEnd) {
  focusOn(document, 3);
  _internal(*context).setLast(9);
  EXPECT_EQ(shown(evaluate({rootStep(), anyDepth(), child("b", {always(text("x"))}),
                            filterStep(XQueryContextItem::contextItem())})),
            "b1 b2");
  EXPECT_EQ(shown(_internal(*context).contextItem()), "doc");
  EXPECT_EQ(_internal(*context).position(), 3);
  EXPECT_EQ(_internal(*context).last(), 9);
}

TEST_F(Path, AnErrorLeavesTheFocusAsItWasWhenItWasRaised) {
  _internal(*context).setLast(9);
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(at("r"), {child("a"), filterStep(failing())});
            }),
            "6: invalid type");
  EXPECT_EQ(shown(_internal(*context).contextItem()), "a1");
  EXPECT_EQ(_internal(*context).position(), 1);
  EXPECT_EQ(_internal(*context).last(), 1);
}

TEST_F(Path, AnItemThatIsNoNodeLeavesTheFocusOfTheStepsBeforeIt) {
  const Value mixed = array({at("r"), text("s")});
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(document, {filterStep(always(mixed)), child("a"), child("b")});
            }),
            "20: context item not a node");
  EXPECT_EQ(shown(_internal(*context).contextItem()), "a2");
  EXPECT_EQ(_internal(*context).position(), 0);
}

TEST_F(Path, ANameThatDoesNotResolveLeavesTheContextItemOfItsStep) {
  EXPECT_EQ(errorOf([&] {
              evaluateFrom(document, {rootStep(), child("r"), child("no:b")});
            }),
            "1: can't resolve QName for \"no:b\"");
  EXPECT_EQ(shown(_internal(*context).contextItem()), "r");
  EXPECT_EQ(_internal(*context).position(), 0);
}

// --- depth ---------------------------------------------------------------------------------------

TEST_F(Path, AChainOfAThousandStepsIsWalked) {
  Steps steps;
  for (int i = 0; i < 1000; ++i) steps.push_back(step(XQueryAxisSelf, anyNode()));
  EXPECT_EQ(shownFrom(at("a1"), steps), "a1");
}

TEST_F(Path, AChainTooLongForTheStackIsAnError) {
  Steps steps;
  for (int i = 0; i < 1000000; ++i) steps.push_back(step(XQueryAxisSelf, anyNode()));
  EXPECT_EQ(errorOf([&] { evaluateFrom(at("a1"), steps); }),
            "0: limit: expression nested too deeply");
}

TEST_F(Path, ADocumentNestedAMillionDeepIsWalked) {
  constexpr int depth = 1000000;
  std::string xml;
  for (int i = 0; i < depth; ++i) xml += "<a>";
  for (int i = 0; i < depth; ++i) xml += "</a>";
  const auto deep = parsed(xml);
  const Value all = evaluateFrom(deep, {rootStep(), anyDepth(), child("a")});
  EXPECT_EQ(cast<NSArray>(all)->count(), static_cast<size_t>(depth));
  const Value innermost = cast<NSArray>(all)->objects().back();
  const Value ancestors = evaluateFrom(innermost, {step(XQueryAxisAncestor, anyNode())});
  EXPECT_EQ(cast<NSArray>(ancestors)->count(), static_cast<size_t>(depth));
}

}  // namespace
}  // namespace xquery
