// What one step of a path has visited so far, so that no node is visited twice.
//
// The context items of a step have overlapping axes more often than not: every "a" of "//a//b" that
// lies in another one walks the other's descendants again, and "//a/following-sibling::a" walks
// every sibling once per "a" before it. Where handing a node on again can only yield what it has
// yielded before, a step walks just the part of an axis that none of its earlier walks has visited,
// which keeps such a path linear. The nodes left out are exactly those visited before and the
// others come in the order of the axis, so that even the order of first arrival is that of complete
// walks.
//
// The trail knows what was visited as
//
//   an interval of the document   descendant, descendant-or-self, following
//   the latest context item       preceding
//   one context item per parent   following-sibling, preceding-sibling
//   a set of nodes                ancestor, ancestor-or-self (an ancestor met before ends the walk,
//                                 since everything above it was met then), parent
//
// and walks the other axes as they are; they overlap only where context items are the same. Most
// steps have one context item in an evaluation, for which nothing is allocated.
//
// A trail holds nodes without keeping their trees alive, and is used with one axis.
#pragma once

#include "Expr/IdentitySet.h"
#include "Expr/XQueryAxisWalk.h"
#include "xquery/XMLNode.h"

#include <memory>
#include <unordered_map>
#include <vector>

namespace xquery {

class XQueryAxisTrail {
 public:
  // Visits the nodes of the axis that no earlier walk has visited. The visitor always goes on.
  template <class Visit>
  void walk(NSXMLNode* node, int axis, Visit visit) {
    switch (axis) {
      case XQueryAxisDescendant:
        return walkInterval(node->nextNode(), XQueryDescendantStop(node), visit);
      case XQueryAxisDescendantOrSelf:
        if (isProperty(node)) return static_cast<void>(visit(node));
        return walkInterval(node, XQueryDescendantStop(node), visit);
      case XQueryAxisFollowing:
        return walkInterval(XQueryFollowingStart(node), nullptr, visit);
      case XQueryAxisFollowingSibling:
        return walkFollowingSiblings(node, visit);
      case XQueryAxisAncestor:
        return walkAncestors(node->parent(), visit);
      case XQueryAxisParent:
        return walkParent(node->parent(), visit);
      case XQueryAxisPreceding:
        return walkPreceding(isProperty(node) ? node->parent() : node, visit);
      case XQueryAxisPrecedingSibling:
        return walkPrecedingSiblings(node, visit);
      case XQueryAxisAncestorOrSelf:
        return walkAncestors(node, visit);
      default:
        return XQueryWalkAxis(node, axis, visit);
    }
  }

 private:
  using ContextByParent = std::unordered_map<const NSXMLNode*, NSXMLNode*>;

  static bool isProperty(const NSXMLNode* node) {
    return node->kind() == Kind::Attribute || node->kind() == Kind::Namespace;
  }
  static bool isBefore(const NSXMLNode* a, const NSXMLNode* b) {
    return NSXMLNode::haveComparableOrder(a, b) && a->orderNumber() < b->orderNumber();
  }

  // From `first` up to (excluding) `stop`, which is null for the end of the document. A second
  // interval that neither overlaps nor touches the first takes its place.
  template <class Visit>
  void walkInterval(NSXMLNode* first, NSXMLNode* stop, Visit& visit) {
    if (!first || first == stop) return;
    const NSXMLNode* oldFirst = _first;
    NSXMLNode* oldStop = _stop;
    const bool isApart = !oldFirst || !NSXMLNode::haveComparableOrder(first, oldFirst) ||
                         (stop && isBefore(stop, oldFirst)) ||
                         (oldStop && isBefore(oldStop, first));
    if (isApart) {
      _first = first;
      _stop = stop;
      return XQueryWalkNodes(first, stop, visit);
    }
    const bool beginsEarlier = isBefore(first, oldFirst);
    const bool endsLater = oldStop && (!stop || isBefore(oldStop, stop));
    if (beginsEarlier) _first = first;
    if (endsLater) _stop = stop;
    if (beginsEarlier) XQueryWalkNodes(first, oldFirst, visit);
    if (endsLater) XQueryWalkNodes(oldStop, stop, visit);
  }

  template <class Visit>
  void walkAncestors(NSXMLNode* first, Visit& visit) {
    if (!first) return;
    if (!_first) {
      _first = first;
      return XQueryWalkAncestors(first, visit);
    }
    if (_visited.isEmpty()) {
      for (const NSXMLNode* node = _first; node; node = node->parent()) _visited.insert(node);
    }
    for (NSXMLNode* node = first; node && _visited.insert(node); node = node->parent()) visit(node);
  }

  template <class Visit>
  void walkParent(NSXMLNode* parent, Visit& visit) {
    if (!parent || parent == _first) return;
    if (!_first) {
      _first = parent;
    } else {
      if (_visited.isEmpty()) _visited.insert(_first);
      if (!_visited.insert(parent)) return;
    }
    visit(parent);
  }

  // The context item last walked from under the parent of `node`; null, and the node's own place,
  // when there was none.
  NSXMLNode*& contextBeside(NSXMLNode* node) {
    if (!_first || _first->parent() == node->parent()) return _first;
    if (!_contexts) _contexts = std::make_unique<ContextByParent>();
    return (*_contexts)[node->parent()];
  }

  template <class Visit>
  void walkFollowingSiblings(NSXMLNode* node, Visit& visit) {
    if (!node->parent() || isProperty(node)) return;
    NSXMLNode*& context = contextBeside(node);
    NSXMLNode* const walked = context;
    if (walked && !isBefore(node, walked)) return;
    context = node;
    for (NSXMLNode* next = node->nextSibling(); next; next = next->nextSibling()) {
      visit(next);
      if (next == walked) return;
    }
  }

  template <class Visit>
  void walkPrecedingSiblings(NSXMLNode* node, Visit& visit) {
    if (!node->parent() || isProperty(node)) return;
    NSXMLNode*& context = contextBeside(node);
    NSXMLNode* const walked = context;
    if (walked && !isBefore(walked, node)) return;
    context = node;
    for (NSXMLNode* previous = node->previousSibling(); previous;
         previous = previous->previousSibling()) {
      visit(previous);
      if (previous == walked) return;
    }
  }

  // What precedes an earlier node precedes a later one as well, and so do the ancestors of the
  // earlier node that are not above the later one.
  template <class Visit>
  void walkPreceding(NSXMLNode* node, Visit& visit) {
    if (!node || !node->parent()) return;
    NSXMLNode* const walked = _first;
    if (!walked || !NSXMLNode::haveComparableOrder(walked, node)) {
      _first = node;
      return XQueryWalkPreceding(node, visit);
    }
    if (!isBefore(walked, node)) return;
    _first = node;
    std::vector<NSXMLNode*> left = XQueryAncestors(walked);
    std::vector<NSXMLNode*> above = XQueryAncestors(node);
    while (!left.empty() && !above.empty() && left.back() == above.back()) {
      left.pop_back();
      above.pop_back();
    }
    for (; !left.empty(); left.pop_back()) visit(left.back());
    XQueryWalkNodesExcept(walked, node, std::move(above), visit);
  }

  NSXMLNode* _first = nullptr;  // where the interval begins, or the first or latest context item
  NSXMLNode* _stop = nullptr;   // where the interval ends
  XQueryIdentitySet _visited;
  std::unique_ptr<ContextByParent> _contexts;  // for parents other than that of `_first`
};

}  // namespace xquery
