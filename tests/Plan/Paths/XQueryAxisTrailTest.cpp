#include "Expr/Paths/PathReference.h"
#include "Functions/FunctionsTesting.h"
#include "Plan/Paths/XQueryAxisTrail.h"

#include <set>

namespace xquery {
namespace {

// What complete walks from the items visit, each node where it came first.
NodeList firstVisits(const NodeList& items, int axis) {
  NodeList visited;
  std::set<NSXMLNode*> known;
  for (NSXMLNode* item : items) {
    for (NSXMLNode* node : plainAxis(item, axis)) {
      if (known.insert(node).second) visited.push_back(node);
    }
  }
  return visited;
}

NodeList trailVisits(const NodeList& items, int axis) {
  NodeList visited;
  XQueryAxisTrail trail;
  for (NSXMLNode* item : items) {
    trail.walk(item, axis, [&](NSXMLNode* node) {
      visited.push_back(node);
      return true;
    });
  }
  return visited;
}

NodeList withoutRepetition(const NodeList& nodes) {
  NodeList result;
  std::set<NSXMLNode*> known;
  for (NSXMLNode* node : nodes) {
    if (known.insert(node).second) result.push_back(node);
  }
  return result;
}

// Items in document order, in reverse order or in none.
NodeList someItems(PathGenerator& generate, const NodeList& nodes) {
  NodeList items;
  const int order = generate.below(3);
  const int sparseness = 1 + generate.below(5);
  for (NSXMLNode* node : nodes) {
    if (generate.oneIn(sparseness)) items.push_back(node);
  }
  if (order == 1) std::reverse(items.begin(), items.end());
  if (order == 2) {
    for (size_t i = 1; i < items.size(); ++i) {
      std::swap(items[i], items[static_cast<size_t>(generate.below(static_cast<int>(i + 1)))]);
    }
  }
  return items;
}

TEST(AxisTrail, VisitsWhatCompleteWalksVisitInTheirOrder) {
  for (unsigned seed = 0; seed < 1500; ++seed) {
    PathGenerator generate(seed);
    const auto document = generate.document();
    const auto other = generate.document();
    std::vector<Value> detached;
    if (generate.oneIn(3)) generate.change(document, detached);
    NodeList nodes = PathGenerator::allNodes(document.get());
    if (generate.oneIn(4)) {
      const NodeList more = PathGenerator::allNodes(other.get());
      nodes.insert(nodes.end(), more.begin(), more.end());
    }
    const NodeList items = someItems(generate, nodes);
    for (int axis = 1; axis <= 12; ++axis) {
      // Leaving something out is for speed; a node visited again is no mistake.
      ASSERT_EQ(shownList(withoutRepetition(trailVisits(items, axis))),
                shownList(firstVisits(items, axis)))
          << "axis " << axis << " seed " << seed;
    }
  }
}

TEST(AxisTrail, VisitsNoNodeTwiceForItemsInDocumentOrder) {
  for (unsigned seed = 0; seed < 300; ++seed) {
    PathGenerator generate(seed);
    const auto document = generate.document();
    NodeList items;
    for (NSXMLNode* node : PathGenerator::allNodes(document.get())) {
      if (generate.oneIn(2)) items.push_back(node);
    }
    for (int axis = 1; axis <= 12; ++axis) {
      const NodeList visited = trailVisits(items, axis);
      ASSERT_EQ(shownList(visited), shownList(firstVisits(items, axis)))
          << "axis " << axis << " seed " << seed;
    }
  }
}

TEST(AxisTrail, AnItemGivenAgainVisitsNothing) {
  const auto document = parsed("<r><a/><b><c/></b><d/></r>");
  NSXMLNode* b = document->rootElement()->firstChild()->nextSibling();
  for (const int axis : {2, 3, 6, 7, 8, 9, 10, 11, 12}) {
    EXPECT_EQ(trailVisits({b, b}, axis), trailVisits({b}, axis)) << axis;
  }
}

// The first item is the last child of a last child and walks to the end of its tree; then the
// predicate of the second one puts the tree into a larger one.
TEST(AxisTrail, WhatAPredicateConstructsIsVisited) {
  const std::string path =
      "let $e := <e><a n='1'><y n='2'><c/></y></a></e> return count(($e/a, $e/a/y)"
      "/self::*[count(if (@n = 2) then <q><z><w>{$e}</w></z><d><c/></d></q> else 1) = 1]";
  for (const char* axis : {"descendant", "descendant-or-self", "following", "ancestor"}) {
    const std::string end = std::string("/") + axis + "::*";
    // Without a trail, since a position may be asked for.
    EXPECT_EQ(functiontest::answer(path + end + ")"),
              functiontest::answer(path + end + "[position() > 0])"))
        << axis;
  }
}

}  // namespace
}  // namespace xquery
