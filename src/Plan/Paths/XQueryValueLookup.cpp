#include "Plan/Paths/XQueryValueLookup.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>

namespace xquery {
namespace {

using Of = XQueryValueLookup::Of;

// A walk among fewer elements is as quick.
constexpr size_t fewElements = 64;
constexpr size_t fewProbes = 64;

struct Range {
  const NSXMLNode* first;
  const NSXMLNode* stop;  // null for the end of the tree
};

Range rangeOf(NSXMLNode* node, int axis) {
  if (axis == XQueryAxisChild) return {node->firstChild(), NSXMLTree::endOfSubtree(node)};
  const bool withNode = axis == XQueryAxisAttributesBelow;
  return {withNode ? node : node->nextNode(), XQueryDescendantStop(node)};
}

bool isWorthAsking(const Range& range) {
  if (!range.first || range.first == range.stop) return false;
  return !range.stop ||
         NSXMLNodeOrder::number(*range.stop) - NSXMLNodeOrder::number(*range.first) >=
             NSXMLTreeIndexes::fewNodes;
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

bool isBefore(const NSXMLNode* a, const NSXMLNode* b) {
  return NSXMLNodeOrder::number(*a) < NSXMLNodeOrder::number(*b);
}

// Each once, in document order.
void putInOrder(std::vector<NSXMLNode*>& nodes) {
  const auto isOutOfOrder = [](const NSXMLNode* a, const NSXMLNode* b) { return !isBefore(a, b); };
  if (std::adjacent_find(nodes.begin(), nodes.end(), isOutOfOrder) == nodes.end()) return;
  WorkPacer pacer;
  std::sort(nodes.begin(), nodes.end(), [&](const NSXMLNode* a, const NSXMLNode* b) {
    pacer.turn();
    return isBefore(a, b);
  });
  nodes.erase(std::unique(nodes.begin(), nodes.end()), nodes.end());
}

// The probe may read the root above the focus, which is that above every candidate.
Value valueFrom(const XQueryExpr& probe, NSXMLNode* node, XQueryContext& context) {
  auto& dynamic = _internal(context);
  Value item = dynamic.contextItem();
  const int64_t position = dynamic.position();
  dynamic.setContextItem(Value(node), 1);
  Value value = XQueryValueOrNull(probe, context);
  dynamic.setContextItem(std::move(item), position);
  return value;
}

}  // namespace

XQueryValueLookup::XQueryValueLookup(Of of, const NSXMLExpandedName* name,
                                     const XQueryValueWay& way, Probe probe, First first)
    : _of(of),
      _name(name),
      _way(way),
      _key(keyOf(of, name, way)),
      _probe(std::move(probe)),
      _first(first) {}

bool XQueryValueLookup::isReady(const NSXMLNode* root) const {
  return _probe.areTexts && NSXMLIndexedValues::of(_key, root, nullptr).values != nullptr;
}

// Numbers and dates are compared with what a text means, "eq" refuses several values, and what has
// no value is not in the index: walking must tell.
bool XQueryValueLookup::areTexts(const XQueryItemList& probes) const {
  if (probes.count() == 0 || (probes.count() > 1 && !_probe.takesSeveral)) return false;
  WorkPacer pacer;
  for (size_t index = 0; index < probes.count(); ++index) {
    pacer.turn();
    const XQueryJoinOperand probe(probes[index]);
    if (!probe.isText()) return false;
    if (_probe.meetsNoneWhenEmpty && probe.text.view().length() == 0) return false;
  }
  return true;
}

// The nodes of one value come in document order, unless the way leads up from them.
void XQueryValueLookup::addNodesWith(const NSXMLValueIndex& values, const XQueryItemList& probes,
                                     const NSXMLNode* first, const NSXMLNode* stop,
                                     XQueryStepTest& test,
                                     std::vector<NSXMLNode*>& candidates) const {
  // What several have for their value is listed once, where they are many.
  std::vector<bool> areListed(probes.count() > fewProbes ? values.valueCount() : 0);
  WorkPacer pacer;
  for (size_t index = 0; index < probes.count(); ++index) {
    pacer.turn();
    const XQueryJoinOperand probe(probes[index]);
    const uint32_t number = values.numberOf(probe.text.view());
    if (number < areListed.size()) {
      if (areListed[number]) continue;
      areListed[number] = true;
    }
    const auto found = NSXMLNameIndex::between(values.nodes(number), first, stop);
    if (_of == Of::Attribute) {
      listAttributes(found, candidates);
    } else if (_of == Of::AnyName) {
      climb(found, first, test, candidates);
    } else {
      candidates.insert(candidates.end(), found.begin(), found.end());
    }
  }
  if (_of == Of::AnyName || probes.count() > 1) putInOrder(candidates);
}

// Nodes in document order may have starts in another one, and several the same.
void XQueryValueLookup::climb(NSXMLNodeSpan ends, const NSXMLNode* first, XQueryStepTest& test,
                              std::vector<NSXMLNode*>& candidates) const {
  WorkPacer pacer;
  for (NSXMLNode* end : ends) {
    pacer.turn();
    NSXMLNode* node = _way.start(end);
    if (!node || isBefore(node, first) || !test.matches(node)) continue;
    if (candidates.empty() || candidates.back() != node) candidates.push_back(node);
  }
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
  if (!isWorthAsking(range) || !_way.isOpen(context)) return false;
  // No index is made for what it cannot answer.
  const Value value = valueFrom(*_probe.expr, node, context);
  const XQueryItemList probes(value.get());
  if (value && probes.count() == 0 && _first == First::Holds) return true;
  if (!value || !areTexts(probes)) return false;
  const auto indexed = NSXMLIndexedValues::of(_key, range.first, range.stop);
  if (!indexed.values) return false;
  addNodesWith(*indexed.values, probes, range.first, range.stop, test, candidates);
  return axis != XQueryAxisChild || keepChildren(node, candidates);
}

void XQueryValueLookup::noteAsked(const NSXMLNode* node, size_t nodes) const {
  if (nodes >= fewElements) NSXMLNoteAskedValues(_key, nodes, node);
}

}  // namespace xquery
