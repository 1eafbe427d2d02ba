// Loops that are counted by the names on the way to what they walk.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

constexpr const char* conditions[] = {
    "$x/ancestor::a",
    "not($x/parent::c)",
    "count($x/ancestor::*) > 1",
    "name($x) eq 'b'",
    "local-name($x/..) = 'c'",
    "'p:a' = name($x)",
    "some $y in $x/ancestor::* satisfies $y/parent::r",
    "every $y in $x/ancestor-or-self::node() satisfies not($y/self::c)",
    "exists($x/ancestor::a[2]) or empty($x/ancestor::r)",
    "$x/self::b and $x/..",
    "$x/ancestor::*[name() = 'c']",
    "true() = exists($x)",
    // These are asked of each.
    "$x/b",
    "$x/@y = '2'",
    "$x/ancestor::a/@x = '1'",
    "$x/following-sibling::*",
    "xs:integer($x) = 1",
    "name($x) eq (1, 2)",
    "$x is (//b)[1]",
};
constexpr const char* walked[] = {"//b", "/r/a/*", "/r//c", "//@y", "//text()"};

// The same with fewer nodes, but enough to be indexed.
const Value& someNames() {
  static const Value parsed = [] {
    std::string xml = "<r xmlns:p='u'>";
    for (int i = 0; i < 30; ++i) xml += "<a x='1'><b/><p:a/><c><b y='2'/></c></a><!----><!---->";
    return document(xml + std::string(200, ' ') + "<b/>" + "<c>x</c></r>");
  }();
  return parsed;
}

TEST(CountByWays, CountsWhatTheLoopFinds) {
  for (const char* path : walked) {
    for (const char* condition : conditions) {
      const std::string loop =
          std::string("for $x in ") + path + " where " + condition + " return $x";
      sameBothWays("for $turn in 1 to 3 return (count(" + loop + "), exists(" + loop + "), not(" +
                       loop + "))",
                   someNames());
      sameBothWays("empty(" + loop + "), boolean(" + loop + ")", names());
    }
  }
}

TEST(CountByWays, SetsItsVariables) {
  for (const char* loop : {
           "for $x in //b let $l := $x/ancestor::c where count($l) >= 1 return $x",
           "for $x in //b let $n := count($x/ancestor::*) where $n >= 3 return 1",
           "for $x in //* let $n := count($x/ancestor::*) let $p := $x/.. where $n = 3 and "
           "$p/self::c return $x",
           "for $x in //* let $n := count($x/ancestor::*) where 2 lt $n return $n",
           "for $x in //* let $l := $x/ancestor::a where exists($l) and $x/self::b return $x",
           "for $x in //* let $l := $x/ancestor::a where $x/self::b and name($l) = 'a' return $x",
           "for $x in //* where $x/ancestor::c return ()",
           "for $x in //* where $x/ancestor::c return ($x, $x)",
           "for $x in //* where $x/ancestor::c return error()",
           "for $x in //* where $x/ancestor::c return $x/@y",
       }) {
    sameBothWays(std::string("for $turn in 1 to 4 return count(") + loop + ")", someNames());
    sameBothWays(std::string("for $turn in 1 to 4 return exists(") + loop + ")", someNames());
    sameBothWays(std::string("let $x := 5 let $l := 6 return (count(") + loop + "), $x, $l)",
                 someNames());
  }
}

TEST(CountByWays, IsSeenInThePlan) {
  for (const char* text :
       {"count(for $x in //b where $x/ancestor::c return $x)",
        "exists(for $x in //b let $n := count($x/ancestor::*) where $n > 2 return 1)",
        "count(for $x in /r/a/* where name($x) eq 'b' return $x)"}) {
    EXPECT_EQ(choicesOf("way counts", text), 1U) << text;
  }
  for (const char* text :
       {"count(for $x in //b where $x/c return $x)", "count(for $x in //b return $x)",
        "count(for $x in //b[c] where $x/ancestor::c return $x)",
        "count(for $x at $n in //b where $x/ancestor::c return $x)",
        "count(for $x in //b//c where $x/ancestor::c return $x)",
        "count(for $x in //b where $x/ancestor::c return error())",
        "count(for $x in //b where $x/ancestor::c return $x/..)",
        "count(for $x in //b where $x/ancestor::c order by $x return $x)",
        "(some $x in //c, $y in //d satisfies $x is $y) and "
        "(some $y in () satisfies count(for $x in //b where $y return $x))"}) {
    EXPECT_EQ(choicesOf("way counts", text), 0U) << text;
  }
}

TEST(CountByWays, LooksAtOneOfEachWay) {
  EXPECT_LT(stepsOf("count(for $x in //b where $x/ancestor::c return $x)"), 60);
  EXPECT_LT(stepsOf("count(//b[some $c in ancestor::c satisfies $c/parent::a])"), 60);
  EXPECT_LT(stepsOf("count(//b[count(ancestor::*) > 2])"), 60);
  EXPECT_LT(stepsOf("count(//b[local-name(..) = 'c'])"), 60);
}

TEST(CountByWays, FailsAsItDid) {
  for (const char* text : {"count(for $x in //b where $x/ancestor::c return $x)",
                           "count(for $x in //b where name($x) eq 'b' return $x)"}) {
    sameBothWays(text);
    sameBothWays(std::string("for $i in (1, 2) return ($i, 3)[") + text + "]", names());
    sameBothWays(std::string("let $e := <r><b/><c><b/></c></r> return $e/") + text, names());
    sameBothWays(
        std::string("let $e := document { <r>{for $i in 1 to 300 return <c><b/></c>}</r> } return "
                    "for $turn in 1 to 4 return $e/") +
            text,
        names());
  }
}

}  // namespace
}  // namespace xquery
