// The set operators over nodes: union, intersect, except.
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Expr/Paths/IdentitySet.h"
#include "Expr/Paths/NodeOrder.h"
#include "Expr/XQuerySequence.h"
#include "Platform/Base/WorkMeter.h"
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

}  // namespace

Value XQueryOperatorExpr::sequenceOperatorEvaluate(int type, const Value& withLeft,
                                                   const Value& right, XQueryContext&) {
  Nodes leftNodes;
  Nodes rightNodes;
  if (!gatherNodes(withLeft, leftNodes) || !gatherNodes(right, rightNodes)) return Value();
  std::vector<Value> nodes = combine(type, leftNodes, rightNodes);
  if (nodes.empty()) return NSNull::null();
  if (nodes.size() == 1) return nodes.front();
  XQuerySortNodesForwardStable(nodes);
  const Ref<XQuerySequence> sequence = XQuerySequence::sequence();
  sequence->objects() = std::move(nodes);
  return sequence;
}

}  // namespace xquery
