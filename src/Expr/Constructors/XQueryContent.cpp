#include "Expr/Constructors/XQueryContent.h"

#include "Context/StackGuard.h"
#include "Context/XQueryContextInternal.h"
#include "Expr/Constructors/XQueryContentText.h"
#include "Expr/Constructors/XQueryElementContentString.h"
#include "Expr/Constructors/XQueryInScopeNamespaces.h"
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Prolog/XQueryProlog.h"
#include "Types/XQueryAtomization.h"
#include "Types/XQueryErrors.h"
#include "xquery/Collection.h"

namespace xquery {

// --- items ---------------------------------------------------------------------------------------

void XQueryContent::add(const Value& value) {
  _previousWasAtomic = false;
  addItem(value.get());
}

void XQueryContent::addItems(const std::vector<Value>& items) {
  XQueryCheckStack(_context);
  for (const Value& item : items) {
    checkWork();
    addItem(item.get());
  }
}

void XQueryContent::addItem(NSObject* item) {
  if (!item || item->kind() == Kind::Null) return;
  if (const auto* items = dyn_cast<NSArray>(item)) {
    addItems(items->objects());
    return;
  }
  const bool followsAtomic = std::exchange(_previousWasAtomic, false);
  if (auto* node = dyn_cast<NSXMLNode>(item)) {
    addNode(*node);
  } else if (const auto* run = dyn_cast<XQueryElementContentString>(item)) {
    if (run->isXMLSpace() && !_internal(_context).xmlSpacePreserve()) return;
    appendText(run->view());
    noteContent();
  } else if (auto* error = dyn_cast<XQueryError>(item)) {
    _internal(_context).raise(error);
  } else if (XQueryIsAtomicType(item)) {
    if (followsAtomic) _text.append(u' ');
    XQueryAppendAtomic(item, _text, _context);
    _previousWasAtomic = true;
    noteContent();
  } else {
    noteContent();
  }
}

void XQueryContent::addNode(NSXMLNode& node) {
  switch (node.kind()) {
    case Kind::Attribute:
      addAttribute(node);
      return;
    case Kind::Namespace:
      addNamespace(node);
      return;
    case Kind::Document:
      for (NSXMLNode* child = node.firstChild(); child; child = child->nextSibling()) {
        checkWork();
        addNode(*child);
      }
      break;
    case Kind::Element:
      addElement(static_cast<NSXMLElement&>(node));
      break;
    case Kind::Text:
      addText(node);
      break;
    default:
      addChild(node);
  }
  noteContent();
}

// --- nodes ---------------------------------------------------------------------------------------

NSXMLNode* XQueryContent::makeNode(Kind kind, NSStringView text) {
  return NSXMLTree::of(&_parent)->makeNode(kind, text, _room);
}

void XQueryContent::flushText() {
  if (_text.length() == 0) return;
  insert(*makeNode(Kind::Text, _text.view()));
  _text.clear();
}

Ref<NSXMLNode> XQueryContent::adoptable(NSXMLNode& node) const {
  if (!NSXMLTree::mayMoveTo(&_parent, &node)) return node.copy();
  NSXMLTree::noteTakenIn(&_parent, &node);
  return Ref<NSXMLNode>(&node);
}

void XQueryContent::insert(NSXMLNode& child) {
  NSXMLTree::insertChild(&_parent, &child, nullptr);
}

void XQueryContent::addChild(NSXMLNode& node) {
  flushText();
  insert(*adoptable(node));
}

// --- elements ------------------------------------------------------------------------------------

XQueryElementContent::XQueryElementContent(NSXMLElement& element, const NSXMLRoom& room,
                                           XQueryInScopeNamespaces& namespaces,
                                           XQueryContext& context, int64_t line)
    : XQueryContent(element, context, line),
      _namespaces(namespaces),
      _inheritNamespaces(!_internal(context).activeProlog() ||
                         _internal(context).activeProlog()->inheritNamespaces()) {
  setRoom(room);
}

void XQueryElementContent::addElement(NSXMLElement& child) {
  const Ref<NSXMLNode> added = adoptable(child);
  const auto* formerParent = dyn_cast<NSXMLElement>(child.parent());
  if (formerParent && !_inheritNamespaces) {
    _namespaces.keepNamespaces(*cast<NSXMLElement>(added.get()), *formerParent);
  }
  flushText();
  insert(*added);
}

bool XQueryElementContent::isNewName(const NSXMLExpandedName* name) {
  constexpr uint32_t few = 16;
  if (_names) return _names->insert(name).second;
  for (const NSXMLNode* other = element().firstAttribute(); other;
       other = NSXMLElement::nextAttribute(other)) {
    if (other->expandedName() == name) return false;
  }
  if (_attributeCount < few) return true;
  _names = std::make_unique<std::unordered_set<const NSXMLExpandedName*>>();
  for (const NSXMLNode* other = element().firstAttribute(); other;
       other = NSXMLElement::nextAttribute(other)) {
    _names->insert(other->expandedName());
  }
  return _names->insert(name).second;
}

// Attributes that differ in their expanded names are all kept, should their prefixes be the same.
// One without a prefix has nothing to declare: the default namespace is none of attributes.
void XQueryElementContent::prepareForAttribute(const NSXMLName& name) {
  if (!isNewName(name.expanded)) {
    _internal(_context).raise(XQueryErrors::attributeNotDistinct.errorAtLine(_line));
  }
  if (name.prefixLength > 0) _namespaces.updateNamespacesForElement(element(), name);
}

void XQueryElementContent::append(NSXMLNode* attribute) {
  NSXMLTree::appendProperty(&element(), attribute, _lastAttribute);
  _lastAttribute = attribute;
  ++_attributeCount;
}

void XQueryElementContent::addAttribute(NSXMLNode& attribute) {
  if (!_attributesAllowed) return;
  prepareForAttribute(*attribute.nodeName());
  append(adoptable(attribute).get());
}

void XQueryElementContent::addNewAttribute(NSXMLNameRef name, NSStringView text) {
  prepareForAttribute(*name.get());
  NSXMLNode* attribute = makeNode(Kind::Attribute, text);
  NSXMLTree::of(attribute)->setName(attribute, name.detach());
  append(attribute);
}

// --- documents -----------------------------------------------------------------------------------

void XQueryDocumentContent::refuse() {
  _internal(_context).raise(XQueryErrors::invalidDocumentNode.errorAtLine(_line));
}

void XQueryDocumentContent::addElement(NSXMLElement& element) {
  if (_hasElement) refuse();
  _hasElement = true;
  addChild(element);
}

}  // namespace xquery
