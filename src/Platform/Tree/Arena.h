// The arena of a tree.
//
//   NSXMLTree (48 bytes)       block of one node      block of a builder     block of a text
//     count, order, blocks       head: tree, next       head                   head
//     last block --------------> node                   node [its text]        view of it
//     names                      [its text]             node [its text] ...    text
//     base URIs on record
//     indexes, era
//
// The blocks of a tree form a ring (the tree knows the last, whose next is the first). The head of
// a block names the tree; a node knows how far it is from the head of its block. So merging two
// trees means renaming the tree in the heads of the one with fewer blocks and joining the rings:
// constant time for the usual case of a small tree, a logarithm of renamings per block at worst,
// and neither nodes nor readers are involved.
//
// Nodes made singly come in blocks just large enough, together with their text, since a query may
// construct very many small elements. Trees that are parsed or copied grow by large blocks, see
// TreeBuilder.h. All blocks are in the range that nodes refer to each other in.
#pragma once

#include "Platform/Tree/TreeHead.h"
#include "xquery/XMLNode.h"

#include <atomic>
#include <cstddef>
#include <memory>
#include <vector>

namespace xquery {

// A processing instruction has a name beside its text.
class NSXMLProcessingInstruction : public NSXMLNode {
 public:
  static bool classof(const NSObject& object) {
    return object.kind() == Kind::ProcessingInstruction;
  }

 private:
  explicit NSXMLProcessingInstruction(Kind kind) : NSXMLNode(kind) {}
  NSXMLLink<const NSXMLName> _target;
  friend class NSXMLTree;
};

struct NSXMLTreeExtra;
struct NSXMLNameList;
class NSXMLTreeIndexes;

// A stretch of a thread's work in which the trees that it makes can be told from those that were
// there before: an evaluation may change the former and must leave the latter as they are, since
// other threads may be reading them. Eras of a thread nest. Those that begin later, here or in
// another thread, have higher numbers, so that what is made in an inner era is also new to the
// outer one when that goes on.
class NSXMLEra {
 public:
  NSXMLEra();
  ~NSXMLEra();
  NSXMLEra(const NSXMLEra&) = delete;
  NSXMLEra& operator=(const NSXMLEra&) = delete;

  // The number of the thread's innermost era; 0, before all others, outside of any.
  static uint64_t current();

 private:
  const uint64_t _around;
};

// Room behind an element made singly for the attributes and texts that it gets next, so that a
// small element is one block. Belongs to whoever makes the element.
class NSXMLRoom {
 private:
  char* _block = nullptr;
  char* _cursor = nullptr;
  char* _end = nullptr;
  friend class NSXMLTree;
};

// A base URI on record for a node. The entries of a tree are a ring: the tree knows the one found
// or added last, and two rings are joined in constant time.
struct NSXMLBaseURI {
  NSXMLBaseURI* next;
  const NSXMLNode* node;
  uint64_t owner;
  NSString* URI;  // one reference
};

class NSXMLTree : public NSXMLTreeHead {
 public:
  static NSXMLTree* of(const NSXMLNode* node) {
    return static_cast<NSXMLTree*>(node->block()->tree);
  }
  // A tree without nodes or references. Whoever creates it makes a reference to a node of it, or
  // destroys it.
  [[nodiscard]] static NSXMLTree* create();
  void destroy();

  // Whether the node's tree was made in the era in force, as a whole. Outside of any era every tree
  // counts as made in it.
  static bool isNew(const NSXMLNode* node) { return of(node)->_era >= NSXMLEra::current(); }
  // For what is read and not constructed: from now on the tree counts as made before all eras.
  void becomeOld() { _era = 0; }

  void retain();
  void release(uint32_t times = 1);
  // Several at once. False, and nothing done, for a tree that is never freed.
  bool addReferences(uint32_t count);
  void removeReferences(uint32_t count);

  // --- nodes: without parent, order number 0 ---------------------------------------------------
  // All kinds but elements and documents. Texts are copied, in 8-bit form if they fit it.
  NSXMLNode* makeNode(Kind kind, NSStringView text);
  NSXMLElement* makeElement();
  NSXMLDocument* makeDocument();
  // A node in a new tree that holds nothing else.
  [[nodiscard]] static NSXMLNode* makeLoneNode(Kind kind, NSStringView text);
  [[nodiscard]] static NSXMLNode* makeLoneNode(Kind kind, NSStringView text, NSStringView name,
                                               NSStringView URI = {});
  [[nodiscard]] static NSXMLElement* makeLoneElement(NSStringView name, NSStringView URI);
  // The tree takes over one count of the name. The room is of that many bytes at least.
  [[nodiscard]] static NSXMLElement* makeLoneElement(const NSXMLName* name, size_t roomBytes,
                                                     NSXMLRoom& room);
  // The same in the tree of the node that the calling thread is filling. Nobody but who makes the
  // element may know it before it is put into that node.
  [[nodiscard]] static NSXMLElement* makeElementInPlace(const NSXMLName* name, size_t roomBytes,
                                                        NSXMLRoom& room);
  [[nodiscard]] static NSXMLNode* makeAttributeInPlace(const NSXMLName* name, NSStringView text);
  // An attribute or a text, in the room as far as that goes; in the element's tree in any case.
  NSXMLNode* makeNode(Kind kind, NSStringView text, NSXMLRoom& room);
  static constexpr size_t roomForNode = sizeof(NSXMLNode);
  // What a text takes behind a node.
  static constexpr size_t roomForText(size_t bytes) { return (bytes + 7) & ~size_t{7}; }
  // The tree takes over one count of the name.
  [[nodiscard]] static NSXMLNode* makeLoneNode(Kind kind, NSStringView text, const NSXMLName* name);

  // Distances of nodes from the heads of their blocks are 16-bit counts of so many bytes.
  static constexpr size_t distanceUnit = 8;
  static constexpr size_t largestNodeBlock = (UINT16_MAX + size_t{1}) * distanceUnit;
  static size_t roomOf(const NSXMLBlock* block) { return size_t{block->roomUnits} * distanceUnit; }

  // --- names and texts -------------------------------------------------------------------------
  // The tree takes over one count of the name.
  void setName(NSXMLNode* node, const NSXMLName* name) {
    adopt(name);
    setAdoptedName(node, name);
  }
  // For a name that the tree holds already.
  static void setAdoptedName(NSXMLNode* node, const NSXMLName* name);
  static const NSXMLName* targetOf(const NSXMLNode* instruction) {
    return cast<NSXMLProcessingInstruction>(instruction)->_target;
  }
  // The tree takes over the caller's count of the name.
  void adopt(const NSXMLName* name);
  // Counts the name for this tree unless it is counted already.
  void use(const NSXMLName* name);
  bool holds(const NSXMLName* name) const;
  // Copies the text into the arena, in 8-bit form if it fits it. What was the text before stays
  // where it is, since strings may refer to it.
  void setText(NSXMLNode* node, NSStringView text);
  void setURI(NSXMLDocument* document, const NSString* URI);  // null for none

  // --- base URIs on record (XMLBaseURIs.cpp) ---------------------------------------------------
  // Each owner has a URI of its own for a node; what it recorded goes with the tree, whether the
  // owner is still there or not. Numbers of owners are never used again. The URI must not refer to
  // text of a tree. Answer: whether the owner had none for the node.
  static bool recordBaseURI(const NSXMLNode* node, uint64_t owner, const Ref<NSString>& URI);
  static NSString* recordedBaseURI(const NSXMLNode* node, uint64_t owner);  // null for none

  // --- structure -------------------------------------------------------------------------------
  // Links what may become a child of `parent`: a parentless node that is neither a document nor an
  // attribute nor a namespace nor the root above `parent`. Answer: whether it did.
  static bool adoptChild(NSXMLNode* parent, NSXMLNode* child, NSXMLNode* before);
  // Whether a constructor that makes `parent` may put the node itself there and not a copy: a root
  // that was made in this era, belongs to nobody else, and is not above `parent`.
  static bool mayMoveTo(const NSXMLNode* parent, const NSXMLNode* node) {
    return !node->_parent && !isFixed(node) && !isFrozen(node) && isNew(node) &&
           !isRootAbove(parent, node);
  }
  // Before a constructor that makes `parent` puts such a node there. Nodes that are made in place
  // are roots of their own as long as they are being filled, which nobody can tell before they take
  // in a node that others know.
  static void noteTakenIn(const NSXMLNode* parent, const NSXMLNode* node);
  // The rest leaves checks to the caller.
  // Links a parentless node, moving its tree into this one. `before` is null to append.
  static void insertChild(NSXMLNode* parent, NSXMLNode* child, NSXMLNode* before);
  static void appendProperty(NSXMLElement* element, NSXMLNode* property);
  // For an element's many attributes or namespaces in turn: `last` is its last one of that kind,
  // null for none.
  static void appendProperty(NSXMLElement* element, NSXMLNode* property, NSXMLNode* last);
  static void detach(NSXMLNode* node);
  // How often the calling thread has linked a node or taken one out so far: while the count stays,
  // the trees of its evaluation stay as they are.
  static uint64_t changeCount();
  // The same without what constructors do to the nodes that they are filling, but with new texts of
  // nodes: while this count stays, so does everything inside the nodes that are finished, and, for
  // nodes of documents, around them. Only a node without a parent may find itself in another one.
  static uint64_t finishedChangeCount();
  static bool isUnfinished(const NSXMLNode* node) { return (node->_flags & unfinished) != 0; }
  static void setUnfinished(NSXMLNode* node, bool isUnfinished) {
    node->_flags =
        static_cast<uint8_t>(isUnfinished ? node->_flags | unfinished : node->_flags & ~unfinished);
  }
  // Before the text of a node that may be known changes.
  static void noteTextChange(const NSXMLNode* node);
  // For builders: the fields of a node, as they are.
  using Link = NSXMLLink<NSXMLNode>;
  static Link& parentOf(NSXMLNode* node) { return node->_parent; }
  static Link& nextOf(NSXMLNode* node) { return node->_next; }
  static Link& previousOf(NSXMLNode* node) { return node->_previous; }
  static Link& firstChildOf(NSXMLNode* node) { return node->_firstChild; }
  static Link& firstPropertyOf(NSXMLElement* element) { return element->_firstProperty; }
  static NSXMLLink<const NSXMLName>& nameOf(NSXMLElement* element) { return element->_name; }
  static NSXMLLink<const NSXMLName>& propertyNameOf(NSXMLNode* node) { return node->_propertyName; }
  static NSXMLNode* firstPropertyOf(const NSXMLElement* element) { return element->_firstProperty; }
  static NSXMLNode* nextProperty(const NSXMLNode* property) { return property->_next; }
  static bool mayHaveChildren(const NSXMLNode* node) { return node->isBranch(); }
  // The node after the whole subtree of `root`; null at the end of the tree.
  static const NSXMLNode* endOfSubtree(const NSXMLNode* root) {
    if (root->isProperty()) return nullptr;
    for (const NSXMLNode* node = root; node; node = node->_parent) {
      if (node->_next) return node->_next;
    }
    return nullptr;
  }
  // The node at which the descendant axis of queries ends: the next sibling or, without one, the
  // parent's. Null lets it run to the end of the tree, past the subtree of the node when that is
  // the last child of a last child.
  static NSXMLNode* descendantStop(const NSXMLNode* node) {
    if (NSXMLNode* sibling = node->nextSibling()) return sibling;
    const NSXMLNode* parent = node->parent();
    return parent ? parent->nextSibling() : nullptr;
  }
  static void setOrderNumber(NSXMLNode* node, uint32_t number) { node->_word = number; }
  static void setCDATA(NSXMLNode* node) { node->_flags |= NSXMLNode::CDATA; }
  static bool isCDATA(const NSXMLNode* node) { return (node->_flags & NSXMLNode::CDATA) != 0; }
  // A fixed node is never adopted nor changed: several threads may be using it.
  static void setFixed(NSXMLNode* node) { node->_flags |= NSXMLNode::Fixed; }
  static bool isFixed(const NSXMLNode* node) { return (node->_flags & NSXMLNode::Fixed) != 0; }

  // A frozen document, and all that is in it, is never changed. Answer: whether the document is the
  // only root of its tree, without which it is not frozen, as a change of another root might move
  // its memory to another tree. No other root comes to a frozen tree: nothing is taken out of it,
  // and it is joined with no other one.
  static bool freeze(NSXMLDocument* document);
  static bool isFrozen(const NSXMLNode* node) { return of(node)->_isFrozen; }

  // The number of a root whose subtree's numbers are good, as they are assigned; and of a root
  // whose subtree's numbers are not good, where the tree has several roots.
  static constexpr uint32_t firstOrderNumber = 1;
  static constexpr uint32_t staleRoot = 0;
  // Whether nodes of the tree may have different roots.
  bool hasSeveralRoots() const { return __atomic_load_n(&order, __ATOMIC_RELAXED) == SeveralRoots; }
  // Whether it has one root and all numbers are good.
  bool isOrderFresh() const { return __atomic_load_n(&order, __ATOMIC_ACQUIRE) == Fresh; }
  // Makes the numbers under this root good, by one thread at a time.
  void makeOrderFresh(const NSXMLNode* root);

 private:
  NSXMLTree() = default;

  uint32_t blockCount() const { return blockCountHigh << 16 | blockCountLow; }
  void setBlockCount(uint64_t count);
  // A new block at the end of the ring, with room for that many bytes after its head.
  NSXMLBlock* allocateBlock(size_t bytes);
  void freeBlocks();
  bool isSetAside();
  template <class Node>
  static Node* placeNode(const void* block, void* memory, Kind kind) {
    const auto distance = static_cast<const char*>(memory) - static_cast<const char*>(block);
    Node* const node = ::new (memory) Node(kind);
    node->_aux = static_cast<uint16_t>(static_cast<size_t>(distance) / distanceUnit);
    return node;
  }
  // A node in a block of its own, with room for a text.
  template <class Node>
  Node* makeNodeOf(Kind kind, size_t textBytes = 0) {
    NSXMLBlock* const block = allocateBlock(sizeof(Node) + textBytes);
    return placeNode<Node>(block, block + 1, kind);
  }
  // Of a text that has been put behind the node, or elsewhere in the arena.
  static void noteTextBehind(NSXMLNode* node, NSStringView text) {
    node->_textLength = text.length();
    if (text.isWide()) node->_flags |= NSXMLNode::WideText;
  }
  static void setTextApart(NSXMLNode* node, const NSStringView* text) {
    node->_textApart = text;
    node->_flags |= NSXMLNode::TextApart;
  }
  friend class NSXMLTreeBuilder;

  // The names of the tree and what else it may hold (XMLTreeExtra.h).
  NSXMLTreeExtra* extra() const;
  NSXMLTreeExtra& makeExtra();
  void freeExtra();
  const NSXMLName* singleName() const;
  NSXMLNameList* nameList() const;
  void setNameList(NSXMLNameList* list);
  template <class Function>
  void forEachName(Function function) const;

  // Whether the parentless node is the other node or an ancestor of it.
  static bool isRootAbove(const NSXMLNode* node, const NSXMLNode* root);
  static void merge(NSXMLTree* a, NSXMLTree* b);
  void absorb(NSXMLTree* smaller);
  void absorbExtra(NSXMLTree* smaller);
  void absorbBaseURIs(NSXMLTree* smaller);
  void freeBaseURIs();
  // The element and the room behind it are one block.
  NSXMLElement* makeElement(size_t roomBytes, NSXMLRoom& room);
  // Before the structure under `parent` changes.
  static void noteChange(const NSXMLNode* parent);
  // Before anything of the tree changes: what is known of it goes.
  void dropIndexes() {
    if (_indexes.load(std::memory_order_relaxed)) releaseIndexes();
  }
  void releaseIndexes();
  friend class NSXMLTreeIndexes;
  static void unlink(NSXMLNode* node);
  static void renumber(const NSXMLNode* root);

  // A bit of a node's flags beside those of NSXMLNode::Flag, which others may look at: this one is
  // only ever set while nobody but the thread that makes the node knows it.
  static constexpr uint8_t unfinished = 1U << 7;

  uint8_t blockCountHigh = 0;  // saturates; only compared
  uint16_t blockCountLow = 0;
  NSXMLBlock* _lastBlock = nullptr;
  // 0; the only name of the tree; a list of its few names; or an extra part. The low bits tell.
  static constexpr uintptr_t nameTag = 1;
  static constexpr uintptr_t listTag = 2;
  static constexpr uintptr_t tagBits = 3;
  uintptr_t _extra = 0;
  NSXMLBaseURI* _baseURIs = nullptr;
  std::atomic<NSXMLTreeIndexes*> _indexes = nullptr;  // made when they pay, see TreeIndexes.h
  uint64_t _era : 62 =
      NSXMLEra::current();                // in which it was made; of merged trees the older one's
  uint64_t _isFrozen : 1 = false;         // its only root is a frozen document
  uint64_t _baseURIsAreAlike : 1 = true;  // of one owner, with one URI
};

static_assert(sizeof(NSXMLTree) == 48 && sizeof(NSXMLBaseURI) == 32);

// The time in which a constructor fills a new node, which has no parent yet.
class NSXMLUnfinished {
 public:
  explicit NSXMLUnfinished(NSXMLNode& node);
  ~NSXMLUnfinished();
  NSXMLUnfinished(const NSXMLUnfinished&) = delete;
  NSXMLUnfinished& operator=(const NSXMLUnfinished&) = delete;

  // What the thread is filling now; null for nothing.
  static const NSXMLUnfinished* innermost();
  // What it was filling already when this began.
  const NSXMLUnfinished* around() const { return _around; }
  NSXMLNode& node() const { return _node; }

 private:
  NSXMLNode& _node;
  const NSXMLUnfinished* const _around;
};

}  // namespace xquery
