// Document order between nodes.
//
// The order is defined by climbing: from two nodes up to the children of their nearest common
// ancestor, whose positions decide. Nodes of one tree carry preorder numbers that give the same
// answer by comparing two integers: an element comes before its namespaces, those before its
// attributes, those before its children, and an ancestor before its descendants. Climbing is left
// for nodes of different trees, which are neither before nor after each other, except that a node
// without a parent is before every node that has one.
//
// That exception and the lack of an order between trees make the relation no total order, so the
// sorts over several trees are merge sorts of our own: they stay within their array and keep what
// cannot be compared in the order in which it stands, whatever the comparator answers. They look up
// the tree and the number of each node once; climbing per comparison would multiply the depth of
// the trees into the sort.
#include "Expr/Paths/NodeOrder.h"

#include "Expr/Clauses/StableMergeSort.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"
#include "xquery/Number.h"

#include <algorithm>
#include <array>
#include <cstdint>

namespace xquery {
namespace {

// Two nodes on their way up to the children of a common ancestor.
struct Climb {
  const NSXMLNode* a;
  const NSXMLNode* b;
  const NSXMLNode* parentOfA;
  const NSXMLNode* parentOfB;

  void climbA() {
    a = parentOfA;
    parentOfA = parentOfA->parent();
  }
  void climbB() {
    b = parentOfB;
    parentOfB = parentOfB->parent();
  }
};

enum class Position { Before, After, Neither };

// Where `a` stands from `b`, for two nodes that both have a parent or both have none.
Position positionByClimbing(const NSXMLNode* a, const NSXMLNode* b) {
  Climb at{a, b, a->parent(), b->parent()};
  if (at.parentOfA != at.parentOfB) {
    int64_t levelOfA = at.parentOfA->level();
    int64_t levelOfB = at.parentOfB->level();
    for (; levelOfA > levelOfB; --levelOfA) {
      if (at.parentOfA == b) return Position::After;
      at.climbA();
    }
    for (; levelOfB > levelOfA; --levelOfB) {
      if (at.parentOfB == at.a) return Position::Before;
      at.climbB();
    }
    while (at.parentOfA != at.parentOfB) {
      at.climbA();
      at.climbB();
      if (!at.parentOfA || !at.parentOfB) return Position::Neither;
    }
  }
  const int64_t indexOfA = at.a->index();
  const int64_t indexOfB = at.b->index();
  if (indexOfA == indexOfB) return Position::Neither;
  return indexOfA < indexOfB ? Position::Before : Position::After;
}

const NSXMLNode* nodeOf(const Value& value) {
  return cast<NSXMLNode>(value);
}

// Being comparable is transitive, so neighbours decide for all.
bool allComparable(const std::vector<Value>& nodes) {
  WorkPacer pacer;
  for (size_t i = 1; i < nodes.size(); ++i) {
    pacer.turn();
    if (!NSXMLNodeOrder::areComparable(nodeOf(nodes[i - 1]), nodeOf(nodes[i]))) return false;
  }
  return true;
}

// A node in a sort over several trees.
struct Placed {
  Value node;
  const NSXMLNode* root = nullptr;
  uint32_t number = 0;  // within the tree
  size_t place = 0;     // where the node stood

  bool isRoot() const { return node.get() == root; }
};

// The roots of the trees that nodes are of, which mostly are few that come again: climbing to the
// root for each change of tree would multiply the depth of the trees into the sort.
class RootsMet {
 public:
  const NSXMLNode* rootOf(const NSXMLNode* node) {
    for (const Met& each : _met) {
      if (each.node && NSXMLNodeOrder::areComparable(each.node, node)) return each.root;
    }
    Met& latest = _met[_next++ % _met.size()];
    latest = {node, node->rootNode()};
    return latest.root;
  }

 private:
  struct Met {
    const NSXMLNode* node = nullptr;
    const NSXMLNode* root = nullptr;
  };
  std::array<Met, 8> _met{};
  size_t _next = 0;
};

std::vector<Placed> placedNodes(std::vector<Value>& nodes) {
  std::vector<Placed> placed;
  placed.reserve(nodes.size());
  RootsMet roots;
  WorkPacer pacer;
  for (Value& value : nodes) {
    pacer.turn();
    const NSXMLNode* node = nodeOf(value);
    const NSXMLNode* root = roots.rootOf(node);
    (void)NSXMLNodeOrder::areComparable(node, node);  // makes the number good
    placed.push_back({std::move(value), root, NSXMLNodeOrder::number(*node), placed.size()});
  }
  return placed;
}

template <class Before>
void sortSeveralTrees(std::vector<Value>& nodes, Before before) {
  std::vector<Placed> placed = placedNodes(nodes);
  stableMergeSort(placed, before);
  WorkPacer pacer;
  for (size_t i = 0; i < nodes.size(); ++i) {
    pacer.turn();
    nodes[i] = std::move(placed[i].node);
  }
}

void sortByOrderNumber(std::vector<Value>& nodes) {
  struct Numbered {
    uint32_t number;
    Value node;
  };
  std::vector<Numbered> numbered;
  numbered.reserve(nodes.size());
  WorkPacer pacer;
  for (Value& node : nodes) {
    pacer.turn();
    const uint32_t number = NSXMLNodeOrder::number(*nodeOf(node));
    numbered.push_back({number, std::move(node)});
  }
  std::sort(numbered.begin(), numbered.end(), [&pacer](const Numbered& a, const Numbered& b) {
    pacer.turn();
    return a.number < b.number;
  });
  for (size_t i = 0; i < nodes.size(); ++i) {
    pacer.turn();
    nodes[i] = std::move(numbered[i].node);
  }
}

}  // namespace

bool XQueryNodeBeforeByClimbing(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b) return false;
  if (a->parent() != b->parent()) {
    if (!a->parent()) return true;
    if (!b->parent()) return false;
  }
  return positionByClimbing(a, b) == Position::Before;
}

bool XQueryNodeAfterByClimbing(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b) return false;
  if (a->parent() != b->parent()) {
    if (!a->parent()) return false;
    if (!b->parent()) return true;
  }
  return positionByClimbing(a, b) == Position::After;
}

bool XQueryNodeBefore(const NSXMLNode* a, const NSXMLNode* b) {
  if (NSXMLNodeOrder::areComparable(a, b))
    return NSXMLNodeOrder::number(*a) < NSXMLNodeOrder::number(*b);
  return XQueryNodeBeforeByClimbing(a, b);
}

bool XQueryNodeAfter(const NSXMLNode* a, const NSXMLNode* b) {
  if (NSXMLNodeOrder::areComparable(a, b))
    return NSXMLNodeOrder::number(*a) > NSXMLNodeOrder::number(*b);
  return XQueryNodeAfterByClimbing(a, b);
}

Value op_node_before(const NSXMLNode* a, const NSXMLNode* b) {
  return NSNumber::numberWithBool(XQueryNodeBefore(a, b));
}

Value op_node_after(const NSXMLNode* a, const NSXMLNode* b) {
  return NSNumber::numberWithBool(XQueryNodeAfter(a, b));
}

int NodeDocOrderCompareForward(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b) return 0;
  return XQueryNodeBefore(a, b) ? -1 : 1;
}

int NodeDocOrderCompareReverse(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b) return 0;
  return XQueryNodeAfter(a, b) ? -1 : 1;
}

void XQuerySortNodesForward(std::vector<Value>& nodes) {
  if (allComparable(nodes)) return sortByOrderNumber(nodes);
  sortSeveralTrees(nodes, [](const Placed& a, const Placed& b) {
    return a.root == b.root ? a.number < b.number : a.isRoot() && !b.isRoot();
  });
}

void XQuerySortNodesReverse(std::vector<Value>& nodes) {
  if (allComparable(nodes)) {
    sortByOrderNumber(nodes);
    std::reverse(nodes.begin(), nodes.end());
    return;
  }
  sortSeveralTrees(nodes, [](const Placed& a, const Placed& b) {
    return a.root == b.root ? a.number > b.number : b.isRoot() && !a.isRoot();
  });
}

void XQuerySortNodesForwardStable(std::vector<Value>& nodes) {
  if (allComparable(nodes)) return sortByOrderNumber(nodes);
  sortSeveralTrees(nodes, [](const Placed& a, const Placed& b) {
    return a.root == b.root ? a.number < b.number : a.place < b.place;
  });
}

}  // namespace xquery
