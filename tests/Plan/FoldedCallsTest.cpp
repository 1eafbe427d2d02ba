// Sums, averages and extremes of what a FLWOR yields, without a list of it.
#include "Expr/RandomChoices.h"
#include "Plan/PlanTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

size_t foldsIn(std::string_view text) {
  return choicesOf("folds", text);
}

const Value& shop() {
  static const Value parsed = document(
      "<r><i p='3' q='1'/><i p='2.5'/><i q='x'/><i p='-7' q='2'/><i p='1e3' q='2'/><i p=''/></r>");
  return parsed;
}

TEST(FoldedCalls, TakeWhatALoopYields) {
  for (const char* text :
       {"sum(for $i in 1 to 9 return $i * 2 + 1)", "avg(for $i in 1 to 9 return $i)",
        "max((for $i in 1 to 9 where $i mod 3 = 1 return -$i))",
        "min(for $i in //i/@q return string-length($i))", "sum(for $i in //i return $i/@p, 0)",
        "sum(for $i in 1 to 9, $j in 1 to $i let $k := $j * 3 return ($i, $j, ()))",
        "sum(for $i in 1 to 9 return ($i * 1.5e0 - 2))", "sum(let $i := 3 return $i)",
        "sum(for $i in () return $i)", "sum(for $i in () return $i, 'none')",
        "(max(for $i in () return $i), avg(for $i in () return $i))",
        "for $n in (3, 0, -2, ()) return (sum(1 to $n), avg((1 to $n)), max(1 to $n), min($n to "
        "3))",
        "for $n in (1, 9) return sum(9223372036854775800 to 9223372036854775790 + $n, 'none')",
        "sum(for $i in //i where $i/@q = //i[1]/@q return 1)",
        "sum(for $i in //i return if ($i/@q = //i[2]/@q) then 1 else 0)"}) {
    EXPECT_GE(foldsIn(text), 1U) << text;
    sameBothWays(text, shop());
  }
}

TEST(FoldedCalls, LeaveOtherCallsAlone) {
  for (const char* text :
       {"sum((1, 2, 3))", "count(for $i in 1 to 9 return $i)", "sum(//i/@q)",
        "sum(for $i in 1 to 9 order by -$i return $i)", "max(for $i in 1 to 9 return $i, 'c')",
        "sum()", "avg(for $i in 1 to 3 return $i, 0)", "sum((for $i in 1 to 3 return $i, 4))"}) {
    EXPECT_EQ(foldsIn(text), 0U) << text;
    sameBothWays(text, shop());
  }
}

TEST(FoldedCalls, FailWhereTheFunctionsFail) {
  for (const char* text :
       {"sum(for $i in (1, 2, 'x')\n return $i)",
        "1 +\n avg(for $i in (1, 'x') return $i)",
        "max(for $i in (1, 'x', 2)\n return $i)",
        "min(for $i in (true(), 1) return $i)",
        "sum(for $i in ('x', 1) return $i)",
        "sum(for $i in 1 to 3 return\n $i idiv ($i - 2))",
        "sum(for $i in (1, 2, 'x', 0) return (10 idiv $i))",
        "sum(for $i in (1, 'x') return $i,\n error())",
        "sum(for $i in () return 1, error())",
        "sum(for $i in 1 to 2 return error())",
        "avg(for $i in () return 1 idiv 0)",
        "sum(for $i in //i return $i/@q)",
        "max(for $i in //i return xs:double($i/@p))",
        "for $n in (1, 'x') return sum(1 to\n $n)",
        "for $n in 1 to 2 return max($n to\n (1, 2))",
        "for $n in (3) return sum(1 to $n, error())",
        "sum(1 to count(//i) * 100000000000000)",
        "sum(for $i in 1 to 3 return .)",
        "sum(for $i in (1, 2) return $u)",
        "sum(for $d in (xs:date('2004-01-01'), 1) return $d)",
        "avg(for $d in ('P1M', 'P2M') return xs:yearMonthDuration($d))",
        "sum(for $i in 1 to 3 return error(QName('', 'e'), concat('no ', $i)))"}) {
    sameBothWays(text, shop());
    sameBothWays(text);
    sameBothWays("for $x in (1, 2) return (" + std::string(text) + ")", shop());
  }
}

// The sum or extreme of one item is that item, whichever object it is.
TEST(FoldedCalls, AnswerTheOnlyItemItself) {
  for (const char* text :
       {"let $n := 3 return ($n, sum(for $i in $n return $i), max(for $i in $n return $i))",
        "let $n := (1, 7, 3) return ($n, max(for $i in $n return $i), min(for $i in $n return $i))",
        "for $k in (1, 2) return sum(for $i in 1 to 1 return 5)"}) {
    EXPECT_GE(foldsIn(text), 1U) << text;
    sameBothWays(text);
  }
}

TEST(FoldedCalls, KeepTheTypesAndSignsOfSums) {
  for (const char* text :
       {"sum(for $i in (-0e0) return $i)", "sum(for $i in (-0e0, -0e0) return $i)",
        "sum(for $i in (0, -0e0) return $i)", "sum(for $i in (1, 2.50) return $i)",
        "sum(for $i in (9223372036854775807, 1, 1e0) return $i)",
        "sum(for $i in (9223372036854775807, 9223372036854775807, -5) return $i + 0 + 0)",
        "sum(for $i in (1, xs:byte('2'), 3) return $i)",
        "sum(for $i in (1, xs:float('2')) return $i)",
        "avg(for $i in (1, 2, number('x'), 'y') return $i)",
        "sum(for $i in 1 to 5 return ($i * 1e300 * 1e10))",
        "max(for $i in (1, 1e0, 1.0) return $i)",
        "sum(for $i in 1 to 3 return if ($i = 2) then number('x') else 'z')",
        "sum(for $i in 1 to 3 return $i * 2 = 4)"}) {
    sameBothWays(text);
  }
}

// A loop over a range has one object for its variable as long as nobody else holds that.
TEST(FoldedCalls, LeaveIntegersThatSomebodyHolds) {
  for (const char* text :
       {"for $i in 1 to 5 return $i", "for $i at $p in 3 to 5 return ($i, $p, $i)",
        "for $i in 1 to 3 let $k := $i return ($k, $i)",
        "let $l := for $i in 1 to 5 where $i mod 2 = 1 return $i return ($l, $l)",
        "for $i in 1 to 2, $j in $i to 3 return ($i, $j)",
        "declare function local:f($a) { for $j in 1 to 2 return ($a, $j) }; "
        "for $i in 1 to 3 return local:f($i)",
        "for $i in 1 to 4 order by -$i return $i", "max(for $i in 1 to 4 return $i)",
        "min(for $i in 1 to 4 return $i)", "for $i in 1 to 3 return <a>{$i}</a>",
        "some $i in 1 to 4 satisfies (every $j in 1 to $i satisfies $j <= $i)",
        "(every $i in 1 to 3 satisfies $i, for $i in 4 to 5 return $i)",
        "for $i in 1 to 3 return (for $i in 1 to 2 return $i, $i)",
        "for $i in 1 to 3 return (some $k in ($i, 7) satisfies $k = 7, $i)",
        "(some $i in 1 to 3 satisfies $i = 2), (for $j in 1 to 2 return $i)",
        "for $i as xs:integer in 1 to 3 return $i", "for $i in 1 to 3 return (1 to 5)[. = $i]",
        "for $i in 1 to 3 return count(//i[position() = $i]/@p)"}) {
    sameBothWays(text, shop());
  }
}

std::string itemFrom(RandomChoices& random) {
  return random.oneOf({"$i",
                       "$i",
                       "$j",
                       "$i * 2 + $j",
                       "$i - $j * 3",
                       "$i * 0.5e0 + 1",
                       "($i)",
                       "($i, $j)",
                       "()",
                       "$i idiv $j",
                       "$i div $j",
                       "string($i)",
                       "'x'",
                       "1.25",
                       "number('x')",
                       "xs:byte('3')",
                       "-0e0",
                       "$i = $j",
                       "if ($i > $j) then $i else 0",
                       "if ($i mod 2 = 0) then 1 else $j",
                       "xs:date('2004-01-01')",
                       "error()",
                       "12345678901234567890",
                       "$i * 9223372036854775807 + 1"});
}

TEST(FoldedCalls, AgreeWithTheFunctionsOverGeneratedLoops) {
  RandomChoices random(20041123);
  size_t taken = 0;
  for (int round = 0; round < 500; ++round) {
    const std::string function = random.oneOf({"sum", "sum", "avg", "max", "min"});
    const std::string first =
        random.oneOf({"1 to 4", "-2 to 2", "(1, 2.5, 3e0)", "(3, 'x', 1)", "//i/@p", "//i/@q", "()",
                      "(9223372036854775806, 5)", "(1, 2, //i[1]/@p)"});
    const std::string second = random.oneOf({"1 to 2", "(2, 3)", "$i", "(0, 1)", "//i[2]/@p"});
    const std::string where = random.oneOf({"", "", " where $i != $j", " where $j > 0"});
    std::string text = function + "(for $i in " + first + ", $j in " + second + where +
                       " return\n " + itemFrom(random) + ")";
    if (function == "sum" && random.below(4) == 0) text.insert(text.size() - 1, ", 'none'");
    taken += foldsIn(text);
    sameBothWays(text, shop());
  }
  EXPECT_EQ(taken, 500U);
}

}  // namespace
}  // namespace xquery
