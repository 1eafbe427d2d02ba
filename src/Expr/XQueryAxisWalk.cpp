#include "Expr/XQueryAxisWalk.h"

namespace xquery {

NSXMLNode* XQueryDescendantStop(const NSXMLNode* node) {
  if (NSXMLNode* sibling = node->nextSibling()) return sibling;
  const NSXMLNode* parent = node->parent();
  return parent ? parent->nextSibling() : nullptr;
}

NSXMLNode* XQueryFollowingStart(const NSXMLNode* node) {
  for (; node; node = node->parent()) {
    if (NSXMLNode* sibling = node->nextSibling()) return sibling;
  }
  return nullptr;
}

std::vector<NSXMLNode*> XQueryAncestors(const NSXMLNode* node) {
  std::vector<NSXMLNode*> ancestors;
  for (NSXMLNode* at = node->parent(); at; at = at->parent()) ancestors.push_back(at);
  return ancestors;
}

NSXMLNode* XQueryLastInSubtree(NSXMLNode* node) {
  while (NSXMLNode* child = node->lastChild()) node = child;
  return node;
}

}  // namespace xquery
