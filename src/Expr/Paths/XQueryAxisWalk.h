// The twelve axes.
//
// XQueryWalkAxis visits the nodes on an axis of a node, in the order in which a path sees them:
// document order for the forward axes and for preceding, nearest first for the other reverse axes.
// XQueryWalkAlongAxis visits the same nodes in the order in which predicates count them, nearest
// first for preceding too. The visitor answers whether the walk goes on. Nothing is allocated,
// except that the preceding axis in document order keeps the list of the node's ancestors. A walk
// may be ended at a limit of the evaluation, by an exception. The visitor may be copied: what it
// changes it refers to.
#pragma once

#include "Expr/Paths/XQueryPath.h"
#include "Platform/Base/WorkMeter.h"
#include "xquery/XMLNode.h"

#include <vector>

namespace xquery {

// The node at which the descendant axis ends: the next sibling or, without one, the parent's. Null
// lets the walk run to the end of the document, past the node's own descendants when the node is
// the last child of a last child.
NSXMLNode* XQueryDescendantStop(const NSXMLNode* node);

// The node with which the following axis begins; null when there is none.
NSXMLNode* XQueryFollowingStart(const NSXMLNode* node);

// The ancestors of a node, the root last.
std::vector<NSXMLNode*> XQueryAncestors(const NSXMLNode* node);

// The deepest last descendant of a node, or the node itself: the last node of its subtree.
NSXMLNode* XQueryLastInSubtree(NSXMLNode* node);

// Visits `first` and each node after it in document order, up to (excluding) `stop`. Only the nodes
// without children are counted, usually half of all: each way down ends at one, and a way
// down of a million levels takes a few milliseconds.
//
// A visitor that can find its nodes without a walk may do so.
template <class Visit>
void XQueryWalkNodes(NSXMLNode* first, const NSXMLNode* stop, const Visit& visitor) {
  if constexpr (requires { visitor.visitIndexed(first, stop); }) {
    if (first && first != stop && visitor.visitIndexed(first, stop)) return;
  }
  WorkPacer pacer;
  Visit visit = visitor;  // whose parts can then be in registers
  for (NSXMLNode* node = first; node && node != stop;) {
    if (!visit(node)) return;
    if (NSXMLNode* child = node->firstChild()) {
      node = child;
    } else {
      pacer.turn();
      node = node->nextNode();
    }
  }
}

// The same without the ancestors of `stop` given, the outermost last.
template <class Visit>
void XQueryWalkNodesExcept(NSXMLNode* first, const NSXMLNode* stop,
                           std::vector<NSXMLNode*> ancestors, Visit& visit) {
  auto visitUnlessAncestor = [&](NSXMLNode* candidate) {
    // The walk meets the ancestors from the outermost inwards.
    if (!ancestors.empty() && candidate == ancestors.back()) {
      ancestors.pop_back();
      return true;
    }
    return visit(candidate);
  };
  XQueryWalkNodes(first, stop, visitUnlessAncestor);
}

// An attribute or namespace node is in nobody's order of next nodes: its walk ends at its parent
// element.
template <class Visit>
void XQueryWalkPreceding(NSXMLNode* node, Visit& visit) {
  NSXMLNode* root = node->rootNode();
  if (root == node) return;
  const bool isChild = node->kind() != Kind::Attribute && node->kind() != Kind::Namespace;
  XQueryWalkNodesExcept(root, isChild ? node : node->parent(), XQueryAncestors(node), visit);
}

// What precedes a node are the subtrees of the siblings before it and before its ancestors.
template <class Visit>
void XQueryWalkPrecedingNearestFirst(NSXMLNode* node, Visit& visit) {
  WorkPacer pacer;
  for (const NSXMLNode* above = node; above; above = above->parent()) {
    pacer.turn();
    for (NSXMLNode* top = above->previousSibling(); top; top = top->previousSibling()) {
      NSXMLNode* at = XQueryLastInSubtree(top);
      pacer.turn();
      while (at != top) {
        pacer.turn();
        if (!visit(at)) return;
        NSXMLNode* previous = at->previousSibling();
        at = previous ? XQueryLastInSubtree(previous) : at->parent();
      }
      if (!visit(top)) return;
    }
  }
}

template <class Visit>
void XQueryWalkAncestors(NSXMLNode* first, Visit& visit) {
  WorkPacer pacer;
  for (NSXMLNode* node = first; node; node = node->parent()) {
    pacer.turn();
    if (!visit(node)) return;
  }
}

template <class Visit>
void XQueryWalkAttributes(NSXMLNode* node, Visit& visit) {
  const auto* element = dyn_cast<NSXMLElement>(node);
  if (!element) return;
  WorkPacer pacer;
  for (NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    if (!visit(attribute)) return;
  }
}

// Visits `first` and its following siblings.
template <class Visit>
void XQueryWalkSiblings(NSXMLNode* first, Visit& visit) {
  WorkPacer pacer;
  for (NSXMLNode* node = first; node; node = node->nextSibling()) {
    pacer.turn();
    if (!visit(node)) return;
  }
}

template <class Visit>
void XQueryWalkPrecedingSiblings(NSXMLNode* node, Visit& visit) {
  WorkPacer pacer;
  for (NSXMLNode* previous = node->previousSibling(); previous;
       previous = previous->previousSibling()) {
    pacer.turn();
    if (!visit(previous)) return;
  }
}

template <class Visit>
void XQueryWalkAxis(NSXMLNode* node, int axis, Visit visit) {
  switch (axis) {
    case XQueryAxisChild:
      return XQueryWalkSiblings(node->firstChild(), visit);
    case XQueryAxisDescendant:
      return XQueryWalkNodes(node->nextNode(), XQueryDescendantStop(node), visit);
    case XQueryAxisDescendantOrSelf:
      if (visit(node)) XQueryWalkNodes(node->nextNode(), XQueryDescendantStop(node), visit);
      return;
    case XQueryAxisAttribute:
      return XQueryWalkAttributes(node, visit);
    case XQueryAxisSelf:
      visit(node);
      return;
    case XQueryAxisFollowingSibling:
      return XQueryWalkSiblings(node->nextSibling(), visit);
    case XQueryAxisFollowing:
      return XQueryWalkNodes(XQueryFollowingStart(node), nullptr, visit);
    case XQueryAxisAncestor:
      return XQueryWalkAncestors(node->parent(), visit);
    case XQueryAxisParent:
      if (node->parent()) visit(node->parent());
      return;
    case XQueryAxisPreceding:
      return XQueryWalkPreceding(node, visit);
    case XQueryAxisPrecedingSibling:
      return XQueryWalkPrecedingSiblings(node, visit);
    case XQueryAxisAncestorOrSelf:
      return XQueryWalkAncestors(node, visit);
    default:  // no such axis: nothing is walked
      return;
  }
}

template <class Visit>
void XQueryWalkAlongAxis(NSXMLNode* node, int axis, Visit visit) {
  if (axis == XQueryAxisPreceding) {
    XQueryWalkPrecedingNearestFirst(node, visit);
  } else {
    XQueryWalkAxis(node, axis, visit);
  }
}

}  // namespace xquery
