// Nodes that were there before an evaluation began: it reads them, copies them and leaves them as
// they are, whoever else may be reading them.
#include "Engine/EmbeddingTesting.h"

namespace xquery {
namespace {

class ExistingNodes : public Embedding {
 protected:
  static Ref<NSXMLElement> element(std::string_view name) {
    return NSXMLElement::elementWithName(NSStringView::ascii(name));
  }
  // What the query makes of the node, as the variable $n, and as the context item.
  std::string made(std::string_view source, const Value& node) {
    const auto items = evaluate(source, {{"n", node}}, node);
    std::string text;
    if (!items) return failure();
    for (const Value& item : items->objects()) {
      const auto* made = dyn_cast<NSXMLNode>(item);
      text += (text.empty() ? "" : " ") +
              (made ? made->XMLString()->utf8() : XQueryItemStringValue(*item));
    }
    return text;
  }
};

TEST_F(ExistingNodes, AnElementFromOutsideIsCopiedIntoContent) {
  const auto outside = element("n");
  outside->addChild(element("m"));
  EXPECT_EQ(made("declare variable $n external; let $e := <e>{$n}</e> "
                 "return ($e, $e/n is $n, empty($n/..))",
                 outside),
            "<e><n><m/></n></e> false true");
  EXPECT_EQ(
      made("let $n := . let $e := document {$n} return ($e/*, $e/n is $n, empty($n/..))", outside),
      "<n><m/></n> false true");
  EXPECT_FALSE(outside->parent());
  EXPECT_EQ(outside->XMLString()->utf8(), "<n><m/></n>");
}

TEST_F(ExistingNodes, SoAreNodesOfOtherKinds) {
  const Ref<NSXMLNode> nodes[] = {
      NSXMLNode::attributeWithName(NSStringView::ascii("a"), NSStringView::ascii("1")),
      NSXMLNode::commentWithStringValue(NSStringView::ascii("c")),
      NSXMLNode::processingInstructionWithName(NSStringView::ascii("p"), NSStringView::ascii("q"))};
  std::string text;
  for (const auto& node : nodes) {
    text += made("declare variable $n external; <e>{$n}</e>", node);
    EXPECT_FALSE(node->parent());
  }
  EXPECT_EQ(text, "<e a=\"1\"/><e><!--c--></e><e><?p q?></e>");
}

TEST_F(ExistingNodes, SoIsWhatAnEarlierEvaluationMade) {
  const auto first = evaluate("<a/>");
  ASSERT_TRUE(first);
  const auto* a = cast<NSXMLElement>(first->objectAtIndex(0));
  EXPECT_EQ(made("<b>{.}</b>", first->objectAtIndex(0)), "<b><a/></b>");
  EXPECT_FALSE(a->parent());
  EXPECT_EQ(made("<c>{.}</c>", Value()), "<c><a/></c>") << "left behind as the context item";
  EXPECT_FALSE(a->parent());
}

TEST_F(ExistingNodes, WhatTheEvaluationMakesItselfIsTakenIn) {
  EXPECT_EQ(made("let $a := <a/>, $b := <b>{$a}</b> return $a/.. is $b", Value()), "true");
}

// An inner query is an evaluation of its own inside of the outer one.
TEST_F(ExistingNodes, AnInnerQueryCopiesWhatTheOuterOneMade) {
  EXPECT_EQ(made("let $a := <a/>, $b := ext:node-xquery($a, '<b>{.}</b>') "
                 "return ($b, empty($a/..))",
                 Value()),
            "<b><a/></b> true");
}

TEST_F(ExistingNodes, WhatAnInnerQueryMadeIsNewToTheOuterOne) {
  EXPECT_EQ(made("let $a := ext:eval('<a/>'), $b := <b>{$a}</b> return ($b, $a/.. is $b)", Value()),
            "<b><a/></b> true");
}

TEST_F(ExistingNodes, TheEvaluationGoesOnAsItWasAfterAnInnerQuery) {
  const auto outside = element("n");
  EXPECT_EQ(made("declare variable $n external; "
                 "let $a := <a/>, $i := ext:eval('<i/>'), $b := <b>{$a, $n}</b> "
                 "return ($b, $a/.. is $b)",
                 outside),
            "<b><a/><n/></b> true");
  EXPECT_FALSE(outside->parent());
}

TEST_F(ExistingNodes, GetNoBaseURI) {
  const std::string declaration = "declare base-uri 'http://b/'; ";
  const auto document = parse("<r><s/></r>");
  EXPECT_EQ(made(declaration + "(//s, <a/>)", document), "<s/> <a/>");
  EXPECT_EQ(made(declaration + "(., <a/>)[1]/*", document), "<r><s/></r>");
  EXPECT_EQ(cast<NSXMLNode>(document)->XMLString()->utf8(),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<r><s/></r>");
  const auto first = evaluate("<a/>");
  ASSERT_TRUE(first);
  EXPECT_EQ(made(declaration + "(., <b/>)", first->objectAtIndex(0)), "<a xml:base=\"\"/> <b/>")
      << "what it was given when it was made, as the first result of a context that has recorded";
}

TEST_F(ExistingNodes, NewOnesGetTheirBaseURI) {
  EXPECT_EQ(made("declare base-uri 'http://b/'; <a>{/r/s}</a>", parse("<r><s/></r>")),
            "<a xml:base=\"http://b/\"><s/></a>");
}

// The comment is there before the evaluation, though it stands in the query.
TEST_F(ExistingNodes, ACommentOfTheQueryIsOneNodeThatStays) {
  const auto query = XQuery::xqueryWithSource(
      "declare function local:c() { <!--c--> }; "
      "let $e := <e>{local:c()}{local:c()}</e>, $d := document {local:c()} "
      "return ($e, local:c() is local:c(), empty(local:c()/..), $d/node() is local:c(), "
      "local:c())");
  Ref<NSXMLNode> comment;
  for (int round = 0; round < 3; ++round) {
    const auto items = context->evaluateXQuery(*query, {}, Value(), &error);
    ASSERT_TRUE(items) << failure();
    EXPECT_EQ(cast<NSXMLNode>(items->objectAtIndex(0))->XMLString()->utf8(),
              "<e><!--c--><!--c--></e>");
    EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(1)), "true");
    EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(2)), "true");
    EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(3)), "false");
    const Ref<NSXMLNode> found(cast<NSXMLNode>(items->objectAtIndex(4)));
    if (comment) {
      EXPECT_EQ(found, comment);
    }
    comment = found;
    const auto host = element("h");
    EXPECT_FALSE(host->addChild(found));
    found->setStringValue(NSStringView::ascii("changed"));
    EXPECT_EQ(found->XMLString()->utf8(), "<!--c-->");
  }
}

TEST_F(ExistingNodes, ACommentOfAnInnerQueryStaysAsWell) {
  EXPECT_EQ(
      made("let $c := ext:eval('<!--c-->'), $e := <e>{$c}</e> return ($e, empty($c/..))", Value()),
      "<e><!--c--></e> true");
}

}  // namespace
}  // namespace xquery
