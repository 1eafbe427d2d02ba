// The XML tree.
//
// Nodes of one tree live in the blocks of one arena (NSXMLTree) and are freed with it; a reference
// to any node keeps its whole tree alive by one counter on the tree. Names are interned: two nodes
// have the same expanded name exactly when their `expandedName` pointers are equal.
//
//   offset   element            document           text, comment      attribute, namespace
//    0       word: document order; kind; flags; distance from the head of the block, which names
//            the tree
//    8       parent             (null)             parent             parent
//   12       next sibling       (null)             next sibling       next of the element
//   16       first child        first child        length of the text, or where the text is
//   20       previous sibling   (null)             previous sibling   name
//   24       name               URI                the text           the text
//   28       first property
//            32 bytes           32 bytes           24 bytes and the text behind them
//
// A processing instruction is like a text, has its name at 24 and its text always elsewhere: 32
// bytes. Elsewhere are also long texts of trees that were read or copied, and those that were set
// later, since strings may refer to the text behind a head as long as the tree lives.
//
// All nodes, and the names they have, are in one range of addresses that the process reserves, not
// larger than `NSXMLRangeBytes` and within a multiple of that. So a link to one of them is 32 bits
// wide: the place in the range, whose start follows from where the link itself is.
//
// The properties of an element are one chain: its namespaces and then its attributes. The first
// child's previous sibling field holds the last child.
//
// Adding a parentless node to another tree moves it: its identity stays, and the two arenas become
// one. Reading a tree from several threads at once is safe while nobody changes it; a document that
// is frozen (Building.h) cannot be changed: what would change it does nothing and answers false.
//
// What a walk looks at stands in the classes below, so that it is one load and no call: a query is
// mostly such walks, and by calls one over all nodes takes four times as long and one over children
// three times.
#pragma once

#include "xquery/Data.h"
#include "xquery/Object.h"
#include "xquery/String.h"

#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

class NSArray;
class NSError;
class NSURL;
class NSXMLTree;
class NSXMLElement;
class NSXMLDocument;
struct XQueryLoading;

using NSXMLNodeKind = Kind;

// An interned (namespace URI, local name) pair. The URI is null for no namespace (an empty text
// counts as none).
struct NSXMLExpandedName;
// An interned qualified name as written: prefix, local name and URI.
struct NSXMLName {
  const NSXMLExpandedName* expanded;
  uint32_t references;
  uint32_t prefixLength;  // without the colon
  NSStringView text;      // prefix:local, or the local name alone
  uint64_t hash;
};

struct NSXMLBlock;  // a piece of an arena

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

// How many bytes the range of nodes and names takes at most.
constexpr uintptr_t NSXMLRangeBytes = uintptr_t{1} << 35;

// A pointer to something in the range, from a place in it; null for none.
template <class Target>
class NSXMLLink {
 public:
  constexpr NSXMLLink() = default;
  NSXMLLink(const NSXMLLink&) = delete;  // it would be read from where the copy is
  NSXMLLink& operator=(const NSXMLLink& other) {
    _place = other._place;
    return *this;
  }
  NSXMLLink& operator=(Target* target) {
    _place = static_cast<uint32_t>(reinterpret_cast<uintptr_t>(target) % NSXMLRangeBytes / unit);
    return *this;
  }
  Target* get() const { return _place ? target() : nullptr; }
  operator Target*() const { return get(); }
  Target* operator->() const { return target(); }
  explicit operator bool() const { return _place != 0; }

 private:
  static constexpr uintptr_t unit = 8;

  Target* target() const {
    const uintptr_t start = reinterpret_cast<uintptr_t>(this) & ~(NSXMLRangeBytes - 1);
    const uintptr_t address = start + uintptr_t{_place} * unit;
    if (!address) __builtin_unreachable();
    return reinterpret_cast<Target*>(address);
  }

  uint32_t _place = 0;
};

static_assert(sizeof(uintptr_t) == 8 && sizeof(NSXMLLink<void>) == 4);

// Told how many bytes of a file, which may be packed, have been read so far, after each piece of at
// most a few hundred kilobytes, and how many the file has; that is 0 for what has no size, as a
// pipe. Some texts are read again from their beginning. Called on the thread that reads; must not
// throw.
using NSXMLReadingProgress = std::function<void(uint64_t bytes, uint64_t whole)>;

// A node of any kind. To walk a tree:
//
//   for (const NSXMLNode* node = root; node; node = node->nextNode()) ...
class XQUERY_EXPORT NSXMLNode : public NSObject {
 public:
  static bool classof(const NSObject& object) { return object.isNode(); }

  // --- navigation: raw pointers, valid while the tree lives; all constant time unless said -------
  NSXMLNode* parent() const { return _parent; }
  // Null for attributes and namespaces.
  NSXMLNode* nextSibling() const { return isProperty() ? nullptr : _next.get(); }
  NSXMLNode* previousSibling() const {
    return isProperty() || !_parent || !_previous->_next ? nullptr : _previous.get();
  }
  // Null for anything but documents and elements.
  NSXMLNode* firstChild() const { return isBranch() ? _firstChild.get() : nullptr; }
  NSXMLNode* lastChild() const {
    return isBranch() && _firstChild ? _firstChild->_previous.get() : nullptr;
  }
  // The next node in document order (attributes and namespaces apart); null at the end of the
  // document and for attributes and namespaces.
  NSXMLNode* nextNode() const {
    if (isBranch() && _firstChild) return _firstChild;
    if (isProperty()) return nullptr;
    for (const NSXMLNode* node = this; node; node = node->_parent) {
      if (node->_next) return node->_next;
    }
    return nullptr;
  }
  uint32_t childCount() const;                    // linear
  NSXMLNode* childAtIndex(uint32_t index) const;  // linear in the index; null past the end
  NSXMLDocument* rootDocument() const;            // the topmost node if it is a document
  NSXMLNode* rootNode() const;                    // the topmost node
  int64_t level() const;                          // number of ancestors
  // Position among the children (linear); of an attribute or namespace node negative, namespaces
  // and then attributes preceding the children; 0 without a parent.
  int64_t index() const;

  // --- names and values -------------------------------------------------------------------------
  bool hasName() const { return nodeName() != nullptr; }
  const NSXMLName* nodeName() const;  // null for unnamed kinds
  // Elements and attributes only, else null.
  const NSXMLExpandedName* expandedName() const;
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

  // --- changes ----------------------------------------------------------------------------------
  // Sets the own text; replaces the children of an element. A comment that stands in a query as it
  // is stays what it is.
  void setStringValue(NSStringView text);
  void detach();                              // becomes a root of its own
  [[nodiscard]] Ref<NSXMLNode> copy() const;  // deep copy in a new tree, without parent

  // --- output -----------------------------------------------------------------------------------
  // Well-formed XML with the namespace declarations the fragment needs; an attribute as
  // name="value".
  Ref<NSString> XMLString() const;
  void appendXMLTo(std::string& utf8) const;
  // Writes through `write` in pieces of bounded size; stops when it answers false.
  void writeXML(const std::function<bool(std::string_view)>& write) const;

  // --- queries ----------------------------------------------------------------------------------
  // The items of the query's result with this node as context item, each call with a new context
  // whose settings are the default ones; a host that needs others evaluates an XQuery. Null on
  // failure, with `*error` (an XQueryError), when `error` is not null, set to what went wrong and
  // to null otherwise.
  [[nodiscard]] Ref<NSArray> objectsForXQuery(const Ref<NSString>& query,
                                              Ref<NSError>* error = nullptr);
  // The same for a query whose result must consist of nodes; an item that is none is error 19
  // "item not a node".
  [[nodiscard]] Ref<NSArray> nodesForXPath(const Ref<NSString>& path,
                                           Ref<NSError>* error = nullptr);
  // The path that leads from the root to this node alone: "/site[1]/people[1]/person[3]/@id", with
  // "text()", "comment()" and "processing-instruction()" for nodes without a name and
  // "namespace::p" for a namespace; "/" for a document. Names are as written. Linear in the number
  // of ancestors and of the siblings before them.
  Ref<NSString> XPath() const;

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

 protected:
  // Bits of `_flags`.
  enum Flag : uint8_t {
    WideText = 1,    // the text behind the head is UTF-16
    CDATA = 2,       // a text written as a CDATA section
    Fixed = 4,       // part of a compiled query: does not move into another tree
    BaseURI = 8,     // the tree has a base URI on record for the node
    TextApart = 16,  // the text is elsewhere
  };

  explicit NSXMLNode(Kind kind) : NSObject(kind) {}

  bool isBranch() const { return kind() <= Kind::Element; }
  bool isProperty() const { return kind() == Kind::Attribute || kind() == Kind::Namespace; }
  const NSXMLBlock* block() const {
    return reinterpret_cast<const NSXMLBlock*>(reinterpret_cast<const char*>(this) -
                                               size_t{_aux} * 8);
  }

  alignas(8) NSXMLLink<NSXMLNode> _parent;
  NSXMLLink<NSXMLNode> _next;
  union {
    NSXMLLink<NSXMLNode> _firstChild{};
    uint32_t _textLength;
    NSXMLLink<const NSStringView> _textApart;
  };
  union {
    NSXMLLink<NSXMLNode> _previous{};
    NSXMLLink<const NSXMLName> _propertyName;
  };
  friend class NSXMLTree;
  friend class NSXMLElement;
  friend struct NSXMLNodeOrder;
};

// Names are qualified names as written; the URI is the namespace ("" for none).
//
//   auto title = NSXMLElement::elementWithName(NSStringView::ascii("title"));
//   title->addChild(NSXMLNode::textWithStringValue(NSStringView::ascii("Emma")));
//   title->XMLString();                                    // <title>Emma</title>
class XQUERY_EXPORT NSXMLElement : public NSXMLNode {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Element; }
  [[nodiscard]] static Ref<NSXMLElement> elementWithName(NSStringView name, NSStringView URI = {});

  NSXMLNode* firstAttribute() const {  // then nextAttribute
    NSXMLNode* property = _firstProperty;
    while (property && property->kind() == Kind::Namespace) property = property->_next;
    return property;
  }
  static NSXMLNode* nextAttribute(const NSXMLNode* attribute) { return attribute->_next; }
  NSXMLNode* firstNamespace() const {  // declared on this element; then nextNamespace
    return namespaceOrNull(_firstProperty);
  }
  static NSXMLNode* nextNamespace(const NSXMLNode* node) { return namespaceOrNull(node->_next); }
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
  // The child must have no parent and must not be an ancestor. Index past the end appends. A
  // comment that stands in a query as it is, and so may be the result of many evaluations, is not
  // added: add a copy of it. Answer: whether it was added.
  bool addChild(const Ref<NSXMLNode>& child);
  bool insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex);

 private:
  explicit NSXMLElement(Kind kind) : NSXMLNode(kind) {}
  static NSXMLNode* namespaceOrNull(NSXMLNode* property) {
    return property && property->kind() == Kind::Namespace ? property : nullptr;
  }

  NSXMLLink<const NSXMLName> _name;
  NSXMLLink<NSXMLNode> _firstProperty;
  friend class NSXMLNode;
  friend class NSXMLTree;
};

inline const NSXMLExpandedName* NSXMLNode::expandedName() const {
  if (kind() == Kind::Element) return static_cast<const NSXMLElement*>(this)->_name->expanded;
  return kind() == Kind::Attribute ? _propertyName->expanded : nullptr;
}

// A whole document.
//
//   NSXMLParseError error;
//   auto document = NSXMLDocument::documentWithFile("books.xml", NSXMLNodePreserveWhitespace,
//                                                   &error);
//   if (!document) ...                                     // error.message, error.line
class XQUERY_EXPORT NSXMLDocument : public NSXMLNode {
 public:
  static bool classof(const NSObject& object) { return object.kind() == Kind::Document; }
  [[nodiscard]] static Ref<NSXMLDocument> document();
  // Parses XML 1.0 with namespaces; null, with `error` filled when given, for input that is not
  // well formed. External entities and DTDs are never read. Depth and the length of texts (below
  // 4 Gi units) are bounded by memory only. Of documents that have declarations of their own, that
  // are neither UTF-8 nor ASCII, or that are not well formed, what internal entities and attribute
  // defaults add is bounded by the larger of 10 MiB and 20 times the input, the attributes of one
  // tag and the names in one list of a declaration by 6,000 and a little more, the attributes that
  // are declared by 10,000, the namespaces in scope by 250,000 and fewer for large tags. Without
  // NSXMLNodePreserveWhitespace a text of white space only is dropped unless xml:space says
  // preserve.
  //
  // Bytes that gzip, xz, zstd or bzip2 has packed, which their beginning shows, are the text that
  // was packed, several members one after another all of it. Refused, with 0 as the line, is what
  // is cut short, damaged or followed by something else, what takes more than 128 MiB to unpack,
  // and text of more than 256 MiB that is more than 1,000 times as long as it is packed.
  //
  // With NSXMLDocumentTidyHTML the bytes are HTML of any quality, in the encoding that they name.
  // What is missing is added: there is always html, head and body. Names are in lower case,
  // elements in the XHTML namespace, svg and math in their own. Nesting of more than some tens of
  // thousands of levels, a tag of more than 1,600 attributes, and a text that takes time or memory
  // out of all proportion are refused, with 0 as the line.
  [[nodiscard]] static Ref<NSXMLDocument> documentWithData(std::string_view bytes, uint32_t options,
                                                           NSXMLParseError* error = nullptr);
  // Reads the file in pieces (`-` is standard input). `error->line` is 0 when it cannot be read.
  // `progress` may be empty.
  [[nodiscard]] static Ref<NSXMLDocument> documentWithFile(
      const std::string& path, uint32_t options, NSXMLParseError* error = nullptr,
      const NSXMLReadingProgress& progress = {});

  NSXMLElement* rootElement() const;  // the first element child

  // --- stylesheets ------------------------------------------------------------------------------
  // What an XSLT 1.0 stylesheet makes of this document, which is not changed: a string when its
  // output method is text, else a new document. Arguments are values of stylesheet parameters by
  // name, each an XPath expression ("3", "'text'").
  //
  // Null when the stylesheet does not compile, ends with a failure or a message that terminates,
  // recurses more than some 3,000 templates deep, or when a document nests too deeply for it
  // (10,000 levels; a stylesheet 3,000); `*error`, when `error` is not null, then says why and is
  // null otherwise. What a stylesheet includes, imports or reads with document() is loaded as
  // `loading` allows, at most 1,000 resources, and is empty otherwise; a stylesheet writes nothing
  // and runs no code of others. Relative references of a stylesheet string have no base.
  using XSLTArguments = std::map<std::string, std::string>;
  [[nodiscard]] Value objectByApplyingXSLTString(const Ref<NSString>& stylesheet,
                                                 const XSLTArguments& arguments,
                                                 Ref<NSError>* error = nullptr) const;
  [[nodiscard]] Value objectByApplyingXSLTString(const Ref<NSString>& stylesheet,
                                                 const XSLTArguments& arguments,
                                                 const XQueryLoading& loading,
                                                 Ref<NSError>* error = nullptr) const;
  // The stylesheet itself is loaded in the same way.
  [[nodiscard]] Value objectByApplyingXSLTAtURL(const Ref<NSURL>& URL,
                                                const XSLTArguments& arguments,
                                                Ref<NSError>* error = nullptr) const;
  [[nodiscard]] Value objectByApplyingXSLTAtURL(const Ref<NSURL>& URL,
                                                const XSLTArguments& arguments,
                                                const XQueryLoading& loading,
                                                Ref<NSError>* error = nullptr) const;

  // The document's own URI; null when none was set.
  Ref<NSString> documentURI() const;
  void setURI(const Ref<NSString>& URI);
  // As an element's.
  bool addChild(const Ref<NSXMLNode>& child);
  bool insertChild(const Ref<NSXMLNode>& child, uint32_t atIndex);

 private:
  explicit NSXMLDocument(Kind kind) : NSXMLNode(kind) {}

  NSString* _URI = nullptr;  // owned by the tree
  friend class NSXMLTree;
};

static_assert(sizeof(NSXMLNode) == 24 && sizeof(NSXMLElement) == 32 && sizeof(NSXMLDocument) == 32);

}  // namespace xquery
