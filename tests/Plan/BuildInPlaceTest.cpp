// Nodes that are made in the tree of those that they are made for.
#include "Plan/PlanTesting.h"
#include "Platform/Tree/Arena.h"

#include <gtest/gtest.h>

#include <string_view>

namespace xquery {
namespace {

using namespace plantest;

TEST(BuildInPlace, IsForWhatIsHandedOnToTheContentOfOtherNodes) {
  const auto chosen = [](std::string_view text) {
    return plantest::choicesIn(text, [](std::string_view rule) { return rule == "constructors"; });
  };
  EXPECT_EQ(chosen("<a><b/>{element c {attribute d {1}}}</a>"), 3U);
  EXPECT_EQ(chosen("document {for $i in //a return if ($i/@x) then <b/> else (1, <c/>)}"), 2U);
  EXPECT_EQ(chosen("<a>{typeswitch (.) case element() return <b/> default return <c/>}</a>"), 2U);
  // Others may get to know these before they are where they belong.
  EXPECT_EQ(chosen("<a/>"), 0U);
  EXPECT_EQ(chosen("<a>{let $b := <b/> return ($b, $b/..)}</a>"), 0U);
  EXPECT_EQ(chosen("<a>{<b/>/c, (<b/>)[1], count(<b/>), <b/> | <c/>}</a>"), 0U);
  EXPECT_EQ(chosen("<a x='{<b/>}'>{attribute y {<c/>}, text {<d/>}}</a>"), 1U);
  EXPECT_EQ(chosen("declare function local:f() {<b/>}; <a>{local:f()}</a>"), 0U);
}

// Whether the tree of the query's only node has one root, so that order numbers can be compared and
// what lies in it can be found by its name.
bool hasOneRoot(std::string_view text) {
  const auto query = XQuery::xqueryWithSource(text);
  const Ref<XQueryContext> context = XQueryContext::xqueryContext();
  const Ref<NSXMLDocument> document =
      NSXMLDocument::documentWithData("<r><x/><x/></r>", NSXMLNodePreserveWhitespace);
  Ref<XQueryError> error;
  const Ref<NSArray> items = context->evaluateXQuery(*query, {}, document, &error);
  EXPECT_TRUE(items && items->count() == 1) << text;
  return !NSXMLTree::of(cast<NSXMLNode>(items->objectAtIndex(0)))->hasSeveralRoots();
}

TEST(BuildInPlace, LeavesOneRootUnlessOthersKnowWhatIsTakenIn) {
  EXPECT_TRUE(hasOneRoot("<a>{for $x in //x return <b>{$x}{$x/..}</b>}</a>"));
  EXPECT_TRUE(hasOneRoot("<a>{for $x in //x return <b><c>{string($x)}</c></b>}</a>"));
  EXPECT_TRUE(hasOneRoot("let $n := <n/> return <a><b/>{$n}<b/></a>"));
  EXPECT_FALSE(hasOneRoot("let $n := <n/> return <a><b>{$n}</b></a>"));
}

}  // namespace
}  // namespace xquery
