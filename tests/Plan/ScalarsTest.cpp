// Arithmetic, comparisons and logic that are computed with machine numbers, and what the operators
// answer.
#include "Expr/RandomChoices.h"
#include "Plan/PlanTesting.h"

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

size_t scalarsIn(std::string_view text) {
  return choicesOf("scalars", text);
}

const Value& numbers() {
  static const Value parsed = document("<r><n>3</n><n>-4</n><n>2.5</n><n>x</n><n/></r>");
  return parsed;
}

void expectTheSame(const std::string& text) {
  const Outcome plain = outcomeOf(*compiled(text), numbers());
  const Outcome planned = outcomeOf(*compiled(text, XQueryWay::Planned), numbers());
  EXPECT_EQ(planned.lines, plain.lines) << text;
}

TEST(Scalars, TakeOperatorsOverVariablesTheFocusAndNumbers) {
  for (const char* text :
       {"for $i in 1 to 9 return $i * 7 mod 5",
        "for $i in 1 to 9 return if ($i mod 2 = 0) then 1 else 2",
        "(1 to 9)[. mod 2 eq 1 or . > 7]", "//n[position() mod 2 = 1]",
        "//n[last() - position() > 2]",
        "for $i in 1 to 9 where not($i mod 3) and $i != 6 return $i",
        "for $n in //n return -$n * 2 + 1", "for $x in (1.5e0, 2e0) return $x * $x < 3",
        "declare function local:f($a, $b) { $a * 2 + $b }; local:f(1, 2)",
        "for $i in 1 to 9 return $i div 3 > 1", "for $i in 1 to 9 return $i + 1.5 > 2",
        "for $i in (2.5, 99999999999999999999) return $i * 0.1 - 7 div 3",
        "for $i in 1 to 3, $j in 1 to 3 return ($i + $j) * ($i - $j) idiv 2"}) {
    EXPECT_EQ(scalarsIn(text), 1U) << text;
    expectTheSame(text);
  }
}

TEST(Scalars, LeaveOtherOperatorsAlone) {
  for (const char* text :
       {"for $i in 1 to 9 return $i + 1", "//n[. = 3]", "for $s in ('a', 'b') return $s = 'a'",
        "for $i in 1 to 9 return $i + count(//n) > 2", "declare variable $g := 3; $g * 2 + 1",
        "for $n in //n return $n = 3", "for $i in 1 to 9 return ($i = 1) = true()",
        "for $i in 1 to 9 return $i = (1, 2)", "2 + 3 * 4"}) {
    EXPECT_EQ(scalarsIn(text), 0U) << text;
    expectTheSame(text);
  }
}

// Where machine numbers end, the operators answer, or fail in their place.
TEST(Scalars, LeaveWhatDoesNotFitToTheOperators) {
  for (const char* text :
       {"for $i in (9223372036854775807, -9223372036854775807) return $i * 2 + 1",
        "for $i in (9223372036854775807) return -$i - 2", "for $i in (0, 1) return 7 mod $i + 1",
        "for $i in (0, -1, 2) return (7 idiv $i) * 2", "for $i in (1, 'x') return $i * 2 + 1",
        "for $i in (9007199254740993, 9007199254740992) return $i * 1 = 9007199254740992e0",
        "for $i in (1, 2.5, 1e0, xs:float('1.5'), true(), (), 'x') return\n $i * 2 - 1 > 0",
        "let $u := () return $u * 2 + 1", "for $i in (0e0, -1e0) return (1 div $i, -$i * 0)",
        "for $i in (number('x'), 1e0 div 0) return ($i * 1 = $i, $i * 1 != $i, not($i * 1))",
        "for $d in (current-date()) return $d + 1 - 2", "let $s := (1, 2) return $s * 2 + 1",
        "for $n in //n return $n * 2 - 1", "for $n in (//n[1], //n[3]) return $n idiv 1 + 1",
        "position() + last() - 1", "for $i in 1 to 3 return . * 2 + $i",
        "for $i in (xs:byte('3'), xs:short('4')) return $i * 2 - $i",
        "some $i in (1, 2) satisfies ($i + 1 = 3 and ($i = 2 or error()))"}) {
    expectTheSame(text);
  }
}

// An expression of numbers, of so many levels.
std::string numberFrom(RandomChoices& random, int level) {
  if (level == 0) {
    return random.oneOf({"$a", "$b", "$a", "$b", ".", "position()", "last()", "0", "1", "3", "-2",
                         "1e0", "0.5e0", "9223372036854775807", "2.5"});
  }
  const auto part = [&] { return numberFrom(random, random.below(2) ? level - 1 : 0); };
  if (random.below(6) == 0) return random.oneOf({"-", "+"}) + std::string("(") + part() + ")";
  const std::string op = random.oneOf({"+", "-", "*", "mod", "idiv", "div", "+", "-", "*"});
  return "(" + part() + " " + op + " " + part() + ")";
}

std::string truthFrom(RandomChoices& random, int level) {
  const auto number = [&] { return numberFrom(random, static_cast<int>(random.below(3))); };
  if (level == 0) {
    const std::string relation =
        random.oneOf({"=", "!=", "<", "<=", ">", ">=", "eq", "ne", "lt", "le", "gt", "ge"});
    return number() + " " + relation + " " + number();
  }
  const auto part = [&] { return truthFrom(random, level - 1); };
  if (random.below(4) == 0) return "not(" + (random.below(3) ? part() : number()) + ")";
  return "(" + part() + random.oneOf({" and ", " or "}) + part() + ")";
}

TEST(Scalars, AgreeWithTheOperatorsOverGeneratedExpressions) {
  RandomChoices random(20041123);
  const std::string values =
      "(0, 1, -7, 12, 9223372036854775807, 9007199254740993, 2.5, 0e0, -1.5e0, 1e300, //n)";
  size_t taken = 0;
  for (int i = 0; i < 400; ++i) {
    const std::string body =
        random.below(2)
            ? numberFrom(random, 2)
            : "if (" + truthFrom(random, static_cast<int>(random.below(3))) + ") then 1 else 2";
    // One at a time, since the first error ends them all.
    const std::string item = std::to_string(1 + random.below(15));
    const std::string other = random.oneOf({"3", "-2", "0.25e0", "$a", "'4'", "4.5"});
    const std::string bare =
        "for $a in " + values + "[" + item + "] let $b := " + other + " return\n" + body;
    taken += scalarsIn(bare);
    expectTheSame(bare);
    expectTheSame("let $a := 3, $b := " + std::string(other == "$a" ? "2" : other) +
                  " return (2e0, 3, 4)[" + body + "]");
    expectTheSame("for $a in " + values + " for $b in (1, " + other + ") return (//n)[" + body +
                  "]");
  }
  EXPECT_GT(taken, 200U);
}

}  // namespace
}  // namespace xquery
