// The set operators over nodes: union, intersect, except.
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/IdentitySet.h"
#include "Expr/Paths/NodeOrder.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"
#include "xquery/Collection.h"

#include <vector>

namespace xquery {
namespace {

using Nodes = std::vector<NSObject*>;

// The nodes of an operand; false when some item is none. A missing operand is invalid.
bool gatherNodes(const Value& operand, Nodes& nodes) {
  if (!operand) return false;
  const XQueryItemList items(operand.get());
  nodes.reserve(items.count());
  WorkPacer pacer;
  for (size_t index = 0; index < items.count(); ++index) {
    pacer.turn();
    NSObject* item = items[index];
    if (!item || !item->isNode()) return false;
    nodes.push_back(item);
  }
  return true;
}

// Appends each node once, as long as `wanted` agrees.
template <class Wanted>
void appendDistinct(const Nodes& nodes, XQueryIdentitySet& seen, std::vector<Value>& result,
                    Wanted wanted) {
  WorkPacer pacer;
  for (NSObject* node : nodes) {
    pacer.turn();
    if (wanted(node) && seen.insert(node)) result.emplace_back(node);
  }
}

std::vector<Value> combine(int type, const Nodes& left, const Nodes& right) {
  std::vector<Value> result;
  XQueryIdentitySet seen;
  const auto any = [](const NSObject*) { return true; };
  if (type == XQueryOperatorUnion) {
    appendDistinct(left, seen, result, any);
    appendDistinct(right, seen, result, any);
    return result;
  }
  XQueryIdentitySet rightSet;
  WorkPacer pacer;
  for (const NSObject* node : right) {
    pacer.turn();
    rightSet.insert(node);
  }
  const bool wantsCommon = type == XQueryOperatorIntersect;
  appendDistinct(left, seen, result,
                 [&](const NSObject* node) { return rightSet.contains(node) == wantsCommon; });
  return result;
}

// Whether the nodes stand in document order, none twice, and all in one tree.
bool areInOrder(const Nodes& nodes) {
  WorkPacer pacer;
  const NSXMLNode* previous = nullptr;
  for (const NSObject* each : nodes) {
    pacer.turn();
    const auto* node = cast<NSXMLNode>(each);
    if (previous && !(NSXMLNodeOrder::areComparable(previous, node) &&
                      NSXMLNodeOrder::number(*previous) < NSXMLNodeOrder::number(*node))) {
      return false;
    }
    previous = node;
  }
  return true;
}

bool areOfOneTree(const Nodes& left, const Nodes& right) {
  return left.empty() || right.empty() ||
         NSXMLNodeOrder::areComparable(cast<NSXMLNode>(left.front()),
                                       cast<NSXMLNode>(right.front()));
}

// The same for nodes in order, whose result is in order without being sorted.
std::vector<Value> merge(int type, const Nodes& left, const Nodes& right) {
  const bool takesRight = type == XQueryOperatorUnion;
  const bool takesBoth = type != XQueryOperatorExcept;
  const bool takesLeft = type != XQueryOperatorIntersect;
  std::vector<Value> result;
  WorkPacer pacer;
  const auto numberOf = [](const NSObject* node) {
    return NSXMLNodeOrder::number(*cast<NSXMLNode>(node));
  };
  size_t index = 0;
  const auto takeRightBefore = [&](uint32_t number) {
    for (; index < right.size() && numberOf(right[index]) < number; ++index) {
      pacer.turn();
      if (takesRight) result.emplace_back(right[index]);
    }
  };
  for (NSObject* node : left) {
    pacer.turn();
    takeRightBefore(numberOf(node));
    const bool isInBoth = index < right.size() && right[index] == node;
    if (isInBoth) ++index;
    if (isInBoth ? takesBoth : takesLeft) result.emplace_back(node);
  }
  takeRightBefore(UINT32_MAX);
  return result;
}

}  // namespace

Value XQueryOperatorExpr::sequenceOperatorEvaluate(int type, const Value& withLeft,
                                                   const Value& right, XQueryContext&) {
  Nodes leftNodes;
  Nodes rightNodes;
  if (!gatherNodes(withLeft, leftNodes) || !gatherNodes(right, rightNodes)) return Value();
  const bool canMerge =
      areInOrder(leftNodes) && areInOrder(rightNodes) && areOfOneTree(leftNodes, rightNodes);
  std::vector<Value> nodes =
      canMerge ? merge(type, leftNodes, rightNodes) : combine(type, leftNodes, rightNodes);
  if (nodes.empty()) return NSNull::null();
  if (nodes.size() == 1) return nodes.front();
  if (!canMerge) XQuerySortNodesForwardStable(nodes);
  const Ref<XQuerySequence> sequence = XQuerySequence::sequence();
  sequence->objects() = std::move(nodes);
  return sequence;
}

}  // namespace xquery
