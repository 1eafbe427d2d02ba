// The base URIs that constructors record, and the mark they leave on the first result.
#include "Context/XQueryContextInternal.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <string>
#include <string_view>

namespace xquery {
namespace {

class BaseURIRecords : public testing::Test {
 protected:
  Ref<NSArray> evaluate(std::string_view query, const Value& item = nullptr) {
    Ref<XQueryError> error;
    const auto result = context->evaluateXQuery(*XQuery::xqueryWithSource(query), {}, item, &error);
    EXPECT_FALSE(error) << (error ? error->description()->utf8() : "");
    return result;
  }
  std::string xml(std::string_view query, size_t index = 0) {
    return cast<NSXMLNode>(evaluate(query)->objectAtIndex(index))->XMLString()->utf8();
  }
  size_t count() const { return _internal(*context).baseURINodeCount(); }
  std::string baseOf(const NSObject* node) const {
    const auto URI = _internal(*context).baseURIForNode(cast<NSXMLNode>(node));
    return URI ? URI->utf8() : "(null)";
  }

  const std::string declaration = "declare base-uri 'http://b/'; ";
  Ref<XQueryContext> context = XQueryContext::xqueryContext();
};

TEST_F(BaseURIRecords, WithoutABaseURINothingIsRecorded) {
  EXPECT_EQ(xml("<a><b/></a>"), "<a><b/></a>");
  EXPECT_EQ(count(), 0u);
}

TEST_F(BaseURIRecords, EveryElementDocumentAndInstructionIsCounted) {
  evaluate(declaration + "<a><b/><?p?><!--c-->{text {1}, attribute x {2}}</a>");
  EXPECT_EQ(count(), 3u);
  evaluate(declaration + "document {<a/>}");
  EXPECT_EQ(count(), 5u);
}

TEST_F(BaseURIRecords, TheCountNeverGoesDown) {
  for (size_t round = 1; round <= 100; ++round) {
    evaluate(declaration + "<a/>");
    EXPECT_EQ(count(), round) << "of nodes that are gone again";
  }
}

TEST_F(BaseURIRecords, ANodeThatIsGoneLeavesNothingBehind) {
  for (int round = 0; round < 1000; ++round) {
    evaluate(declaration + "<a/>");
    const auto other = NSXMLElement::elementWithName(NSStringView::ascii("a"));
    ASSERT_EQ(baseOf(other.get()), "(null)") << "even where it was";
  }
}

TEST_F(BaseURIRecords, ADiscardedNodesCountStillMarksTheFirstResult) {
  evaluate(declaration + "<a/>");
  EXPECT_EQ(xml("<b/>"), "<b xml:base=\"\"/>");
}

TEST_F(BaseURIRecords, NodesOutliveTheContext) {
  const auto result = evaluate(declaration + "(<a/>, <b><c/></b>, document {<d/>})");
  context = XQueryContext::xqueryContext();
  EXPECT_EQ(cast<NSXMLNode>(result->objectAtIndex(1))->XMLString()->utf8(), "<b><c/></b>");
  EXPECT_EQ(count(), 0u);
  EXPECT_EQ(baseOf(result->objectAtIndex(1)), "") << "what another context recorded is its own";
  evaluate(declaration + "<x/>");
  EXPECT_EQ(baseOf(result->objectAtIndex(1)), "(null)");
}

TEST_F(BaseURIRecords, EachQueryRecordsItsOwn) {
  const auto first = evaluate("declare base-uri 'http://1/'; (<x/>, <a/>)");
  const auto second = evaluate("declare base-uri 'http://2/'; (<x/>, <a/>)");
  EXPECT_EQ(baseOf(first->objectAtIndex(1)), "http://1/");
  EXPECT_EQ(baseOf(second->objectAtIndex(1)), "http://2/");
}

TEST_F(BaseURIRecords, AnAdoptedNodeKeepsItsOwn) {
  const auto result = evaluate(declaration + "let $b := <b/>, $a := <a>{$b}</a> return (1, $b)");
  EXPECT_EQ(baseOf(result->objectAtIndex(1)), "http://b/");
}

TEST_F(BaseURIRecords, ACopyHasNone) {
  const auto result =
      evaluate(declaration + "let $b := <b/>, $a := (<a>{$b}</a>, <a>{$b}</a>) return (1, $a/b)");
  EXPECT_EQ(baseOf(result->objectAtIndex(1)), "http://b/");
  EXPECT_EQ(baseOf(result->objectAtIndex(2)), "(null)");
}

TEST_F(BaseURIRecords, AnElementsOwnBaseComesFirst) {
  const auto result =
      evaluate(declaration + "let $a := <a xml:base='http://o/'><b/></a> return (1, $a, $a/b)");
  EXPECT_EQ(baseOf(result->objectAtIndex(1)), "http://o/");
  EXPECT_EQ(baseOf(result->objectAtIndex(2)), "http://o/");
}

TEST_F(BaseURIRecords, ALongEvaluationKeepsOnlyWhatIsAlive) {
  // Each element is dropped before the next is made; what they leave behind would be seen.
  evaluate(declaration + "for $i in 1 to 20000 where <a>{$i}</a> = 0 return $i");
  EXPECT_EQ(count(), 20000u);
}

// --- the mark ------------------------------------------------------------------------------------

TEST_F(BaseURIRecords, OnlyTheFirstResultIsMarked) {
  const auto result = evaluate(declaration + "(<a/>, <b/>)");
  EXPECT_EQ(cast<NSXMLNode>(result->objectAtIndex(0))->XMLString()->utf8(),
            "<a xml:base=\"http://b/\"/>");
  EXPECT_EQ(cast<NSXMLNode>(result->objectAtIndex(1))->XMLString()->utf8(), "<b/>");
}

TEST_F(BaseURIRecords, ADocumentsElementIsMarked) {
  EXPECT_NE(xml(declaration + "document {<!--c-->, <a/>}").find("<a xml:base=\"http://b/\"/>"),
            std::string::npos);
}

TEST_F(BaseURIRecords, WhatIsNoElementIsNotMarked) {
  EXPECT_EQ(xml(declaration + "(attribute a {1}, <b/>)", 1), "<b/>");
  EXPECT_EQ(xml(declaration + "(1, <b/>)", 1), "<b/>");
  EXPECT_EQ(xml(declaration + "document {<?p?>}/node()"), "<?p?>");
}

TEST_F(BaseURIRecords, ABaseThatIsThereStays) {
  EXPECT_EQ(xml(declaration + "<a xml:base='http://o/'/>"), "<a xml:base=\"http://o/\"/>");
  EXPECT_EQ(xml(declaration + "<a xml:base=''/>"), "<a xml:base=\"\"/>");
}

TEST_F(BaseURIRecords, AResultGivenTwiceIsMarkedOnce) {
  const auto first = evaluate(declaration + "<a/>");
  const auto again = evaluate(".", first->objectAtIndex(0));
  EXPECT_EQ(cast<NSXMLNode>(again->objectAtIndex(0))->XMLString()->utf8(),
            "<a xml:base=\"http://b/\"/>");
}

}  // namespace
}  // namespace xquery
