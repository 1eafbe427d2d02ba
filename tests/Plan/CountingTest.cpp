// Items that are only counted: FLWORs, filters and variables.
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Sixty items with a price, of which some are no number, some missing and some double.
const Value& items() {
  static const Value parsed = [] {
    std::string text = "<l>";
    for (int i = 0; i < 60; ++i) {
      text += "<i n='" + std::to_string(i) + "' k='" + std::to_string(i * i % 11) + "'>";
      if (i % 7 != 2) text += "<p>" + std::to_string(i % 9) + "</p>";
      if (i % 5 == 4) text += "<p>" + std::to_string(i % 4) + "</p>";
      if (i % 20 == 7) text += "<q>x</q>";
      text += "<q>" + std::to_string(i % 13) + "</q></i>";
    }
    return document(text + "</l>");
  }();
  return parsed;
}

size_t listsIn(const std::string& text) {
  return choicesOf("lists", text);
}

// Of which the text is put into a loop, so that a table is worth its making.
std::vector<std::string> resultOf(const std::string& text) {
  return sameBothWays("for $x in (0 to 20, '3', 'x', 2.5, ()) return (" + text + ")", items())
      .lines;
}

TEST(CountedLists, LeaveTheirNumberInAVariable) {
  for (const char* text : {
           "let $l := for $i in //i where $i/@k < $x return $i return count($l)",
           "let $l := for $i in //i where $i/p = $x return $i/p return (count($l), exists($l))",
           "let $l := //i[@k < $x] return if (empty($l)) then 'none' else count(($l)) + 1",
           "let $l := //i[p = $x][q = $x] where $l return count($l)",
           "let $l := //i[xs:integer(q) = $x] return not($l)",
           "let $k := //@k let $l := $k[. < $x] return count($l)",
           "let $l := for $i in //i let $m := $i/p where count($m) > $x return $m return count($l)",
           "let $l := (for $i in //i return if ($i/@k = $x) then 1 else ()) return count($l)",
           "let $l := for $i in (1, 2) return (1, $i, ()) return count($l) * 2",
       }) {
    EXPECT_GE(listsIn("for $x in 1 to 20 return (" + std::string(text) + ")"), 1U) << text;
    resultOf(text);
  }
}

TEST(CountedLists, AreListsWhereTheirItemsAreAskedFor) {
  for (const char* text : {
           "let $l := for $i in //i where $i/@k < $x return $i return (count($l), $l/@n)",
           "let $l := for $i in //i order by $i/q return $i return count($l)",
           "let $l as item()* := for $i in //i return $i return count($l)",
           "let $l := for $i in //i return $i return count(($l, 1))",
           "let $l := for $i in //i return string($i) return (boolean($l), count($l))",
           "let $l := //i return for $y in $l return count($y)",
           "let $l := (1, 2) return count($l)",
           "let $l := for $i in //i return $i return count($l, $l)",
       }) {
    EXPECT_EQ(listsIn("for $x in 1 to 20 return (" + std::string(text) + ")"), 0U) << text;
    resultOf(text);
  }
}

// A variable of a quantifier without items may be read where nothing has set it, and shows what
// another one left under its number.
TEST(CountedLists, AreListsWhereTheVariableMayBeReadUnset) {
  const std::string text =
      "((let $l := //i return count($l)), (some $y in //none satisfies $y), $y)";
  EXPECT_EQ(listsIn(text), 0U);
  sameBothWays(text, items());
}

TEST(CountedLists, FailWhereTheyAlwaysFail) {
  for (const char* text : {
           "let $l := for $i in //i where $i/@k < $x\n return xs:integer($i/q) return count($l)",
           "let $l :=\n //i[xs:integer(q) < $x]/xs:integer(q) return exists($l)",
           "let $l := (for $i in //i return 1)[\n. idiv 0 = 1] return 1 + count($l)",
           "let $l := for $i in //i return error() return 1",
           "let $l := .[@k] return count($l)",
       }) {
    resultOf(text);
    sameBothWays(text);
  }
}

TEST(Counting, FLWORsAndFilters) {
  for (const char* text : {
           "count(for $i in //i where $i/@k < $x return $i)",
           "count(for $i in //i where $i/@k = $x return ($i/p, 1))",
           "count(for $i in //i, $j in //i where $i/@k = $j/q and $j/@n = $x return $j)",
           "count(for $i in //i where $i/q > $x return $i/q)",
           "exists(for $i in //i where $i/q = $x return $i)",
           "empty(for $i in //i where $i/p = $x return $i/p)",
           "not(for $i in //i where $i/p = $x return $i)",
           "if (for $i in //i where $i/p = $x return $i) then 1 else 2",
           "count(for $i in //i where $i/p = $x return $i) > 3",
           "2 >= count((for $i in //i where $i/q = $x return $i))",
           "count(//i[@k < $x])",
           "count(//i[@k < $x]/p)",
           "count((//i, //i)[@k < $x])",
           "count(//p[. < $x])",
           "count(//i[q < $x])",
           "count(//i//*[. < $x])",
           "count((//i//*, //p)[. = $x])",
           "count((//p, 1, 'x')[. = $x])",
       }) {
    EXPECT_GE(choicesOf("counts", "for $x in 1 to 20 return (" + std::string(text) + ")"), 1U)
        << text;
    resultOf(text);
  }
}

TEST(Counting, LeavesAloneWhatIsNoQuestionOfNumber) {
  for (const char* text : {
           "boolean(for $i in //i return string($i))",
           "not(for $i in //i return 1)",
           "count(for $i in //i order by $i/q return $i)",
           "count((for $i in //i return 1, 2))",
       }) {
    EXPECT_EQ(choicesOf("counts", text), 0U) << text;
    sameBothWays(text, items());
  }
}

// What comes behind the answer fails all the same, is traced, and leaves its variables.
TEST(Counting, EndsEarlyWhereNobodyCanTell) {
  for (const char* text : {
           "exists(for $i in //i return xs:integer($i/q))",
           "exists(for $i in (1, 2, 0) return 1 idiv $i)",
           "empty(for $i in //i return trace($i/@k, 't'))",
           "(exists(for $i in //i return (some $y in $i/p satisfies $y = 3)), $y)",
       }) {
    sameBothWays(text, items());
  }
  const auto query =
      compiled("exists(for $i in //i, $j in $i/../i, $k in $j/../i return $k)", XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContext();
  context->_internal().setContextItem(items(), 1);
  const int64_t before = workMeter.stepsLeft;
  EXPECT_TRUE(query->_internal().body()->evaluateWithContext(*context));
  EXPECT_LT(before - workMeter.stepsLeft, 200);
}

TEST(Counting, SumsOfAConstant) {
  for (const char* text : {
           "sum(for $i in //i where $i/@k < $x return 1)",
           "sum(for $i in //i where $i/@k < $x return 3, 0)",
           "sum(for $i in //i where $i/@k = $x return 2, ())",
           "sum(for $i in //i return if ($i/@k < $x) then 1 else 0)",
           "sum((for $i in //i return (if ($x > $i/@n) then 4 else 0)))",
           "sum(for $i in //i return if ($i/@k < $x) then 1 else ())",
           "sum(for $i in //i, $j in //p where $j < $x return 1)",
           "sum(for $i in //i where $i/@n = $x return 2.5)",
           "sum(for $i in //i where $i/@n = $x return 1)/(., .)",
       }) {
    EXPECT_GE(choicesOf("for-joins", "for $x in 1 to 20 return (" + std::string(text) + ")"), 1U)
        << text;
    resultOf(text);
  }
  // One literal is the same object each time.
  sameBothWays("for $x in 1 to 20 return //i[1]/sum(for $i in //i where $i/@n = $x return 1)",
               items());
}

}  // namespace
}  // namespace xquery
