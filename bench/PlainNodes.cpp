#include "PlainNodes.h"

namespace bench {

using namespace xquery;

PlainNodes::PlainNodes(const NSXMLNode* document) {
  size_t count = 0;
  for (const NSXMLNode* node = document; node; node = node->nextNode()) {
    ++count;
    const auto* const element = dyn_cast<NSXMLElement>(node);
    const NSXMLNode* attribute = element ? element->firstAttribute() : nullptr;
    for (; attribute; attribute = NSXMLElement::nextAttribute(attribute)) ++count;
  }
  _nodes.reserve(count);  // so that nodes stay where they are
  struct Open {
    const NSXMLNode* node;
    Node* plain;
    Node* lastChild;
  };
  std::vector<Open> open;
  for (const NSXMLNode* node = document; node; node = node->nextNode()) {
    while (!open.empty() && open.back().node != node->parent()) open.pop_back();
    Open* const above = open.empty() ? nullptr : &open.back();
    add(node, above ? above->plain : nullptr, above ? above->lastChild : nullptr);
    Node* const added = &_nodes.back();
    if (above) above->lastChild = added;
    addAttributes(node);
    open.push_back({node, added, nullptr});
  }
}

void PlainNodes::add(const NSXMLNode* node, Node* parent, Node* previous) {
  _nodes.push_back(
      {static_cast<size_t>(node->kind()), parent, previous, nullptr, nullptr, nullptr, node});
  if (previous) {
    previous->next = &_nodes.back();
  } else if (parent) {
    parent->firstChild = &_nodes.back();
  }
}

void PlainNodes::addAttributes(const NSXMLNode* node) {
  const auto* const element = dyn_cast<NSXMLElement>(node);
  if (!element) return;
  Node* const owner = &_nodes.back();
  Node* last = nullptr;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    _nodes.push_back({static_cast<size_t>(attribute->kind()), owner, last, nullptr, nullptr,
                      nullptr, attribute});
    (last ? last->next : owner->firstAttribute) = &_nodes.back();
    last = &_nodes.back();
  }
}

size_t PlainNodes::count() const {
  size_t count = 0;
  const Node* node = &_nodes.front();
  for (;;) {
    if (node->firstChild) {
      node = node->firstChild;
    } else {
      while (node && !node->next) node = node->parent;
      if (!node) return count;
      node = node->next;
    }
    ++count;
  }
}

}  // namespace bench
