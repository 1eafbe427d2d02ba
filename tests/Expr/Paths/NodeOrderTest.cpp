#include "Expr/Paths/NodeOrder.h"
#include "PathTesting.h"
#include "xquery/Number.h"

#include <algorithm>

namespace xquery {
namespace {

class NodeOrder : public testing::Test {
 protected:
  NSXMLNode* at(std::string_view id) { return byID(document.get(), id); }
  NSXMLNode* attribute(std::string_view id, std::string_view name) {
    return cast<NSXMLElement>(at(id))->attributeForName(NSStringView::ascii(name));
  }
  static std::string shownAll(const std::vector<Value>& nodes) { return shown(array(nodes)); }

  Ref<NSXMLDocument> document = parsed(
      "<r id='r' xmlns:n='urn:n'><a id='a' x='1' y='2'><b id='b'/><b id='c'/></a>"
      "<d id='d'><e id='e'/></d></r>");
  Ref<NSXMLDocument> other = parsed("<r id='s'><a id='t'/></r>");
};

// Both ways of deciding, and both truth values.
void expectOrder(const NSXMLNode* a, const NSXMLNode* b, bool before, bool after) {
  const std::string nodes = shown(a) + " and " + shown(b);
  EXPECT_EQ(XQueryNodeBefore(a, b), before) << nodes;
  EXPECT_EQ(XQueryNodeAfter(a, b), after) << nodes;
  EXPECT_EQ(XQueryNodeBeforeByClimbing(a, b), before) << nodes;
  EXPECT_EQ(XQueryNodeAfterByClimbing(a, b), after) << nodes;
  EXPECT_EQ(op_node_before(a, b).get(), NSNumber::numberWithBool(before).get()) << nodes;
  EXPECT_EQ(op_node_after(a, b).get(), NSNumber::numberWithBool(after).get()) << nodes;
  const int forward = a == b ? 0 : before ? -1 : 1;
  const int reverse = a == b ? 0 : after ? -1 : 1;
  EXPECT_EQ(NodeDocOrderCompareForward(a, b), forward) << nodes;
  EXPECT_EQ(NodeDocOrderCompareReverse(a, b), reverse) << nodes;
}

TEST_F(NodeOrder, ANodeIsNeitherBeforeNorAfterItself) {
  expectOrder(at("b"), at("b"), false, false);
  expectOrder(document.get(), document.get(), false, false);
}

TEST_F(NodeOrder, SiblingsAreOrderedByTheirIndex) {
  expectOrder(at("b"), at("c"), true, false);
  expectOrder(at("d"), at("a"), false, true);
}

TEST_F(NodeOrder, AnAncestorIsBeforeItsDescendants) {
  expectOrder(document.get(), at("e"), true, false);
  expectOrder(at("r"), at("c"), true, false);
  expectOrder(at("a"), at("b"), true, false);
  expectOrder(at("e"), at("r"), false, true);
  expectOrder(at("b"), at("a"), false, true);
}

TEST_F(NodeOrder, NodesOfDifferentBranchesAreOrderedByTheirBranches) {
  expectOrder(at("c"), at("d"), true, false);
  expectOrder(at("c"), at("e"), true, false);
  expectOrder(at("d"), at("b"), false, true);
  expectOrder(at("e"), at("b"), false, true);
}

TEST_F(NodeOrder, NamespacesComeBeforeAttributesAndThoseBeforeChildren) {
  const NSXMLNode* ns = cast<NSXMLElement>(at("r"))->firstNamespace();
  expectOrder(at("r"), ns, true, false);
  expectOrder(ns, attribute("r", "id"), true, false);
  expectOrder(ns, at("a"), true, false);
  expectOrder(at("a"), attribute("a", "x"), true, false);
  expectOrder(attribute("a", "x"), attribute("a", "y"), true, false);
  expectOrder(attribute("a", "y"), at("b"), true, false);
  expectOrder(at("d"), attribute("a", "y"), false, true);
}

TEST_F(NodeOrder, NodesOfDifferentTreesAreNeitherBeforeNorAfter) {
  expectOrder(at("a"), byID(other.get(), "t"), false, false);
  expectOrder(at("e"), byID(other.get(), "t"), false, false);
  expectOrder(byID(other.get(), "s"), at("e"), false, false);
  expectOrder(document.get(), other.get(), false, false);
}

TEST_F(NodeOrder, AParentlessNodeIsBeforeEveryNodeWithAParent) {
  expectOrder(other.get(), at("e"), true, false);
  expectOrder(at("r"), other.get(), false, true);
  const auto lone = NSXMLElement::elementWithName(NSStringView::ascii("lone"));
  expectOrder(lone.get(), at("r"), true, false);
}

TEST_F(NodeOrder, SortsNodesOfOneTreeEitherWay) {
  std::vector<Value> nodes = {at("e"), attribute("a", "y"), at("b"), document, at("d"), at("a")};
  XQuerySortNodesForward(nodes);
  EXPECT_EQ(shownAll(nodes), "doc a @y b d e");
  XQuerySortNodesReverse(nodes);
  EXPECT_EQ(shownAll(nodes), "e d b @y a doc");
  std::swap(nodes[1], nodes[4]);
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(shownAll(nodes), "doc a @y b d e");
}

TEST_F(NodeOrder, TheSameNodeMayStandInASortTwice) {
  std::vector<Value> nodes = {at("e"), at("b"), at("e"), at("b")};
  XQuerySortNodesForward(nodes);
  EXPECT_EQ(shownAll(nodes), "b b e e");
}

TEST_F(NodeOrder, StableSortingKeepsDocumentsInTheOrderInWhichTheyStand) {
  const Value s = byID(other.get(), "s");
  const Value t = byID(other.get(), "t");
  std::vector<Value> nodes = {t, s, at("d"), at("a")};
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(shownAll(nodes), "s t a d");
  nodes = {at("a"), s, at("d"), t};
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(shownAll(nodes), "a s d t");
}

TEST_F(NodeOrder, SortingSeveralTreesPutsEachInItsOrderAndParentlessNodesBeforeAllOthers) {
  const Value s = byID(other.get(), "s");
  const Value t = byID(other.get(), "t");
  std::vector<Value> nodes = {t, s, at("d"), at("a")};
  XQuerySortNodesForward(nodes);
  EXPECT_EQ(shownAll(nodes), "s t a d");
  nodes = {s, t, at("a"), at("d")};
  XQuerySortNodesReverse(nodes);
  EXPECT_EQ(shownAll(nodes), "t s d a");
  const Value lone = NSXMLElement::elementWithName(NSStringView::ascii("lone"));
  nodes = {at("a"), lone, at("d")};
  XQuerySortNodesForward(nodes);
  EXPECT_EQ(shownAll(nodes), "lone a d");
  XQuerySortNodesReverse(nodes);
  EXPECT_EQ(shownAll(nodes), "d a lone");
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(shownAll(nodes), "a d lone");
}

TEST_F(NodeOrder, ParentlessNodesOfSeveralTreesKeepTheirOrder) {
  std::vector<Value> nodes = {other, at("a"), document};
  XQuerySortNodesForward(nodes);
  ASSERT_EQ(nodes[0].get(), other.get());
  ASSERT_EQ(nodes[1].get(), document.get());
}

TEST_F(NodeOrder, SortingDeepTreesCostsNoClimbPerComparison) {
  constexpr int depth = 200000;
  std::string xml;
  for (int i = 0; i < depth; ++i) xml += "<a>";
  for (int i = 0; i < depth; ++i) xml += "</a>";
  const Ref<NSXMLDocument> documents[] = {parsed(xml), parsed(xml)};
  std::vector<Value> expected;
  for (const auto& deep : documents) {
    for (NSXMLNode* node = deep->rootElement(); node; node = node->nextNode()) {
      expected.push_back(node);
    }
  }
  std::vector<Value> nodes = expected;
  std::reverse(nodes.begin(), nodes.begin() + depth);
  std::reverse(nodes.begin() + depth, nodes.end());
  std::vector<Value> sorted = nodes;
  XQuerySortNodesForward(sorted);
  EXPECT_EQ(sorted, expected);
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(nodes, expected);
  // Nor one for each change of the tree: this would take minutes.
  std::vector<Value> inTurn;
  for (int i = 0; i < depth; ++i) {
    inTurn.push_back(expected[depth - 1 - i]);
    inTurn.push_back(expected[depth + i]);
  }
  XQuerySortNodesForward(inTurn);
  EXPECT_EQ(inTurn.size(), expected.size());
}

TEST_F(NodeOrder, SortingNodesOfSeveralTreesKeepsEveryNode) {
  std::vector<Ref<NSXMLDocument>> documents;
  std::vector<Value> nodes;
  for (int i = 0; i < 20; ++i) {
    documents.push_back(parsed("<r><a id='1'/><a id='2'/><a id='3'/></r>"));
    for (const NSXMLNode* n = documents.back().get(); n; n = n->nextNode()) {
      nodes.push_back(const_cast<NSXMLNode*>(n));
    }
  }
  for (size_t i = 0; i < nodes.size(); ++i) std::swap(nodes[i], nodes[i * 7 % nodes.size()]);
  const auto identities = [](const std::vector<Value>& values) {
    std::vector<const NSObject*> result;
    for (const Value& value : values) result.push_back(value.get());
    std::sort(result.begin(), result.end());
    return result;
  };
  const auto before = identities(nodes);
  XQuerySortNodesForward(nodes);
  EXPECT_EQ(identities(nodes), before);
  XQuerySortNodesReverse(nodes);
  EXPECT_EQ(identities(nodes), before);
  XQuerySortNodesForwardStable(nodes);
  EXPECT_EQ(identities(nodes), before);
}

TEST_F(NodeOrder, OrderFollowsChangesOfTheTree) {
  const Ref<NSXMLNode> moved = at("a");
  moved->detach();
  expectOrder(moved.get(), at("d"), true, false);  // a root now
  expectOrder(byID(moved.get(), "b"), at("d"), false, false);
  cast<NSXMLElement>(at("d"))->addChild(moved);
  expectOrder(at("e"), moved.get(), true, false);
  expectOrder(at("e"), at("b"), true, false);
  expectOrder(moved.get(), at("d"), false, true);
}

}  // namespace
}  // namespace xquery
