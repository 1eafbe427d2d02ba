#include "Platform/Stylesheets/LibXMLTree.h"

#include "Platform/Base/WorkMeter.h"
#include "Platform/Text/UTF8.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/TreeBuilder.h"

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <libxml/valid.h>

#include <climits>
#include <cstring>
#include <new>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

namespace xquery {

namespace {

constexpr xmlChar noText[] = {0};

// For the time that the text lives.
const xmlChar* XMLText(const std::string& text) {
  return reinterpret_cast<const xmlChar*>(text.c_str());
}

template <class T>
T* required(T* pointer) {
  if (!pointer) throw std::bad_alloc();
  return pointer;
}

// --- to libxml2 ----------------------------------------------------------------------------------

// The declarations of one prefix that are in scope, the nearest last.
struct Prefix {
  std::string text;
  std::vector<xmlNs*> declarations;
};

// A name of ours in libxml2's terms.
struct ExportedName {
  const xmlChar* localName;  // in the dictionary
  std::string URI;
  Prefix* prefix;
};

class Exporter {
 public:
  Exporter(const NSXMLDocument& document, const std::string& URL, xmlDict* dictionary);
  LibXMLDocument run(size_t mostLevels);

 private:
  void visit(const NSXMLNode* node);
  void openElement(const NSXMLElement& element);
  void closeElement();
  void addAttribute(xmlNode* element, const NSXMLNode* attribute);
  void addLeaf(const NSXMLNode* node);
  void append(xmlNode* node);
  void setValue(xmlAttr* attribute, NSStringView value);
  xmlNode* makeText(NSStringView text);

  const ExportedName& nameOf(const NSXMLNode* node);
  const xmlChar* inDictionary(const std::string& text);
  Prefix* prefixNamed(const std::string& text);
  void declare(xmlNode* element, Prefix* prefix, const std::string& URI);
  // The declaration that gives the name its namespace; made on the element where there is none.
  xmlNs* namespaceFor(xmlNode* element, const ExportedName& name, bool isAttribute);
  xmlNs* declarationOf(const Prefix& prefix, const std::string& URI) const;

  const NSXMLDocument& _source;
  LibXMLDocument _document;
  xmlNode* _parent = nullptr;  // the open element; null for the document
  std::unordered_map<const NSXMLName*, ExportedName> _names;
  std::unordered_map<std::string, Prefix> _prefixes;
  std::vector<Prefix*> _declared;      // on open elements
  std::vector<size_t> _declaredAbove;  // for each open element, how many before its own
  xmlNs* _lastDeclaration = nullptr;   // of the element that is being opened
  xmlAttr* _lastAttribute = nullptr;
  size_t _inventedPrefixes = 0;
};

Exporter::Exporter(const NSXMLDocument& document, const std::string& URL, xmlDict* dictionary)
    : _source(document), _document(required(xmlNewDoc(XMLText("1.0")))) {
  if (dictionary) {
    xmlDictReference(dictionary);
    _document->dict = dictionary;
  } else {
    _document->dict = required(xmlDictCreate());
  }
  if (!URL.empty()) _document->URL = required(xmlStrdup(XMLText(URL)));
}

LibXMLDocument Exporter::run(size_t mostLevels) {
  WorkPacer pacer;
  const NSXMLNode* node = _source.firstChild();
  while (node) {
    pacer.turn();
    visit(node);
    if (_declaredAbove.size() > mostLevels) return nullptr;
    const NSXMLNode* next = node->firstChild();
    if (!next && node->kind() == Kind::Element) closeElement();
    while (!next && node != &_source) {
      next = node->nextSibling();
      if (next) break;
      node = node->parent();
      if (node != &_source) closeElement();
    }
    node = next;
  }
  return std::move(_document);
}

void Exporter::visit(const NSXMLNode* node) {
  if (const auto* element = dyn_cast<NSXMLElement>(node)) {
    openElement(*element);
  } else {
    addLeaf(node);
  }
}

void Exporter::append(xmlNode* node) {
  node->parent = _parent ? _parent : reinterpret_cast<xmlNode*>(_document.get());
  xmlNode*& first = _parent ? _parent->children : _document->children;
  xmlNode*& last = _parent ? _parent->last : _document->last;
  if (last) {
    last->next = node;
    node->prev = last;
  } else {
    first = node;
  }
  last = node;
}

void Exporter::openElement(const NSXMLElement& element) {
  const ExportedName& name = nameOf(&element);
  xmlNode* made = required(xmlNewDocNode(_document.get(), nullptr, name.localName, nullptr));
  append(made);
  _parent = made;
  _declaredAbove.push_back(_declared.size());
  _lastDeclaration = nullptr;
  _lastAttribute = nullptr;
  WorkPacer pacer;
  for (const NSXMLNode* declaration = element.firstNamespace(); declaration;
       declaration = NSXMLElement::nextNamespace(declaration)) {
    pacer.turn();
    declare(made, prefixNamed(declaration->nameView().utf8()), declaration->textView().utf8());
  }
  made->ns = namespaceFor(made, name, false);
  for (const NSXMLNode* attribute = element.firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    addAttribute(made, attribute);
  }
}

void Exporter::closeElement() {
  for (size_t count = _declaredAbove.back(); _declared.size() > count; _declared.pop_back()) {
    _declared.back()->declarations.pop_back();
  }
  _declaredAbove.pop_back();
  xmlNode* parent = _parent->parent;
  _parent = parent->type == XML_ELEMENT_NODE ? parent : nullptr;
}

void Exporter::addAttribute(xmlNode* element, const NSXMLNode* attribute) {
  const ExportedName& name = nameOf(attribute);
  xmlAttr* made = required(xmlNewDocProp(_document.get(), name.localName, nullptr));
  made->parent = element;
  if (_lastAttribute) {
    _lastAttribute->next = made;
    made->prev = _lastAttribute;
  } else {
    element->properties = made;
  }
  _lastAttribute = made;
  made->ns = namespaceFor(element, name, true);
  setValue(made, attribute->textView());
  if (attribute->nameView() == "xml:id") {
    xmlAddID(nullptr, _document.get(), XMLText(attribute->textView().utf8()), made);
  }
}

// Not through the functions that take a text: they would read references in it.
void Exporter::setValue(xmlAttr* attribute, NSStringView value) {
  xmlNode* text = makeText(value);
  text->parent = reinterpret_cast<xmlNode*>(attribute);
  attribute->children = text;
  attribute->last = text;
}

xmlNode* Exporter::makeText(NSStringView text) {
  if (!text.isWide() && text.length() <= INT_MAX) {
    const auto* bytes = reinterpret_cast<const xmlChar*>(text.asciiUnits());
    return required(xmlNewDocTextLen(_document.get(), text.isEmpty() ? noText : bytes,
                                     static_cast<int>(text.length())));
  }
  const std::string bytes = text.utf8();
  if (bytes.size() > INT_MAX) throw std::bad_alloc();
  return required(
      xmlNewDocTextLen(_document.get(), XMLText(bytes), static_cast<int>(bytes.size())));
}

void Exporter::addLeaf(const NSXMLNode* node) {
  const NSStringView text = node->textView();
  chargeWork(text.length() / 4096);
  if (node->kind() == Kind::Text) {
    if (!text.isEmpty()) append(makeText(text));
    return;
  }
  const std::string bytes = text.utf8();
  if (node->kind() == Kind::Comment) {
    append(required(xmlNewDocComment(_document.get(), XMLText(bytes))));
  } else if (node->kind() == Kind::ProcessingInstruction) {
    const std::string target = node->nameView().utf8();
    append(required(xmlNewDocPI(_document.get(), XMLText(target), XMLText(bytes))));
  }
}

// --- names of the copy ---------------------------------------------------------------------------

const xmlChar* Exporter::inDictionary(const std::string& text) {
  return required(xmlDictLookup(_document->dict, XMLText(text), -1));
}

Prefix* Exporter::prefixNamed(const std::string& text) {
  Prefix& prefix = _prefixes[text];
  prefix.text = text;
  return &prefix;
}

const ExportedName& Exporter::nameOf(const NSXMLNode* node) {
  const auto [place, isNew] = _names.try_emplace(node->nodeName());
  ExportedName& name = place->second;
  if (!isNew) return name;
  name.URI = node->URIView().utf8();
  // A prefix without a namespace is part of the name and no more.
  const bool hasPrefix = !name.URI.empty();
  name.localName = inDictionary((hasPrefix ? node->localNameView() : node->nameView()).utf8());
  name.prefix = prefixNamed(hasPrefix ? node->prefixView().utf8() : "");
  return name;
}

void Exporter::declare(xmlNode* element, Prefix* prefix, const std::string& URI) {
  if (prefix->text == "xml") return;
  const xmlChar* text = prefix->text.empty() ? nullptr : XMLText(prefix->text);
  xmlNs* declaration = required(xmlNewNs(nullptr, XMLText(URI), text));
  (_lastDeclaration ? _lastDeclaration->next : element->nsDef) = declaration;
  _lastDeclaration = declaration;
  _declared.push_back(prefix);
  prefix->declarations.push_back(declaration);
}

xmlNs* Exporter::declarationOf(const Prefix& prefix, const std::string& URI) const {
  if (prefix.text == "xml") {
    return required(xmlSearchNs(_document.get(), _parent, XMLText("xml")));
  }
  if (prefix.declarations.empty()) return nullptr;
  xmlNs* nearest = prefix.declarations.back();
  return URI == reinterpret_cast<const char*>(nearest->href) ? nearest : nullptr;
}

xmlNs* Exporter::namespaceFor(xmlNode* element, const ExportedName& name, bool isAttribute) {
  if (name.URI.empty()) return nullptr;
  Prefix* prefix = name.prefix;
  // The default namespace is none of an attribute's.
  if (isAttribute && prefix->text.empty()) {
    prefix = prefixNamed("_ns" + std::to_string(++_inventedPrefixes));
  }
  if (xmlNs* declared = declarationOf(*prefix, name.URI)) return declared;
  declare(element, prefix, name.URI);
  return prefix->declarations.back();
}

// --- from libxml2 --------------------------------------------------------------------------------

std::string_view viewOf(const xmlChar* text) {
  return text ? std::string_view(reinterpret_cast<const char*>(text)) : std::string_view();
}

bool isText(const xmlNode* node) {
  return node->type == XML_TEXT_NODE || node->type == XML_CDATA_SECTION_NODE;
}

class Importer {
 public:
  explicit Importer(const xmlDoc& document) : _document(document), _builder(1024, 512) {}
  NSXMLDocument* run();

 private:
  struct Key {
    const xmlChar* name;
    const xmlNs* ns;
    bool operator==(const Key& other) const { return name == other.name && ns == other.ns; }
  };
  struct KeyHash {
    size_t operator()(const Key& key) const {
      return reinterpret_cast<uintptr_t>(key.name) * 31 + reinterpret_cast<uintptr_t>(key.ns);
    }
  };

  void visit(const xmlNode* node);
  void openElement(const xmlNode* element);
  // Calls `work` with the text as it is to be stored.
  template <class Work>
  void withText(std::string_view text, Work work);
  NSXMLNode* addLeaf(Kind kind, const xmlNode* node);
  void addProperty(Kind kind, const NSXMLName* name, std::string_view text);
  const NSXMLName* name(const xmlChar* name, const xmlNs* ns);
  const NSXMLName* makeName(const xmlChar* name, const xmlNs* ns);

  const xmlDoc& _document;
  NSXMLTreeBuilder _builder;
  std::unordered_map<Key, const NSXMLName*, KeyHash> _names;  // by address
};

NSXMLDocument* Importer::run() {
  _builder.tree().becomeOld();
  _builder.openDocument();
  WorkPacer pacer;
  const xmlNode* node = _document.children;
  while (node) {
    pacer.turn();
    visit(node);
    if (node->type == XML_ELEMENT_NODE && node->children) {
      node = node->children;
      continue;
    }
    if (node->type == XML_ELEMENT_NODE) _builder.close();
    while (node && !node->next) {
      node = node->parent;
      if (node && node->type == XML_ELEMENT_NODE) {
        _builder.close();
      } else {
        node = nullptr;  // the document
      }
    }
    if (node) node = node->next;
  }
  return cast<NSXMLDocument>(_builder.finish());
}

void Importer::visit(const xmlNode* node) {
  switch (node->type) {
    case XML_ELEMENT_NODE:
      openElement(node);
      break;
    case XML_TEXT_NODE:
      addLeaf(Kind::Text, node);
      break;
    case XML_CDATA_SECTION_NODE:
      NSXMLTree::setCDATA(addLeaf(Kind::Text, node));
      break;
    case XML_COMMENT_NODE:
      addLeaf(Kind::Comment, node);
      break;
    case XML_PI_NODE:
      withText(viewOf(node->content), [&](NSStringView text) {
        _builder.addInstruction(name(node->name, nullptr), text);
      });
      break;
    default:
      break;
  }
}

struct FreeText {
  void operator()(xmlChar* text) const { xmlFree(text); }
};

void Importer::openElement(const xmlNode* element) {
  _builder.openElement(name(element->name, element->ns));
  WorkPacer pacer;
  for (const xmlNs* declared = element->nsDef; declared; declared = declared->next) {
    pacer.turn();
    const xmlChar* prefix = declared->prefix ? declared->prefix : noText;
    addProperty(Kind::Namespace, name(prefix, nullptr), viewOf(declared->href));
  }
  for (const xmlAttr* attribute = element->properties; attribute; attribute = attribute->next) {
    pacer.turn();
    const NSXMLName* const made = name(attribute->name, attribute->ns);
    const xmlNode* value = attribute->children;
    if (value && !value->next && isText(value)) {
      addProperty(Kind::Attribute, made, viewOf(value->content));
    } else {
      const std::unique_ptr<xmlChar, FreeText> text(
          xmlNodeListGetString(element->doc, attribute->children, 1));
      addProperty(Kind::Attribute, made, viewOf(text.get()));
    }
  }
}

template <class Work>
void Importer::withText(std::string_view text, Work work) {
  chargeWork(text.size() / 4096);
  if (isASCII(text)) {
    work(NSStringView::ascii(text));
  } else {
    work(NSString::stringWithUTF8Replacing(text)->view());
  }
}

NSXMLNode* Importer::addLeaf(Kind kind, const xmlNode* node) {
  NSXMLNode* leaf = nullptr;
  withText(viewOf(node->content), [&](NSStringView text) { leaf = _builder.addLeaf(kind, text); });
  return leaf;
}

void Importer::addProperty(Kind kind, const NSXMLName* name, std::string_view text) {
  withText(text, [&](NSStringView stored) { _builder.addProperty(kind, name, stored); });
}

const NSXMLName* Importer::name(const xmlChar* name, const xmlNs* ns) {
  const auto [place, isNew] = _names.try_emplace({name, ns});
  if (isNew) place->second = makeName(name, ns);
  return place->second;
}

const NSXMLName* Importer::makeName(const xmlChar* name, const xmlNs* ns) {
  std::string text;
  if (ns && ns->prefix) text.append(viewOf(ns->prefix)).push_back(':');
  text.append(viewOf(name));
  const Ref<NSString> qualified = NSString::stringWithUTF8Replacing(text);
  const Ref<NSString> URI = NSString::stringWithUTF8Replacing(viewOf(ns ? ns->href : nullptr));
  const NSXMLNameRef made(qualified->view(), URI->view());
  _builder.tree().use(made.get());
  return made.get();
}

}  // namespace

void LibXMLFreeDocument::operator()(_xmlDoc* document) const {
  xmlFreeDoc(document);
}

LibXMLDocument LibXMLDocumentFrom(const NSXMLDocument& document, size_t mostLevels,
                                  const std::string& URL, _xmlDict* dictionary) {
  return Exporter(document, URL, dictionary).run(mostLevels);
}

Ref<NSXMLDocument> documentFromLibXML(const _xmlDoc& document) {
  return Importer(document).run();
}

Ref<NSString> textFromLibXML(const _xmlDoc& document) {
  std::string text;
  WorkPacer pacer;
  const xmlNode* node = document.children;
  while (node) {
    pacer.turn();
    if (isText(node)) text.append(viewOf(node->content));
    const xmlNode* next = node->type == XML_ELEMENT_NODE ? node->children : nullptr;
    while (node && !next) {
      next = node->next;
      node = node->parent;
    }
    node = next;
  }
  return NSString::stringWithUTF8Replacing(text);
}

}  // namespace xquery
