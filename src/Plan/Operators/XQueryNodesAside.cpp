// Nobody can tell: all the nodes are of one tree that stays as it is, and those that stand on one
// side of a node are the first or the last of them, so that the first one in a table of them all,
// or the last one, tells whether there is any. Where an item or a value is unusual, there is
// nothing to compare, or diagnostics are on, everything is done as it was written.
#include "Plan/Operators/XQueryNodesAside.h"

#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryAxisWalk.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinTable.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"
#include "xquery/Number.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <limits>
#include <vector>

namespace xquery {
namespace {

using Nodes = std::shared_ptr<std::vector<Value>>;

NSXMLNode* nodeIn(const Value& item) {
  return cast<NSXMLNode>(item.get());
}

bool isOfSiblings(int axis) {
  return axis == XQueryAxisPrecedingSibling || axis == XQueryAxisFollowingSibling;
}

bool goesBack(int axis) {
  return axis == XQueryAxisPrecedingSibling || axis == XQueryAxisPreceding;
}

bool isAbove(const NSXMLNode* node, const NSXMLNode* other) {
  for (const NSXMLNode* each = other->parent(); each; each = each->parent()) {
    if (each == node) return true;
  }
  return false;
}

// All that the step finds from any of those nodes, the first one that it may find in front.
Nodes nodesOf(const XQueryWalkedStep& step, NSXMLNode* above, XQueryContext& context) {
  const auto nodes = std::make_shared<std::vector<Value>>();
  XQueryPathResults results;
  XQueryPathRun run(results, context);
  XQueryStepTest test(step, run);
  const auto take = [&](NSXMLNode* node) {
    if (test.matches(node)) nodes->emplace_back(node);
    return nodes->size() <= XQueryJoinTable::mostItems;
  };
  if (isOfSiblings(step.axis)) {
    XQueryWalkSiblings(above->firstChild(), take);
  } else {
    XQueryWalkNodes(above, nullptr, take);
  }
  if (!goesBack(step.axis)) std::reverse(nodes->begin(), nodes->end());
  return nodes;
}

}  // namespace

class XQueryNodesAside::Table final : public XQueryKeptValue {
 public:
  Table(Nodes nodes, const XQueryShortWalk& walk, int axis)
      : _nodes(std::move(nodes)), _axis(axis), _keys({}, _nodes, [&](size_t position) {
          Value keys = keysOf((*_nodes)[position], walk);
          const bool isFirst = keys && keys->kind() != Kind::Null && position < _firstWithKeys;
          if (isFirst) _firstWithKeys = position;
          return keys;
        }) {}

  bool isComplete() const { return _keys.isComplete(); }
  bool isRegular() const { return _keys.isRegular(); }

  // Whether what is found from the node meets the value; nothing where there is no telling.
  std::optional<bool> isMetFrom(const NSXMLNode* node, const Value& value) {
    if (_firstWithKeys >= _nodes->size() || !isAside(_firstWithKeys, node)) return std::nullopt;
    const auto question = _keys.questionOf(value);
    if (!question) return std::nullopt;
    XQueryJoinTable::Selection met;
    _keys.select(*question, met, true);
    // One that has to be asked may be an error, whatever else is met.
    const bool areSure =
        std::all_of(met.begin(), met.end(), [](const XQueryPick& pick) { return pick.isSure; });
    if (!areSure) return std::nullopt;
    if (met.empty()) return false;
    const size_t first = met.front().position;
    if (isAside(first, node)) return true;
    // Behind an ancestor another one may be met.
    if (_axis == XQueryAxisPreceding && isAbove(nodeIn((*_nodes)[first]), node)) {
      return std::nullopt;
    }
    return false;
  }

 private:
  // Whether it is found from the node. The trees are those of the same root.
  bool isAside(size_t position, const NSXMLNode* node) const {
    const NSXMLNode* other = nodeIn((*_nodes)[position]);
    const uint32_t number = NSXMLNodeOrder::number(*other);
    if (goesBack(_axis)) {
      const bool isBefore = number < NSXMLNodeOrder::number(*node);
      return isBefore && (_axis == XQueryAxisPrecedingSibling || !isAbove(other, node));
    }
    if (_axis == XQueryAxisFollowingSibling) return number > NSXMLNodeOrder::number(*node);
    const NSXMLNode* end = XQueryFollowingStart(node);
    return end && number >= NSXMLNodeOrder::number(*end);
  }

  static Value keysOf(const Value& item, const XQueryShortWalk& walk) {
    if (walk.isEmpty()) return item;
    XQueryGatherer keys;
    walk.visit(nodeIn(item), [&](NSXMLNode* found) {
      keys.add(Value(found));
      return true;
    });
    return keys.value();
  }

  const Nodes _nodes;
  const int _axis;
  size_t _firstWithKeys = std::numeric_limits<size_t>::max();
  XQueryJoinTable _keys;
};

bool XQueryNodesAside::isOpenFor(const XQueryWalkedPath& path) {
  if (path.steps().empty() || (path.start() && !path.start()->predicates().empty())) return false;
  const XQueryWalkedStep& step = path.steps().front();
  const bool leadsAside = path.beginsWithSiblings() || step.axis == XQueryAxisPreceding ||
                          step.axis == XQueryAxisFollowing;
  return leadsAside && step.step->predicates().empty() && !step.testMayRaise && !step.choice;
}

// Null where the path does not start from one node of a tree, or is not worth a table.
NSXMLNode* XQueryNodesAside::start(XQueryContext& context) const {
  const auto& dynamic = _internal(context);
  const bool isOpen = _operands.walk.isOpen(context) && !dynamic.hasDefaultNamespace();
  if (!isOpen) return nullptr;
  const Value item = _operands.varID ? Value(dynamic.variableForID(_operands.varID))
                                     : Value(dynamic.contextItem());
  if (_operands.path->beginsWithSiblings()) return _operands.path->nodeAmongMany(item, context);
  auto* node = dyn_cast<NSXMLNode>(item.get());
  const bool isChild =
      node && node->parent() && node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  return isChild ? node : nullptr;
}

std::shared_ptr<XQueryNodesAside::Table> XQueryNodesAside::tableFor(NSXMLNode* node,
                                                                    XQueryContext& context) const {
  auto& keptValues = _internal(context).keptValues();
  if (keptValues.looksAway(*this)) return nullptr;
  const XQueryWalkedStep& step = _operands.path->steps().front();
  NSXMLNode* above = isOfSiblings(step.axis) ? node->parent() : node->rootNode();
  const std::array<Value, 1> dependencies = {Value(above)};
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = keptValues.use(*this, dependencies, true, kept);
  if (use == XQueryKeptValues::Use::First) return nullptr;
  if (use == XQueryKeptValues::Use::Further) return std::static_pointer_cast<Table>(kept);
  const Nodes nodes = nodesOf(step, above, context);
  std::shared_ptr<Table> made;
  const bool isOpen = !nodes->empty() && nodes->size() <= XQueryJoinTable::mostItems &&
                      NSXMLNodeOrder::areComparable(node, nodeIn(nodes->front()));
  if (isOpen) made = std::make_shared<Table>(nodes, _operands.walk, step.axis);
  if (made && !made->isComplete()) made = nullptr;
  keptValues.keep(*this, dependencies, made);
  return made;
}

// Null for: compare.
Value XQueryNodesAside::answer(NSXMLNode* node, const Value& value, XQueryContext& context) const {
  const auto table = node && value ? tableFor(node, context) : nullptr;
  if (!table) return {};
  // Nothing is compared with a list of what can be.
  if (isNull(value)) return table->isRegular() ? Value(NSNull::null()) : Value();
  const auto isMet = table->isMetFrom(node, value);
  return isMet ? Value(NSNumber::numberWithBool(*isMet)) : Value();
}

Value XQueryNodesAside::computeValue(XQueryContext& context) const {
  if (_internal(context).showsErrors()) return plain().evaluateWithContext(context);
  const Value value = _operands.value->evaluateWithContext(context);
  if (XQueryHasFailed(value, context)) return {};
  const Value found = answer(start(context), value, context);
  return found ? found : plain().evaluateWithContext(context);
}

}  // namespace xquery
