#include "Plan/Paths/XQueryValueLookup.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Platform/Tree/Arena.h"

#include <algorithm>

namespace xquery {
namespace {

using Of = XQueryValueLookup::Of;

// A walk among fewer elements is as quick.
constexpr size_t fewElements = 64;

struct Range {
  const NSXMLNode* first;
  const NSXMLNode* stop;  // null for the end of the tree
};

Range rangeOf(NSXMLNode* node, int axis) {
  if (axis == XQueryAxisChild) return {node->firstChild(), NSXMLTree::endOfSubtree(node)};
  const bool withNode = axis == XQueryAxisAttributesBelow;
  return {withNode ? node : node->nextNode(), XQueryDescendantStop(node)};
}

NSXMLValueKey keyOf(Of of, const NSXMLExpandedName* name, const XQueryValueWay& way) {
  if (of == Of::Name) return way.keyFor(*name);
  if (of == Of::AnyName) return way.keyOfEnd();
  return {{}, {}, NSXMLExpandedNameRef(name)};
}

// Leaves the children of one node. False where there are so many others that walking the children
// may be quicker.
bool keepChildren(const NSXMLNode* parent, std::vector<NSXMLNode*>& nodes) {
  size_t kept = 0;
  size_t others = 0;
  WorkPacer pacer;
  for (NSXMLNode* node : nodes) {
    pacer.turn();
    if (node->parent() == parent) {
      nodes[kept++] = node;
    } else if (++others > 2 * kept + fewElements) {
      nodes.clear();
      return false;
    }
  }
  nodes.resize(kept);
  return true;
}

}  // namespace

XQueryValueLookup::XQueryValueLookup(Of of, const NSXMLExpandedName* name,
                                     const XQueryValueWay& way, Probe probe)
    : _of(of), _name(name), _way(way), _key(keyOf(of, name, way)), _probe(std::move(probe)) {}

// None where walking must tell.
std::optional<NSXMLNodeSpan> XQueryValueLookup::elementsWith(const NSXMLValueIndex& values,
                                                             XQueryContext& context,
                                                             const NSXMLNode* first,
                                                             const NSXMLNode* stop) const {
  const Value value = XQueryValueOrNull(*_probe.expr, context);
  if (!value) return std::nullopt;
  // Numbers and dates are compared with what a text means. What any of several values is equal to
  // would have to be merged.
  const XQueryItemList probes(value.get());
  if (probes.count() != 1) return std::nullopt;
  const XQueryJoinOperand probe(probes[0]);
  if (!probe.isText()) return std::nullopt;
  const NSStringView text = probe.text.view();
  if (_probe.meetsNoneWhenEmpty && text.length() == 0) return std::nullopt;
  return NSXMLNameIndex::between(values.nodes(text), first, stop);
}

// Nodes in document order may have starts in another one, and several the same.
void XQueryValueLookup::climb(NSXMLNodeSpan ends, const NSXMLNode* first, XQueryStepTest& test,
                              std::vector<NSXMLNode*>& candidates) const {
  const auto isBefore = [](const NSXMLNode* a, const NSXMLNode* b) {
    return a->orderNumber() < b->orderNumber();
  };
  bool areInOrder = true;
  WorkPacer pacer;
  for (NSXMLNode* end : ends) {
    pacer.turn();
    NSXMLNode* node = _way.start(end);
    if (!node || isBefore(node, first) || !test.matches(node)) continue;
    if (!candidates.empty() && candidates.back() == node) continue;
    areInOrder = areInOrder && (candidates.empty() || isBefore(candidates.back(), node));
    candidates.push_back(node);
  }
  if (areInOrder) return;
  std::sort(candidates.begin(), candidates.end(), [&](const NSXMLNode* a, const NSXMLNode* b) {
    pacer.turn();
    return isBefore(a, b);
  });
  candidates.erase(std::unique(candidates.begin(), candidates.end()), candidates.end());
}

void XQueryValueLookup::listAttributes(NSXMLNodeSpan owners,
                                       std::vector<NSXMLNode*>& candidates) const {
  const auto list = [&](NSXMLNode* attribute) {
    if (attribute->expandedName() == _name.get()) candidates.push_back(attribute);
    return true;
  };
  for (NSXMLNode* owner : owners) XQueryWalkAttributes(owner, list);
}

bool XQueryValueLookup::find(NSXMLNode* node, int axis, XQueryStepTest& test,
                             XQueryContext& context, std::vector<NSXMLNode*>& candidates) const {
  if ((axis == XQueryAxisAttributesBelow) != (_of == Of::Attribute)) return false;
  if (_name && test.onlyName() != _name.get()) return false;
  const Range range = rangeOf(node, axis);
  if (!range.first || range.first == range.stop || !_way.isOpen(context)) return false;
  const auto indexed = NSXMLIndexedValues::of(_key, range.first, range.stop);
  if (!indexed.values) return false;
  const auto found = elementsWith(*indexed.values, context, range.first, range.stop);
  if (!found) return false;
  if (_of == Of::Attribute) {
    listAttributes(*found, candidates);
  } else if (_of == Of::AnyName) {
    climb(*found, range.first, test, candidates);
  } else {
    candidates.assign(found->begin(), found->end());
  }
  return axis != XQueryAxisChild || keepChildren(node, candidates);
}

void XQueryValueLookup::noteAsked(const NSXMLNode* node, size_t nodes) const {
  if (nodes >= fewElements) NSXMLNoteAskedValues(_key, nodes, node);
}

}  // namespace xquery
