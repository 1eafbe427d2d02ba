// The base URIs of nodes that are asked for one after the other.
//
// A base URI is found by climbing to the nearest "xml:base". In a tree of ten thousand levels,
// climbing from every node takes a time that grows with their square. Nodes are mostly asked for in
// document order, one close to the one before it in the tree, so the way to the root that was
// climbed last is kept:
//
//   root - a - b - c - d   the last way, each with the "xml:base" that holds there
//   root - a - b - e - f   the way of f, in another branch of b: only f and e are climbed
//
// Short climbs are done without it. A way is good as long as its tree has not changed, which the
// tree's indexes tell.
#pragma once

#include "Platform/Tree/TreeIndexes.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <cstddef>

namespace xquery {

class XQueryBaseURIs {
 public:
  // What XQueryNodeBaseURI answers: "" when there is none.
  Ref<NSString> ofNode(const NSXMLNode* node);
  // Forgets the way, which counts towards the memory ceiling.
  void clear();

 private:
  struct Level {
    const NSXMLElement* element;
    const NSXMLNode* base;  // its own or inherited; null for none
  };

  Ref<NSString> ofDeepElement(const NSXMLElement* element);
  // The number of levels down to the element; 0 when it is not on the way.
  size_t levelsTo(const NSXMLElement* element) const;

  NSXMLIndexesRef _tree;
  NSXMLIndexList<Level> _way;  // from the root down
};

}  // namespace xquery
