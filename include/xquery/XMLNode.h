// The XML tree.
//
// Nodes of one tree live in one arena (NSXMLTree) and are freed with it; a reference to any node
// keeps its whole tree alive by one counter on the tree. Names are interned: two nodes have the
// same expanded name exactly when their `expandedName` pointers are equal.
//
//   common part (every node)         element                attribute         text, comment
//     word   document order            previous sibling       name              previous sibling
//     kind, flags, spare               first, last child      value, length     text, length
//     tree                             name
//     parent                           first attribute
//     next sibling                     first namespace
//     80 bytes at most                 56 at most             56 at most
//
// Adding a parentless node to another tree moves it: its identity stays, and the two arenas become
// one. Reading a tree from several threads at once is safe while nobody changes it.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "xquery/Data.h"
#include "xquery/Object.h"
#include "xquery/String.h"

namespace xquery {

class NSXMLTree;
class NSXMLElement;
class NSXMLDocument;

using NSXMLNodeKind = Kind;

// An interned (namespace URI, local name) pair. The URI is null for no namespace (an empty text
// counts as none).
struct NSXMLExpandedName;
// An interned qualified name as written: prefix, local name and URI.
struct NSXMLName;

// Parsing options; the bit numbers are part of the interface.
enum NSXMLOptions : uint32_t {
  NSXMLNodeOptionsNone = 0,
  NSXMLNodeExpandEmptyElement = 1U << 1,
  NSXMLNodeCompactEmptyElement = 1U << 2,
  NSXMLNodePreserveEmptyElements = (1U << 1) | (1U << 2),
  NSXMLDocumentTidyHTML = 1U << 9,
  NSXMLNodePreserveCDATA = 1U << 24,
  NSXMLNodePreserveWhitespace = 1U << 25,
};

// What went wrong while parsing: message, and the place counted from 1.
struct NSXMLParseError {
  std::string message;
  int64_t line = 0;
  int64_t column = 0;
};

class XQUERY_EXPORT NSXMLNode : public NSObject {
 public:
  static bool classof(const NSObject& object) { return object.isNode(); }

  // --- navigation: raw pointers, valid while the tree lives; all constant time unless said -------
  NSXMLNode* parent() const { return _parent; }
  NSXMLNode* nextSibling() const;      // null for attributes and namespaces
  NSXMLNode* previousSibling() const;  // null for attributes and namespaces
  NSXMLNode* firstChild() const;       // null for anything but documents and elements
  NSXMLNode* lastChild() const;
  // The next node in document order (attributes and namespaces apart); null at the end of the
  // document and for attributes and namespaces.
  NSXMLNode* nextNode() const;
  uint32_t childCount() const;                      // linear
  NSXMLNode* childAtIndex(uint32_t index) const;    // linear in the index; null past the end
  NSXMLDocument* rootDocument() const;              // the topmost node if it is a document
  NSXMLNode* rootNode() const;                      // the topmost node
  int64_t level() const;                            // number of ancestors
  // Position among the children (linear); of an attribute or namespace node negative, namespaces
  // and then attributes preceding the children; 0 without a parent.
  int64_t index() const;

  // --- names and values -------------------------------------------------------------------------
  bool hasName() const { return nodeName() != nullptr; }
  const NSXMLName* nodeName() const;                // null for unnamed kinds
  const NSXMLExpandedName* expandedName() const;    // elements and attributes only, else null
  // As strings; null when there is none. A namespace node's name is its prefix ("" for the default
  // namespace), a processing instruction's its target.
  Ref<NSString> name() const;
  Ref<NSString> localName() const;
  Ref<NSString> prefix() const;
  Ref<NSString> URI() const;
  // The same as borrowed text; empty when there is none.
  NSStringView nameView() const;
  NSStringView localNameView() const;
  NSStringView prefixView() const;
  NSStringView URIView() const;
  // The node's own text: attribute value, text, comment, processing-instruction content, namespace
  // URI. Empty for elements and documents.
  NSStringView textView() const;
  // Attribute, namespace, text, comment and PI: their text. Elements and documents: all descendant
  // text (CDATA included), comments and PIs apart. When an element has exactly one text child the
  // text is not copied.
  Ref<NSString> stringValue() const;
  // Appends the same text.
  void appendStringValueTo(NSMutableString& out) const;

  // --- order ------------------------------------------------------------------------------------
  // Document order within one tree: -1, 0, 1. Both nodes must have the same root.
  static int compareOrder(const NSXMLNode* a, const NSXMLNode* b);
  // Whether both nodes hang under one root and that root's order numbers can be compared directly.
  static bool haveComparableOrder(const NSXMLNode* a, const NSXMLNode* b);
  // The order number; meaningful between nodes for which haveComparableOrder answered true.
  uint32_t orderNumber() const { return _word; }

  // --- changes ----------------------------------------------------------------------------------
  void setStringValue(NSStringView text);   // own text; for an element replaces the children
  void detach();                            // becomes a root of its own
  [[nodiscard]] Ref<NSXMLNode> copy() const;  // deep copy in a new tree, without parent

  // --- output -----------------------------------------------------------------------------------
  // Well-formed XML with the namespace declarations the fragment needs; an attribute as
  // name="value".
  Ref<NSString> XMLString() const;
  void appendXMLTo(std::string& utf8) const;
  // Writes through `write` in pieces of bounded size; stops when it answers false.
  void writeXML(const std::function<bool(std::string_view)>& write) const;

  // --- factories: each makes a parentless node in a tree of its own ------------------------------
  [[nodiscard]] static Ref<NSXMLNode> textWithStringValue(NSStringView text);
  [[nodiscard]] static Ref<NSXMLNode> cdataWithStringValue(NSStringView text);
  [[nodiscard]] static Ref<NSXMLNode> commentWithStringValue(NSStringView text);
  [[nodiscard]] static Ref<NSXMLNode> processingInstructionWithName(NSStringView name,
                                                                    NSStringView stringValue);
  [[nodiscard]] static Ref<NSXMLNode> attributeWithName(NSStringView name, NSStringView stringValue,
                                                        NSStringView URI = {});
  [[nodiscard]] static Ref<NSXMLNode> namespaceWithName(NSStringView prefix,
                                                        NSStringView stringValue);

  NSXMLTree* tree() const;  // the arena that holds the node now

 protected:
  explicit NSXMLNode(Kind kind) : NSObject(kind) {}

  NSXMLTree* _tree = nullptr;
  NSXMLNode* _parent = nullptr;
  NSXMLNode* _next = nullptr;
  friend class NSXMLTree;
};

// Names are qualified names as written; the URI is the namespace ("" for none).
class XQUERY_EXPORT NSXMLElement : public NSXMLNode {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Element; }
  [[nodiscard]] static Ref<NSXMLElement> elementWithName(NSStringView name, NSStringView URI = {});

  NSXMLNode* firstAttribute() const;               // then nextAttribute
  static NSXMLNode* nextAttribute(const NSXMLNode* attribute);
  NSXMLNode* firstNamespace() const;               // declared on this element; then nextNamespace
  static NSXMLNode* nextNamespace(const NSXMLNode* node);
  uint32_t attributeCount() const;
  // By qualified name as written / by expanded name; null when missing.
  NSXMLNode* attributeForName(NSStringView name) const;
  NSXMLNode* attributeForLocalName(NSStringView localName, NSStringView URI) const;

  // The node must have no parent; it moves into this tree. An attribute whose qualified name is
  // already there is not added. Answer: whether it was added.
  bool addAttribute(const Ref<NSXMLNode>& attribute);
  // A declaration of a prefix already declared here is not added.
  bool addNamespace(const Ref<NSXMLNode>& node);
  void removeAttributeForName(NSStringView name);
  // The child must have no parent and must not be an ancestor. Index past the end appends.
  bool addChild(const Ref<NSXMLNode>& child);
  bool insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex);

 private:
  NSXMLElement() : NSXMLNode(Kind::Element) {}
  NSXMLNode* _previous = nullptr;
  NSXMLNode* _firstChild = nullptr;
  NSXMLNode* _lastChild = nullptr;
  const NSXMLName* _name = nullptr;
  NSXMLNode* _firstAttribute = nullptr;
  NSXMLNode* _firstNamespace = nullptr;
  friend class NSXMLNode;
  friend class NSXMLTree;
};

class XQUERY_EXPORT NSXMLDocument : public NSXMLNode {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Document; }
  [[nodiscard]] static Ref<NSXMLDocument> document();
  // Parses XML 1.0 with namespaces; null, with `error` filled when given, for input that is not
  // well formed. External entities and DTDs are never read; entity expansion is bounded; depth is
  // bounded by memory only. Without NSXMLNodePreserveWhitespace a text of white space only is
  // dropped unless xml:space says preserve.
  [[nodiscard]] static Ref<NSXMLDocument> documentWithData(std::string_view bytes, uint32_t options,
                                                           NSXMLParseError* error = nullptr);
  // Reads the file in pieces (`-` is standard input). `error->line` is 0 when it cannot be read.
  [[nodiscard]] static Ref<NSXMLDocument> documentWithFile(const std::string& path,
                                                           uint32_t options,
                                                           NSXMLParseError* error = nullptr);

  NSXMLElement* rootElement() const;  // the first element child
  // The document's own URI; null when none was set.
  Ref<NSString> documentURI() const;
  void setURI(const Ref<NSString>& URI);
  bool addChild(const Ref<NSXMLNode>& child);
  bool insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex);

 private:
  NSXMLDocument() : NSXMLNode(Kind::Document) {}
  NSXMLNode* _firstChild = nullptr;
  NSXMLNode* _lastChild = nullptr;
  NSString* _URI = nullptr;  // owned by the tree
  friend class NSXMLNode;
  friend class NSXMLTree;
};

// Interned names. The returned pointer stays valid while a handle to it lives.
class XQUERY_EXPORT NSXMLExpandedNameRef {
 public:
  NSXMLExpandedNameRef() = default;
  // An empty URI is no namespace.
  NSXMLExpandedNameRef(NSStringView URI, NSStringView localName);
  NSXMLExpandedNameRef(const NSXMLExpandedNameRef& other);
  NSXMLExpandedNameRef(NSXMLExpandedNameRef&& other) noexcept;
  NSXMLExpandedNameRef& operator=(NSXMLExpandedNameRef other) noexcept;
  ~NSXMLExpandedNameRef();
  const NSXMLExpandedName* get() const { return _name; }
  explicit operator bool() const { return _name != nullptr; }

 private:
  const NSXMLExpandedName* _name = nullptr;
};

}  // namespace xquery
