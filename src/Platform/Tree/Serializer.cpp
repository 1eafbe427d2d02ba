// Trees as XML text.
//
// The walk iterates; output goes through a buffer that is handed on whenever it is full. Names
// carry their URIs, so every element is written with whatever declarations its names need and do
// not yet have in scope:
//
//   - its own declarations, in their order, except those that contradict the element's own name;
//   - for the topmost element, those in scope in the tree above that names below it use;
//   - those that its name and the names of its attributes still lack. An attribute whose prefix
//     means something else here gets a prefix that is free.
//
// What XML cannot contain (control characters, lone surrogates) is written as U+FFFD, and comments
// and processing instructions that would end early are written with a space in between, so that
// the output is always well formed.
#include "Platform/Base/WorkMeter.h"
#include "Platform/Tree/Arena.h"
#include "Platform/Tree/Names.h"
#include "xquery/XMLNode.h"

#include <array>
#include <deque>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace xquery {

namespace {

NSStringView ascii(std::string_view text) {
  return NSStringView::ascii(text);
}

// --- output ----------------------------------------------------------------------------------

// Collects UTF-8. With a sink, pieces of at most `pieceSize` bytes are handed to it.
class Output {
 public:
  using Sink = std::function<bool(std::string_view)>;
  Output(std::string& buffer, const Sink* sink) : _buffer(buffer), _sink(sink) {}

  bool isStopped() const { return _isStopped; }

  void write(std::string_view bytes) {
    if (!_sink) {
      _buffer.append(bytes);
      return;
    }
    while (!bytes.empty() && !_isStopped) {
      const std::string_view part = bytes.substr(0, pieceSize - _buffer.size());
      _buffer.append(part);
      bytes.remove_prefix(part.size());
      if (_buffer.size() == pieceSize) flush();
    }
  }
  void write(char byte) { write(std::string_view(&byte, 1)); }
  void write(NSStringView text) {
    if (text.isWide()) {
      write(std::string_view(text.utf8()));
    } else {
      write(std::string_view(text.asciiUnits(), text.length()));
    }
  }
  void flush() {
    if (!_sink || _buffer.empty()) return;
    if (!_isStopped) _isStopped = !(*_sink)(_buffer);
    _buffer.clear();
  }

 private:
  static constexpr size_t pieceSize = size_t{64} * 1024;
  std::string& _buffer;
  const Sink* _sink;
  bool _isStopped = false;
};

// --- characters ------------------------------------------------------------------------------

constexpr std::string_view replacement = "\xEF\xBF\xBD";

// What is written in place of each of the first 128 characters; null for itself.
using EscapeTable = std::array<const char*, 128>;

constexpr EscapeTable illegalReplaced() {
  EscapeTable table{};
  for (size_t unit = 0; unit < ' '; ++unit) {
    if (unit != '\t' && unit != '\n' && unit != '\r') table[unit] = replacement.data();
  }
  return table;
}

constexpr EscapeTable textEscapes() {
  EscapeTable table = illegalReplaced();
  table['&'] = "&amp;";
  table['<'] = "&lt;";
  table['>'] = "&gt;";
  table['\r'] = "&#xD;";
  return table;
}

constexpr EscapeTable attributeEscapes() {
  EscapeTable table = illegalReplaced();
  table['&'] = "&amp;";
  table['<'] = "&lt;";
  table['"'] = "&quot;";
  table['\t'] = "&#x9;";
  table['\n'] = "&#xA;";
  table['\r'] = "&#xD;";
  return table;
}

// A section cannot refer to characters: it is closed for a carriage return.
constexpr EscapeTable CDATAEscapes() {
  EscapeTable table = illegalReplaced();
  table['\r'] = "]]>&#xD;<![CDATA[";
  return table;
}

constexpr EscapeTable plainTable = illegalReplaced();
constexpr EscapeTable textTable = textEscapes();
constexpr EscapeTable attributeTable = attributeEscapes();
constexpr EscapeTable CDATATable = CDATAEscapes();

void writeNarrow(Output& out, std::string_view text, const EscapeTable& table) {
  size_t start = 0;
  for (size_t at = 0; at < text.size(); ++at) {
    const char* escape = table[static_cast<unsigned char>(text[at])];
    if (!escape) continue;
    out.write(text.substr(start, at - start));
    out.write(std::string_view(escape));
    start = at + 1;
  }
  out.write(text.substr(start));
}

// Runs without anything to replace are converted as a whole; so are surrogate pairs within them.
void writeWide(Output& out, NSStringView text, const EscapeTable& table) {
  constexpr uint32_t runLength = 8192;
  uint32_t start = 0;
  const auto writeRun = [&](uint32_t end) { out.write(text.substring(start, end - start)); };
  for (uint32_t at = 0; at < text.length(); ++at) {
    const char16_t unit = text.wideUnits()[at];
    const char* escape = unit < 0x80 ? table[unit] : unit >= 0xFFFE ? replacement.data() : nullptr;
    if (escape) {
      writeRun(at);
      out.write(std::string_view(escape));
      start = at + 1;
    } else if (at - start >= runLength && (unit < 0xDC00 || unit >= 0xE000)) {
      writeRun(at);  // not between the halves of a pair
      start = at;
    }
  }
  writeRun(text.length());
}

void writeEscaped(Output& out, NSStringView text, const EscapeTable& table) {
  if (text.isWide()) {
    writeWide(out, text, table);
  } else {
    writeNarrow(out, {text.asciiUnits(), text.length()}, table);
  }
}

// Writes `between` in the middle of every occurrence of `separated`, after its first `keep` units.
void writeSeparated(Output& out, NSStringView text, std::string_view separated, uint32_t keep,
                    std::string_view between, const EscapeTable& table) {
  uint32_t start = 0;
  while (true) {
    const uint32_t found = text.find(ascii(separated), start);
    if (found == NSStringView::notFound) break;
    writeEscaped(out, text.substring(start, found + keep - start), table);
    out.write(between);
    start = found + keep;
  }
  writeEscaped(out, text.substring(start), table);
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
  // A name in the start tag of the element has the prefix, whatever it means.
  void use(const NSXMLNode* element, NSStringView prefix) { at(prefix).lastUser = element; }
  // The same where the prefix has that meaning; otherwise nothing, and false.
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

bool isReserved(NSStringView prefix) {
  return prefix == "xml" || prefix == "xmlns";
}

// --- the walk --------------------------------------------------------------------------------

class Serializer {
 public:
  Serializer(const NSXMLNode* root, Output& out) : _root(root), _out(out) {}
  void run();

 private:
  void open(const NSXMLNode* node);
  void close(const NSXMLNode* node);
  void writeLeaf(const NSXMLNode* node);
  void writeStartTag(const NSXMLElement* element);
  void writeAttribute(NSStringView prefix, NSStringView localName, NSStringView value);
  void writeDeclaration(const Declaration& declaration);

  // Fill `_declared`, what the start tag of the element declares.
  void declareFor(const NSXMLElement* element);
  void declareOwn(const NSXMLElement* element);
  void declareInherited(const NSXMLElement* element);
  void declareForName(const NSXMLElement* element);
  void declare(const NSXMLElement* element, const Declaration& declaration) {
    _declared.push_back(declaration);
    _scope.declare(element, declaration);
  }
  // The prefix to write the name of an attribute in a namespace with.
  NSStringView prefixForAttribute(const NSXMLElement* element, const NSXMLNode* attribute);
  NSStringView madePrefix(const NSXMLElement* element, NSStringView URI);

  const NSXMLNode* _root;
  Output& _out;
  NamespaceScope _scope;
  std::vector<Declaration> _declared;                 // in the start tag at hand
  std::vector<NSStringView> _attributePrefixes;       // of its attributes in turn
  std::map<std::string, NSStringView> _madePrefixes;  // by URI
  std::deque<std::string> _madeTexts;
};

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

void Serializer::open(const NSXMLNode* node) {
  if (const auto* element = dyn_cast<NSXMLElement>(node)) {
    writeStartTag(element);
  } else if (node->kind() == Kind::Document) {
    _out.write("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n");
  } else {
    writeLeaf(node);
  }
}

void Serializer::close(const NSXMLNode* node) {
  if (node->kind() != Kind::Element) return;
  _out.write("</");
  _out.write(node->nameView());
  _out.write('>');
  _scope.leave(node);
}

void Serializer::writeLeaf(const NSXMLNode* node) {
  const NSStringView text = node->textView();
  switch (node->kind()) {
    case Kind::Comment:
      _out.write("<!--");
      writeSeparated(_out, text, "--", 1, " ", plainTable);
      if (text.endsWith(ascii("-"))) _out.write(' ');
      _out.write("-->");
      break;
    case Kind::ProcessingInstruction:
      _out.write("<?");
      _out.write(node->nameView());
      if (!text.isEmpty()) _out.write(' ');
      writeSeparated(_out, text, "?>", 1, " ", plainTable);
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
        writeSeparated(_out, text, "]]>", 2, "]]><![CDATA[", CDATATable);
        _out.write("]]>");
      } else {
        writeEscaped(_out, text, textTable);
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
  writeEscaped(_out, value, attributeTable);
  _out.write('"');
}

void Serializer::writeDeclaration(const Declaration& declaration) {
  if (declaration.prefix.isEmpty()) {
    writeAttribute({}, ascii("xmlns"), declaration.URI);
  } else {
    writeAttribute(ascii("xmlns"), declaration.prefix, declaration.URI);
  }
}

void Serializer::writeStartTag(const NSXMLElement* element) {
  declareFor(element);
  _out.write('<');
  _out.write(element->nameView());
  for (const Declaration& declaration : _declared) {
    _out.write(' ');
    writeDeclaration(declaration);
  }
  size_t index = 0;
  WorkPacer pacer;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    _out.write(' ');
    const NSStringView prefix = _attributePrefixes[index++];
    const bool isPlain = attribute->URIView().isEmpty();
    writeAttribute(prefix, isPlain ? attribute->nameView() : attribute->localNameView(),
                   attribute->textView());
  }
  if (element->firstChild()) {
    _out.write('>');
  } else {
    _out.write("/>");
    _scope.leave(element);
  }
}

// --- which declarations ----------------------------------------------------------------------

void Serializer::declareOwn(const NSXMLElement* element) {
  for (const NSXMLNode* node = element->firstNamespace(); node;
       node = NSXMLElement::nextNamespace(node)) {
    const Declaration own{node->nameView(), node->textView()};
    if (isReserved(own.prefix)) continue;
    // Only the default namespace can be undeclared.
    if (own.URI.isEmpty() && !own.prefix.isEmpty()) continue;
    if (own.prefix.equals(element->prefixView()) && !own.URI.equals(element->URIView())) continue;
    declare(element, own);
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
      if (declaration.prefix.isEmpty() || declaration.URI.isEmpty()) continue;
      if (!isReserved(declaration.prefix)) found.push_back(declaration);
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

void Serializer::declareInherited(const NSXMLElement* element) {
  const std::vector<Declaration> above = declarationsAbove(element);
  if (above.empty()) return;
  const UsedPrefixes used(element);
  for (const Declaration& declaration : above) {
    if (used.contains(declaration)) declare(element, declaration);
  }
}

void Serializer::declareForName(const NSXMLElement* element) {
  const Declaration needed{element->prefixView(), element->URIView()};
  // A prefix without a URI is written as it is: there is nothing to declare it as.
  if (isReserved(needed.prefix) || (!needed.prefix.isEmpty() && needed.URI.isEmpty())) {
    _scope.use(element, needed.prefix);
  } else if (!_scope.useAs(element, needed)) {
    declare(element, needed);
  }
}

NSStringView Serializer::prefixForAttribute(const NSXMLElement* element,
                                            const NSXMLNode* attribute) {
  const Declaration needed{attribute->prefixView(), attribute->URIView()};
  // This namespace has one prefix, which is never declared, and the reserved ones stand for no
  // other.
  if (needed.URI == "http://www.w3.org/XML/1998/namespace") return ascii("xml");
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

void Serializer::declareFor(const NSXMLElement* element) {
  _declared.clear();
  _attributePrefixes.clear();
  declareOwn(element);
  if (element == _root) declareInherited(element);
  declareForName(element);
  WorkPacer pacer;
  for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
       attribute = NSXMLElement::nextAttribute(attribute)) {
    pacer.turn();
    // A name without a URI is written as it is.
    const bool isPlain = attribute->URIView().isEmpty();
    _attributePrefixes.push_back(isPlain ? NSStringView() : prefixForAttribute(element, attribute));
  }
}

}  // namespace

// --- the node's own functions ----------------------------------------------------------------

void NSXMLNode::appendXMLTo(std::string& utf8) const {
  Output out(utf8, nullptr);
  Serializer(this, out).run();
}

void NSXMLNode::writeXML(const std::function<bool(std::string_view)>& write) const {
  std::string buffer;
  Output out(buffer, &write);
  Serializer(this, out).run();
}

Ref<NSString> NSXMLNode::XMLString() const {
  std::string utf8;
  appendXMLTo(utf8);
  return NSString::stringWithUTF8(utf8);
}

}  // namespace xquery
