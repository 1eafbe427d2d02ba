// Walks that take the nodes of a name from the index of the tree, where it has one, and an axis
// that joins two others.
#pragma once

#include "Expr/Paths/XQueryAxisWalk.h"
#include "Platform/Tree/TreeIndexes.h"
#include "xquery/XMLNode.h"

namespace xquery {

// No axis of a query: the attributes of a node and of all below it, as "//@a" finds them.
inline constexpr int XQueryAxisAttributesBelow = 1000;

// Calls act(node) for each of the nodes until it answers false. Those of a name lie far from each
// other, so that each is fetched into the cache while the ones before it are dealt with.
template <class Act>
void XQueryVisitSpan(NSXMLNodeSpan nodes, Act act) {
  constexpr size_t ahead = 8;
  WorkPacer pacer;
  for (size_t i = 0; i < nodes.size(); ++i) {
    pacer.turn();
    if (ahead < nodes.size() - i) __builtin_prefetch(nodes[i + ahead]);
    if (!act(nodes[i])) return;
  }
}

template <class Act>
void XQueryVisitIndexed(const NSXMLIndexedNodes& indexed, Act act) {
  XQueryVisitSpan(indexed.nodes, act);
}

// Does something with the elements and attributes of a name and passes over all other nodes. Of the
// children of a node, those behind the only one of the name are not looked at.
template <class Act>
class XQueryNamedVisit {
 public:
  XQueryNamedVisit(const NSXMLExpandedName* name, int axis, Act act)
      : _name(name), _areChildren(axis == XQueryAxisChild), _act(act) {}

  bool operator()(NSXMLNode* found) {
    const bool isNamed = found->kind() == Kind::Element || found->kind() == Kind::Attribute;
    if (!isNamed || found->expandedName() != _name) return true;
    if (!_act(found)) return false;
    if (!_areChildren || !found->nextSibling()) return true;
    _areChildren = NSXMLTreeIndexes::endsWalk(found);
    return !_areChildren;
  }
  // In place of a walk, which would meet no attributes.
  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    const auto indexed = NSXMLIndexedElements(_name, first, stop);
    if (!indexed) return false;
    XQueryVisitIndexed(*indexed, _act);
    return true;
  }
  bool visitIndexedAttributes(const NSXMLNode* first, const NSXMLNode* stop) const {
    const auto indexed = NSXMLIndexedAttributes(_name, first, stop);
    if (!indexed) return false;
    XQueryVisitIndexed(*indexed, _act);
    return true;
  }

 private:
  const NSXMLExpandedName* _name;
  bool _areChildren;  // of which the first may be the only one
  Act _act;
};

// The same for a test that takes several names and elements alone, or instructions as well.
template <class Test, class Act>
class XQueryChoiceVisit {
 public:
  XQueryChoiceVisit(Test& test, Act act) : _test(test), _act(act) {}

  bool operator()(NSXMLNode* found) { return !_test.matches(found) || _act(found); }
  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    const auto indexed =
        NSXMLIndexedElements(*_test.onlyNames(), _test.acceptsInstructions(), first, stop);
    if (!indexed) return false;
    XQueryVisitIndexed(*indexed, _act);
    return true;
  }

 private:
  Test& _test;
  Act _act;
};

// Goes from nodes to their attributes.
template <class Visit>
class XQueryAttributesVisit {
 public:
  explicit XQueryAttributesVisit(Visit& visit) : _visit(visit) {}

  bool operator()(NSXMLNode* node) {
    bool goesOn = true;
    auto visitOne = [&](NSXMLNode* attribute) { return goesOn = _visit(attribute); };
    XQueryWalkAttributes(node, visitOne);
    return goesOn;
  }
  bool visitIndexed(const NSXMLNode* first, const NSXMLNode* stop) const {
    if constexpr (requires { _visit.visitIndexedAttributes(first, stop); }) {
      return _visit.visitIndexedAttributes(first, stop);
    }
    return false;
  }

 private:
  Visit& _visit;
};

// The nodes on one of these axes, in the order in which a path sees them, or in that in which
// predicates count them.
template <class Visit>
void XQueryWalkAnyAxis(NSXMLNode* node, int axis, bool isCounted, Visit visit) {
  if (axis == XQueryAxisAttributesBelow) {
    XQueryWalkNodes(node, XQueryDescendantStop(node), XQueryAttributesVisit(visit));
  } else if (isCounted) {
    XQueryWalkAlongAxis(node, axis, visit);
  } else {
    XQueryWalkAxis(node, axis, visit);
  }
}

}  // namespace xquery
