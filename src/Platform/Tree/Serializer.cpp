// Trees as XML text.
//
// The walk iterates; output goes through a buffer that is handed on whenever it is full. Names
// carry their URIs, so every element is written with whatever declarations its names need and do
// not yet have in scope:
//
//   - its own declarations, in their order, except those that contradict the element's own name;
//   - for the topmost element that is written, those in scope in the tree above that names below it
//     use; none where the text will stand within the start tags of the elements above;
//   - those that its name and the names of its attributes still lack. An attribute whose prefix
//     means something else here gets a prefix that is free.
//
// A host may give names that no text can have. What is written is what a reader takes, and reads as
// the same names as far as there are such: the reserved prefixes and namespaces are never declared;
// a prefix that cannot have the namespace is replaced; a name without a namespace has no prefix; of
// attributes that a reader would take for the same, the first is written; and an attribute that
// spells a declaration is one.
//
// What XML cannot contain (control characters, lone surrogates) is written as U+FFFD, and comments
// and processing instructions that would end early are written with a space in between, so that
// the output is always well formed.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "Platform/Tree/ReservedNamespaces.h"
#include "Platform/Tree/XMLOutput.h"
#include "xquery/Serializing.h"
#include "xquery/XMLNode.h"

#include <algorithm>
#include <deque>
#include <map>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace xquery {

namespace {

NSStringView ascii(std::string_view text) {
  return NSStringView::ascii(text);
}

// --- declarations in scope -------------------------------------------------------------------

struct Declaration {
  NSStringView prefix;
  NSStringView URI;
};

// Which URI each prefix means at the place of the walk.
class NamespaceScope {
 public:
  NSStringView URIForPrefix(NSStringView prefix) const {
    const Prefix* known = find(prefix);
    return known ? known->URI() : NSStringView();
  }
  bool isDeclared(NSStringView prefix) const { return !URIForPrefix(prefix).isEmpty(); }

  void declare(const NSXMLNode* element, const Declaration& declaration) {
    at(declaration.prefix).meanings.push_back({element, declaration.URI});
    _declarations.push_back({element, declaration.prefix});
  }
  // A name in the start tag of the element has the prefix, where it has that meaning; otherwise
  // nothing, and false.
  bool useAs(const NSXMLNode* element, const Declaration& meaning) {
    Prefix& known = at(meaning.prefix);
    if (!known.URI().equals(meaning.URI)) return false;
    known.lastUser = element;
    return true;
  }
  // Whether the start tag of the element gives the prefix a meaning already.
  bool isTaken(const NSXMLNode* element, NSStringView prefix) const {
    const Prefix* known = find(prefix);
    if (!known) return false;
    return known->lastUser == element ||
           (!known->meanings.empty() && known->meanings.back().element == element);
  }
  void leave(const NSXMLNode* element) {
    while (!_declarations.empty() && _declarations.back().element == element) {
      at(_declarations.back().prefix).meanings.pop_back();
      _declarations.pop_back();
    }
  }

 private:
  struct Less {
    bool operator()(NSStringView a, NSStringView b) const { return a.compare(b) < 0; }
  };
  struct Meaning {
    const NSXMLNode* element;
    NSStringView URI;
  };
  struct Prefix {
    NSStringView URI() const { return meanings.empty() ? NSStringView() : meanings.back().URI; }
    std::vector<Meaning> meanings;
    const NSXMLNode* lastUser = nullptr;
  };
  struct Entry {
    const NSXMLNode* element;
    NSStringView prefix;
  };
  const Prefix* find(NSStringView prefix) const {
    if (prefix.isEmpty()) return &_default;
    const auto found = _prefixes.find(prefix);
    return found == _prefixes.end() ? nullptr : &found->second;
  }
  Prefix& at(NSStringView prefix) { return prefix.isEmpty() ? _default : _prefixes[prefix]; }

  Prefix _default;
  std::map<NSStringView, Prefix, Less> _prefixes;
  std::vector<Entry> _declarations;
};

// --- what names can be ---------------------------------------------------------------------------

bool isReserved(NSStringView prefix) {
  return prefix == "xml" || prefix == "xmlns";
}

// Only the default namespace can be undeclared.
bool mayBeDeclared(const Declaration& declaration) {
  if (isReserved(declaration.prefix)) return false;
  if (declaration.URI.isEmpty()) return declaration.prefix.isEmpty();
  return declaration.URI != namespaceOfXML && declaration.URI != namespaceOfDeclarations;
}

// The prefix that a name is written with, and what it has to mean. A name with the prefix of XML's
// own namespace is in it, should nobody have said so; nothing is in the namespace of declarations.
Declaration neededFor(const NSXMLNode* named) {
  const Declaration written{named->prefixView(), named->URIView()};
  if (written.URI == namespaceOfXML || (written.URI.isEmpty() && written.prefix == "xml")) {
    return {ascii("xml"), ascii(namespaceOfXML)};
  }
  if (written.URI.isEmpty() || written.URI == namespaceOfDeclarations) return {};
  return written;
}

bool contradicts(const Declaration& declaration, const Declaration& needed) {
  return declaration.prefix.equals(needed.prefix) && !declaration.URI.equals(needed.URI);
}

// As a name without a namespace is written without its prefix.
bool spellsDefault(const NSXMLNode* attribute) {
  if (attribute->nameView() == "xmlns") return true;
  return attribute->URIView().isEmpty() && attribute->localNameView() == "xmlns" &&
         !isReserved(attribute->prefixView());
}

bool spellsDeclaration(const NSXMLNode* attribute) {
  const NSStringView URI = attribute->URIView();
  if (URI == namespaceOfDeclarations) return true;
  return URI.isEmpty() && (spellsDefault(attribute) || attribute->prefixView() == "xmlns");
}

Declaration declarationSpeltBy(const NSXMLNode* attribute) {
  const bool isDefault = spellsDefault(attribute);
  return {isDefault ? NSStringView() : attribute->localNameView(), attribute->textView()};
}

// An attribute, the prefix that it is written with, and the namespace that this means.
struct WrittenAttribute {
  const NSXMLNode* node;
  Declaration needed;
};

// Drops the attributes whose names a reader would take for that of an earlier one.
void dropRepeated(std::vector<WrittenAttribute>& attributes) {
  std::set<std::pair<std::string, std::string>> seen;
  std::erase_if(attributes, [&](const WrittenAttribute& each) {
    checkWork();
    return !seen.emplace(each.needed.URI.utf8(), each.node->localNameView().utf8()).second;
  });
}

// --- lines and indentation -------------------------------------------------------------------

bool isBlank(NSStringView text) {
  for (uint32_t i = 0; i < text.length(); ++i) {
    const char16_t unit = text[i];
    if (unit != ' ' && unit != '\t' && unit != '\n' && unit != '\r') return false;
  }
  return true;
}

// Which children get lines of their own: those of elements without text of their own, unless an
// element around them has.
class Layout {
 public:
  void open(const NSXMLNode* branch) {
    const bool isAllowed = _levels.empty() || _levels.back();
    _levels.push_back(isAllowed && hasLinesWithin(branch));
  }
  void close() { _levels.pop_back(); }
  bool hasLines() const { return !_levels.empty() && _levels.back(); }
  size_t depth() const { return _levels.size(); }

 private:
  static bool hasLinesWithin(const NSXMLNode* branch) {
    if (const auto* element = dyn_cast<NSXMLElement>(branch)) {
      const NSXMLNode* space =
          element->attributeForLocalName(ascii("space"), ascii(namespaceOfXML));
      if (space && space->textView() == "preserve") return false;
    }
    bool hasOthers = false;
    WorkPacer pacer;
    for (const NSXMLNode* child = branch->firstChild(); child; child = child->nextSibling()) {
      pacer.turn();
      const bool isText = child->kind() == Kind::Text;
      if (isText && (NSXMLTree::isCDATA(child) || !isBlank(child->textView()))) return false;
      hasOthers |= !isText;
    }
    return hasOthers;
  }

  std::vector<bool> _levels;  // for each open branch
};

// --- the walk --------------------------------------------------------------------------------

enum class Lines { AsTheyAre, Indented };

class Serializer {
 public:
  Serializer(const NSXMLNode* root, XMLOutput& out, Lines lines = Lines::AsTheyAre)
      : _root(root), _out(out), _lines(lines) {}
  void run();
  // What is written will stand within the start tags of the elements above.
  void standInPlace();
  void runStartTag();

 private:
  void open(const NSXMLNode* node);
  void close(const NSXMLNode* node);
  // Whether the node is white space that the layout has none of.
  bool layOut(const NSXMLNode* node);
  void startLine(size_t depth);
  void writeLeaf(const NSXMLNode* node);
  void writeStartTag(const NSXMLElement* element);
  void writeOpenedTag(const NSXMLElement* element, NSStringView prefix);
  void writeName(const NSXMLNode* element, NSStringView prefix);
  void writeAttribute(NSStringView prefix, NSStringView localName, NSStringView value);
  void writeDeclaration(const Declaration& declaration);

  // Fill `_declared`, what the start tag of the element declares, and `_attributes`. Answer: the
  // prefix that the element is written with. Declarations that contradict what the name needs are
  // left out.
  NSStringView declareFor(const NSXMLElement* element);
  void declareOwn(const NSXMLElement* element, const Declaration& needed);
  void declareInherited(const NSXMLElement* element, const Declaration& needed);
  NSStringView prefixForName(const NSXMLElement* element, const Declaration& needed);
  void chooseAttributes(const NSXMLElement* element);
  bool mayRepeatNames();
  void declare(const NSXMLElement* element, const Declaration& declaration) {
    _declared.push_back(declaration);
    _scope.declare(element, declaration);
  }
  NSStringView prefixForAttribute(const NSXMLElement* element, const Declaration& needed);
  NSStringView madePrefix(const NSXMLElement* element, NSStringView URI);

  const NSXMLNode* _root;
  XMLOutput& _out;
  const Lines _lines;
  bool _isInPlace = false;
  Layout _layout;  // where lines are indented
  NamespaceScope _scope;
  std::vector<Declaration> _declared;         // in the start tag at hand
  std::vector<WrittenAttribute> _attributes;  // in the same
  std::vector<const NSXMLExpandedName*> _attributeNames;
  // Open elements with another prefix than their own.
  std::vector<std::pair<const NSXMLNode*, NSStringView>> _renamed;
  std::map<std::string, NSStringView> _madePrefixes;  // by URI
  std::deque<std::string> _madeTexts;
};

void Serializer::standInPlace() {
  _isInPlace = true;
  std::vector<const NSXMLElement*> above;
  for (const NSXMLNode* node = _root->parent(); node; node = node->parent()) {
    checkWork();
    if (const auto* element = dyn_cast<NSXMLElement>(node)) above.push_back(element);
  }
  for (auto each = above.rbegin(); each != above.rend(); ++each) declareFor(*each);
}

void Serializer::runStartTag() {
  const auto* element = cast<NSXMLElement>(_root);
  writeOpenedTag(element, declareFor(element));
  _out.write('>');
  _out.flush();
}

void Serializer::run() {
  const NSXMLNode* node = _root;
  while (!_out.isStopped()) {
    checkWork();
    open(node);
    if (const NSXMLNode* child = node->firstChild()) {
      node = child;
      continue;
    }
    while (node != _root && !node->nextSibling()) {
      node = node->parent();
      close(node);
    }
    if (node == _root) break;
    node = node->nextSibling();
  }
  _out.flush();
}

// What nobody reads would grow with the square of the depth.
void Serializer::startLine(size_t depth) {
  constexpr size_t deepest = 100;
  _out.write('\n');
  for (size_t level = 0; level < std::min(depth, deepest); ++level) _out.write("  ");
}

// Nothing stands before the document's first child, whose declaration ends with a line feed.
bool Serializer::layOut(const NSXMLNode* node) {
  if (_lines == Lines::AsTheyAre) return false;
  if (_layout.hasLines()) {
    if (node->kind() == Kind::Text) return true;
    const bool isInDocument = node->parent()->kind() == Kind::Document;
    const size_t depth = _layout.depth() - (_root->kind() == Kind::Document);
    if (!isInDocument || node->previousSibling()) startLine(depth);
  }
  if (node->firstChild()) _layout.open(node);
  return false;
}

void Serializer::open(const NSXMLNode* node) {
  if (layOut(node)) return;
  if (const auto* element = dyn_cast<NSXMLElement>(node)) {
    writeStartTag(element);
  } else if (node->kind() == Kind::Document) {
    _out.write("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n");
  } else {
    writeLeaf(node);
  }
}

void Serializer::close(const NSXMLNode* node) {
  if (_lines == Lines::Indented) {
    const bool hadLines = _layout.hasLines();
    _layout.close();
    const size_t depth = _layout.depth() - (_root->kind() == Kind::Document);
    if (hadLines && node->kind() == Kind::Element) startLine(depth);
  }
  if (node->kind() != Kind::Element) return;
  _out.write("</");
  if (!_renamed.empty() && _renamed.back().first == node) {
    writeName(node, _renamed.back().second);
    _renamed.pop_back();
  } else {
    _out.write(node->nameView());
  }
  _out.write('>');
  _scope.leave(node);
}

void Serializer::writeName(const NSXMLNode* element, NSStringView prefix) {
  if (!prefix.isEmpty()) {
    _out.write(prefix);
    _out.write(':');
  }
  _out.write(element->localNameView());
}

void Serializer::writeLeaf(const NSXMLNode* node) {
  const NSStringView text = node->textView();
  switch (node->kind()) {
    case Kind::Comment:
      _out.write("<!--");
      XMLWriteSeparated(_out, text, "--", 1, " ", XMLPlainEscapes);
      if (text.endsWith(ascii("-"))) _out.write(' ');
      _out.write("-->");
      break;
    case Kind::ProcessingInstruction:
      _out.write("<?");
      _out.write(node->nameView());
      if (!text.isEmpty()) _out.write(' ');
      XMLWriteSeparated(_out, text, "?>", 1, " ", XMLPlainEscapes);
      _out.write("?>");
      break;
    case Kind::Attribute:
      writeAttribute({}, node->nameView(), text);
      break;
    case Kind::Namespace:
      writeDeclaration({node->nameView(), text});
      break;
    default:
      if (NSXMLTree::isCDATA(node)) {
        _out.write("<![CDATA[");
        XMLWriteSeparated(_out, text, "]]>", 2, "]]><![CDATA[", XMLCDATAEscapes);
        _out.write("]]>");
      } else {
        XMLWriteEscaped(_out, text, XMLTextEscapes);
      }
  }
}

void Serializer::writeAttribute(NSStringView prefix, NSStringView localName, NSStringView value) {
  if (!prefix.isEmpty()) {
    _out.write(prefix);
    _out.write(':');
  }
  _out.write(localName);
  _out.write("=\"");
  XMLWriteEscaped(_out, value, XMLAttributeEscapes);
  _out.write('"');
}

void Serializer::writeDeclaration(const Declaration& declaration) {
  if (declaration.prefix.isEmpty()) {
    writeAttribute({}, ascii("xmlns"), declaration.URI);
  } else {
    writeAttribute(ascii("xmlns"), declaration.prefix, declaration.URI);
  }
}

// All of it but its end.
void Serializer::writeOpenedTag(const NSXMLElement* element, NSStringView prefix) {
  _out.write('<');
  if (prefix.equals(element->prefixView())) {
    _out.write(element->nameView());
  } else {
    writeName(element, prefix);
  }
  for (const Declaration& declaration : _declared) {
    _out.write(' ');
    writeDeclaration(declaration);
  }
  WorkPacer pacer;
  for (const WrittenAttribute& attribute : _attributes) {
    pacer.turn();
    _out.write(' ');
    writeAttribute(attribute.needed.prefix, attribute.node->localNameView(),
                   attribute.node->textView());
  }
}

void Serializer::writeStartTag(const NSXMLElement* element) {
  const NSStringView prefix = declareFor(element);
  writeOpenedTag(element, prefix);
  if (element->firstChild()) {
    _out.write('>');
    if (!prefix.equals(element->prefixView())) _renamed.emplace_back(element, prefix);
  } else {
    _out.write("/>");
    _scope.leave(element);
  }
}

// --- which declarations ----------------------------------------------------------------------

void Serializer::declareOwn(const NSXMLElement* element, const Declaration& needed) {
  for (const NSXMLNode* node = element->firstNamespace(); node;
       node = NSXMLElement::nextNamespace(node)) {
    const Declaration own{node->nameView(), node->textView()};
    if (mayBeDeclared(own) && !contradicts(own, needed)) declare(element, own);
  }
}

namespace {

// The declarations above the element that it does not declare anew, nearest first.
std::vector<Declaration> declarationsAbove(const NSXMLElement* element) {
  std::set<std::string> seen;
  std::vector<Declaration> found;
  WorkPacer pacer;
  for (const NSXMLNode* node = element; node; node = node->parent()) {
    pacer.turn();
    const auto* place = dyn_cast<NSXMLElement>(node);
    const NSXMLNode* own = place ? place->firstNamespace() : nullptr;
    for (; own; own = NSXMLElement::nextNamespace(own)) {
      checkWork();
      const Declaration declaration{own->nameView(), own->textView()};
      if (!seen.insert(declaration.prefix.utf8()).second || place == element) continue;
      if (!declaration.prefix.isEmpty() && mayBeDeclared(declaration)) found.push_back(declaration);
    }
  }
  return found;
}

// The prefixes that names in the subtree use, with the URIs they mean there.
class UsedPrefixes {
 public:
  explicit UsedPrefixes(const NSXMLElement* root) {
    const NSXMLNode* end = NSXMLTree::endOfSubtree(root);
    WorkPacer pacer;
    for (const NSXMLNode* node = root; node != end; node = node->nextNode()) {
      pacer.turn();
      const auto* element = dyn_cast<NSXMLElement>(node);
      if (!element) continue;
      add(element);
      for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
           attribute = NSXMLElement::nextAttribute(attribute)) {
        pacer.turn();
        add(attribute);
      }
    }
  }
  bool contains(const Declaration& declaration) const {
    return _used.contains({declaration.prefix.utf8(), declaration.URI.utf8()});
  }

 private:
  void add(const NSXMLNode* node) {
    const NSXMLName* name = node->nodeName();
    if (!name->prefixLength || !_names.insert(name)) return;
    _used.insert({node->prefixView().utf8(), node->URIView().utf8()});
  }

  NSXMLNameSet _names;  // each is looked at once
  std::set<std::pair<std::string, std::string>> _used;
};

}  // namespace

void Serializer::declareInherited(const NSXMLElement* element, const Declaration& needed) {
  const std::vector<Declaration> above = declarationsAbove(element);
  if (above.empty()) return;
  const UsedPrefixes used(element);
  for (const Declaration& declaration : above) {
    if (!contradicts(declaration, needed) && used.contains(declaration)) {
      declare(element, declaration);
    }
  }
}

NSStringView Serializer::prefixForName(const NSXMLElement* element, const Declaration& needed) {
  if (needed.URI == namespaceOfXML) return needed.prefix;
  if (isReserved(needed.prefix)) return madePrefix(element, needed.URI);
  if (!_scope.useAs(element, needed)) declare(element, needed);
  return needed.prefix;
}

NSStringView Serializer::prefixForAttribute(const NSXMLElement* element,
                                            const Declaration& needed) {
  if (needed.URI.isEmpty() || needed.URI == namespaceOfXML) return needed.prefix;
  if (!needed.prefix.isEmpty() && !isReserved(needed.prefix)) {
    if (_scope.useAs(element, needed)) return needed.prefix;
    if (!_scope.isTaken(element, needed.prefix)) {
      declare(element, needed);
      return needed.prefix;
    }
  }
  return madePrefix(element, needed.URI);
}

NSStringView Serializer::madePrefix(const NSXMLElement* element, NSStringView URI) {
  NSStringView& prefix = _madePrefixes[URI.utf8()];
  if (!prefix.isEmpty() && _scope.useAs(element, {prefix, URI})) return prefix;
  if (prefix.isEmpty() || _scope.isTaken(element, prefix) || _scope.isDeclared(prefix)) {
    do {
      prefix = ascii(_madeTexts.emplace_back("ns" + std::to_string(_madeTexts.size() + 1)));
    } while (_scope.isTaken(element, prefix) || _scope.isDeclared(prefix));
  }
  declare(element, {prefix, URI});
  return prefix;
}

NSStringView Serializer::declareFor(const NSXMLElement* element) {
  _declared.clear();
  const Declaration needed = neededFor(element);
  declareOwn(element, needed);
  if (element == _root && !_isInPlace) declareInherited(element, needed);
  const NSStringView prefix = prefixForName(element, needed);
  chooseAttributes(element);
  WorkPacer pacer;
  for (WrittenAttribute& attribute : _attributes) {
    pacer.turn();
    attribute.needed.prefix = prefixForAttribute(element, attribute.needed);
  }
  return prefix;
}

void Serializer::chooseAttributes(const NSXMLElement* element) {
  _attributes.clear();
  WorkPacer pacer;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    if (!spellsDeclaration(attribute)) {
      _attributes.push_back({attribute, neededFor(attribute)});
      continue;
    }
    const Declaration spelt = declarationSpeltBy(attribute);
    if (mayBeDeclared(spelt) && !_scope.isTaken(element, spelt.prefix)) declare(element, spelt);
  }
  if (mayRepeatNames()) dropRepeated(_attributes);
}

// Names that differ are written as different ones, but for those in XML's own namespace that do not
// say so.
bool Serializer::mayRepeatNames() {
  if (_attributes.size() < 2) return false;
  _attributeNames.clear();
  for (const WrittenAttribute& attribute : _attributes) {
    if (attribute.needed.URI.length() != attribute.node->URIView().length()) return true;
    _attributeNames.push_back(attribute.node->expandedName());
  }
  std::sort(_attributeNames.begin(), _attributeNames.end());
  return std::adjacent_find(_attributeNames.begin(), _attributeNames.end()) !=
         _attributeNames.end();
}

}  // namespace

// --- the node's own functions ----------------------------------------------------------------

void NSXMLNode::appendXMLTo(std::string& utf8) const {
  XMLOutput out(utf8, nullptr);
  Serializer(this, out).run();
}

void NSXMLNode::writeXML(const std::function<bool(std::string_view)>& write) const {
  std::string buffer;
  XMLOutput out(buffer, &write);
  Serializer(this, out).run();
}

void XQueryWriteIndentedXML(const NSXMLNode& node,
                            const std::function<bool(std::string_view)>& write) {
  std::string buffer;
  XMLOutput out(buffer, &write);
  Serializer(&node, out, Lines::Indented).run();
}

void XQueryWriteStartTag(const NSXMLElement& element,
                         const std::function<bool(std::string_view)>& write) {
  std::string buffer;
  XMLOutput out(buffer, &write);
  Serializer serializer(&element, out);
  serializer.standInPlace();
  serializer.runStartTag();
}

void XQueryWriteXMLInPlace(const NSXMLNode& node,
                           const std::function<bool(std::string_view)>& write) {
  std::string buffer;
  XMLOutput out(buffer, &write);
  Serializer serializer(&node, out);
  serializer.standInPlace();
  serializer.run();
}

Ref<NSString> NSXMLNode::XMLString() const {
  std::string utf8;
  appendXMLTo(utf8);
  return NSString::stringWithUTF8(utf8);
}

}  // namespace xquery
