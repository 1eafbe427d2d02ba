// Paths that begin with a step to siblings, from one node after another of the same parent.
//
// What such a step asks for is the same for all of them, but for where they stand: so the children
// of the parent that pass its test, and its predicates where these read nothing but the child, are
// listed once, and found before or behind a node by binary search. A join makes its tables of all
// children in the same way, and of those it picks some are left out.
//
// Nobody can tell: siblings are asked that stand on the other side, but errors in predicates are
// passed over, and nothing else is left of them.
#include "Context/KeptValues.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <memory>
#include <utility>
#include <vector>

namespace xquery {
namespace {

bool goesBack(int axis) {
  return axis == XQueryAxisPrecedingSibling;
}

// So few are walked as quickly as looked up.
constexpr size_t fewSiblings = 12;

bool hasManySiblings(const NSXMLNode* node, int axis) {
  for (size_t i = 0; i < fewSiblings && node; ++i) {
    node = goesBack(axis) ? node->previousSibling() : node->nextSibling();
  }
  return node != nullptr;
}

bool standsBefore(const NSXMLNode* a, const NSXMLNode* b) {
  return NSXMLNodeOrder::number(*a) < NSXMLNodeOrder::number(*b);
}

bool areComparable(const NSXMLNode* node, const NSXMLNode* others) {
  return NSXMLNodeOrder::areComparable(node, others);
}

}  // namespace

// In document order; their parent keeps them alive.
class XQueryWalkedPath::Siblings final : public XQueryKeptValue {
 public:
  std::vector<NSXMLNode*, ValueAllocator<NSXMLNode*>> nodes;
};

bool XQueryWalkedPath::beginsWithSiblings() const {
  if (_steps.empty()) return false;
  const int axis = _steps.front().axis;
  return axis == XQueryAxisPrecedingSibling || axis == XQueryAxisFollowingSibling;
}

NSXMLNode* XQueryWalkedPath::nodeAmongMany(const Value& start, const XQueryContext& context) const {
  auto* node = dyn_cast<NSXMLNode>(start.get());
  if (!node || !node->parent()) return nullptr;
  const bool isChild = node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  // Which name is asked for would depend on the place of the evaluation.
  const bool isOpen = isChild && !_internal(context).hasDefaultNamespace();
  return isOpen && hasManySiblings(node, _steps.front().axis) ? node : nullptr;
}

// The children of a parent that the test of the step takes.
void XQueryWalkedPath::listSiblings(const NSXMLNode* parent, XQueryPathWalk& walk,
                                    std::vector<Value>& listed) const {
  XQueryStepTest test(_steps.front(), walk);
  WorkPacer pacer;
  for (NSXMLNode* child = parent->firstChild(); child; child = child->nextSibling()) {
    pacer.turn();
    if (test.matches(child)) listed.emplace_back(child);
  }
}

// Leaves out what stands on the other side of the node; false where that cannot be told. What is
// left stands as the walk finds it, the nearest first.
bool XQueryWalkedPath::leaveOnOneSide(const NSXMLNode* node, XQueryPicks& picks) const {
  if (picks.chosen.empty()) return true;
  const auto nodeAt = [&picks](const XQueryPick& pick) {
    return cast<NSXMLNode>((*picks.items)[pick.position].get());
  };
  if (!areComparable(node, nodeAt(picks.chosen.front()))) return false;
  const auto border = std::partition_point(
      picks.chosen.begin(), picks.chosen.end(),
      [&](const XQueryPick& pick) { return standsBefore(nodeAt(pick), node); });
  if (goesBack(_steps.front().axis)) {
    picks.chosen.erase(border, picks.chosen.end());
    std::reverse(picks.chosen.begin(), picks.chosen.end());
  } else {
    const bool isNode = border != picks.chosen.end() && nodeAt(*border) == node;
    picks.chosen.erase(picks.chosen.begin(), isNode ? std::next(border) : border);
  }
  return true;
}

// What the step finds from all children of a parent together; null for: walk, and after a failure.
std::shared_ptr<const XQueryWalkedPath::Siblings> XQueryWalkedPath::siblingsBelow(
    NSXMLNode* parent, XQueryPathWalk& walk) const {
  auto& keptValues = _internal(walk.context).keptValues();
  if (keptValues.looksAway(*this)) return nullptr;
  const std::array<Value, 1> dependencies = {Value(parent)};
  std::shared_ptr<XQueryKeptValue> kept;
  const auto use = keptValues.use(*this, dependencies, true, kept);
  if (use == XQueryKeptValues::Use::First) return nullptr;
  if (use == XQueryKeptValues::Use::Further) return std::static_pointer_cast<Siblings>(kept);
  std::vector<Value> listed;
  listSiblings(parent, walk, listed);
  const auto made = std::make_shared<Siblings>();
  const XQueryWalkedStep& step = _steps.front();
  WorkPacer pacer;
  for (const Value& each : listed) {
    pacer.turn();
    auto* node = cast<NSXMLNode>(each.get());
    const bool isKept = std::all_of(
        step.firstPredicate(), step.step->predicates().end(),
        [&](const auto& asked) { return XQueryStep::keeps(*asked, node, 1, walk.context); });
    walk.hasFailed = walk.hasFailed || _internal(walk.context).isFailing();
    if (walk.hasFailed) return nullptr;
    if (isKept) made->nodes.push_back(node);
  }
  keptValues.keep(*this, dependencies, made);
  return made;
}

bool XQueryWalkedPath::takeSiblings(const Value& start, XQueryPathWalk& walk) const {
  const XQueryWalkedStep& step = _steps.front();
  const bool isCounted = walk.results.countsOnly() && _steps.size() == 1;
  if (!isCounted && !step.hasPredicates()) return false;
  NSXMLNode* node = walk.setsEveryFocus ? nullptr : nodeAmongMany(start, walk.context);
  const auto siblings = node ? siblingsBelow(node->parent(), walk) : nullptr;
  if (!siblings) return walk.hasFailed;
  if (siblings->nodes.empty()) return true;
  if (!areComparable(node, siblings->nodes.front())) return false;
  auto first = siblings->nodes.begin();
  auto end = siblings->nodes.end();
  if (goesBack(step.axis)) {
    end = std::lower_bound(first, end, node, standsBefore);
  } else {
    first = std::upper_bound(first, end, node, standsBefore);
  }
  if (isCounted) {
    walk.results.addNumber(static_cast<uint64_t>(end - first));
    return true;
  }
  std::vector<NSXMLNode*>& nodes = walk.openNodeList();
  nodes.assign(first, end);
  if (goesBack(step.axis)) std::reverse(nodes.begin(), nodes.end());
  walk.takeNodes(1, nodes);
  walk.closeNodeList();
  return true;
}

}  // namespace xquery
