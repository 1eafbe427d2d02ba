#include "Expr/Paths/XQueryPathResults.h"
#include "PathTesting.h"
#include "Types/XQueryNumber.h"

namespace xquery {
namespace {

class PathResults : public PathTesting {
 protected:
  NSXMLNode* at(std::string_view id) { return byID(document.get(), id); }
  void add(const Value& value) { results.add(value.get(), *context); }
  void addNodes(std::initializer_list<std::string_view> ids) {
    for (const auto id : ids) results.addNode(at(id), *context);
  }
  std::string ordered() { return shown(results.value(true)); }
  std::string unordered() { return shown(results.value(false)); }

  Ref<NSXMLDocument> document =
      parsed("<r id='r'><a id='a' x='1'><b id='b'/></a><c id='c'><d id='d'/></c></r>");
  XQueryPathResults results;
};

TEST_F(PathResults, NothingAddedGivesTheEmptySequence) {
  EXPECT_EQ(ordered(), "()");
  add(nullptr);
  add(NSNull::null());
  add(array({}));
  EXPECT_EQ(ordered(), "()");
}

TEST_F(PathResults, OneItemIsTheItemItself) {
  add(array({at("a")}));
  EXPECT_EQ(results.value(true).get(), at("a"));
  add(Value(at("a")));
  EXPECT_EQ(results.value(true).get(), at("a"));
}

TEST_F(PathResults, ItemsOfAnArrayAreAddedInOrderUpToAMissingOne) {
  add(array({at("c"), at("a"), nullptr, at("b")}));
  EXPECT_EQ(unordered(), "c a");
}

TEST_F(PathResults, ANodeAddedAgainStaysOnce) {
  addNodes({"a", "b", "b", "a", "c", "a", "c", "c"});
  EXPECT_EQ(unordered(), "a b c");
  EXPECT_EQ(ordered(), "a b c");
}

TEST_F(PathResults, AscendingNodesAreKeptAsTheyCome) {
  addNodes({"r", "a", "b", "c", "d"});
  EXPECT_EQ(unordered(), "r a b c d");
  EXPECT_EQ(ordered(), "r a b c d");
  results.setIsReversed(true);
  EXPECT_EQ(ordered(), "d c b a r");
}

TEST_F(PathResults, DescendingNodesAreSortedForward) {
  addNodes({"d", "c", "b", "b", "a"});
  EXPECT_EQ(unordered(), "d c b a");
  EXPECT_EQ(ordered(), "a b c d");
}

TEST_F(PathResults, AfterAReverseAxisTheNearestComesFirst) {
  results.setIsReversed(true);
  addNodes({"d", "c", "r"});
  EXPECT_EQ(ordered(), "d c r");
}

TEST_F(PathResults, MixedNodesAreSortedEitherWay) {
  addNodes({"c", "a", "d", "r", "b", "a", "d"});
  EXPECT_EQ(unordered(), "c a d r b");
  EXPECT_EQ(ordered(), "r a b c d");
  results.setIsReversed(true);
  EXPECT_EQ(ordered(), "d c b a r");
}

TEST_F(PathResults, ADuplicateAfterABreakOfTheOrderIsFound) {
  addNodes({"a", "b", "c", "b", "d", "a", "r", "r"});
  EXPECT_EQ(unordered(), "a b c d r");
}

TEST_F(PathResults, MoreNodesMayComeAfterAValueWasTaken) {
  addNodes({"d", "c"});
  EXPECT_EQ(ordered(), "c d");
  addNodes({"d", "a", "c"});
  EXPECT_EQ(ordered(), "a c d");
}

TEST_F(PathResults, AttributesComeBetweenTheirElementAndItsChildren) {
  auto* attribute = cast<NSXMLElement>(at("a"))->attributeForName(NSStringView::ascii("x"));
  results.addNode(at("b"), *context);
  results.addNode(attribute, *context);
  results.addNode(at("a"), *context);
  EXPECT_EQ(ordered(), "a @x b");
}

TEST_F(PathResults, IdentityIsThatOfTheObject) {
  const auto other = parsed("<a id='a'/>");
  addNodes({"a"});
  results.addNode(other->rootElement(), *context);
  EXPECT_EQ(cast<NSArray>(results.value(false))->count(), 2U);
}

TEST_F(PathResults, NodesOfSeveralTreesAreEachKeptOnce) {
  const auto other = parsed("<r><a id='x'/><b id='y'/></r>");
  addNodes({"a"});
  results.addNode(byID(other.get(), "y"), *context);
  addNodes({"a", "b"});
  results.addNode(byID(other.get(), "x"), *context);
  results.addNode(byID(other.get(), "y"), *context);
  EXPECT_EQ(unordered(), "a y b x");
}

TEST_F(PathResults, AtomicValuesKeepTheOrderOfArrivalAndTheirIdentity) {
  const Value one = XQueryNumber::integerWithInt64(1);
  const Value two = XQueryNumber::integerWithInt64(2);
  const Value anotherOne = XQueryNumber::integerWithInt64(1);
  add(array({two, one, two, anotherOne, one}));
  EXPECT_EQ(ordered(), "2 1 1");
}

TEST_F(PathResults, AnAtomicValueAfterANodeIsAnError) {
  addNodes({"a"});
  EXPECT_EQ(errorOf([&] { add(text("s")); }), "19: item not a node");
}

TEST_F(PathResults, ANodeAfterAnAtomicValueIsAnError) {
  add(text("s"));
  EXPECT_EQ(errorOf([&] { add(Value(at("a"))); }), "19: item not an atomic typ");
  EXPECT_EQ(ordered(), "s");
}

TEST_F(PathResults, WhatIsNeitherANodeNorAtomicIsAnError) {
  const Value record = XQueryError::error(6, "some error");
  EXPECT_EQ(errorOf([&] { add(record); }), "19: item not a node or atomic type");
  addNodes({"a"});
  EXPECT_EQ(errorOf([&] { add(record); }), "19: item not a node or atomic type");
  EXPECT_EQ(errorOf([&] {
              add(array({NSNull::null(), NSNull::null()}));
            }),
            "19: item not a node or atomic type");
}

}  // namespace
}  // namespace xquery
