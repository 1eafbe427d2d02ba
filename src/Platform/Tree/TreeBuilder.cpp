#include "Platform/Tree/TreeBuilder.h"

#include "Platform/Base/LastingObjects.h"
#include "Platform/Text/Blocks.h"

#include <cstring>
#include <new>

namespace xquery {
namespace {

NSXMLTree* lastingTree() {
  const LastingObjects lasting;
  return NSXMLTree::create();
}

}  // namespace

NSXMLTreeBuilder::NSXMLTreeBuilder(size_t nodeBytes, size_t textBytes) : _tree(lastingTree()) {
  _tree->startBulk(nodeBytes, textBytes);
}

NSXMLTreeBuilder::~NSXMLTreeBuilder() {
  if (_tree) _tree->destroy();
}

void NSXMLTreeBuilder::number(NSXMLNode* node) {
  // Numbers are 32 bits wide: a tree of more nodes is more than memory was given for.
  if (_nextNumber == UINT32_MAX) throw std::bad_alloc();
  NSXMLTree::setOrderNumber(node, _nextNumber++);
}

void NSXMLTreeBuilder::append(NSXMLNode* child) {
  number(child);
  if (!_root) _root = child;
  if (!_current) return;
  NSXMLTree::parentOf(child) = _current;
  if (_lastChild) {
    NSXMLTree::nextOf(_lastChild) = child;
    NSXMLTree::previousOf(child) = _lastChild;
  } else {
    NSXMLTree::firstChildOf(_current) = child;
  }
  _lastChild = child;
}

NSXMLDocument* NSXMLTreeBuilder::openDocument() {
  NSXMLDocument* document = _tree->makeDocument();
  append(document);
  _current = document;
  _lastChild = nullptr;
  return document;
}

NSXMLElement* NSXMLTreeBuilder::openElement(const NSXMLName* name) {
  NSXMLElement* element = _tree->makeElement();
  NSXMLTree::setAdoptedName(element, name);
  append(element);
  _current = element;
  _lastChild = nullptr;
  _lastProperty = nullptr;
  return element;
}

NSXMLNode* NSXMLTreeBuilder::addProperty(Kind kind, const NSXMLName* name) {
  NSXMLNode* property = _tree->makeNode(kind);
  NSXMLTree::setAdoptedName(property, name);
  number(property);
  NSXMLTree::parentOf(property) = _current;
  (_lastProperty ? NSXMLTree::nextOf(_lastProperty)
                 : NSXMLTree::firstPropertyOf(cast<NSXMLElement>(_current))) = property;
  _lastProperty = property;
  return property;
}

NSXMLNode* NSXMLTreeBuilder::addLeaf(Kind kind, const NSXMLName* name) {
  NSXMLNode* leaf = _tree->makeNode(kind);
  if (name) NSXMLTree::setAdoptedName(leaf, name);
  append(leaf);
  return leaf;
}

NSStringView NSXMLTreeBuilder::addText(NSStringView text) {
  return withUnitsOf(text, [this](auto units) -> NSStringView {
    using Unit = typename decltype(units)::value_type;
    auto* const copy = static_cast<Unit*>(_tree->allocateText(units.size() * sizeof(Unit)));
    auto* to = copy;
    inBlocks(units, [&to](auto block) {
      if (!block.empty()) std::memcpy(to, block.data(), block.size() * sizeof(Unit));
      to += block.size();
    });
    return {copy, static_cast<uint32_t>(units.size())};
  });
}

void NSXMLTreeBuilder::close() {
  // The first child's previous sibling field holds the last child.
  if (NSXMLNode* first = NSXMLTree::firstChildOf(_current)) {
    NSXMLTree::previousOf(first) = _lastChild;
  }
  _lastChild = _current;
  _lastProperty = nullptr;
  _current = _current->parent();
}

NSXMLNode* NSXMLTreeBuilder::finish() {
  while (_current) close();
  _tree->endBulk();
  _tree = nullptr;
  return _root;
}

}  // namespace xquery
