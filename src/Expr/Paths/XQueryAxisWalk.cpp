#include "Expr/Paths/XQueryAxisWalk.h"

#include "Platform/Tree/Arena.h"

namespace xquery {

NSXMLNode* XQueryDescendantStop(const NSXMLNode* node) {
  return NSXMLTree::descendantStop(node);
}

NSXMLNode* XQueryFollowingStart(const NSXMLNode* node) {
  WorkPacer pacer;
  for (; node; node = node->parent()) {
    pacer.turn();
    if (NSXMLNode* sibling = node->nextSibling()) return sibling;
  }
  return nullptr;
}

std::vector<NSXMLNode*> XQueryAncestors(const NSXMLNode* node) {
  std::vector<NSXMLNode*> ancestors;
  WorkPacer pacer;
  for (NSXMLNode* at = node->parent(); at; at = at->parent()) {
    pacer.turn();
    ancestors.push_back(at);
  }
  return ancestors;
}

NSXMLNode* XQueryLastInSubtree(NSXMLNode* node) {
  WorkPacer pacer;
  while (NSXMLNode* child = node->lastChild()) {
    pacer.turn();
    node = child;
  }
  return node;
}

}  // namespace xquery
