// A document as nodes of seven words, in document order and linked by pointers: what a walk through
// the engine's smaller nodes is measured beside.
#pragma once

#include "xquery/xquery.h"

#include <cstddef>
#include <vector>

namespace bench {

class PlainNodes {
 public:
  // Of the same shape as the document, its attributes included.
  explicit PlainNodes(const xquery::NSXMLNode* document);

  // A walk: as many nodes as `count(//node())` finds.
  size_t count() const;

 private:
  struct Node {
    size_t kind = 0;
    Node* parent = nullptr;
    Node* previous = nullptr;
    Node* next = nullptr;
    Node* firstChild = nullptr;
    Node* firstAttribute = nullptr;
    const void* content = nullptr;  // its name or its text, which lie elsewhere
  };
  static_assert(sizeof(void*) != 8 || sizeof(Node) == 56);

  void add(const xquery::NSXMLNode* node, Node* parent, Node* previous);
  void addAttributes(const xquery::NSXMLNode* node);

  std::vector<Node> _nodes;
};

}  // namespace bench
