#include "HTMLWriter.h"

#include <algorithm>
#include <cctype>
#include <iterator>
#include <string>
#include <string_view>

namespace cli {
namespace {

using namespace xquery;

constexpr std::string_view namespaceOfXHTML = "http://www.w3.org/1999/xhtml";
constexpr std::string_view withoutContent[] = {"area",  "base",   "br",    "col",  "embed",
                                               "hr",    "img",    "input", "link", "meta",
                                               "param", "source", "track", "wbr"};
constexpr std::string_view withRawText[] = {"script", "style",   "xmp",
                                            "iframe", "noembed", "noframes"};

template <size_t count>
bool isOneOf(const std::string& name, const std::string_view (&names)[count]) {
  return std::find(std::begin(names), std::end(names), name) != std::end(names);
}

// The name as HTML knows it; empty for an element that is none of HTML's.
std::string nameInHTML(const NSXMLNode* element) {
  const NSStringView URI = element->URIView();
  if (!URI.isEmpty() && URI != namespaceOfXHTML) return {};
  std::string name = element->localNameView().utf8();
  std::transform(name.begin(), name.end(), name.begin(),
                 [](unsigned char byte) { return static_cast<char>(std::tolower(byte)); });
  return name;
}

bool isRawText(const NSXMLNode* text) {
  const NSXMLNode* parent = text->parent();
  return parent && parent->kind() == Kind::Element && isOneOf(nameInHTML(parent), withRawText);
}

class Writer {
 public:
  Writer(const NSXMLNode& root, ResultPart& result) : _root(&root), _result(result) {}

  void run() {
    const NSXMLNode* node = _root;
    while (!_result.isStopped()) {
      open(node);
      if (const NSXMLNode* child = node->firstChild()) {
        node = child;
        continue;
      }
      close(node);
      while (node != _root && !node->nextSibling()) {
        node = node->parent();
        close(node);
      }
      if (node == _root) break;
      node = node->nextSibling();
    }
  }

 private:
  void open(const NSXMLNode* node) {
    if (const auto* element = dyn_cast<NSXMLElement>(node)) {
      writeStartTag(element);
    } else if (node->kind() == Kind::Document) {
      _result.append("<!DOCTYPE html>\n");
    } else if (node->kind() == Kind::Text && isRawText(node)) {
      _result.append(node->textView().utf8());
    } else if (node->kind() == Kind::Text) {
      writeAsXML(*NSXMLNode::textWithStringValue(node->textView()));
    } else if (node->kind() == Kind::ProcessingInstruction) {
      const std::string text = node->textView().utf8();
      _result.append("<?" + node->nameView().utf8() + (text.empty() ? "" : " ") + text + ">");
    } else {
      writeAsXML(*node);
    }
  }

  void close(const NSXMLNode* node) {
    if (node->kind() != Kind::Element) return;
    if (!node->firstChild() && isOneOf(nameInHTML(node), withoutContent)) return;
    _result.append("</" + node->localNameView().utf8() + ">");
  }

  void writeStartTag(const NSXMLElement* element) {
    _result.append("<" + element->localNameView().utf8());
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      _result.append(" ");
      writeAsXML(*attribute);
    }
    _result.append(">");
  }

  void writeAsXML(const NSXMLNode& node) {
    node.writeXML([this](std::string_view text) { return _result.append(text); });
  }

  const NSXMLNode* const _root;
  ResultPart& _result;
};

}  // namespace

void writeHTML(const NSXMLNode& node, ResultPart& result) {
  Writer(node, result).run();
}

}  // namespace cli
