// The children of all nodes below one, without looking at every node twice.
//
// "//" and a child step find them parent by parent, and the descendant axis in document order. The
// parents come in document order, too, so that the one order is had of the other by sorting by the
// parent alone:
//
//   <r><p><q><p/></q></p><p/></r>     document order   p1 p2 p3
//                                     by parents       p1 p3 (of r), p2 (of q)
//
// Where nodes of that name do not lie in each other, both are the same.
#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryPathResults.h"
#include "Plan/Paths/XQueryIndexedWalk.h"
#include "Plan/Paths/XQueryPathWalk.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"

#include <algorithm>

namespace xquery {
namespace {

uint32_t numberOfParent(const NSXMLNode* node) {
  return NSXMLNodeOrder::number(*node->parent());
}

void putInOrderOfParents(std::vector<NSXMLNode*>& nodes) {
  WorkPacer pacer;
  const auto isBefore = [&pacer](const NSXMLNode* a, const NSXMLNode* b) {
    pacer.turn();
    return numberOfParent(a) < numberOfParent(b);
  };
  if (std::is_sorted(nodes.begin(), nodes.end(), isBefore)) return;
  std::stable_sort(nodes.begin(), nodes.end(), isBefore);
}

}  // namespace

// Parents that are open, the innermost last, with the number of their children met so far. Children
// are met in document order, so that a parent that comes after another child's is done with.
class XQueryPathWalk::ChildCounts {
 public:
  // The position of the node among those of its parent.
  uint64_t countFor(const NSXMLNode* node) {
    const NSXMLNode* parent = node->parent();
    while (!_open.empty() && _open.back().parent != parent &&
           isDone(*_open.back().parent, *parent)) {
      _open.pop_back();
    }
    if (_open.empty() || _open.back().parent != parent) _open.push_back({parent, 0});
    return ++_open.back().count;
  }

 private:
  struct Parent {
    const NSXMLNode* parent;
    uint64_t count;
  };

  static bool isDone(const NSXMLNode& one, const NSXMLNode& next) {
    if (NSXMLNodeOrder::number(one) > NSXMLNodeOrder::number(next)) return true;
    const NSXMLNode* behind = one.nextSibling();
    return behind && NSXMLNodeOrder::number(*behind) <= NSXMLNodeOrder::number(next);
  }

  std::vector<Parent, ValueAllocator<Parent>> _open;
};

// Acts on the nodes at the position that the first predicate asks for and for which the others
// hold.
template <class Act>
void XQueryPathWalk::visitCountedBelow(size_t index, NSXMLNode* node, Act act) {
  const XQueryWalkedStep& step = _steps[index];
  const uint64_t position = *step.step->literalPosition(step.predicatesInTest);
  XQueryStepTest test(step, *this);
  ChildCounts counts;
  const auto actOnCounted = [&](NSXMLNode* found) {
    if (counts.countFor(found) != position) return true;
    if (!keepsAlone(step, step.predicatesInTest + 1, found)) return !hasFailed;
    return act(found);
  };
  if (const NSXMLExpandedName* name = test.onlyName()) {
    XQueryWalkAxis(node, XQueryAxisDescendant,
                   XQueryNamedVisit(name, XQueryAxisDescendant, actOnCounted));
  } else if (test.onlyNames()) {
    XQueryWalkAxis(node, XQueryAxisDescendant, XQueryChoiceVisit(test, actOnCounted));
  } else {
    XQueryWalkAxis(node, XQueryAxisDescendant, [&test, actOnCounted](NSXMLNode* found) {
      return !test.matches(found) || actOnCounted(found);
    });
  }
}

void XQueryPathWalk::takeCountedBelow(size_t index, NSXMLNode* node) {
  visitCountedBelow(index, node, [&](NSXMLNode* found) {
    takeNode(index + 1, found);
    return !isOver();
  });
}

// In the order in which the child step would hand them on, and in the same lists.
void XQueryPathWalk::takeByParents(size_t index, int axis, NSXMLNode* node) {
  std::vector<NSXMLNode*>& nodes = openNodeList();
  if (gatherBelow(index, axis, node, nodes)) {
    putInOrderOfParents(nodes);
    if (listingStep == &_steps[index]) {
      listed->insert(listed->end(), nodes.begin(), nodes.end());
    } else {
      handOnByParents(index, nodes);
    }
  } else {
    hasFailed = true;
  }
  closeNodeList();
}

// What the step keeps, or would ask its predicates of where it only lists. False after an error.
bool XQueryPathWalk::gatherBelow(size_t index, int axis, NSXMLNode* node,
                                 std::vector<NSXMLNode*>& nodes) {
  const XQueryWalkedStep& step = _steps[index];
  if (step.countsBelow) {
    visitCountedBelow(index, node, [&nodes](NSXMLNode* found) {
      nodes.push_back(found);
      return true;
    });
    return !hasFailed;
  }
  size_t firstAsked = step.predicatesInTest;
  if (lookUp(step, axis, node, nodes)) {
    firstAsked += step.lookup->answers();
  } else {
    collect(step, axis, node, nodes);
    _met += nodes.size();
    if (step.lookup) step.lookup->noteAsked(node, nodes.size());
  }
  return listingStep == &step || filterNodes(step, firstAsked, nodes);
}

// A step with predicates hands on a list for each parent, one without them node by node.
void XQueryPathWalk::handOnByParents(size_t index, std::span<NSXMLNode* const> nodes) {
  const bool areLists = _steps[index].hasPredicates();
  while (!nodes.empty() && !isOver()) {
    size_t count = 1;
    if (areLists) {
      const NSXMLNode* parent = nodes.front()->parent();
      while (count < nodes.size() && nodes[count]->parent() == parent) ++count;
      takeNodes(index + 1, nodes.first(count));
    } else {
      takeNode(index + 1, nodes.front());
    }
    nodes = nodes.subspan(count);
  }
}

}  // namespace xquery
