#include "xquery/XMLNode.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace xquery {
namespace {

// The paths of the document's nodes in document order, attributes and namespaces before children.
std::vector<std::string> paths(std::string_view xml) {
  std::vector<std::string> result;
  const auto document = NSXMLDocument::documentWithData(xml, NSXMLNodePreserveWhitespace);
  for (const NSXMLNode* node = document.get(); node; node = node->nextNode()) {
    result.push_back(node->XPath()->utf8());
    const auto* element = dyn_cast<NSXMLElement>(node);
    if (!element) continue;
    for (const NSXMLNode* declared = element->firstNamespace(); declared;
         declared = NSXMLElement::nextNamespace(declared)) {
      result.push_back(declared->XPath()->utf8());
    }
    for (const NSXMLNode* attribute = element->firstAttribute(); attribute;
         attribute = NSXMLElement::nextAttribute(attribute)) {
      result.push_back(attribute->XPath()->utf8());
    }
  }
  return result;
}

using Paths = std::vector<std::string>;

TEST(XMLPath, CountsElementsOfOneName) {
  EXPECT_EQ(paths("<site><people><person/><x/><person id='1'/></people></site>"),
            (Paths{"/", "/site[1]", "/site[1]/people[1]", "/site[1]/people[1]/person[1]",
                   "/site[1]/people[1]/x[1]", "/site[1]/people[1]/person[2]",
                   "/site[1]/people[1]/person[2]/@id"}));
}

TEST(XMLPath, CountsNodesOfOneKind) {
  EXPECT_EQ(paths("<a>t<!--1-->u<?p q?><!--2--><?r s?></a>"),
            (Paths{"/", "/a[1]", "/a[1]/text()[1]", "/a[1]/comment()[1]", "/a[1]/text()[2]",
                   "/a[1]/processing-instruction()[1]", "/a[1]/comment()[2]",
                   "/a[1]/processing-instruction()[2]"}));
  EXPECT_EQ(paths("<!--1--><a/><!--2-->"), (Paths{"/", "/comment()[1]", "/a[1]", "/comment()[2]"}));
}

TEST(XMLPath, CountsByExpandedNameAndWritesTheQualifiedOne) {
  EXPECT_EQ(paths("<r xmlns:p='u' xmlns:q='u' xmlns:o='v' p:i='1'><p:a/><q:a/><o:a/><a/></r>"),
            (Paths{"/", "/r[1]", "/r[1]/namespace::p", "/r[1]/namespace::q", "/r[1]/namespace::o",
                   "/r[1]/@p:i", "/r[1]/p:a[1]", "/r[1]/q:a[2]", "/r[1]/o:a[1]", "/r[1]/a[1]"}));
}

TEST(XMLPath, BeginsAtTheRootOfATreeWithoutADocument) {
  const auto element = NSXMLElement::elementWithName(NSStringView::ascii("a"));
  element->addChild(NSXMLNode::textWithStringValue(NSStringView::ascii("t")));
  EXPECT_EQ(element->XPath()->utf8(), "/a[1]");
  EXPECT_EQ(element->firstChild()->XPath()->utf8(), "/a[1]/text()[1]");
  const auto attribute =
      NSXMLNode::attributeWithName(NSStringView::ascii("x"), NSStringView::ascii("1"));
  EXPECT_EQ(attribute->XPath()->utf8(), "/@x");
}

TEST(XMLPath, IsLinearInTheNestingAndTheSiblings) {
  std::string xml;
  constexpr size_t levels = 300000;
  for (size_t level = 0; level < levels; ++level) xml += "<a>";
  for (size_t count = 0; count < levels; ++count) xml += "<b/>";
  for (size_t level = 0; level < levels; ++level) xml += "</a>";
  const auto document = NSXMLDocument::documentWithData(xml, NSXMLNodeOptionsNone);
  const NSXMLNode* node = document->rootElement();
  while (node->firstChild()) node = node->lastChild();
  const Ref<NSString> path = node->XPath();
  EXPECT_EQ(path->length(), levels * 5 + std::string("/b[300000]").size());
  EXPECT_TRUE(path->view().endsWith(NSStringView::ascii("/a[1]/b[300000]")));
}

}  // namespace
}  // namespace xquery
