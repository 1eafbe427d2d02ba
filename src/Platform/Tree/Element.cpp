#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "xquery/XMLNode.h"

namespace xquery {

Ref<NSXMLElement> NSXMLElement::elementWithName(NSStringView name, NSStringView URI) {
  return NSXMLTree::makeLoneElement(name, URI);
}

// --- attributes and namespaces ---------------------------------------------------------------

uint32_t NSXMLElement::attributeCount() const {
  uint32_t count = 0;
  for (const NSXMLNode* node = firstAttribute(); node; node = nextAttribute(node)) ++count;
  chargeWork(count / WorkPacer::turnsPerStep);
  return count;
}

NSXMLNode* NSXMLElement::attributeForName(NSStringView name) const {
  NSXMLNode* attribute = firstAttribute();
  WorkPacer pacer;
  for (; attribute && !attribute->nameView().equals(name); attribute = nextAttribute(attribute)) {
    pacer.turn();
  }
  return attribute;
}

NSXMLNode* NSXMLElement::attributeForLocalName(NSStringView localName, NSStringView URI) const {
  NSXMLNode* attribute = firstAttribute();
  WorkPacer pacer;
  while (attribute &&
         !(attribute->localNameView().equals(localName) && attribute->URIView().equals(URI))) {
    pacer.turn();
    attribute = nextAttribute(attribute);
  }
  return attribute;
}

bool NSXMLElement::addAttribute(const Ref<NSXMLNode>& attribute) {
  if (!attribute || attribute->kind() != Kind::Attribute || attribute->parent() ||
      attributeForName(attribute->nameView()) || NSXMLTree::isFrozen(this)) {
    return false;
  }
  NSXMLTree::appendProperty(this, attribute.get());
  return true;
}

bool NSXMLElement::addNamespace(const Ref<NSXMLNode>& node) {
  if (!node || node->kind() != Kind::Namespace || node->parent()) return false;
  if (NSXMLTree::isFrozen(this)) return false;
  WorkPacer pacer;
  for (const NSXMLNode* present = firstNamespace(); present; present = nextNamespace(present)) {
    pacer.turn();
    if (present->nodeName() == node->nodeName()) return false;
  }
  NSXMLTree::appendProperty(this, node.get());
  return true;
}

void NSXMLElement::removeAttributeForName(NSStringView name) {
  if (NSXMLNode* attribute = attributeForName(name)) attribute->detach();
}

// --- children --------------------------------------------------------------------------------

bool NSXMLElement::addChild(const Ref<NSXMLNode>& child) {
  return NSXMLTree::adoptChild(this, child.get(), nullptr);
}

bool NSXMLElement::insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex) {
  return NSXMLTree::adoptChild(this, child.get(), childAtIndex(atIndex));
}

}  // namespace xquery
