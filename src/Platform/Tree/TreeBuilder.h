// Builds a tree in document order: nodes come from large blocks, one behind the other and each with
// its text, and get their order numbers as they arrive. Parsing and copying are its users.
//
// A long text lies in a block of texts and the node refers to it, so that a walk over the nodes
// does not have to pass it.
#pragma once

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/TreeHead.h"

#include <cstring>
#include <new>

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

  // The first node becomes the root. Names must have been adopted by the tree. Texts are copied, in
  // the width that they have.
  NSXMLDocument* openDocument();
  NSXMLElement* openElement(const NSXMLName* name);
  // Namespaces and then attributes, before the element's children.
  NSXMLNode* addProperty(Kind kind, const NSXMLName* name, NSStringView text);
  NSXMLNode* addLeaf(Kind kind, NSStringView text);  // a text or a comment
  NSXMLNode* addInstruction(const NSXMLName* target, NSStringView text);
  void close();

  // The same with a text that is in the tree already, and may be that of several nodes.
  NSXMLNode* addProperty(Kind kind, const NSXMLName* name, const NSStringView* stored);
  NSXMLNode* addLeaf(Kind kind, const NSStringView* stored);
  NSXMLNode* addInstruction(const NSXMLName* target, const NSStringView* stored);
  const NSStringView* store(NSStringView text);
  // Room for so many units of a text, for the caller to fill.
  char16_t* roomForUnits(size_t count);
  const NSStringView* storeFilled(NSStringView text);
  // Room for as many units, of which the caller may fill fewer; null where it would have to be
  // made. It is taken by storing what is there, before anything else is.
  char16_t* unitsInHand(size_t most) const;
  const NSStringView* storeUnitsInHand(size_t count);

  // In bytes: a longer one lies apart from its node. Most texts are shorter.
  static constexpr size_t longestTextBehind = 128;

  // A text that stays where it is when its builder goes back.
  const NSStringView* storeLasting(NSStringView text);

  // --- going back ------------------------------------------------------------------------------
  // A place between two children of the open node. Of a document that is read part by part, each
  // is built, looked at and dropped: the next one takes the same memory and the same numbers.
  struct Mark {
    NSXMLBlock* lastBlock;
    NSXMLBlock* nodeBlock;
    char* nodeCursor;
    char* nodeEnd;
    NSXMLBlock* textBlock;
    char* textCursor;
    char* textEnd;
    uint32_t nextNumber;
    NSXMLNode* current;
    NSXMLNode* lastChild;
  };
  Mark mark() const;
  // As if nothing had been added since; what was is gone, so that nobody may refer to it. The node
  // that was open must be, and be the innermost. Names stay, and so do lasting texts.
  void backTo(const Mark& mark);
  // What is there can be walked, as if the open nodes ended here; more may be added afterwards.
  void endOpenNodes();
  // The open element, which has no children, is as if it had not been there.
  void dropOpenElement();

  // What a node of the kind and its text take of nodes and of texts.
  static void addRoom(Kind kind, NSStringView text, size_t& nodeBytes, size_t& textBytes);

  // The open element or document; null before the first and after the last.
  NSXMLNode* current() const { return _current; }
  // The finished tree's root, which the caller must make a reference to.
  [[nodiscard]] NSXMLNode* finish();

 private:
  static size_t bytesOf(NSStringView text) {
    return size_t{text.length()} << static_cast<int>(text.isWide());
  }
  static const char* unitsOf(NSStringView text) {
    return text.isWide() ? reinterpret_cast<const char*>(text.wideUnits()) : text.asciiUnits();
  }
  static void copyShort(char* to, const char* from, size_t bytes);
  [[noreturn]] static void refuseNode();

  char* takeRoom(size_t bytes) {
    if (static_cast<size_t>(_nodeEnd - _nodeCursor) < bytes) [[unlikely]] {
      startNodeBlock(bytes);
    }
    char* const room = _nodeCursor;
    _nodeCursor += bytes;
    return room;
  }
  void startNodeBlock(size_t bytes);
  void beginNodeBlock(NSXMLBlock* block);
  void beginTextBlock(NSXMLBlock* block);
  void freeBlocksBehind(NSXMLBlock* last, const NSXMLBlock* butNodes, const NSXMLBlock* butTexts);
  char* takeTextRoom(size_t bytes);

  template <class Node>
  Node* make(Kind kind, size_t textBytes = 0) {
    char* const room = takeRoom(sizeof(Node) + textBytes);  // may start a block
    Node* const node = NSXMLTree::placeNode<Node>(_nodeBlock, room, kind);
    // Numbers are 32 bits wide: a tree of more nodes is more than memory was given for.
    if (_nextNumber == UINT32_MAX) [[unlikely]] {
      refuseNode();
    }
    NSXMLTree::setOrderNumber(node, _nextNumber++);
    return node;
  }
  NSXMLNode* makeWithText(Kind kind, NSStringView text);
  void append(NSXMLNode* child);
  void appendProperty(NSXMLNode* property, const NSXMLName* name);

  NSXMLTree* _tree;
  NSXMLNode* _root = nullptr;
  NSXMLNode* _current = nullptr;
  NSXMLNode* _lastChild = nullptr;     // of the current node
  NSXMLNode* _lastProperty = nullptr;  // of the current element
  uint32_t _nextNumber = NSXMLTree::firstOrderNumber;
  // Where the next node and its text go, and the next long text.
  NSXMLBlock* _nodeBlock = nullptr;
  char* _nodeCursor = nullptr;
  char* _nodeEnd = nullptr;
  NSXMLBlock* _textBlock = nullptr;
  char* _textCursor = nullptr;
  char* _textEnd = nullptr;
  size_t _nextNodeBlock;
  size_t _nextTextBlock;
  // The tree's last block when its builder went back, and that of the mark.
  const NSXMLBlock* _lastKept = nullptr;
  const NSXMLBlock* _lastMarked = nullptr;
};

// --- how ---------------------------------------------------------------------------------------

inline char16_t* NSXMLTreeBuilder::unitsInHand(size_t most) const {
  const auto room = static_cast<size_t>(_textEnd - _textCursor) / sizeof(char16_t);
  return room < most ? nullptr : reinterpret_cast<char16_t*>(_textCursor);
}

inline void NSXMLTreeBuilder::append(NSXMLNode* child) {
  if (!_current) {
    if (!_root) _root = child;
    return;
  }
  NSXMLTree::parentOf(child) = _current;
  if (_lastChild) {
    NSXMLTree::nextOf(_lastChild) = child;
    NSXMLTree::previousOf(child) = _lastChild;
  } else {
    NSXMLTree::firstChildOf(_current) = child;
  }
  _lastChild = child;
}

inline NSXMLElement* NSXMLTreeBuilder::openElement(const NSXMLName* name) {
  auto* const element = make<NSXMLElement>(Kind::Element);
  NSXMLTree::nameOf(element) = name;
  append(element);
  _current = element;
  _lastChild = nullptr;
  _lastProperty = nullptr;
  return element;
}

// Texts are short, and a call of memcpy costs more than copying them.
inline void NSXMLTreeBuilder::copyShort(char* to, const char* from, size_t bytes) {
  if (bytes > 32) {
    std::memcpy(to, from, bytes);
  } else if (bytes >= 8) {
    const size_t last = bytes - 8;
    for (size_t at = 0; at < last; at += 8) std::memcpy(to + at, from + at, 8);
    std::memcpy(to + last, from + last, 8);
  } else if (bytes >= 4) {
    std::memcpy(to, from, 4);
    std::memcpy(to + bytes - 4, from + bytes - 4, 4);
  } else {
    for (size_t at = 0; at < bytes; ++at) to[at] = from[at];
  }
}

inline NSXMLNode* NSXMLTreeBuilder::makeWithText(Kind kind, NSStringView text) {
  const size_t bytes = bytesOf(text);
  if (bytes > longestTextBehind) [[unlikely]] {
    const NSStringView* const stored = store(text);
    auto* const node = make<NSXMLNode>(kind);
    NSXMLTree::setTextApart(node, stored);
    return node;
  }
  auto* const node = make<NSXMLNode>(kind, NSXMLTree::roomForText(bytes));
  copyShort(reinterpret_cast<char*>(node + 1), unitsOf(text), bytes);
  NSXMLTree::noteTextBehind(node, text);
  return node;
}

inline void NSXMLTreeBuilder::appendProperty(NSXMLNode* property, const NSXMLName* name) {
  NSXMLTree::propertyNameOf(property) = name;
  NSXMLTree::parentOf(property) = _current;
  (_lastProperty ? NSXMLTree::nextOf(_lastProperty)
                 : NSXMLTree::firstPropertyOf(static_cast<NSXMLElement*>(_current))) = property;
  _lastProperty = property;
}

inline NSXMLNode* NSXMLTreeBuilder::addProperty(Kind kind, const NSXMLName* name,
                                                NSStringView text) {
  NSXMLNode* const property = makeWithText(kind, text);
  appendProperty(property, name);
  return property;
}

inline NSXMLNode* NSXMLTreeBuilder::addLeaf(Kind kind, NSStringView text) {
  NSXMLNode* const leaf = makeWithText(kind, text);
  append(leaf);
  return leaf;
}

inline void NSXMLTreeBuilder::close() {
  // The first child's previous sibling field holds the last child.
  if (NSXMLNode* const first = NSXMLTree::firstChildOf(_current)) {
    NSXMLTree::previousOf(first) = _lastChild;
  }
  _lastChild = _current;
  _lastProperty = nullptr;
  _current = _current->parent();
}

}  // namespace xquery
