// Every walk here is a loop: a tree may be a million elements deep.
#include "Types/XQueryNodeFunctions.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Types/XQueryNumber.h"

#include <unordered_map>
#include <unordered_set>
#include <utility>

namespace xquery {

namespace {

struct TextHash {
  size_t operator()(NSStringView text) const { return text.hash(); }
};
using PrefixSet = std::unordered_set<NSStringView, TextHash>;

// The namespace nodes declared on the node and its ancestors, nearest element first and each
// prefix once. The answer: whether any was met.
template <class Visit>
bool visitNamespaces(const NSXMLNode* node, Visit visit) {
  PrefixSet seen;
  WorkPacer pacer;
  for (; node; node = node->parent()) {
    pacer.turn();
    const NSXMLElement* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (NSXMLNode* declaration = element->firstNamespace(); declaration;
         declaration = NSXMLElement::nextNamespace(declaration)) {
      pacer.turn();
      if (seen.insert(declaration->nameView()).second) visit(declaration);
    }
  }
  return !seen.empty();
}

const NSXMLNode* attributeNamed(const NSXMLNode* node, std::string_view name) {
  const NSXMLElement* element = dyn_cast<NSXMLElement>(node);
  return element ? element->attributeForName(NSStringView::ascii(name)) : nullptr;
}

Ref<NSString> textOrEmpty(Ref<NSString> text) {
  return text ? std::move(text) : NSString::empty();
}

bool sameNameAndText(const NSXMLNode* a, const NSXMLNode* b) {
  return a->nameView() == b->nameView() && a->textView() == b->textView();
}

// Finds an element's attributes by their names. An element may have tens of thousands, and going
// through them for each name would take seconds; beyond a few a table finds them.
class AttributesByName {
 public:
  AttributesByName(const NSXMLElement* element, uint32_t count) : _element(element) {
    constexpr uint32_t few = 32;
    if (count <= few) return;
    WorkPacer pacer;
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      pacer.turn();
      _table.emplace(attribute->nameView(), attribute);
    }
  }

  const NSXMLNode* find(NSStringView name) const {
    if (_table.empty()) return _element->attributeForName(name);
    const auto found = _table.find(name);
    return found == _table.end() ? nullptr : found->second;
  }

 private:
  const NSXMLElement* _element;
  std::unordered_map<NSStringView, const NSXMLNode*, TextHash> _table;
};

// The count test is what it is on purpose: an element without attributes differs from one with
// exactly one attribute, and one with attributes differs from one without; all else passes, and
// attributes that only b has are not looked at.
bool sameAttributes(const NSXMLElement* a, const NSXMLElement* b) {
  const uint32_t refused = a->firstAttribute() ? 0 : 1;
  const uint32_t count = b->attributeCount();
  if (count == refused) return false;
  const AttributesByName others(b, count);
  WorkPacer pacer;
  for (const NSXMLNode* attribute = a->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    const NSXMLNode* other = others.find(attribute->nameView());
    if (!other || !sameNameAndText(attribute, other)) return false;
  }
  return true;
}

// Everything but the children.
bool sameOwnParts(const NSXMLNode* a, const NSXMLNode* b) {
  if (a == b) return true;
  if (a->kind() != b->kind()) return false;
  switch (a->kind()) {
    case Kind::Element:
      return a->nameView() == b->nameView() &&
             sameAttributes(cast<NSXMLElement>(a), cast<NSXMLElement>(b));
    case Kind::Attribute:
    case Kind::Namespace:
    case Kind::ProcessingInstruction:
      return sameNameAndText(a, b);
    case Kind::Comment:
    case Kind::Text:
      return a->textView() == b->textView();
    default:
      return false;
  }
}

// The node itself or its next sibling that counts for equality.
const NSXMLNode* skipUncompared(const NSXMLNode* node) {
  while (node && (node->kind() == Kind::ProcessingInstruction || node->kind() == Kind::Comment)) {
    node = node->nextSibling();
  }
  return node;
}

// Walks the two trees in step below two elements whose own parts are equal. `a` and `b` are the
// current pair of siblings, at any time children of `parentA` and `parentB`.
bool sameChildren(const NSXMLNode* rootA, const NSXMLNode* rootB) {
  const NSXMLNode* parentA = rootA;
  const NSXMLNode* parentB = rootB;
  const NSXMLNode* a = skipUncompared(parentA->firstChild());
  const NSXMLNode* b = skipUncompared(parentB->firstChild());
  WorkPacer pacer;
  while (true) {
    pacer.turn();
    if (!a || !b) {
      if (a || b) return false;
      if (parentA == rootA) return true;
      a = skipUncompared(parentA->nextSibling());
      b = skipUncompared(parentB->nextSibling());
      parentA = parentA->parent();
      parentB = parentB->parent();
      continue;
    }
    if (!sameOwnParts(a, b)) return false;
    if (a != b && a->kind() == Kind::Element) {
      parentA = a;
      parentB = b;
      a = skipUncompared(parentA->firstChild());
      b = skipUncompared(parentB->firstChild());
    } else {
      a = skipUncompared(a->nextSibling());
      b = skipUncompared(b->nextSibling());
    }
  }
}

bool isXMLTarget(NSStringView target) {
  return target.length() == 3 && (target[0] | 0x20) == u'x' && (target[1] | 0x20) == u'm' &&
         (target[2] | 0x20) == u'l';
}

}  // namespace

Ref<NSString> XQueryNodeStringValue(const NSXMLNode* node) {
  return textOrEmpty(node ? node->stringValue() : nullptr);
}

Ref<NSString> XQueryNodeTypedValue(const NSXMLNode* node) {
  return XQueryNodeStringValue(node);
}

// A node without children has no text below it, though it may have one of its own.
void XQueryNodeAddChildTextValues(const NSXMLNode* node, NSMutableString& text) {
  if (node && node->firstChild()) node->appendStringValueTo(text);
}

Ref<NSString> XQueryNodeName(const NSXMLNode* node) {
  return node ? node->name() : nullptr;
}

Ref<NSString> XQueryNodeTypeName(const NSXMLNode*) {
  return nullptr;
}

Ref<NSString> XQueryNodeLanguage(const NSXMLNode* node) {
  WorkPacer pacer;
  for (; node && node->kind() != Kind::Document; node = node->parent()) {
    pacer.turn();
    if (const NSXMLNode* language = attributeNamed(node, "xml:lang")) {
      return language->stringValue();
    }
  }
  return nullptr;
}

Ref<NSString> XQueryNodeDocumentURI(const NSXMLNode* node) {
  const NSXMLDocument* document = node ? node->rootDocument() : nullptr;
  return textOrEmpty(document ? document->documentURI() : nullptr);
}

NSXMLNode* XQueryNodeRoot(const NSXMLNode* node) {
  return node ? node->rootNode() : nullptr;
}

// The outermost declaration of the prefix wins, not the nearest, and the last one of an element.
Ref<NSString> XQueryNodeNamespaceForPrefix(const NSXMLNode* node, NSStringView prefix) {
  const NSXMLNode* found = nullptr;
  WorkPacer pacer;
  for (; node; node = node->parent()) {
    pacer.turn();
    const NSXMLElement* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (const NSXMLNode* declaration = element->firstNamespace(); declaration;
         declaration = NSXMLElement::nextNamespace(declaration)) {
      pacer.turn();
      if (declaration->nameView() == prefix) found = declaration;
    }
  }
  return found ? found->stringValue() : nullptr;
}

// "xml" joins the prefixes only when there is any other declaration.
std::vector<Ref<NSString>> XQueryNodeInScopePrefixes(const NSXMLNode* node) {
  std::vector<Ref<NSString>> prefixes;
  bool sawXML = false;
  const bool sawAny = visitNamespaces(node, [&](const NSXMLNode* declaration) {
    prefixes.push_back(textOrEmpty(declaration->name()));
    if (declaration->nameView() == "xml") sawXML = true;
  });
  if (sawAny && !sawXML) prefixes.push_back(NSString::stringWithASCII("xml"));
  return prefixes;
}

std::vector<Ref<NSXMLNode>> CopyXQueryNodeNamespaces(const NSXMLNode* node) {
  std::vector<Ref<NSXMLNode>> namespaces;
  visitNamespaces(node,
                  [&](const NSXMLNode* declaration) { namespaces.push_back(declaration->copy()); });
  return namespaces;
}

bool XQueryNodeEqual(const NSXMLNode* a, const NSXMLNode* b, XQueryContext*) {
  if (a == b) return true;
  if (!a || !b || a->kind() != b->kind()) return false;
  if (a->kind() == Kind::Document) {
    a = cast<NSXMLDocument>(a)->rootElement();
    b = cast<NSXMLDocument>(b)->rootElement();
    if (a == b) return true;
    if (!a || !b) return false;
  }
  if (!sameOwnParts(a, b)) return false;
  return a->kind() != Kind::Element || sameChildren(a, b);
}

Value XQueryNodeResolveID(const NSXMLNode*, NSStringView) {
  return nullptr;
}

Value XQueryNodeResolveIDRef(const NSXMLNode*, NSStringView) {
  return nullptr;
}

Ref<NSString> XQueryNodeStringRepresentaion(const NSXMLNode* node) {
  return node ? node->XMLString() : nullptr;
}

Ref<NSXMLDocument> XQueryNodeFromString(const NSString& string, uint32_t options) {
  return NSXMLDocument::documentWithData(string.utf8(), options);
}

Ref<NSXMLDocument> XQueryNodeFromData(const NSData& data, uint32_t options) {
  return NSXMLDocument::documentWithData(data.bytes(), options);
}

Ref<NSXMLNode> XQueryXMLNodeText(const NSString& text) {
  return NSXMLNode::textWithStringValue(text.view());
}

// An ordinary text node: CDATA is a way of writing, not a kind of node.
Ref<NSXMLNode> XQueryXMLNodeCDATA(const NSString& text) {
  return XQueryXMLNodeText(text);
}

Ref<NSXMLNode> XQueryXMLNodeComment(const NSString& text) {
  const NSStringView view = text.view();
  if (view.find(NSStringView::ascii("--")) != NSStringView::notFound) return nullptr;
  if (view.endsWith(NSStringView::ascii("-"))) return nullptr;
  return NSXMLNode::commentWithStringValue(view);
}

Ref<NSXMLNode> XQueryXMLNodePI(const NSString& target, const NSString& text) {
  return XQueryXMLNodePI(NSXMLNameRef(target.view(), NSStringView()), text.view());
}

Ref<NSXMLNode> XQueryXMLNodePI(NSXMLNameRef target, NSStringView text) {
  if (isXMLTarget(target->text)) return nullptr;
  return NSXMLTree::makeLoneNode(Kind::ProcessingInstruction, text, target.detach());
}

Ref<NSXMLNode> XQueryXMLNodeAttribute(const NSString& name, const NSString& value) {
  return NSXMLNode::attributeWithName(name.view(), value.view());
}

Ref<NSXMLNode> XQueryXMLNodeNamespace(const NSString& prefix, const NSString& URI) {
  return NSXMLNode::namespaceWithName(prefix.view(), URI.view());
}

bool XQueryNamespacesEqual(NSStringView a, NSStringView b) {
  if (a.equals(b)) return true;
  if (a.length() < b.length()) std::swap(a, b);
  return a.length() == b.length() + 1 && a[b.length()] == u'/' && a.startsWith(b);
}

}  // namespace xquery
