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
//   an interval of the document   descendant, descendant-or-self, following, attributes below
//   the latest context item       preceding, ancestor, ancestor-or-self
//   one context item per parent   following-sibling, preceding-sibling
//   a set of nodes                parent
//
// and walks the other axes as they are; they overlap only where context items are the same. What it
// knows is made for context items in document order, the usual case; in another order some nodes
// may be visited again. Most steps have one context item in an evaluation, for which nothing is
// allocated.
//
// Two context items in document order have in common, of what is above them, the ancestors of the
// later one that do not come after the earlier one: an ancestor's subtree is one stretch of the
// document, so if it begins before the earlier item and holds the later one, it holds both.
//
// A trail holds nodes without keeping their trees alive, and is used with one axis.
#pragma once

#include "Expr/Paths/IdentitySet.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Platform/Tree/TreeHead.h"
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
      case XQueryAxisAttributesBelow: {
        XQueryAttributesVisit visitAttributes(visit);
        return walkInterval(node, XQueryDescendantStop(node), visitAttributes);
      }
      case XQueryAxisFollowing:
        return walkFollowing(node, visit);
      case XQueryAxisFollowingSibling:
        return walkFollowingSiblings(node, visit);
      case XQueryAxisAncestor:
        return walkAncestors(node, false, visit);
      case XQueryAxisParent:
        return walkParent(node->parent(), visit);
      case XQueryAxisPreceding:
        return walkPreceding(isProperty(node) ? node->parent() : node, visit);
      case XQueryAxisPrecedingSibling:
        return walkPrecedingSiblings(node, visit);
      case XQueryAxisAncestorOrSelf:
        return walkAncestors(node, true, visit);
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
    return NSXMLNodeOrder::areComparable(a, b) &&
           NSXMLNodeOrder::number(*a) < NSXMLNodeOrder::number(*b);
  }

  // From `first` up to (excluding) `stop`, which is null for the end of the document. A second
  // interval that neither overlaps nor touches the first takes its place.
  template <class Visit>
  void walkInterval(NSXMLNode* first, NSXMLNode* stop, Visit& visit) {
    if (!first || first == stop) return;
    const NSXMLNode* oldFirst = _first;
    NSXMLNode* oldStop = _stop;
    const bool isApart = !oldFirst || !NSXMLNodeOrder::areComparable(first, oldFirst) ||
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

  // The latest context item if `node` is in its tree and does not come before it, else null. It is
  // the latest one from now on, unless it comes before that.
  const NSXMLNode* contextUpTo(NSXMLNode* node) {
    NSXMLNode* const earlier = _context;
    if (earlier && NSXMLNodeOrder::areComparable(earlier, node)) {
      if (NSXMLNodeOrder::number(*node) < NSXMLNodeOrder::number(*earlier)) return nullptr;
      _context = node;
      return earlier;
    }
    _context = node;
    return nullptr;
  }
  static bool isAfter(const NSXMLNode* node, const NSXMLNode* context) {
    return !context || NSXMLNodeOrder::number(*node) > NSXMLNodeOrder::number(*context);
  }

  // What follows an ancestor of the earlier item follows that item as well.
  template <class Visit>
  void walkFollowing(NSXMLNode* node, Visit& visit) {
    const NSXMLNode* earlier = contextUpTo(node);
    WorkPacer pacer;
    for (NSXMLNode* at = node; at && isAfter(at, earlier); at = at->parent()) {
      pacer.turn();
      if (NSXMLNode* sibling = at->nextSibling()) return walkInterval(sibling, nullptr, visit);
    }
  }

  template <class Visit>
  void walkAncestors(NSXMLNode* node, bool andSelf, Visit& visit) {
    const NSXMLNode* earlier = contextUpTo(node);
    NSXMLNode* at = andSelf ? node : node->parent();
    WorkPacer pacer;
    for (; at && isAfter(at, earlier); at = at->parent()) {
      pacer.turn();
      visit(at);
    }
    // Its own walk did not visit the earlier item.
    if (at && at == earlier && !andSelf) visit(at);
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
    auto visitUpToWalked = [&](NSXMLNode* next) {
      visit(next);
      return next != walked;
    };
    XQueryWalkSiblings(node->nextSibling(), visitUpToWalked);
  }

  template <class Visit>
  void walkPrecedingSiblings(NSXMLNode* node, Visit& visit) {
    if (!node->parent() || isProperty(node)) return;
    NSXMLNode*& context = contextBeside(node);
    NSXMLNode* const walked = context;
    if (walked && !isBefore(walked, node)) return;
    context = node;
    auto visitUpToWalked = [&](NSXMLNode* previous) {
      visit(previous);
      return previous != walked;
    };
    XQueryWalkPrecedingSiblings(node, visitUpToWalked);
  }

  // What precedes the earlier item precedes the later one as well, and so do the ancestors of the
  // earlier one that are not above the later one.
  template <class Visit>
  void walkPreceding(NSXMLNode* node, Visit& visit) {
    if (!node || !node->parent()) return;
    NSXMLNode* const latest = _context;
    const NSXMLNode* earlier = contextUpTo(node);
    const bool isCovered = earlier == node || (!earlier && _context == latest);
    if (isCovered) return;
    if (!earlier) return XQueryWalkPreceding(node, visit);
    std::vector<NSXMLNode*> above;
    NSXMLNode* common = node->parent();
    WorkPacer pacer;
    for (; isAfter(common, earlier); common = common->parent()) {
      pacer.turn();
      above.push_back(common);
    }
    if (common == earlier) {
      above.push_back(common);
    } else {
      std::vector<NSXMLNode*> left;
      for (NSXMLNode* at = earlier->parent(); at != common; at = at->parent()) {
        pacer.turn();
        left.push_back(at);
      }
      for (; !left.empty(); left.pop_back()) visit(left.back());
    }
    XQueryWalkNodesExcept(latest, node, std::move(above), visit);
  }

  NSXMLNode* _context = nullptr;  // the latest context item
  NSXMLNode* _first = nullptr;    // where the interval begins, or the first context item or parent
  NSXMLNode* _stop = nullptr;     // where the interval ends
  XQueryIdentitySet _visited;
  std::unique_ptr<ContextByParent> _contexts;  // for parents other than that of `_first`
};

}  // namespace xquery
