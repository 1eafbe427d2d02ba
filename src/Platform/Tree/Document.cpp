#include "Platform/Tree/Arena.h"
#include "xquery/XMLNode.h"

namespace xquery {

Ref<NSXMLDocument> NSXMLDocument::document() {
  return NSXMLTree::create()->makeDocument();
}

NSXMLElement* NSXMLDocument::rootElement() const {
  NSXMLNode* child = firstChild();
  while (child && child->kind() != Kind::Element) child = child->nextSibling();
  return cast<NSXMLElement>(child);
}

Ref<NSString> NSXMLDocument::documentURI() const {
  return _URI;
}

void NSXMLDocument::setURI(const Ref<NSString>& URI) {
  if (!NSXMLTree::isFrozen(this)) NSXMLTree::of(this)->setURI(this, URI.get());
}

bool NSXMLDocument::addChild(const Ref<NSXMLNode>& child) {
  return NSXMLTree::adoptChild(this, child.get(), nullptr);
}

bool NSXMLDocument::insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex) {
  return NSXMLTree::adoptChild(this, child.get(), childAtIndex(atIndex));
}

}  // namespace xquery
