// The content of a constructed element or document.
//
// A constructor evaluates its content items one by one and hands each value to a collector, which
// walks it: text and atomic values gather in a buffer that becomes one text node, and nodes become
// children as they are or as copies. A copy is made of a node that has a parent, that was there
// before the evaluation (others may be using it), or that would come to lie below itself.
#pragma once

#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "xquery/Object.h"
#include "xquery/String.h"
#include "xquery/XMLNode.h"

#include <cstdint>
#include <memory>
#include <unordered_set>
#include <vector>

namespace xquery {

class XQueryContext;
class XQueryInScopeNamespaces;

class XQueryContent {
 public:
  // One content item. Items of different content items never have a space between them.
  void add(const Value& value);
  // Makes a node of the text still in the buffer.
  void finish() { flushText(); }

 protected:
  // `parent` gets the content; errors name `line`.
  XQueryContent(NSXMLNode& parent, XQueryContext& context, int64_t line)
      : _parent(parent), _context(context), _line(line) {}
  ~XQueryContent() = default;

  virtual void addElement(NSXMLElement& element) = 0;
  virtual void addAttribute(NSXMLNode& attribute) = 0;
  virtual void addNamespace(NSXMLNode& declaration) = 0;
  virtual void addText(NSXMLNode& text) = 0;
  // Anything but an attribute or a namespace has been added.
  virtual void noteContent() {}

  // Where nodes made here go first.
  void setRoom(const NSXMLRoom& room) { _room = room; }
  NSXMLNode* makeNode(Kind kind, NSStringView text);
  void appendText(NSStringView text) { _text.append(text); }
  void flushText();
  // The node itself where it may be moved, else a copy.
  Ref<NSXMLNode> adoptable(NSXMLNode& node) const;
  // Flushes the text before it.
  void addChild(NSXMLNode& node);
  void insert(NSXMLNode& child);

  NSXMLNode& _parent;
  XQueryContext& _context;
  const int64_t _line;

 private:
  // A node that was taken in leads up to the parent while it still grows.
  const NSXMLUnfinished _unfinished{_parent};

  void addItem(NSObject* item);
  void addItems(const std::vector<Value>& items);
  void addNode(NSXMLNode& node);

  NSMutableString _text;
  NSXMLRoom _room;
  bool _previousWasAtomic = false;
};

// Attributes are taken up to the first other content; later ones are left out.
class XQueryElementContent final : public XQueryContent {
 public:
  // `room` is what was left behind the element when it was made.
  XQueryElementContent(NSXMLElement& element, const NSXMLRoom& room,
                       XQueryInScopeNamespaces& namespaces, XQueryContext& context, int64_t line);

  // What adding the attribute as a content item would do, without making it a tree of its own.
  void addNewAttribute(NSXMLNameRef name, NSStringView text);

 private:
  void addElement(NSXMLElement& element) override;
  void addAttribute(NSXMLNode& attribute) override;
  void addNamespace(NSXMLNode&) override {}
  // Texts next to each other become one node.
  void addText(NSXMLNode& text) override { appendText(text.textView()); }
  void noteContent() override { _attributesAllowed = false; }
  bool isNewName(const NSXMLExpandedName* name);
  // Checks that the name is new to the element, and declares what it needs.
  void prepareForAttribute(const NSXMLName& name);
  void append(NSXMLNode* attribute);
  NSXMLElement& element() const { return static_cast<NSXMLElement&>(_parent); }

  XQueryInScopeNamespaces& _namespaces;
  const bool _inheritNamespaces;
  bool _attributesAllowed = true;
  NSXMLNode* _lastAttribute = nullptr;
  uint32_t _attributeCount = 0;
  std::unique_ptr<std::unordered_set<const NSXMLExpandedName*>> _names;  // when there are many
};

// One element child at most, and neither attributes nor namespaces. Text nodes stay what they are.
class XQueryDocumentContent final : public XQueryContent {
 public:
  XQueryDocumentContent(NSXMLDocument& document, XQueryContext& context, int64_t line)
      : XQueryContent(document, context, line) {}

 private:
  void addElement(NSXMLElement& element) override;
  void addAttribute(NSXMLNode&) override { refuse(); }
  void addNamespace(NSXMLNode&) override { refuse(); }
  void addText(NSXMLNode& text) override { addChild(text); }
  [[noreturn]] void refuse();

  bool _hasElement = false;
};

}  // namespace xquery
