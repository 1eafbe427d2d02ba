#include "Plan/Paths/XQueryValueLookup.h"

#include "Expr/XQuerySequence.h"
#include "Plan/Joins/XQueryJoinOperand.h"
#include "Plan/Operators/XQueryTentative.h"
#include "Platform/Tree/Arena.h"

#include <algorithm>

namespace xquery {
namespace {

// A walk among fewer elements is as quick.
constexpr size_t fewElements = 64;

struct Range {
  const NSXMLNode* first;
  const NSXMLNode* stop;  // null for the end of the tree
};

Range rangeOf(NSXMLNode* node, int axis) {
  if (axis == XQueryAxisChild) return {node->firstChild(), NSXMLTree::endOfSubtree(node)};
  return {node->nextNode(), XQueryDescendantStop(node)};
}

// Of the nodes the children of one. False where there are so many others that walking the children
// may be quicker.
bool addChildren(const NSXMLNode* parent, NSXMLNodeSpan nodes,
                 std::vector<NSXMLNode*>& candidates) {
  size_t others = 0;
  WorkPacer pacer;
  for (NSXMLNode* node : nodes) {
    pacer.turn();
    if (node->parent() == parent) {
      candidates.push_back(node);
    } else if (++others > 2 * candidates.size() + fewElements) {
      candidates.clear();
      return false;
    }
  }
  return true;
}

}  // namespace

bool XQueryValueLookup::find(NSXMLNode* node, int axis, XQueryContext& context,
                             std::vector<NSXMLNode*>& candidates) const {
  const Range range = rangeOf(node, axis);
  if (!range.first || range.first == range.stop || !_walk.isOpen(context)) return false;
  const auto indexed = NSXMLIndexedValues::of(_key, range.first, range.stop);
  if (!indexed.values) return false;
  const Value value = XQueryValueOrNull(*_probe, context);
  if (!value) return false;
  // Numbers and dates are compared with what a text means. What any of several values is equal to
  // would have to be merged.
  const XQueryItemList probes(value.get());
  if (probes.count() != 1) return false;
  const XQueryJoinOperand probe(probes[0]);
  if (!probe.isText()) return false;
  const NSXMLNodeSpan found =
      NSXMLNameIndex::between(indexed.values->nodes(probe.text.view()), range.first, range.stop);
  if (axis == XQueryAxisChild) return addChildren(node, found, candidates);
  candidates.assign(found.begin(), found.end());
  return true;
}

void XQueryValueLookup::noteAsked(const NSXMLNode* node, size_t elements) const {
  if (elements >= fewElements) NSXMLNoteAskedValues(_key, elements, node);
}

}  // namespace xquery
