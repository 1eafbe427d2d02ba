#include "Functions/FunctionsTesting.h"
#include "Functions/NodeText.h"

namespace xquery {
namespace {

using namespace functiontest;

std::string parsed(std::string_view text, std::string_view letters) {
  const Value arguments[] = {string(text), string(letters)};
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Value node = ext_node_from_string(arguments, 2, *context);
  if (!node) return "null";
  EXPECT_EQ(node->kind(), Kind::Document);
  const auto* root = cast<NSXMLDocument>(node.get())->rootElement();
  return root ? root->XMLString()->utf8() : "";
}

TEST(StringFromNode, SerialisesTheNode) {
  const Value doc = document("<a x='1'>b<!--c--><?d e?></a>");
  const NSXMLElement* root = cast<NSXMLDocument>(doc.get())->rootElement();
  const auto text = [](NSXMLNode* node) { return call(ext_string_from_node, {Value(node)}); };
  EXPECT_EQ(text(const_cast<NSXMLElement*>(root)), "untypedAtomic <a x=\"1\">b<!--c--><?d e?></a>");
  EXPECT_EQ(text(root->firstAttribute()), "untypedAtomic x=\"1\"");
  EXPECT_EQ(text(root->firstChild()), "untypedAtomic b");
}

TEST(StringFromNode, RefusesOtherItems) {
  EXPECT_EQ(call(ext_string_from_node, {string("a")}), "null");
  EXPECT_EQ(call(ext_string_from_node, {NSNull::null()}), "null");
  EXPECT_EQ(refusedCounts(ext_string_from_node, document("<a/>")), "0 2 3 4 5");
}

TEST(NodeFromString, ParsesADocument) {
  EXPECT_EQ(answer("ext:node-from-string('<a><b>1</b></a>')/a/b cast as xs:integer"), "integer 1");
  EXPECT_EQ(answer("ext:node-from-string('<a>&#xE9;</a>') eq 'é'"), "true");
  EXPECT_EQ(answer("ext:node-from-string('<a>é</a>') eq 'é'"), "true");
  EXPECT_EQ(answer("ext:node-from-string('<a/>') instance of document-node()"), "true");
}

TEST(NodeFromString, IsRefusedForTextThatDoesNotParse) {
  for (const std::string_view text :
       {"", "x", "<a>", "<a></b>", "<a/><b/>", "<a b='&c;'/>", "<a>\x01</a>",
        "<!DOCTYPE a SYSTEM 'file:///etc/passwd'><a>&x;</a>",
        "<!DOCTYPE a [<!ENTITY x SYSTEM 'file:///etc/passwd'>]><a>&x;</a>"}) {
    EXPECT_EQ(call(ext_node_from_string, {string(text)}), "null") << text;
  }
}

TEST(NodeFromString, DropsWhiteSpaceUnlessToldToPreserveIt) {
  EXPECT_EQ(parsed("<a> <b/> </a>", ""), "<a><b/></a>");
  EXPECT_EQ(parsed("<a> <b/> </a>", "w"), "<a> <b/> </a>");
  EXPECT_EQ(parsed("<a> <b/> </a>", "P"), "<a> <b/> </a>");
  EXPECT_EQ(parsed("<a> <b/> </a>", "eqanrpdx"), "<a><b/></a>");
}

TEST(NodeFromString, PreservesCDATASectionsWhenToldTo) {
  EXPECT_EQ(parsed("<a><![CDATA[<]]></a>", ""), "<a>&lt;</a>");
  EXPECT_EQ(parsed("<a><![CDATA[<]]></a>", "d"), "<a><![CDATA[<]]></a>");
  EXPECT_EQ(parsed("<a><![CDATA[<]]></a>", "P"), "<a><![CDATA[<]]></a>");
}

TEST(NodeFromString, TidiesHTMLAndPreservesWhiteSpace) {
  const std::string tidied = parsed("<p>a<br> <b>c</b> <i>d", "hw");
  EXPECT_NE(tidied.find("<br/>"), std::string::npos) << tidied;
  EXPECT_NE(tidied.find("<b>c</b> <i>d</i>"), std::string::npos) << tidied;
  EXPECT_NE(parsed("<p>a", "T").find("<p>a</p>"), std::string::npos);
  // Without the letter it is no document.
  EXPECT_EQ(parsed("<p>a<br>", "w"), "null");
}

TEST(NodeFromString, IgnoresOtherLetters) {
  EXPECT_EQ(parsed("<a> </a>", "WzZ9 -é"), "<a/>");
  EXPECT_EQ(parsed("<a> </a>", "WzwZ"), "<a> </a>");
  EXPECT_EQ(call(ext_node_from_string, {string("<a/>"), NSNull::null()}), "node ");
}

TEST(NodeFromString, PromotesItsText) {
  EXPECT_EQ(call(ext_node_from_string, {untyped("<a/>")}), "node ");
  EXPECT_EQ(call(ext_node_from_string, {NSNull::null()}), "null");
  EXPECT_EQ(call(ext_node_from_string, {integer(1)}), "error 6 not a string type - 1");
  EXPECT_EQ(refusedCounts(ext_node_from_string, string("<a/>")), "0 3 4 5");
}

TEST(NodeFromString, TakesDeepDocuments) {
  std::string text;
  constexpr int levels = 200000;
  for (int level = 0; level < levels; ++level) text += "<a>";
  for (int level = 0; level < levels; ++level) text += "</a>";
  EXPECT_EQ(answer("declare variable $t external; count(ext:node-from-string($t)//a)", {},
                   {{"t", untyped(text)}}),
            "integer 200000");
}

TEST(XPathForNode, IsAString) {
  EXPECT_EQ(answer("ext:xpath-for-node((//b)[2])", document("<a><b/><c/><b/></a>")),
            "string /a[1]/b[2]");
  EXPECT_EQ(answer("ext:xpath-for-node(/)", document("<a/>")), "string /");
}

TEST(XPathForNode, RefusesOtherItems) {
  EXPECT_EQ(call(ext_xpath_for_node, {string("a")}), "null");
  EXPECT_EQ(call(ext_xpath_for_node, {NSNull::null()}), "null");
  EXPECT_EQ(refusedCounts(ext_xpath_for_node, document("<a/>")), "0 2 3 4 5");
}

TEST(XPathForNode, LeadsBackToTheNode) {
  const std::string_view xml =
      "<a x='1' y='2'>t<b>u</b>v<!--c--><b x='3'>w<?p q?><b/>x</b><!--d--><?r s?><?p u?></a>";
  EXPECT_EQ(answer("every $n in (//node(), //@*) satisfies "
                   "ext:node-xpath(/, ext:xpath-for-node($n)) is $n",
                   document(xml)),
            "true");
}

}  // namespace
}  // namespace xquery
