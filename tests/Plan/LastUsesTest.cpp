// Lists that functions pass on, changed in place where they are read for the last time.
#include "Expr/RandomChoices.h"
#include "Plan/AgreeUnlessLimited.h"
#include "Plan/PlanTesting.h"

#include <chrono>
#include <string>

namespace xquery {
namespace {

using namespace plantest;

size_t takenIn(std::string_view text) {
  return choicesOf("last uses", text);
}

std::string function(const std::string& body, const std::string& call = "local:f((1 to 4), 3)") {
  return "declare function local:f($s, $n) { " + body + " }; " + call;
}

TEST(LastUses, AreThoseBehindWhichNobodyReadsTheVariable) {
  const struct {
    const char* body;
    size_t taken;  // of $s and $n
  } cases[] = {
      {"if ($n = 0) then $s else local:f(($s, $n), $n - 1)", 1},
      {"if ($n = 0) then $s else local:f(($n, $s), $n - 1)", 1},
      {"if ($n = 0) then 0 else $s[1] + local:f(subsequence($s, 2), $n - 1)", 1},
      {"if ($n = 0) then () else ($s[1], local:f(remove($s, 1), $n - 1))", 1},
      {"if ($n = 0) then () else (local:f(remove($s, 1), $n - 1), $s[1])", 0},
      {"if ($n = 0) then () else (local:f(remove($s, 1), $n - 1), $n)", 2},
      {"if ($n = 0) then $s else local:f(reverse($s), $n - 1)", 1},
      {"if ($n = 0) then $s else local:f($s[position() > 1], $n - 1)", 1},
      {"if ($n = 0) then $s else local:f($s[position() = 2 to last()], $n - 1)", 1},
      {"if ($n = 0) then $s else local:f($s[position() != 1], $n - 1)", 1},
      {"if ($n = 0) then $s else local:f($s[. > 1][position() > 1], $n - 1)", 0},
      {"if ($n = 0) then $s else local:f($s[position() > count($s) - 2], $n - 1)", 0},
      {"if ($n = 0) then $s else local:f($s[position() > 1]/.., $n - 1)", 0},
      {"if ($n = 0) then $s else local:f(insert-before($s, 2, $n), $n - 1)", 1},
      {"if ($n = 0) then $s else local:f(insert-before($s, 2, $s), $n - 1)", 0},
      {"if ($n = 0) then $s else local:f(insert-before(1, 2, $s), $n - 1)", 0},
      {"if ($n = 0) then $s else local:f(subsequence($s, count($s) - 2), $n - 1)", 0},
      {"let $h := $s[1] let $t := subsequence($s, 2) return if ($n = 0) then $h else "
       "local:f($t, $n - 1)",
       2},
      {"let $t := subsequence($s, 2) return if ($n = 0) then $s[1] else local:f($t, $n - 1)", 1},
      {"let $t := ($s, 1) where $n = 0 return ($t, $n)", 3},
      {"let $t := ($s, 1) where count($s) > 0 return ($t, 2)", 1},
      {"for $i in 1 to $n return ($s, $i)", 0},
      {"(for $i in 1 to $n return count($s), ($s, $n))", 2},
      {"some $i in ($s, $n) satisfies $i = 3", 0},
      {"count(($s, $n))", 2},
      {"if (count(($s, 1)) = 5) then ($s, 2) else 3", 1},
      {"typeswitch ($n) case xs:integer return ($s, 1) default return ($s, $n)", 3},
      {"(1 to 3)[. = ($s, $n)]", 0},
      {"<e>{($s, $n)}</e>", 0},
      {"string-join(for $i in ($s, $n) order by $i return string($i), ',')", 0},
  };
  for (const auto& example : cases) {
    EXPECT_EQ(takenIn(function(example.body)), example.taken) << example.body;
    sameBothWays(function(example.body));
  }
}

TEST(LastUses, AreNotTakenOutsideOfFunctions) {
  for (const char* text :
       {"let $s := 1 to 3 return ($s, 4)", "for $i in 1 to 3 let $s := ($i, 2) return ($s, 1)",
        "declare variable $g := let $s := 1 to 3 return ($s, 4); $g"}) {
    EXPECT_EQ(takenIn(text), 0U) << text;
    sameBothWays(text);
  }
}

TEST(LastUses, LeaveListsThatOthersHoldAsTheyAre) {
  for (const char* call :
       {"let $l := (1, 2, 3) return (local:f($l, 3), '|', $l)",
        "let $l := (1, 2, 3) return (local:f($l, 2), local:f($l, 1), count($l))",
        "declare variable $g := (5, 6, 7); (local:f($g, 2), $g, local:f($g, 3))",
        "for $i in 1 to 2 let $l := (1, $i, 3) return (local:f($l, 3), $l)",
        "local:f((1, 2, 3), 3), local:f((1, 2, 3), 3)",
        "let $l := (local:f((1, 2, 3), 3)) return (count($l), local:f($l, 2), $l)",
        "count(local:f((1 to 5), 3)), exists(local:f((1 to 5), 3)), local:f((1 to 5), 3)[2]",
        "boolean(local:f((), 3)), local:f((), 3) = 2, (local:f(<a/>, 2))[last()]"}) {
    for (const char* body : {"if ($n = 0) then $s else local:f(($s, $n), $n - 1)",
                             "if ($n = 0) then $s else local:f(($n, 0, $s), $n - 1)",
                             "if ($n = 0) then $s else local:f(remove($s, 2), $n - 1)",
                             "if ($n = 0) then $s else local:f(reverse($s), $n - 1)",
                             "if ($n = 0) then $s else local:f(insert-before($s, 2, (8, 9)), "
                             "$n - 1)",
                             "if ($n = 0) then $s else (local:f(subsequence($s, 2), $n - 1), 7)"}) {
      const std::string text = call;
      const size_t semicolon = text.find(';');
      const std::string program =
          semicolon == std::string::npos
              ? function(body, text)
              : text.substr(0, semicolon + 1) + function(body, text.substr(semicolon + 1));
      EXPECT_GE(takenIn(program), 1U) << program;
      sameBothWays(program);
    }
  }
}

TEST(LastUses, FailAsEver) {
  for (const char* body :
       {"if ($n = 0) then error() else local:f(($s, $n),\n $n - 1)",
        "if ($n = 0) then $s else local:f(remove($s, 'x'),\n $n - 1)",
        "if ($n = 0) then $s else local:f(($s, 1 idiv ($n - 2)),\n $n - 1)",
        "if ($n = 0) then $s else local:f(insert-before($s, 1, $u), $n - 1)",
        "if ($n = 0) then sum($s) else local:f(($s, 'x'), $n - 1)",
        "if ($n = 0) then $s else local:f(($s, .), $n - 1)",
        "if ($n = 0) then $s else local:g(($s, 1))", "local:f(($s, $n), $n)[0]"}) {
    const std::string text = function(body);
    if (std::string_view(body) != "local:f(($s, $n), $n)[0]") sameBothWays(text);
  }
}

// Every call would keep a list of its own: 8 bytes * 1,500 * 1,500 / 2.
TEST(LastUses, NeedNoMemoryForTheCallsThatWait) {
  for (const char* body : {"if (empty($s)) then 0 else $s[1] + local:f(subsequence($s, 2), $n)",
                           "if (count($s) > 3000) then count($s) else local:f(($s, $n), $n)",
                           "if (empty($s)) then 0 else 1 + local:f(remove($s, 1), $n)"}) {
    const std::string text = function(body, "local:f(1 to 1500, 1)");
    const XQueryLimits limits = boundedBy(std::chrono::seconds(60), 3'000'000);
    const Outcome outcome = outcomeOf(*compiled(text, XQueryWay::Planned), {}, {}, limits);
    EXPECT_FALSE(endedAtLimit(outcome)) << text;
  }
}

class ProgramOfLists {
 public:
  explicit ProgramOfLists(unsigned seed) : _random(seed) {}

  std::string text() {
    std::string all;
    for (const char* name : {"local:f", "local:g"}) {
      all += std::string("declare function ") + name + "($s, $t, $n) { if ($n <= 0) then " +
             list(0) + " else " + list(4) + " };\n";
    }
    return all + "let $l := (1 to 5) return (local:f($l, ('a', 'b', 'c'), " +
           _random.oneOf({"1", "2", "3"}) + "), '|', $l, '|', local:g((), <x/>, 2), '|', " +
           "count(local:g($l, $l, 2)))";
  }

 private:
  std::string number() {
    return _random.oneOf({"1", "2", "3", "$n", "count($s)", "-1", "$n + 1", "count($t) - 1"});
  }

  std::string call(int depth) {
    return _random.oneOf({"local:f(", "local:g("}) + list(depth) + ", " + list(depth) + ", $n - " +
           _random.oneOf({"1", "2"}) + ")";
  }

  std::string list(int depth) {
    if (depth <= 0) {
      return _random.oneOf(
          {"$s", "$t", "$s", "$t", "$s[1]", "$t[last()]", "()", "(7, 8)", "'x'", "count($t)"});
    }
    const int next = depth - 1;
    switch (_random.below(14)) {
      case 0:
        return "(" + list(next) + ", " + list(next) + ")";
      case 1:
        return "(" + list(next) + ", $n, " + list(next) + ")";
      case 2:
        return "remove(" + list(next) + ", " + number() + ")";
      case 3:
        return "insert-before(" + list(next) + ", " + number() + ", " + list(next) + ")";
      case 4:
        return "subsequence(" + list(next) + ", " + number() + ")";
      case 5:
        return "subsequence(" + list(next) + ", " + number() + ", " + number() + ")";
      case 6:
        return "reverse(" + list(next) + ")";
      case 7:
        return "(let $v := " + list(next) + " return " + listOf("$v", next) + ")";
      case 8:
        return "(if (" + _random.oneOf({"$n mod 2 = 0", "count($s) > 2", "exists($t)"}) +
               ") then " + list(next) + " else " + list(next) + ")";
      case 9:
        return "(typeswitch (" + list(0) + ") case $c as xs:integer return ($c, " + list(next) +
               ") default return " + list(next) + ")";
      case 10:
        return "(for $i in " + list(0) + " return " + listOf("$i", 1) + ")";
      case 11:
        return _random.oneOf({"$s", "$t", "(" + list(next) + ")"}) + "[position() " +
               _random.oneOf({"> 1", "!= 2", "= 2 to last()", "< last()", "<= $n",
                              ">= 2 and position() != last()", "= count($s)"}) +
               "]";
      default:
        return call(next / 2);
    }
  }

  // One that reads a further variable.
  std::string listOf(const std::string& variable, int depth) {
    return _random.oneOf(
        {"(" + variable + ", " + list(depth) + ")", "remove(" + variable + ", " + number() + ")",
         "(" + list(depth) + ", " + variable + ", " + variable + ")",
         "insert-before(" + variable + ", 1, " + list(depth) + ")", "reverse(" + variable + ")"});
  }

  RandomChoices _random;
};

TEST(LastUses, AnswerAsCopiesDoOverGeneratedPrograms) {
  size_t taken = 0;
  for (unsigned seed = 0; seed < 400; ++seed) {
    const std::string text = ProgramOfLists(seed).text();
    taken += takenIn(text);
    agreeUnlessLimited(text);
  }
  EXPECT_GT(taken, 600U);
}

}  // namespace
}  // namespace xquery
