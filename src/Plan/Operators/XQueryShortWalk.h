// The walk of a short path: from one node over children and attributes of given names, and of these
// all there are, or over its ancestors or siblings first.
//
// What such a path finds from one node comes in document order, each node once: the children of a
// node stand in their order, the subtrees of two siblings do not meet, and attributes have no
// children. So there is nothing to sort and nothing to look for twice. Ancestors and preceding
// siblings come the nearest first, as a path answers them; what is found from several ancestors
// comes once, but in another order than that of the path. Where the tree is known to have no two
// siblings of a name (Platform/Tree/SingleNames.h), the walk for it ends with the first one.
#pragma once

#include "Context/XQueryContextInternal.h"
#include "Expr/Paths/XQueryAxisWalk.h"
#include "Expr/Paths/XQueryPathRun.h"
#include "Platform/Tree/TreeIndexes.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

namespace xquery {

class XQueryExpr;
class XQueryPathExpr;

class XQueryShortWalk {
 public:
  static constexpr size_t mostSteps = 8;

  // Of a path, or of "." and a local variable alone, in parentheses or not; false for any other
  // expression. Lives no longer than that expression.
  [[nodiscard]] bool readFrom(const XQueryExpr& expr);

  // The same of a path of one step with a literal position and nothing else, "b[6]", or a number of
  // nodes that there have to be, "b[last() > 5]", without that: from one node the path finds
  // something when the walk finds so many. 0 for any other path.
  [[nodiscard]] uint64_t readFromWithPosition(const XQueryPathExpr& path);

  // Whether it starts from the context item.
  bool startsFromFocus() const { return _varID == 0; }
  // The local variable that it starts from otherwise, and 0.
  int64_t variable() const { return _varID; }

  // The same of steps behind something else, which may be none.
  [[nodiscard]] bool readSteps(const XQueryStep* step);
  bool isEmpty() const { return _count == 0; }

  // Whether names need not be resolved in the namespaces of the context.
  bool isOpen(const XQueryContext& context) const {
    return !_needsNoDefaultNamespace || !_internal(context).hasDefaultNamespace();
  }
  // The node to start from; null where the walk is not open: there is none or there are several, or
  // names have to be resolved in the namespaces of the context.
  NSXMLNode* start(const XQueryContext& context) const {
    if (!isOpen(context)) return nullptr;
    const auto& dynamic = _internal(context);
    return dyn_cast<NSXMLNode>(_varID ? dynamic.variableForID(_varID)
                                      : dynamic.contextItem().get());
  }
  // Whether the nodes come in the order in which the path answers them.
  bool visitsInOrder() const { return _count <= 1 || !goesUp(_steps[0].axis); }
  // Whether it finds nothing but nodes above the start, or the start.
  bool goesUpOnly() const {
    return std::all_of(_steps.begin(), _steps.begin() + _count, [](const Step& step) {
      return goesUp(step.axis) || step.axis == XQueryAxisParent;
    });
  }
  // Visits what there is from the start on, until the visitor answers false.
  template <class Visit>
  void visit(NSXMLNode* start, Visit visit) const {
    visitFrom(0, start, visit);
  }

 private:
  struct Step {
    int axis;
    uint32_t kinds;                 // as bits
    const NSXMLExpandedName* name;  // null for any
    bool takes(const NSXMLNode* node) const {
      if ((kinds & XQueryKindBit(node->kind())) == 0) return false;
      return !name || node->expandedName() == name;
    }
  };

  bool readOrigin(const XQueryExpr* origin);
  bool readStep(const XQueryAxisStep& step);
  static bool goesUp(int axis) {
    return axis == XQueryAxisAncestor || axis == XQueryAxisAncestorOrSelf;
  }
  static bool goesAside(int axis) {
    return axis == XQueryAxisFollowingSibling || axis == XQueryAxisPrecedingSibling;
  }
  // What is found from preceding siblings comes in document order where these do.
  template <class Take>
  static void walkPrecedingSiblings(NSXMLNode* node, bool isLast, Take& take) {
    if (isLast) return XQueryWalkPrecedingSiblings(node, take);
    if (!node->previousSibling()) return;
    const auto takeBefore = [&](NSXMLNode* found) { return found != node && take(found); };
    XQueryWalkSiblings(node->parent()->firstChild(), takeBefore);
  }

  // False to end the walk.
  template <class Visit>
  bool visitFrom(size_t index, NSXMLNode* node, Visit& visit) const {
    if (index == _count) return visit(node);
    const Step& step = _steps[index];
    bool goesOn = true;
    // Asked of the first one that is found.
    bool mayBeSingle = step.axis == XQueryAxisChild && step.name;
    const auto take = [&](NSXMLNode* found) {
      if (!step.takes(found)) return true;
      goesOn = visitFrom(index + 1, found, visit);
      if (!goesOn || !mayBeSingle || !found->nextSibling()) return goesOn;
      mayBeSingle = NSXMLTreeIndexes::endsWalk(found);
      return !mayBeSingle;
    };
    if (step.axis == XQueryAxisChild) {
      XQueryWalkSiblings(node->firstChild(), take);
    } else if (step.axis == XQueryAxisAttribute) {
      XQueryWalkAttributes(node, take);
    } else if (goesUp(step.axis)) {
      XQueryWalkAncestors(step.axis == XQueryAxisAncestor ? node->parent() : node, take);
    } else if (step.axis == XQueryAxisFollowingSibling) {
      XQueryWalkSiblings(node->nextSibling(), take);
    } else if (step.axis == XQueryAxisPrecedingSibling) {
      walkPrecedingSiblings(node, index + 1 == _count, take);
    } else if (node->parent()) {
      take(node->parent());
    }
    return goesOn;
  }

  int64_t _varID = 0;  // 0 for the context item
  bool _needsNoDefaultNamespace = false;
  size_t _count = 0;
  std::array<Step, mostSteps> _steps{};
};

}  // namespace xquery
