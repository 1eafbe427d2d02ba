// Builds a tree in document order: nodes come from large blocks and get their order numbers as they
// arrive. Parsing and copying are its users.
#pragma once

#include "Platform/Tree/Arena.h"

namespace xquery {

class NSXMLTreeBuilder {
 public:
  // Room for that much to begin with; it grows from there.
  NSXMLTreeBuilder(size_t nodeBytes, size_t textBytes);
  // Frees the tree unless `finish` handed it out.
  ~NSXMLTreeBuilder();
  NSXMLTreeBuilder(const NSXMLTreeBuilder&) = delete;
  NSXMLTreeBuilder& operator=(const NSXMLTreeBuilder&) = delete;

  NSXMLTree& tree() { return *_tree; }

  // The first node becomes the root. Names must have been adopted by the tree.
  NSXMLDocument* openDocument();
  NSXMLElement* openElement(const NSXMLName* name);
  // Namespaces and then attributes, before the element's children.
  NSXMLNode* addProperty(Kind kind, const NSXMLName* name);
  NSXMLNode* addLeaf(Kind kind, const NSXMLName* name = nullptr);
  // A copy of the text in the tree, in the width that it has, for `setStoredText`.
  NSStringView addText(NSStringView text);
  void close();

  // The open element or document; null before the first and after the last.
  NSXMLNode* current() const { return _current; }
  // The finished tree's root, which the caller must make a reference to.
  [[nodiscard]] NSXMLNode* finish();

 private:
  void number(NSXMLNode* node);
  void append(NSXMLNode* child);

  NSXMLTree* _tree;
  NSXMLNode* _root = nullptr;
  NSXMLNode* _current = nullptr;
  NSXMLNode* _lastChild = nullptr;     // of the current node
  NSXMLNode* _lastProperty = nullptr;  // of the current element
  uint32_t _nextNumber = NSXMLTree::firstOrderNumber;
};

}  // namespace xquery
