// A part that fails, in every place that every kind of expression has for one: its error, with its
// line, is that of the whole query, and nothing is evaluated after it.
//
// In a query below "%" is the part that fails, "~" one that is evaluated before it, and "#" one
// that would come after it.
#include "Platform/Base/StackTestSupport.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <ostream>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

constexpr const char* prolog =
    "declare function local:none() { () }; "
    "declare function local:same($x) { $x }; "
    "declare function local:pair($x, $y) { $x, $y }; "
    "declare function local:fail($n) { if ($n = 0) then 'x' cast as xs:integer "
    "else 1 + local:fail($n - 1) }; "
    "declare function local:endless($n) { 1 + local:endless($n + 1) }; ";

// Each begins on a line of its own.
constexpr const char* failingParts[] = {
    "$undefined",                    // no value
    "local:undefined()",             // no function
    "count(1, 2)",                   // a built-in that refuses its arguments
    "exactly-one((1, 2))",           // one that answers an error
    "string-length((1, 2))",         // one that raises it
    "('x' cast as xs:integer)",      // a cast
    "(1 + 'x')",                     // an operator
    "(if (error()) then 1 else 2)",  // a condition
    "(1, 2)/a",                      // a path
    "<a>{error()}</a>",              // a constructor
    "local:fail(20)",                // deep inside of calls
};

constexpr const char* places[] = {
    // lists and leaves
    "~, %, #",
    "((~, %), #)",
    "(%)",
    // operators
    "% + #",
    "~ + %",
    "~ + ~ + % + # - #",
    "-(%)",
    "% * #",
    "~ idiv %",
    "% or #",
    "(~ = 2) or %",
    "% and #",
    "~ and %",
    "% to #",
    "~ to %",
    "(% to #) = 1",
    "~ = (% to #)",
    "~ = (~ to %)",
    "% = #",
    "~ = %",
    "% eq #",
    "~ eq %",
    "% is #",
    "<a/> is %",
    "% | #",
    "<a/> | %",
    "<a/> intersect %",
    "% except #",
    // clauses
    "if (%) then # else #",
    "if (~) then % else #",
    "if (~ = 2) then # else %",
    "for $x in % return #",
    "for $x in (~, %) return #",
    "for $x in % to # return #",
    "for $x in ~ to % return #",
    "for $x at $i in (1, 2) return ($x[$i = 1], %, #)",
    "for $x in ~ return (%, #)",
    "for $x in (1, 2) where % return #",
    "for $x in (1, 2), $y in % return #",
    "for $x in %, $y in # return #",
    "for $x in ~, $y in ~ where ~ return (%, #)",
    "for $x as xs:integer in % return #",
    "let $x := % return #",
    "let $x as xs:integer := % return #",
    "let $x := ~, $y := % return #",
    "let $x := %, $y := # return #",
    "for $x in (1, 2) let $y := % return #",
    "for $x in 1 order by % return ~",
    "for $x in 1 order by ~, % return ~",
    "for $x in 1 order by %, # return ~",
    "for $x in (2, 1) order by $x return (%, #)",
    "some $x in % satisfies #",
    "some $x in (1, 2) satisfies %",
    "every $x in 1, $y in % satisfies #",
    "every $x in 1, $y in 2 satisfies (%, #)",
    "some $x in ~ to % satisfies #",
    "ordered { % }",
    "unordered { (~, %, #) }",
    // types
    "% instance of xs:integer",
    "% treat as xs:integer",
    "% cast as xs:integer",
    "% castable as xs:integer",
    "typeswitch (%) case xs:integer return # default return #",
    "typeswitch (~) case xs:integer return % default return #",
    "typeswitch ('x') case $v as xs:integer return # default $v return %",
    "typeswitch (~) case $v as xs:integer return (%, #) default return #",
    // calls
    "count(%)",
    "count((~, %, #))",
    "concat(%, #)",
    "concat(~, %, #)",
    "concat(~, ~, ~, %, #)",
    "local:same(%)",
    "local:same((~, %, #))",
    "local:pair(%, #)",
    "local:pair(~, %)",
    "local:same(local:same(%))",
    "local:pair(1, local:pair(2, %))",
    "local:undefined-too(%, #)",
    "string(%)",
    "xs:integer(%)",
    "deep-equal(~, %)",
    "not(%)",
    "exists(%)",
    // paths
    "(%)/a",
    "(%)[#]",
    "(%)[1]",
    "(%)//a",
    "<r/>/(%)",
    "<r/>/(%)/a",
    "<r/>/(~, %, #)",
    "<r><a/><a/></r>/a/(%)",
    "<r><a/><a/></r>//a/(%)",
    "<r><a/><a/></r>/a[~]/(%)",
    "<r><a/><a/></r>/(a, a)/(%, #)",
    "<r><a/><a/></r>/*/string(%)",
    "<r><a/></r>/a/../a/(%)/b",
    "<r><a/></r>/a/following::*/.., %, #",
    // constructors
    "<a>{ % }</a>",
    "<a>{ ~, %, # }</a>",
    "<a>{ ~ }{ % }{ # }</a>",
    "<a>text<b>{ % }</b>{ # }</a>",
    "<a b='{ % }' c='{ # }'/>",
    "<a b='{ ~ }' c='x{ % }{ # }'>{ # }</a>",
    "<a xmlns:p='urn:p' p:b='{ % }'/>",
    "element { % } { # }",
    "element { 'a' } { % }",
    "element a { ~, %, # }",
    "element a { attribute b { % }, # }",
    "attribute { % } { # }",
    "attribute { 'a' } { % }",
    "attribute a { ~, % }",
    "text { % }",
    "text { ~, %, # }",
    "comment { % }",
    "processing-instruction { % } { # }",
    "processing-instruction p { % }",
    "document { % }",
    "document { <a>{ % }</a>, # }",
};

void replaceAll(std::string& text, char sign, const std::string& by) {
  for (size_t at = text.find(sign); at != text.npos; at = text.find(sign, at + by.size())) {
    text.replace(at, 1, by);
  }
}

std::string filled(std::string query, const std::string& part) {
  replaceAll(query, '~', "(trace(1, 'before'))");
  replaceAll(query, '#', "(trace(1, 'after'))");
  replaceAll(query, '%', "(\n" + part + ")");
  return query;
}

class Log : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>& label, XQueryContext&) override {
    (label->utf8() == "after" ? wasAfter : wasBefore) = true;
  }
  bool wasBefore = false;
  bool wasAfter = false;
};

struct Outcome {
  std::string text;  // the values of the items, or the description of the error
  std::shared_ptr<Log> log = std::make_shared<Log>();
};

Outcome evaluate(const std::string& body) {
  Outcome outcome;
  const auto context = XQueryContext::xqueryContext();
  context->contextSetClient(outcome.log);
  const auto query = XQuery::xqueryWithSource(prolog + body);
  EXPECT_FALSE(query->parseErrors()) << body;
  Ref<XQueryError> error;
  const auto items = context->evaluateXQuery(*query, {}, Value(), &error);
  if (error) outcome.text = error->description()->utf8();
  if (!items) return outcome;
  for (const Value& item : items->objects()) {
    outcome.text += (outcome.text.empty() ? "" : " ") + XQueryItemStringValue(*item);
  }
  return outcome;
}

class FailingPart : public testing::TestWithParam<const char*> {
 protected:
  static bool has(char sign) {
    return std::string_view(GetParam()).find(sign) != std::string::npos;
  }
};

TEST_P(FailingPart, IsTheErrorOfTheWholeAndNothingComesAfterIt) {
  for (const std::string part : failingParts) {
    const Outcome alone = evaluate("\n" + part);
    const std::string query = filled(GetParam(), part);
    const Outcome outcome = evaluate(query);
    EXPECT_EQ(outcome.text, alone.text) << query;
    EXPECT_TRUE(outcome.text.starts_with("XQueryError:")) << query;
    EXPECT_FALSE(outcome.log->wasAfter) << query;
    EXPECT_EQ(outcome.log->wasBefore, has('~')) << query;
  }
}

TEST_P(FailingPart, InAPredicateDropsOneItemAndLeavesTheFocusAsItWas) {
  for (const std::string part : failingParts) {
    const std::string query = "('a', 'b', 'c')[if (position() = 1) then (" +
                              filled(GetParam(), part) +
                              ") else last() = 3 and (position() = 2 or . = 'c')], 'd'";
    const Outcome outcome = evaluate(query);
    EXPECT_EQ(outcome.text, "b c d") << query;
    EXPECT_FALSE(outcome.log->wasAfter) << query;
  }
}

TEST_P(FailingPart, OfAnAxisStepsPredicateDropsOneNodeAndLeavesTheFocusAsItWas) {
  for (const std::string part : failingParts) {
    const std::string query = "<r><a>1</a><a>2</a><a>3</a></r>/a[if (position() = 1) then (" +
                              filled(GetParam(), part) +
                              ") else last() = 3 and (position() = 2 or . = '3')]";
    const Outcome outcome = evaluate(query);
    EXPECT_EQ(outcome.text, "2 3") << query;
    EXPECT_FALSE(outcome.log->wasAfter) << query;
  }
}

TEST_P(FailingPart, ThatReachesALimitIsPassedOverNowhere) {
  const std::string query = filled(GetParam(), "local:endless(0)");
  onStack(size_t{512} << 10, [&] {
    for (const std::string& each :
         {query, "(1)[(" + query + ")], 2", "<r><a/></r>/a[(" + query + ")]/b",
          "((1)[" + query + "])[2]"}) {
      const Outcome outcome = evaluate(each);
      EXPECT_EQ(outcome.text, "XQueryError:0 - \"limit: expression nested too deeply\"") << each;
      EXPECT_FALSE(outcome.log->wasAfter) << each;
    }
  });
}

INSTANTIATE_TEST_SUITE_P(Places, FailingPart, testing::ValuesIn(places),
                         [](const auto& instance) { return std::to_string(instance.index); });

TEST(FailingPartOfAProlog, EndsTheEvaluationBeforeTheBody) {
  const auto log = std::make_shared<Log>();
  const auto context = XQueryContext::xqueryContext();
  context->contextSetClient(log);
  const auto query = XQuery::xqueryWithSource(
      "declare variable $a := trace(1, 'before');\ndeclare variable $b := (1, $undefined);\n"
      "declare variable $c := trace(1, 'after'); trace(1, 'after')");
  Ref<XQueryError> error;
  EXPECT_FALSE(context->evaluateXQuery(*query, {}, Value(), &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->description()->utf8(),
            "XQueryError:8 - \"reference to undefined variable \"undefined\"\" at line:2");
  EXPECT_TRUE(log->wasBefore);
  EXPECT_FALSE(log->wasAfter);
}

}  // namespace
}  // namespace xquery
