// Conditions of a where clause that are asked before the clauses behind what they read.
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"

#include <cstdint>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

size_t conditionsIn(std::string_view text) {
  return choicesOf("early conditions", text);
}

// Orders with lines; some have no customer, one has a number that is none.
Value orders(int count) {
  std::string text = "<r>";
  for (int i = 0; i < count; ++i) {
    text += "<o" + (i % 5 ? " c='c" + std::to_string(i % 4) + "'" : "") + " s='" +
            (i % 3 ? "open" : "done") + "' n='" + (i == 7 ? "x" : std::to_string(i)) + "'>";
    for (int k = 0; k < i % 4; ++k) text += "<l q='" + std::to_string((i + k) % 6) + "'/>";
    text += "</o>";
  }
  return document(text + "<c id='c1' k='a'/><c id='c2' k='b'/></r>");
}

TEST(AskEarly, TakesConditionsThatReadEarlierClauses) {
  for (const char* text : {
           "for $o in //o, $l in $o/l where $o/@s = 'open' return $l",
           "for $o in //o, $l in $o/l where $o/@s = 'open' and $l/@q = '1' return $l",
           "for $o in //o, $l in $o/l where $o/@s = 'open' and xs:integer($l/@q) = 1 return $l",
           "for $o in //o, $l in $o/l where $l/@q = '1' and $o/@s = 'open' return $l",
           "for $o in //o let $s := $o/@s for $l in $o/l where $s = 'open' return $l",
           "for $o in //o let $l := $o/l where exists($o/@c) return count($l)",
           "for $o at $n in //o, $l in $o/l where $o/@c return ($n, $l)",
           "for $o in //o, $l at $n in $o/l where exists($o/@c) return ($n, $l)",
           "for $o in //o, $l in $o/l where $o/../c[@id = $o/@c]/@k = 'a' return $l",
           "for $o in //o, $l in $o/l where $o/@s = 'open' order by $l/@q return $l",
           "for $o in //o, $l in $o/l where $o/@s = 'open' return <e>{$l}</e>",
           // There is a document, or the first clause would have failed.
           "for $o in //o, $l in //l where $o/@s = 'open' return $l",
           "for $o in //o, $l in $o/l where //c[@id = $o/@c]/@k = 'a' return $l",
           "for $o in //o, $i in 1 to 2 where $o/@s = 'open' return $i",
           "for $o in //o, $l in $o/l where (some $x in $o/l satisfies $x/@q = '2') return $l",
       }) {
    EXPECT_EQ(conditionsIn(text), 1U) << text;
    sameBothWays(text, orders(30));
  }
  const char* const both =
      "for $o in //o, $l in $o/l, $i in (1, 2) "
      "where $o/@s = 'open' and ($l/@q = '1' and $o/@c = 'c1') return $l";
  EXPECT_EQ(conditionsIn(both), 3U);
  sameBothWays(both, orders(30));
}

TEST(AskEarly, LeavesOthersAlone) {
  for (const char* text : {
           // Nothing stands behind what they read.
           "for $o in //o where $o/@s = 'open' return $o",
           "for $o in //o, $l in $o/l where $l/@q = '1' return $l",
           "for $o in //o, $l in $o/l where $o/@n = $l/@q return $l",
           // They, or what stands before them, may fail.
           "for $o in //o, $l in $o/l where $o/@n = 7 return $l",
           "for $o in //o, $l in $o/l where $l/@q > 1 and $o/@s = 'open' return $l",
           "for $o in //o, $l in $o/l where $o/@c and $o/@n > 3 or $l/@q = '1' return $l",
           "for $o in //o, $l in $o/l where exactly-one($o/@c) = 'c1' return $l",
           // Clauses behind may fail, make nodes or trace, or load what may be missing.
           "for $o in //o, $l in xs:integer($o/@n) where $o/@s = 'open' return $l",
           "for $o in //o let $l := exactly-one($o/@c) where $o/@s = 'open' return $l",
           "for $o in //o, $l as element(l) in $o/l where $o/@s = 'open' return $l",
           "for $o in //o let $l := <e>{$o}</e> where $o/@s = 'open' return $l",
           "for $o in //o let $l := trace($o/@n, 'n') where $o/@s = 'open' return $l",
           "for $o in //o let $l := doc('none.xml') where $o/@s = 'open' return $l",
           // There may be no document.
           "for $o in .//o, $l in //l where $o/@s = 'open' return $l",
           "for $o in .//o, $l in $o/l where //c[@id = $o/@c]/@k = 'a' return $l",
           // They trace, or make nodes.
           "for $o in //o, $l in $o/l where trace($o/@c, 'c') return $l",
           "for $o in //o, $l in $o/l where <e>{$o}</e> return $l",
           // What is around a node changes meanwhile.
           "let $n := (<a/>, <b/>) for $o in $n, $l in 1 to 2 where empty($o/..) return "
           "<e>{$o}</e>",
       }) {
    EXPECT_EQ(conditionsIn(text), 0U) << text;
    sameBothWays(text, orders(30));
  }
}

// Where a join picks items, these are asked as well.
TEST(AskEarly, TakesConditionsBesideJoins) {
  for (const char* text : {
           "for $c in //c, $o in //o, $l in $o/l where $o/@c = $c/@id and $l/@q = '1' return $l",
           "for $i in (1, 2), $c in (//c, //c), $o in //o, $l in $o/l "
           "where $o/@c = $c/@id and $o/@s != 'done' and $l/@q = '1' return ($i, $l)",
       }) {
    EXPECT_GE(conditionsIn(text), 1U) << text;
    sameBothWays(text, orders(60));
    sameBothWays("for $x in 1 to 3 return count(" + std::string(text) + ")", orders(60));
  }
}

// Behind a condition that may drop most tuples, long ones stay where they are.
TEST(AskEarly, LeavesLongConditionsBehindOthers) {
  EXPECT_EQ(conditionsIn("for $o in //o, $l in $o/l "
                         "where $l/@q = '1' and $o/../c/@k = 'a' return $l"),
            0U);
  EXPECT_EQ(conditionsIn("for $o in //o, $l in $o/l "
                         "where $o/../c/@k = 'a' and $l/@q = '1' and $o/@s = 'open' "
                         "return $l"),
            2U);
}

TEST(AskEarly, DoesNotEvaluateTheClausesBehind) {
  const auto stepsOf = [](std::string_view text) {
    const auto query = compiled(text, XQueryWay::Planned);
    const auto context = XQueryContext::xqueryContext();
    _internal(*context).setContextItem(orders(200), 1);
    const int64_t before = workMeter.stepsLeft;
    EXPECT_TRUE(_internal(*query).body()->evaluateWithContext(*context)) << text;
    return before - workMeter.stepsLeft;
  };
  EXPECT_LT(stepsOf("for $o in //o, $l in $o/../o/l where $o/@s = 'none' return $l"), 10000);
  EXPECT_GT(stepsOf("for $o in //o, $l in $o/../o/l where $o/@n = 'none' or $l = 'x' return 1"),
            50000);
}

TEST(AskEarly, LeavesFocusVariablesAndErrorsAsTheyAre) {
  const Value few = orders(20);
  for (const char* text : {
           "(for $o in //o, $l in $o/l where $o/@s = 'open' return $l), $l",
           "(for $o in //o, $l in $o/l where $o/@s = 'none' return $l), $o",
           "for $o in //o, $l in $o/l where $o/@s = 'none' return error()",
           "for $o in //o, $l in $o/l where $o/@s = 'open' and $l/@q > 'a' return "
           "xs:integer($o/@n)",
           "for $o in //o, $l in $o/l where $o/@s = 'open' and error() return $l",
           "//c[for $o in //o, $l in $o/l where $o/@c = 'c1' return $l]/@id",
           "//o[for $x in ., $l in l where $x/@s = 'open' return position() = 3]",
           "for $o in //o, $l in $o/l where (some $x in $o/l satisfies $x/@q = '2') return $x",
           "for $o in //o, $l in $o/l where (some $x in $o/l satisfies $x/@q = '2') return $l",
           "for $o in //o, $q in $o/l[some $x in . satisfies $x/@q = '2'] where $o/@c return $x",
           "for $o in //o where $o/@c return for $l in $o/l where $o/@s = 'open' return $l",
           "count(for $o in //o, $l in $o/l where $o/@s = 'open' return $l)",
           "exists(for $o in //o, $l in $o/l where $o/@s = 'open' return $l)",
           "(for $o in //o, $l in $o/l where $o/@s = 'open' return $l)[2]",
           "sum(for $o in //o, $l in $o/l where $o/@s = 'open' return 1)",
           "for $o in (//o, 1), $l in 1 to 2 where $o/@s = 'open' return $l",
           "for $o in (1, 'a'), $l in 1 to 2 where $o = 'a' return $l",
           "let $n := (<a/>, <b/>) for $o in $n, $l in 1 to 2 where $o/self::a return <e>{$o}</e>",
           "<e>{for $o in //o, $l in $o/l where $o/@s = 'open' return <f>{$l}</f>}</e>",
       }) {
    sameBothWays(text, few);
  }
}

TEST(AskEarly, AnswersTheSame) {
  const std::vector<std::string> first = {"//o", "(//o, //c)", "(//o)[position() < 9]", "//l/..",
                                          "(//o, 1, 'a')"};
  const std::vector<std::string> clauses = {
      "for $l in $o/l ",         "let $l := $o/l ",    "for $l at $n in $o/* ",
      "for $l in (1, 2, 'x') ",  "for $l in //c ",     "let $m := $o/@c for $l in $m ",
      "for $l in $o/../c ",      "for $l in $o/l/@q ", "let $l := string($o/@n) ",
      "for $l in <e>{$o}</e>/* "};
  const std::vector<std::string> conditions = {"$o/@s = 'open'",  "$o/@c",           "$l/@q = '2'",
                                               "$o/@n > 3",       "$l = $o/@c",      "exists($o/l)",
                                               "not($o/l[2])",    "$o/@n = $l/@q",   "$o is //o[3]",
                                               "count($o/l) > 1", "$o/../c/@k = 'a'"};
  const std::vector<std::string> answers = {"$l",          "($o/@n, $l)", "<e>{$l}</e>",
                                            "<e>{$o}</e>", "position()",  "xs:integer($o/@n)"};
  std::mt19937 random(11);
  const auto oneOf = [&random](const std::vector<std::string>& texts) {
    return texts[random() % texts.size()];
  };
  const Value some = orders(12);
  for (int round = 0; round < 400; ++round) {
    std::string text = "for $o in " + oneOf(first) + " " + oneOf(clauses);
    if (random() % 3 == 0) text += "for $k in 1 to 2 ";
    text += "where " + oneOf(conditions);
    while (random() % 2) text += (random() % 5 ? " and " : " or ") + oneOf(conditions);
    sameBothWays(text + " return " + oneOf(answers), some);
  }
}

}  // namespace
}  // namespace xquery
