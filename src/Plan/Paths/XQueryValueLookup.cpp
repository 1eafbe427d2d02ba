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
#include <array>
#include <utility>

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

// Numbers and dates are compared with what a text means, "eq" refuses several values, and what has
// no value is not in the index: walking must tell.
bool areTexts(const XQueryItemList& probes, const XQueryValueLookup::Probe& asked) {
  if (probes.count() == 0 || (probes.count() > 1 && !asked.takesSeveral)) return false;
  WorkPacer pacer;
  for (size_t index = 0; index < probes.count(); ++index) {
    pacer.turn();
    const XQueryJoinOperand probe(probes[index]);
    if (!probe.isText()) return false;
    if (asked.meetsNoneWhenEmpty && probe.text.view().length() == 0) return false;
  }
  return true;
}

}  // namespace

XQueryValueLookup::XQueryValueLookup(Of of, const NSXMLExpandedName* name,
                                     std::vector<Match> matches, First first)
    : _of(of), _name(name), _first(first) {
  for (Match& match : matches) {
    NSXMLValueKey key = keyOf(of, name, match.way);
    _matches.push_back({std::move(match), std::move(key)});
  }
}

bool XQueryValueLookup::isReady(const NSXMLNode* root) const {
  return std::all_of(_matches.begin(), _matches.end(), [root](const KeyedMatch& each) {
    return each.match.probe.areTexts && NSXMLIndexedValues::of(each.key, root, nullptr).values;
  });
}

// The nodes of one value come in document order, unless the way leads up from them.
void XQueryValueLookup::addNodesWith(const NSXMLValueIndex& values, const XQueryItemList& probes,
                                     const XQueryValueWay& way, const Search& search) const {
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
    const auto found = NSXMLNameIndex::between(values.nodes(number), search.first, search.stop);
    if (_of == Of::Attribute) {
      listAttributes(found, search.candidates);
    } else if (_of == Of::AnyName) {
      climb(found, way, search);
    } else {
      search.candidates.insert(search.candidates.end(), found.begin(), found.end());
    }
  }
}

// Nodes in document order may have starts in another one, and several the same.
void XQueryValueLookup::climb(NSXMLNodeSpan ends, const XQueryValueWay& way, const Search& search) {
  auto& candidates = search.candidates;
  WorkPacer pacer;
  for (NSXMLNode* end : ends) {
    pacer.turn();
    NSXMLNode* node = way.start(end);
    if (!node || isBefore(node, search.first) || !search.test.matches(node)) continue;
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
  if (!isWorthAsking(range)) return false;
  // No index is made for what it cannot answer.
  std::array<Value, mostMatches> values;
  size_t probeCount = 0;
  for (size_t i = 0; i < _matches.size(); ++i) {
    const auto& [way, probe] = _matches[i].match;
    if (!way.isOpen(context)) return false;
    values[i] = valueFrom(*probe.expr, node, context);
    if (!values[i]) return false;
    const XQueryItemList probes(values[i].get());
    const bool meetsNone = probes.count() == 0 && (probe.takesSeveral || _first == First::Holds);
    if (!meetsNone && !areTexts(probes, probe)) return false;
    probeCount += probes.count();
  }
  const Search search{range.first, range.stop, test, candidates};
  for (size_t i = 0; i < _matches.size(); ++i) {
    const XQueryItemList probes(values[i].get());
    if (probes.count() == 0) continue;
    const auto indexed = NSXMLIndexedValues::of(_matches[i].key, range.first, range.stop);
    if (!indexed.values) {
      candidates.clear();
      return false;
    }
    addNodesWith(*indexed.values, probes, _matches[i].match.way, search);
  }
  if (_of == Of::AnyName || probeCount > 1) putInOrder(candidates);
  return axis != XQueryAxisChild || keepChildren(node, candidates);
}

void XQueryValueLookup::noteAsked(const NSXMLNode* node, size_t nodes) const {
  if (nodes < fewElements) return;
  for (const KeyedMatch& each : _matches) {
    // Several matches may ask for the same values.
    const auto first = std::find_if(_matches.begin(), _matches.end(),
                                    [&](const KeyedMatch& other) { return other.key == each.key; });
    if (&*first == &each) NSXMLNoteAskedValues(each.key, nodes, node);
  }
}

}  // namespace xquery
