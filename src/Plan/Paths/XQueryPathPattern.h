// A path from the document, asked whether it finds a node that somebody has.
//
// The steps are gone through from the last one to the first, from the node up: the node has to pass
// the last test, its parent the one before, and so on up to the document. No other node of the tree
// is looked at, whatever there is.
//
//   /a/b/c      c, its parent b, the parent of that a, which is topmost
//   //b[@x]/c   c, its parent b with an @x, anywhere in the tree
//   /a//c       c, somewhere below a topmost a
//
// "//" further down is not asked so: the descendant axis of the last child of a last child goes on
// behind its subtree, to nodes that it is no ancestor of.
#pragma once

#include "Expr/Paths/XQueryPathResults.h"
#include "Expr/Paths/XQueryPathRun.h"
#include "Plan/Paths/XQueryWalkedStep.h"
#include "Platform/Tree/NameIndex.h"
#include "xquery/XMLNode.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace xquery {

class XQueryWalkedPath;

class XQueryPathPattern {
 public:
  // Whether the path can be asked: it begins at the document, countsNodes, and leads down by
  // children, attributes and at most one "//", which is not further down than behind the first
  // step; its predicates ask for the truth of something, wherever a node stands.
  static bool fits(const XQueryWalkedPath& path);

  // One evaluation of such a path, which lives longer. The order numbers of the document are to be
  // those of nobody who changes it meanwhile.
  XQueryPathPattern(const XQueryWalkedPath& path, const NSXMLDocument& ofDocument,
                    XQueryContext& context);
  XQueryPathPattern(const XQueryPathPattern&) = delete;
  XQueryPathPattern& operator=(const XQueryPathPattern&) = delete;

  // Whether no nodes but elements are found in the tree.
  bool findsElementsAlone(bool hasInstructions) const;
  // Of how many nodes at most the last predicates are asked when the path is walked, where its last
  // step asks for names of elements.
  std::optional<uint64_t> mostAsked(const NSXMLNameIndex& elements) const;
  // False as well where a predicate comes to a limit, which the context says then. The focus is
  // left anywhere.
  bool finds(NSXMLNode* node);

 private:
  static constexpr size_t mostLevels = 12;
  struct Level {
    const XQueryWalkedStep* step;
    XQueryStepTest test;
    bool isDeep;  // behind "//", or on the descendant axis
  };

  bool standsRight(NSXMLNode* node, std::array<NSXMLNode*, mostLevels>& at);
  NSXMLNode* topmostAbove(const NSXMLNode* node);
  bool isKept(const XQueryWalkedStep& step, NSXMLNode* node) const;

  const NSXMLDocument& _document;
  XQueryContext& _context;
  XQueryPathResults _results;
  XQueryPathRun _run;
  std::vector<Level> _levels;
};

}  // namespace xquery
