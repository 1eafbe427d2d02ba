// Trees that are built, changed and moved as the input says, written, and read back. The first byte
// says whether prefixes, namespaces and characters are such as XML can have: then what is read back
// is the same tree; else what is written is well formed all the same, has the same nodes with the
// same local names and texts as far as XML has such, and once it is read writes the same again and
// again.
#include "support/Failure.h"
#include "support/Input.h"
#include "xquery/Serializing.h"
#include "xquery/XMLNode.h"

#include <map>
#include <string>
#include <vector>

using namespace xquery;
using namespace xquery::fuzz;

namespace {

constexpr uint32_t keepsAll = NSXMLNodePreserveWhitespace | NSXMLNodePreserveCDATA;
constexpr size_t mostEvents = 400;
constexpr size_t longestText = 24;
constexpr size_t mostCopied = 10'000;  // nodes

Ref<NSString> string(std::string_view text) {
  return NSString::stringWithUTF8Replacing(text);
}

// --- a tree in words -----------------------------------------------------------------------------

std::string nameOf(const NSXMLNode* node) {
  return "{" + node->URIView().utf8() + "}" + node->localNameView().utf8();
}

void describeStart(const NSXMLElement* element, std::string& out) {
  out += "<" + nameOf(element);
  std::map<std::string, std::string> attributes;
  const NSXMLNode* attribute = element->firstAttribute();
  for (; attribute; attribute = NSXMLElement::nextAttribute(attribute)) {
    attributes[nameOf(attribute)] = attribute->textView().utf8();
  }
  for (const auto& [name, value] : attributes) out += " " + name + "='" + value + "'";
  out += ">";
}

// Texts that meet are one; how they were written does not matter.
std::string described(const NSXMLNode* root) {
  std::string out;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    out += std::to_string(node->level() - root->level());
    if (const auto* element = dyn_cast<NSXMLElement>(node)) {
      describeStart(element, out);
    } else if (node->kind() == Kind::Text) {
      const bool isBehindText = out.ends_with("\1" + std::to_string(node->level() - root->level()));
      if (isBehindText) out.resize(out.rfind('\1'));
      if (!isBehindText && node->textView().isEmpty()) {
        out.resize(out.size() - std::to_string(node->level() - root->level()).size());
        continue;
      }
      out += node->textView().utf8() + "\1";
    } else {
      out += std::to_string(static_cast<int>(node->kind())) + node->nameView().utf8() + "(" +
             node->textView().utf8() + ")";
    }
  }
  return out;
}

// What there is but texts, where it is, and local names: what is kept of nodes that XML has no way
// to write as they are.
std::string outline(const NSXMLNode* root) {
  std::string out;
  for (const NSXMLNode* node = root; node; node = node->nextNode()) {
    if (node->kind() == Kind::Text) continue;
    out += std::to_string(node->level() - root->level()) + ":" +
           std::to_string(static_cast<int>(node->kind())) + node->localNameView().utf8() + " ";
  }
  return out;
}

// The text as XML can have it: what is no character of XML is one that stands for it.
std::string readable(const NSString& text) {
  NSMutableString kept;
  for (uint32_t i = 0; i < text.length(); ++i) {
    const char16_t unit = text.characterAtIndex(i);
    const bool isControl = unit < 0x20 && unit != u'\t' && unit != u'\n' && unit != u'\r';
    kept.append(isControl || unit >= 0xFFFE ? char16_t{0xFFFD} : unit);
  }
  return kept.string()->utf8();
}

std::string withoutSpace(std::string text) {
  std::erase_if(text, [](char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r'; });
  return text;
}

// --- building ------------------------------------------------------------------------------------

class Builder {
 public:
  Builder(Input& input, bool isSane) : _input(input), _isSane(isSane) {}

  Ref<NSXMLElement> build() {
    Ref<NSXMLElement> root = element();
    _elements = {root};
    for (size_t i = 0; i < mostEvents && !_input.isEmpty(); ++i) event();
    return root;
  }

 private:
  std::string_view choice(std::initializer_list<std::string_view> sane,
                          std::initializer_list<std::string_view> wild) {
    const size_t count = sane.size() + (_isSane ? 0 : wild.size());
    const size_t at = _input.below(count);
    return at < sane.size() ? sane.begin()[at] : wild.begin()[at - sane.size()];
  }

  struct Name {
    std::string text;
    std::string URI;
  };
  Name name() {
    const std::string local(choice({"a", "b", "c", "x-1", "\xc3\xa9", "_"}, {"xmlns", "xml"}));
    std::string URI(choice({"", "", "urn:p", "urn:q"}, {"http://www.w3.org/XML/1998/namespace",
                                                        "http://www.w3.org/2000/xmlns/"}));
    std::string prefix(choice({"", "p", "q", "ns0"}, {"xml", "xmlns", "ns1"}));
    if (_isSane && URI.empty()) prefix.clear();
    return {prefix.empty() ? local : prefix + ":" + local, URI};
  }

  // Characters that XML can have, in sane trees.
  Ref<NSString> text(bool isData = true) {
    const auto raw = string(_input.bytes(1 + _input.below(longestText)));
    if (!_isSane) return raw;
    NSMutableString kept;
    for (uint32_t i = 0; i < raw->length(); ++i) {
      const char16_t unit = raw->characterAtIndex(i);
      const bool isLineEnd = unit == u'\r' && !isData;
      const bool isControl = unit < 0x20 && unit != u'\t' && unit != u'\n' && unit != u'\r';
      const bool isMark = !isData && (unit == u'-' || unit == u'?' || unit == u' ' || unit < 0x20);
      kept.append(isControl || isLineEnd || isMark || unit >= 0xFFFE ? u'_' : unit);
    }
    return kept.string();
  }

  Ref<NSXMLElement> element() {
    const Name n = name();
    return NSXMLElement::elementWithName(string(n.text)->view(), string(n.URI)->view());
  }

  NSXMLElement* any() { return _elements[_input.below(_elements.size())].get(); }

  void add(const Ref<NSXMLNode>& node) {
    NSXMLElement* parent = any();
    if (_input.chance(4)) {
      check(parent->insertChild(node, _input.byte()), "not inserted");
    } else {
      check(parent->addChild(node), "not added");
    }
  }

  void addAttribute() {
    NSXMLElement* element = any();
    const Name n = name();
    const auto value = text();
    const auto attribute =
        NSXMLNode::attributeWithName(string(n.text)->view(), value->view(), string(n.URI)->view());
    const bool isThere =
        element->attributeForLocalName(attribute->localNameView(), attribute->URIView());
    if (!(_isSane && isThere)) static_cast<void>(element->addAttribute(attribute));
  }

  void addNamespace() {
    const std::string_view prefix = choice({"", "p", "q"}, {"xml", "xmlns"});
    const std::string_view URI = choice({"urn:p", "urn:q"}, {"", "http://www.w3.org/2000/xmlns/"});
    static_cast<void>(any()->addNamespace(
        NSXMLNode::namespaceWithName(string(prefix)->view(), string(URI)->view())));
  }

  // To where it does not lie below itself.
  void move() {
    NSXMLElement* moved = any();
    NSXMLElement* to = any();
    if (moved == _elements.front()) return;
    for (const NSXMLNode* above = to; above; above = above->parent()) {
      if (above == moved) return;
    }
    const Ref<NSXMLNode> kept(moved);
    moved->detach();
    check(to->addChild(kept), "not moved");
  }

  void event() {
    switch (_input.below(12)) {
      case 0:
      case 1:
      case 2: {
        const Ref<NSXMLElement> made = element();
        add(made);
        _elements.push_back(made);
        break;
      }
      case 3:
        add(NSXMLNode::textWithStringValue(text()->view()));
        break;
      case 4:
        add(NSXMLNode::cdataWithStringValue(text()->view()));
        break;
      case 5:
        add(NSXMLNode::commentWithStringValue(text(false)->view()));
        break;
      case 6: {
        const std::string_view target = choice({"a", "php", "\xc3\xa9"}, {"x"});
        add(NSXMLNode::processingInstructionWithName(string(target)->view(), text(false)->view()));
        break;
      }
      case 7:
      case 8:
        addAttribute();
        break;
      case 9:
        addNamespace();
        break;
      case 10:
        move();
        break;
      default:
        copy();
    }
  }

  // Copies of copies grow without bound.
  void copy() {
    const NSXMLElement* original = any();
    size_t nodes = 1;
    for (const NSXMLNode* node = original->nextNode(); node && node->level() > original->level();
         node = node->nextNode()) {
      ++nodes;
    }
    _copied += nodes;
    if (_copied <= mostCopied) add(original->copy());
  }

  Input& _input;
  const bool _isSane;
  std::vector<Ref<NSXMLElement>> _elements;
  size_t _copied = 0;
};

// --- checks --------------------------------------------------------------------------------------

void checkOrder(const NSXMLNode* root) {
  for (const NSXMLNode* node = root; const NSXMLNode* next = node->nextNode(); node = next) {
    const bool isOrdered = NSXMLNode::compareOrder(node, next) < 0;
    if (!isOrdered) fail("nodes out of order", root->XMLString()->utf8());
  }
}

Ref<NSXMLDocument> readBack(const std::string& written) {
  NSXMLParseError error;
  auto document = NSXMLDocument::documentWithData(written, keepsAll, &error);
  if (!document) fail("written but not read: " + error.message, written);
  return document;
}

void checkIndented(const NSXMLElement& root) {
  std::string written;
  XQueryWriteIndentedXML(root, [&](std::string_view piece) {
    written += piece;
    return true;
  });
  const auto document = readBack(written);
  checkEqual(withoutSpace(document->stringValue()->utf8()),
             withoutSpace(readable(*root.stringValue())), "indented with another text");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  const bool isSane = !input.chance(3);
  const auto root = Builder(input, isSane).build();
  checkOrder(root.get());
  std::string written;
  root->appendXMLTo(written);
  const auto document = readBack(written);
  checkIndented(*root);
  const auto copy = root->copy();
  checkEqual(described(copy.get()), described(root.get()), "copied as another tree");
  if (isSane) {
    checkEqual(described(document->rootElement()), described(root.get()),
               "read back as another tree");
    return 0;
  }
  checkEqual(outline(document->rootElement()), outline(root.get()), "read back as other nodes");
  checkEqual(document->stringValue()->utf8(), readable(*root->stringValue()),
             "read back with another text");
  // What spelt a declaration is one by now.
  std::string again;
  document->rootElement()->appendXMLTo(again);
  std::string third;
  readBack(again)->rootElement()->appendXMLTo(third);
  checkEqual(third, again, "written otherwise once it is read");
  return 0;
}
