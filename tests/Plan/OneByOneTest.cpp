// Clauses that find no more of their items than are asked for.
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

size_t clausesIn(std::string_view text) {
  return choicesOf("one by one", text);
}

// Elements a and b in each other, some with attributes and numbers.
Value tree(int count) {
  std::string text = "<r><s>";
  for (int i = 0; i < count; ++i) {
    text += "<a n='" + std::to_string(i) + "'><b>" + std::to_string(i % 7) + "</b>";
    text += i % 3 ? "<b>x</b></a>" : "<a n='y'><b>3</b></a></a>";
  }
  return document(text + "</s></r>");
}

TEST(OneByOne, IsTakenWhereNotAllMayBeAskedFor) {
  for (const char* text : {
           "some $a in //a satisfies $a/@n = '3'",
           "every $a in //a[b] satisfies $a/b = 1",
           "for $a in //a return some $b in $a/b satisfies $b = 2",
           "exists(for $a in /r/s/a where $a/b = '3' return $a)",
           "(for $a in //a where $a/b = '3' return $a/b)[1]",
           "count(for $a in //a return $a) > 2",
           "if (for $a in //a where $a/b = '3' return $a) then 1 else 2",
       }) {
    EXPECT_EQ(clausesIn(text), 1U) << text;
  }
  EXPECT_EQ(clausesIn("some $a in //a, $b in $a/b satisfies $b = 3"), 2U);
  EXPECT_EQ(clausesIn("exists(for $a in //a, $b in $a//b where $b = '3' return $b)"), 2U);
}

TEST(OneByOne, IsNotTakenWhereThatCouldBeToldOrIsOfNoUse) {
  for (const char* text : {
           // All of them are asked for.
           "for $a in //a where $a/b = 3 return $a",
           "count(for $a in //a where $a/b = 3 return $a)",
           "(for $a in //a order by $a/@n return $a)[1]",
           // What is behind may fail.
           "exists(for $a in //a where $a/b = 3 return $a)",
           "exists(for $a in //a where xs:integer($a/b) = 3 return string-length($a/b))",
           "(for $a in //a return xs:integer($a/b))[1]",
           // No path, or one that may be told to have been walked, or in another order.
           "some $a in (1, 2, 3) satisfies $a = 2",
           "some $a in //a[trace(., 'x')] satisfies $a/b = 3",
           "some $a in //a/ancestor::* satisfies $a/b = 3",
           "some $a in //b/../b satisfies $a = 3",
           "some $a in //a/string(.) satisfies $a = '3'",
           // Nodes are made in between.
           "some $a in //a satisfies <e>{$a}</e>/a/@n = 'y'",
           "some $a in //a satisfies trace($a, 'x')",
           // It is kept from one time to the next.
           "for $x in 1 to 3 where some $a in //a satisfies $a/@n = $x return $x",
       }) {
    EXPECT_EQ(clausesIn(text), 0U) << text;
  }
}

// What an evaluation of it takes when indexes have been made.
int64_t stepsOf(std::string_view text, const Value& contextItem) {
  const auto query = compiled(text, XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContext();
  _internal(*context).setContextItem(contextItem, 1);
  int64_t steps = 0;
  for (int turn = 0; turn < 4; ++turn) {
    const int64_t before = workMeter.stepsLeft;
    EXPECT_TRUE(_internal(*query).body()->evaluateWithContext(*context)) << text;
    steps = before - workMeter.stepsLeft;
  }
  return steps;
}

TEST(OneByOne, EndsWithTheItemThatDecides) {
  const Value many = tree(20000);
  for (const char* text : {
           "some $a in //a satisfies $a/@n = '3'",
           "every $a in //a satisfies $a/b != '2'",
           "some $a in r/s/a satisfies $a/b = '5'",
           "some $a in /r/s/a, $b in $a//b satisfies ($a/@n = '3' and $b = '3')",
           "exists(for $a in //a where $a/@n = '3' return $a)",
           "(for $a in /r/s/a, $b in $a/b where $b = '3' return $b)[2]",
           "count(for $a in //a[b = 'x'] return $a/b) >= 3",
       }) {
    EXPECT_LT(stepsOf(text, many), 120) << text;
  }
}

TEST(OneByOne, LeavesFocusVariablesAndErrorsAsTheyAre) {
  const Value few = tree(20);
  for (const char* text : {
           "(some $a in //a[b = 'x'] satisfies $a/b = 4, .)",
           "//b[some $a in ../a[b] satisfies ($a/b = 3 and position() = 1 and last() = 1)]",
           "//a[some $a in a satisfies @n = '3']",
           "(some $a in //a satisfies $a/b = 4), $a",
           "(some $a in //a satisfies $a/@n = 'none'), $a",
           "(every $a in //none satisfies $a), $a",
           "some $a in //none, $c in //a satisfies $c/b = 4",
           "some $a as element(b) in //a satisfies $a/b = 4",
           "some $a as element(a) in //a satisfies $a/b = 4",
           "some $a in //a satisfies xs:integer($a/@n) = 30",
           "some $a in //a satisfies xs:integer($a/@n) = 1",
           "every $a in //a satisfies error()",
           "//a[every $b in b satisfies error()]",
           "some $a in (//a)[2]/b satisfies $a = 'x'",
           "some $a in (//a, 3)/b satisfies $a = 'x'",
           "for $s in //s return some $a in $s/a satisfies string-length($a/b[1]) = 1",
           "for $x in (3, //s) return some $a in $x/a satisfies $a/b = 1",
           "for $x in //a return exists(for $b at $n in $x/b where $n = 2 return $b)",
           "unordered { some $a in //a satisfies $a/b = 4 }",
           "some $a in //a[some $y in b satisfies $y = 2] satisfies $y = 2",
           "some $a in //a satisfies (some $y in $a/b satisfies $y = 2), $y",
           "declare function local:has($e, $v) { some $c in $e/* satisfies ($c = $v or "
           "local:has($c, $v)) }; (local:has(/, '3'), local:has(/, 'none'))",
       }) {
    sameBothWays(text, few);
  }
}

// Paths, conditions and ways to ask put together at random.
TEST(OneByOne, AnswersTheSame) {
  const std::vector<std::string> paths = {
      "//a",         "//a[b]",  "/r/s/a",   "r/s/a",          "//a//b",
      "//a[@n > 5]", "//@n/..", "//a[2]/b", "//s/a[3]",       "(//a, //b)",
      "//b/..",      "//none",  "$o/b",     "$o/ancestor::*", "$o//a[b = $o/b]"};
  const std::vector<std::string> conditions = {
      "$x/b = 3",           "$x/@n = $o/@n",
      "$x is $o",           "count($x/b) > 1",
      "xs:integer($x) > 2", "string($x) < string($o)",
      "$x = 'x3'",          "some $y in $x/* satisfies $y = 3"};
  const std::vector<std::string> ways = {
      "some $x in P satisfies C",
      "every $x in P satisfies not(C)",
      "some $x in P, $z in $x/b satisfies (C and $z = 3)",
      "exists(for $x in P where C return $x)",
      "empty(for $x in P, $z in $x/b where C return $z)",
      "(for $x in P where C return $x/@n)[1]",
      "subsequence(for $x at $i in P where C return ($i, $x), 1, 3)",
      "count(for $x in P where C return $x) > 2"};
  std::mt19937 random(7);
  const auto oneOf = [&random](const std::vector<std::string>& texts) {
    return texts[random() % texts.size()];
  };
  for (int round = 0; round < 400; ++round) {
    std::string text;
    for (const char each : oneOf(ways)) {
      text += each == 'P'   ? oneOf(paths)
              : each == 'C' ? "(" + oneOf(conditions) + ")"
                            : std::string(1, each);
    }
    sameBothWays("for $o in (//a)[position() = (1, 4, 9)] return (" + text + ")",
                 tree(static_cast<int>(random() % 30)));
  }
}

}  // namespace
}  // namespace xquery
