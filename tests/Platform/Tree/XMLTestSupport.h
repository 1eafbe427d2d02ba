// What the tests of the XML tree share.
#pragma once

#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <string_view>

namespace xquery {

inline NSStringView A(std::string_view text) {
  return NSStringView::ascii(text);
}

inline Ref<NSXMLDocument> parsed(std::string_view text,
                                 uint32_t options = NSXMLNodePreserveWhitespace) {
  NSXMLParseError error;
  Ref<NSXMLDocument> document = NSXMLDocument::documentWithData(text, options, &error);
  EXPECT_TRUE(document) << error.message << " at " << error.line << ":" << error.column;
  return document;
}

// Everything that makes up a tree but its declarations, with expanded names, in one text: equal
// texts for equal trees.
inline std::string described(const NSXMLNode* root) {
  std::string out;
  const auto name = [](const NSXMLNode* node) {
    return "{" + node->URIView().utf8() + "}" + node->localNameView().utf8();
  };
  const NSXMLNode* node = root;
  int64_t depth = 0;
  while (node) {
    out.append(static_cast<size_t>(depth), ' ');
    out +=
        std::to_string(static_cast<int>(node->kind())) + name(node) + "=" + node->textView().utf8();
    if (const auto* element = dyn_cast<NSXMLElement>(node)) {
      for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
           attribute = NSXMLElement::nextAttribute(attribute)) {
        out += " @" + name(attribute) + "=" + attribute->textView().utf8();
      }
    }
    out += '\n';
    if (node->firstChild()) {
      node = node->firstChild();
      ++depth;
      continue;
    }
    while (node != root && !node->nextSibling()) {
      node = node->parent();
      --depth;
    }
    node = node == root ? nullptr : node->nextSibling();
  }
  return out;
}

// Writes a document with everything the parser knows: namespaces declared, used and undeclared,
// references, sections, comments, instructions, characters of every length.
class RandomDocument {
 public:
  explicit RandomDocument(uint32_t seed) : _random(seed) {}
  std::string text() {
    std::string out = pick({"", "<?xml version='1.0'?>\n", "<!-- before -->", "<?pi before?>"});
    element(out, 0);
    return out + pick({"", "<!--after-->\n"});
  }

 private:
  std::string pick(std::initializer_list<const char*> choices) {
    return choices.begin()[_random() % choices.size()];
  }

  void element(std::string& out, int depth) {
    const std::string prefix = pick({"", "", "p:", "q:"});
    const std::string name = prefix + pick({"a", "b", "c\xC3\xA9", "d-1"});
    out += "<" + name;
    // Below the top a prefix may change its meaning or be declared again.
    if (depth == 0 || _random() % 6 == 0) out += " xmlns:p='" + pick({"urn:p", "urn:r"}) + "'";
    if (depth == 0 || _random() % 6 == 0) out += " xmlns:q=\"urn:q\"";
    if (_random() % 6 == 0) out += " xmlns='" + pick({"urn:d", "", "urn:p"}) + "'";
    if (_random() % 3 == 0)
      out += " x=\"" + pick({"1", "&lt;&amp;&quot;'[\xE2\x82\xAC]", ""}) + "\"";
    if (_random() % 3 == 0) out += " p:x=\"" + pick({"a&#9;b&#10;c&#13;d", " > ' "}) + "\"";
    if (_random() % 5 == 0) out += " q:x='v'";
    const size_t count = depth > 6 ? 0 : _random() % 5;
    if (count == 0 && _random() % 2) {
      out += "/>";
      return;
    }
    out += ">";
    for (size_t index = 0; index < count; ++index) content(out, depth + 1);
    out += "</" + name + ">";
  }

  void content(std::string& out, int depth) {
    switch (_random() % 7) {
      case 0:
        out += pick({"text", "a&lt;b&gt;c&amp;d", "\xF0\x9F\x98\x80 wide", "]] &gt;", "cr&#13;"});
        break;
      case 1:
        out += pick({" ", "\n\t", "x\ny"});
        break;
      case 2:
        out += pick(
            {"<![CDATA[<not> &an; element]]>", "<![CDATA[ ]]>", "<![CDATA[a]]]]><![CDATA[>b]]>"});
        break;
      case 3:
        out += pick({"<!--comment-->", "<!-- - -->", "<!---->"});
        break;
      case 4:
        out += pick({"<?pi?>", "<?pi some text ?>", "<?pi a? > b?>"});
        break;
      default:
        element(out, depth);
    }
  }

  std::mt19937 _random;
};

}  // namespace xquery
