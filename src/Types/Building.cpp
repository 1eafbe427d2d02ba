// Trees built and changed by hosts. Everything is looked at before anything is changed.
#include "xquery/Building.h"

#include "Platform/Reading/XMLCharacters.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/ReservedNamespaces.h"
#include "Types/XQueryValueErrors.h"
#include "Types/XQueryValueText.h"

#include <algorithm>
#include <initializer_list>

namespace xquery {

namespace {

using Failure = Ref<XQueryError>;
using Node = XQueryResult<Ref<NSXMLNode>>;
using Done = XQueryResult<void>;

Ref<NSString> string(std::string_view utf8) {
  return NSString::stringWithUTF8(utf8);
}

// --- what texts and names may be -----------------------------------------------------------------

Failure textsError(std::initializer_list<std::string_view> texts) {
  for (const std::string_view text : texts) {
    if (auto error = XQueryTextError(text)) return error;
  }
  return nullptr;
}

// Whether a prefix, which may be empty, may stand for a namespace. The two reserved ones belong to
// each other, the default is none of them.
bool mayBind(std::string_view prefix, std::string_view URI) {
  if (prefix == "xml" || URI == namespaceOfXML) return prefix == "xml" && URI == namespaceOfXML;
  return prefix.empty() || !URI.empty();
}

Failure nameError(Kind kind, std::string_view name, std::string_view URI) {
  if (auto error = textsError({name, URI})) return error;
  const XMLNameShape shape = shapeOfXMLName(name);
  if (!shape.isName) return XQueryErrors::notOfTheForm.error(XQueryShownText(name), "xs:QName");
  const bool isAttribute = kind == Kind::Attribute;
  const std::string_view prefix = name.substr(0, shape.colon);
  if (prefix == "xmlns" || URI == namespaceOfDeclarations || (isAttribute && name == "xmlns")) {
    return XQueryErrors::attributeIsXMLNS.error();
  }
  const bool wantsPrefix = isAttribute && !URI.empty() && prefix.empty();
  if (wantsPrefix || !mayBind(prefix, URI)) return XQueryErrors::invalidNamespace.error();
  return nullptr;
}

Failure namespaceError(std::string_view prefix, std::string_view URI) {
  if (auto error = textsError({prefix, URI})) return error;
  const XMLNameShape shape = shapeOfXMLName(prefix);
  if (!prefix.empty() && (!shape.isName || shape.colon != 0)) {
    return XQueryErrors::notOfTheForm.error(XQueryShownText(prefix), "xs:NCName");
  }
  const bool isReserved = prefix == "xmlns" || URI == namespaceOfDeclarations;
  if (isReserved || !mayBind(prefix, URI)) return XQueryErrors::invalidNamespace.error();
  return nullptr;
}

Failure targetError(std::string_view target) {
  if (auto error = XQueryTextError(target)) return error;
  const XMLNameShape shape = shapeOfXMLName(target);
  const bool isXML = target.size() == 3 && (target[0] | 0x20) == 'x' && (target[1] | 0x20) == 'm' &&
                     (target[2] | 0x20) == 'l';
  if (shape.isName && shape.colon == 0 && !isXML) return nullptr;
  return XQueryErrors::notOfTheForm.error(XQueryShownText(target), "xs:NCName");
}

bool contains(std::string_view text, std::string_view part) {
  return text.find(part) != text.npos;
}

// Of the text of a node of that kind.
Failure contentError(Kind kind, std::string_view text) {
  if (auto error = XQueryTextError(text)) return error;
  if (kind == Kind::Comment && (contains(text, "--") || text.ends_with('-'))) {
    return XQueryErrors::invalidComment.error();
  }
  if (kind == Kind::ProcessingInstruction && contains(text, "?>")) {
    return XQueryErrors::invalidInstruction.error();
  }
  return nullptr;
}

// --- where nodes may be put ----------------------------------------------------------------------

bool isChildKind(Kind kind) {
  return kind == Kind::Element || kind == Kind::Text || kind == Kind::Comment ||
         kind == Kind::ProcessingInstruction;
}

// Whether a document takes the node beside what it has.
bool fitsDocument(const NSXMLDocument& document, Kind kind) {
  return kind == Kind::Element ? !document.rootElement() : kind != Kind::Text;
}

Failure placeError(const NSXMLNode& parent, const NSXMLNode* node) {
  if (!node) return XQueryErrors::nodeCannotBeThere.error();
  if (NSXMLTree::isFrozen(&parent)) return XQueryErrors::documentIsFrozen.error();
  if (node->parent()) return XQueryErrors::nodeHasParent.error();
  return nullptr;
}

Failure childError(const NSXMLNode& parent, const NSXMLNode* child) {
  if (auto error = placeError(parent, child)) return error;
  const auto* document = dyn_cast<NSXMLDocument>(&parent);
  if (document && (child->kind() == Kind::Document || isChildKind(child->kind()))) {
    if (child->kind() == Kind::Document || !fitsDocument(*document, child->kind())) {
      return XQueryErrors::invalidDocumentNode.error();
    }
  }
  const bool isBranch = document || isa<NSXMLElement>(&parent);
  if (isBranch && isChildKind(child->kind())) return nullptr;
  return XQueryErrors::nodeCannotBeThere.error();
}

// The members answer whether they did it; what else is in the way is told by nothing but that.
Done done(bool isDone) {
  if (isDone) return {};
  return XQueryErrors::nodeCannotBeThere.error();
}

}  // namespace

// --- nodes without a parent ----------------------------------------------------------------------

XQueryResult<Ref<NSXMLElement>> XQueryMakeElement(std::string_view name,
                                                  std::string_view namespaceURI) {
  if (auto error = nameError(Kind::Element, name, namespaceURI)) return error;
  return NSXMLElement::elementWithName(string(name)->view(), string(namespaceURI)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeAttribute(std::string_view name, std::string_view value,
                                                 std::string_view namespaceURI) {
  if (auto error = nameError(Kind::Attribute, name, namespaceURI)) return error;
  if (auto error = contentError(Kind::Attribute, value)) return error;
  return NSXMLNode::attributeWithName(string(name)->view(), string(value)->view(),
                                      string(namespaceURI)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeNamespace(std::string_view prefix,
                                                 std::string_view namespaceURI) {
  if (auto error = namespaceError(prefix, namespaceURI)) return error;
  return NSXMLNode::namespaceWithName(string(prefix)->view(), string(namespaceURI)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeText(std::string_view text) {
  if (auto error = contentError(Kind::Text, text)) return error;
  return NSXMLNode::textWithStringValue(string(text)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeCDATA(std::string_view text) {
  if (auto error = contentError(Kind::Text, text)) return error;
  if (contains(text, "]]>")) return XQueryErrors::cdataEnds.error();
  return NSXMLNode::cdataWithStringValue(string(text)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeComment(std::string_view text) {
  if (auto error = contentError(Kind::Comment, text)) return error;
  return NSXMLNode::commentWithStringValue(string(text)->view());
}

XQueryResult<Ref<NSXMLNode>> XQueryMakeProcessingInstruction(std::string_view target,
                                                             std::string_view content) {
  if (auto error = targetError(target)) return error;
  if (auto error = contentError(Kind::ProcessingInstruction, content)) return error;
  return NSXMLNode::processingInstructionWithName(string(target)->view(), string(content)->view());
}

// --- changes -------------------------------------------------------------------------------------

XQueryResult<void> XQueryAddChild(NSXMLNode& parent, const Ref<NSXMLNode>& child) {
  if (auto error = childError(parent, child.get())) return error;
  return done(NSXMLTree::adoptChild(&parent, child.get(), nullptr));
}

XQueryResult<void> XQueryInsertChild(NSXMLNode& parent, const Ref<NSXMLNode>& child,
                                     uint32_t atIndex) {
  if (auto error = childError(parent, child.get())) return error;
  return done(NSXMLTree::adoptChild(&parent, child.get(), parent.childAtIndex(atIndex)));
}

XQueryResult<void> XQueryAddAttribute(NSXMLElement& element, const Ref<NSXMLNode>& attribute) {
  if (auto error = placeError(element, attribute.get())) return error;
  if (attribute->kind() != Kind::Attribute) return done(false);
  if (element.attributeForLocalName(attribute->localNameView(), attribute->URIView()) ||
      element.attributeForName(attribute->nameView())) {
    return XQueryErrors::attributeNotDistinct.error();
  }
  return done(element.addAttribute(attribute));
}

XQueryResult<void> XQueryAddNamespace(NSXMLElement& element, const Ref<NSXMLNode>& node) {
  if (auto error = placeError(element, node.get())) return error;
  if (node->kind() != Kind::Namespace) return done(false);
  if (!element.addNamespace(node)) return XQueryErrors::invalidNamespace.error();
  return {};
}

XQueryResult<void> XQuerySetAttribute(NSXMLElement& element, std::string_view name,
                                      std::string_view value, std::string_view namespaceURI) {
  auto attribute = XQueryMakeAttribute(name, value, namespaceURI);
  if (!attribute) return attribute.error();
  NSXMLNode* const present =
      element.attributeForLocalName((*attribute)->localNameView(), (*attribute)->URIView());
  return present ? XQuerySetText(*present, value) : XQueryAddAttribute(element, *attribute);
}

XQueryResult<void> XQuerySetText(NSXMLNode& node, std::string_view text) {
  if (NSXMLTree::isFrozen(&node)) return XQueryErrors::documentIsFrozen.error();
  if (auto error = contentError(node.kind(), text)) return error;
  if (node.kind() == Kind::Document) return XQueryErrors::invalidDocumentNode.error();
  if (NSXMLTree::isCDATA(&node) && contains(text, "]]>")) return XQueryErrors::cdataEnds.error();
  if (node.kind() == Kind::Namespace) {
    if (auto error = namespaceError(node.nameView().utf8(), text)) return error;
  }
  if (NSXMLTree::isFixed(&node)) return done(false);
  node.setStringValue(string(text)->view());
  return {};
}

XQueryResult<void> XQueryRemove(NSXMLNode& node) {
  if (NSXMLTree::isFrozen(&node)) return XQueryErrors::documentIsFrozen.error();
  node.detach();
  return {};
}

// --- frozen documents ----------------------------------------------------------------------------

Ref<NSXMLDocument> XQueryFreeze(const Ref<NSXMLDocument>& document) {
  if (!document || NSXMLTree::freeze(document.get())) return document;
  const Ref<NSXMLNode> copy = document->copy();
  auto* const frozen = static_cast<NSXMLDocument*>(copy.get());
  NSXMLTree::freeze(frozen);
  return frozen;
}

bool XQueryIsFrozen(const NSXMLNode& node) {
  return NSXMLTree::isFrozen(&node);
}

}  // namespace xquery
