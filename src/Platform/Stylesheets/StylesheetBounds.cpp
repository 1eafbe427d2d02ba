#include "Platform/Stylesheets/StylesheetBounds.h"

#include "Platform/Base/WorkMeter.h"

#include <algorithm>
#include <string_view>

namespace xquery {

namespace {

constexpr std::string_view XSLT = "http://www.w3.org/1999/XSL/Transform";
// Comparing two names takes that many bytes' time at least.
constexpr uint64_t bytesOfEachName = 16;

struct List {
  std::string_view attribute;
  std::string_view element;  // empty for any
  bool (*separates)(char16_t unit);
};

bool isBlank(char16_t unit) {
  return unit == u' ' || unit == u'\t' || unit == u'\n' || unit == u'\r';
}
bool isBar(char16_t unit) {
  return unit == u'|';
}

constexpr List lists[] = {
    {"exclude-result-prefixes", "", isBlank},
    {"extension-element-prefixes", "", isBlank},
    {"use-attribute-sets", "", isBlank},
    {"cdata-section-elements", "", isBlank},
    {"elements", "", isBlank},
    {"match", "key", isBar},
};

size_t namesIn(NSStringView list, bool (*separates)(char16_t)) {
  size_t count = 1;
  WorkPacer pacer;
  for (size_t index = 0; index < list.length(); ++index) {
    pacer.turn();
    count += separates(list[index]);
  }
  return count;
}

// On the top level, or in a set of attributes.
bool isDeclaration(const NSXMLElement& element) {
  const auto* parent = dyn_cast<NSXMLElement>(element.parent());
  if (!parent) return false;
  return !dyn_cast<NSXMLElement>(parent->parent()) ||
         (parent->localNameView() == "attribute-set" && parent->URIView() == XSLT);
}

size_t lengthOf(const NSXMLNode& declaration) {
  return declaration.nameView().length() + declaration.textView().length();
}

}  // namespace

void StylesheetBounds::Names::add(size_t length) {
  ++count;
  bytes += length + bytesOfEachName;
}

void StylesheetBounds::Names::remove(size_t length) {
  --count;
  bytes -= length + bytesOfEachName;
}

void StylesheetBounds::addAttribute(const NSXMLElement& element, const NSXMLNode& attribute) {
  const NSStringView name = attribute.localNameView();
  const NSStringView value = attribute.textView();
  ++_nodes;
  _bytes += value.length();
  _longestAttribute = std::max<size_t>(_longestAttribute, value.length());
  for (const List& list : lists) {
    if (name != list.attribute) continue;
    if (!list.element.empty() && element.localNameView() != list.element) continue;
    _listed.count += namesIn(value, list.separates) - 1;
    _listed.add(value.length());
  }
}

void StylesheetBounds::open(const NSXMLElement& element) {
  WorkPacer pacer;
  for (const NSXMLNode* declared = element.firstNamespace(); declared;
       declared = NSXMLElement::nextNamespace(declared)) {
    pacer.turn();
    _scope.add(lengthOf(*declared));
  }
  _widestScope.count = std::max(_widestScope.count, _scope.count);
  _widestScope.bytes = std::max(_widestScope.bytes, _scope.bytes);
  size_t naming = 0;
  for (const NSXMLNode* attribute = element.firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    addAttribute(element, *attribute);
    const NSStringView name = attribute->nameView();
    if (name == "name" || name == "mode") naming += attribute->textView().length();
  }
  if (isDeclaration(element)) _declarations.add(naming);
}

void StylesheetBounds::close(const NSXMLElement& element) {
  for (const NSXMLNode* declared = element.firstNamespace(); declared;
       declared = NSXMLElement::nextNamespace(declared)) {
    _scope.remove(lengthOf(*declared));
  }
}

bool StylesheetBounds::admit(const NSXMLDocument& stylesheet) {
  const NSXMLNode* node = stylesheet.firstChild();
  while (node && !isExceeded()) {
    checkWork();
    ++_nodes;
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (element)
      open(*element);
    else
      _bytes += node->textView().length();
    const NSXMLNode* next = node->firstChild();
    while (!next && node != &stylesheet) {
      if (const auto* closed = dyn_cast<NSXMLElement>(node)) close(*closed);
      next = node->nextSibling();
      node = node->parent();
    }
    node = next;
  }
  _scope = {};
  return !isExceeded();
}

bool StylesheetBounds::isExceeded() const {
  const uint64_t declarations = _declarations.count * _declarations.bytes;
  const uint64_t names =
      (_widestScope.count + _listed.count) * (_widestScope.bytes + _listed.bytes);
  return declarations > mostComparisons || names > mostComparisons || _nodes > mostNodes ||
         _bytes > mostBytes || _longestAttribute > mostBytesOfAttribute;
}

}  // namespace xquery
