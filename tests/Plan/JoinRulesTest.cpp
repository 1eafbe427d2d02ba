// Joins: where one takes over, where none does, and that nobody can tell.
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryBinding.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/PlanTesting.h"
#include "Prolog/XQueryDeclarations.h"

#include <string>
#include <vector>

namespace xquery {
namespace {

using namespace plantest;

template <class Visit>
void forEachExpr(std::string_view text, Visit visit) {
  const auto query = compiled(text, XQueryWay::Planned);
  const XQueryProgram program = programOf(*query);
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) visit(*program[place].expr);
}

// How many clauses and paths have their items picked.
size_t joinsIn(std::string_view text) {
  size_t count = 0;
  forEachExpr(text, [&](const XQueryExpr& expr) {
    if (const auto* clause = dyn_cast<XQueryBindingExpr>(&expr)) count += clause->picker() ? 1 : 0;
    const auto* planned = dyn_cast<XQueryPlannedExpr>(&expr);
    if (planned && planned->walkedPath()) count += planned->walkedPath()->picker() ? 1 : 0;
  });
  return count;
}

size_t setsIn(std::string_view text) {
  return choicesIn(text, [](std::string_view rule) { return rule == "sets"; });
}

// Persons p0 to p19, sales of which every third has a buyer that is nobody, some two buyers and
// some none; numbers that are none among the prices.
const Value& market() {
  static const Value parsed = [] {
    std::string text = "<m>";
    for (int i = 0; i < 20; ++i) {
      const std::string number = std::to_string(i);
      text += "<p id='p" + number + "' n='" + number + "' c='" + std::to_string(i % 4) + "'/>";
    }
    for (int i = 0; i < 24; ++i) {
      text += "<s i='i" + std::to_string(i % 12) + "' v='" +
              (i % 7 == 3 ? "x" : std::to_string(i * 3)) + "'>";
      if (i % 5 != 1) text += "<b p='p" + std::to_string(i % 3 == 0 ? i + 50 : i % 20) + "'/>";
      if (i % 6 == 2) text += "<b p='p" + std::to_string(i % 4) + "'/>";
      text += "</s>";
    }
    for (int i = 0; i < 12; ++i) {
      text += "<i id='i" + std::to_string(i) + "' c='" + std::to_string(i % 5) + "'/>";
    }
    return document(text + "</m>");
  }();
  return parsed;
}

std::vector<std::string> resultOf(std::string_view text) {
  return sameBothWays(text, market()).lines;
}

std::string onlyResultOf(std::string_view text) {
  const auto lines = resultOf(text);
  return lines.empty() ? "" : lines.front();
}

// --- for clauses ---------------------------------------------------------------------------------

TEST(ForJoins, UseAConditionAtTheEarliestClauseThatBindsWhatItReads) {
  EXPECT_EQ(joinsIn("for $p in //p, $s in //s where $s/b/@p = $p/@id return $s"), 1U);
  EXPECT_EQ(joinsIn("for $p in //p, $s in //s, $i in //i "
                    "where $s/b/@p = $p/@id and $s/@i = $i/@id return $s"),
            2U);
  // In any order, since comparing nodes cannot fail.
  EXPECT_EQ(joinsIn("for $p in //p, $s in //s, $i in //i "
                    "where $s/@i = $i/@id and $s/b/@p = $p/@id return $s"),
            2U);
  EXPECT_EQ(onlyResultOf("count(for $p in //p, $s in //s, $i in //i where $s/@i = $i/@id and "
                         "$s/b/@p = $p/@id and $i/@c != $p/@c return $s)"),
            "xs:integer 11");
}

TEST(ForJoins, FindTextsByTheirBeginning) {
  for (const char* text : {
           "for $n in ('i', 'i1', '', 'x') return for $s in //s where starts-with($s/@i, $n) "
           "return $s",
           "for $p in //p return //s[starts-with(@i, concat('i', $p/@n))]/@v",
           "for $p in //p where some $s in //s satisfies starts-with($s/@v, $p/@n) return $p/@id",
           "for $c in (1 to 5) return //s[@i = concat('i', $c)][starts-with(@v, string($c))]",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  for (const char* text : {
           "for $p in //p return //s[starts-with($p/@id, @i)]",
           "for $p in //p return for $s in //s where starts-with($s/@i, 'i1', 'none') return $s",
       }) {
    EXPECT_EQ(joinsIn(text), 0U) << text;
    resultOf(text);
  }
}

// What another comparison of the same clause leaves out is left out although nothing is known of
// the kinds of the first, as long as a table answers that one.
TEST(ForJoins, ComeTogetherInAnyOrder) {
  for (const char* text : {
           "for $c in distinct-values(//p/@c), $n in distinct-values(//p/@n) return "
           "count(for $p in //p where $p/@c = $c and $p/@n = $n return $p)",
           "for $c in (//p/@c, 1, 'x', xs:date('2004-10-29')), $n in 1 to 3 return "
           "count(for $s in //s where $s/@v = $c and $s/@i = concat('i', $n) return $s)",
           "for $a in //p, $b in //p where $a/@c = $b/@c and $b/@n + 0 > $a/@n + 0 return $b",
           "for $a in //p return //p[@c = $a/@c][number(@n) > number($a/@n)]",
           "for $i in 1 to 20 return //s[@v >= $i and @v < $i + 2]/@i",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
}

// A comparison of numbers fails where an operand does, which is found out beforehand.
TEST(ForJoins, PassOverComparisonsOfNumbers) {
  for (const char* text : {
           "for $p in //p, $s in //s where number($s/@v) > number($p/@n) and $s/b/@p = $p/@id "
           "return $s",
           "for $p in //p, $s in //s where number($s/@v) < number($p/@n) and $s/b/@p = $p/@id "
           "return $s",
           "for $p in //p, $s in //s where xs:integer($s/@v) > xs:integer($p/@n) and "
           "$s/b/@p = $p/@id return $s",
           "for $p in //p, $s in //s, $i in //i where number($s/@v) > number($p/@n) and "
           "$s/b/@p = $p/@id return $s",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
}

TEST(ForJoins, FollowLetAndForClausesToTheKey) {
  EXPECT_EQ(joinsIn("for $p in //p let $id := string($p/@id) for $s in //s "
                    "let $b := $s/b/@p where $b = $id return $s"),
            1U);
  EXPECT_EQ(joinsIn("for $p in //p, $s in //s, $b in $s/b/@p where $b = $p/@id return $s"), 2U);
  resultOf(
      "for $p in //p let $id := string($p/@id) for $s in //s let $b := $s/b/@p "
      "where $b = $id return ($p, $s, $b)");
  resultOf("for $p in //p, $s in //s, $b in $s/b/@p where $b = $p/@id return ($p, $s, $b)");
  resultOf("for $p in //p, $s in //s let $v := xs:integer($s/@v) where $p/@n = $v return $s");
}

// A function that answers a comparison is as good as the comparison.
TEST(ForJoins, LookIntoFunctions) {
  const std::string sells = "declare function local:m($p, $s) { $s/b/@p = $p/@id }; ";
  const std::string two = "declare function local:m($a, $b, $c) { ($a < 2 * $b) }; ";
  for (const std::string& text : {
           sells + "for $p in //p, $s in //s where local:m($p, $s) return $s",
           sells + "for $p in //p where some $s in //s satisfies local:m($p, $s) return $p",
           sells + "for $p in //p return //s[local:m($p, .)]",
           two + "for $p in //p, $s in //s where local:m($s/@v, $p/@n, 1) return $s",
           two + "for $p in //p, $s in //s[@v != 'x'] where local:m($p/@n, $s/@v, 1) return $s",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  // The third argument may fail, and is evaluated for each pair.
  for (const std::string& text : {
           two + "for $p in //p, $s in //s where local:m($s/@v, $p/@n, 1 idiv $p/@n) return $s",
           std::string("declare function local:r($p, $s) { $s/@x = $p/@id and "
                       "local:r($p, $s/..) }; "
                       "for $p in //p, $s in //s where local:r($p, $s) return $s"),
       }) {
    EXPECT_EQ(joinsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(ForJoins, AreRefusedWhereWhatIsLeftOutCouldBeTold) {
  // A later clause may fail, constructs or traces; the binding has a type.
  for (const char* text : {
           "for $p in //p, $s in //s, $i in xs:integer($s/@v + $p/@n) where $s/b/@p = $p/@id "
           "return $s",
           "for $p in //p, $s in //s, $i in <i/> where $s/b/@p = $p/@id return $s",
           "for $p in //p, $s in //s, $i in trace($s/@v, 't') where $s/b/@p = $p/@id return $s",
           "for $p in //p, $s as element() in //s where $s/b/@p = $p/@id return $s",
           "for $p in //p, $s in //s where $s/b/@p != $p/@id return $s",
           "for $p in //p, $s in //s where $p/@n + $s/@v = 3 return $s",
           "for $p in //p, $s in //s where $p/@n + $s/@v = 3 and $s/b/@p = $p/@id return $s",
       }) {
    EXPECT_EQ(joinsIn(text), 0U) << text;
    resultOf(text);
  }
}

TEST(ForJoins, RaiseTheErrorOfAKeyWhereItAlwaysComesUp) {
  EXPECT_EQ(onlyResultOf("for $p in //p, $s in //s where $p/@n = xs:integer($s/@v)\n return $s")
                .substr(0, 5),
            "error");
  resultOf(
      "for $p in //p, $s in //s where $p/@id = $s/b/@p and $p/@n = xs:integer($s/@v) "
      "return $s");
  resultOf("for $p in //p, $s in //s where exactly-one($s/b/@p) = $p/@id return $s");
  resultOf(
      "for $p in //p, $s in //s, $i in //i where $s/@i = $i/@id and "
      "xs:integer($s/@v) = $p/@n return $s");
}

// Persons are found by the sales of an item although the clause of the sales comes later.
TEST(ForJoins, LookAheadThroughALaterClause) {
  EXPECT_EQ(joinsIn("for $i in //i, $p in //p, $s in //s "
                    "where $i/@id = $s/@i and $p/@id = $s/b/@p return $s"),
            2U);
  EXPECT_EQ(joinsIn("for $i in //i, $p in //p, $s in //s where $i/@id = $s/@i return $s"), 1U);
  for (const char* text : {
           "for $i in //i, $p in //p, $s in //s "
           "where $p/@id = $s/b/@p and $i/@c = $p/@c and $i/@id = $s/@i return ($i, $p, $s)",
           "for $i in (//i, //s/@i), $p in //p, $s in (//s, <s i='i3'><b p='p3'/></s>) "
           "where $i/@id = $s/@i and $p/@id = $s/b/@p return ($i, $p, $s/@i)",
           "for $i in (1, //i), $p at $n in //p, $s in //s "
           "where $i = $s/@i and $p/@id = $s/b/@p return ($n, $s)",
           "for $i in //i, $p in //p, $s in //s[xs:integer(@v) > 0] "
           "where $i/@id = $s/@i and $p/@id = $s/b/@p return ($i, $p, $s)",
           "for $i in //i, $p in //p, $s in (//s, 1) "
           "where $i/@id = $s/@i and $p/@id = $s/b/@p return ($i, $p, $s)",
       }) {
    resultOf(text);
  }
}

// "if" in the return clause asks as "where" does.
TEST(ForJoins, TakeTheConditionOfTheReturnClause) {
  for (const char* text : {
           "for $p in //p return count(for $s in //s return if ($s/b/@p = $p/@id) then $s else ())",
           "for $p in //p, $s in //s return if ($s/b/@p = $p/@id) then ($p/@id, $s/@i) else ()",
           "for $p in //p return sum(for $s in //s return if ($s/b/@p = $p/@id) then 1 else 0)",
           "for $i in 1 to 20 return sum((for $s in //s[@v != 'x'] return "
           "(if ($s/@v < $i) then $s/@v else 0)))",
           "for $p in //p return //i/sum(for $s in //s return if ($s/@i = $p/@id) then 1 else 0)",
           "for $p in //p return sum(for $s in //s return if ($s/@v < $p/@n) then -0e0 else 0)",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  for (const char* text : {
           "for $p in //p return sum(for $s in //s return if ($s/b/@p = $p/@id) then 1 else 2)",
           "for $p in //p return avg(for $s in //s return if ($s/b/@p = $p/@id) then 1 else 0)",
           "for $p in //p return sum(for $s in //s return if ($s/@i = $p/@id) then 1 else 0, 7)",
           "for $p in //p return sum(for $s in //s return if ($s/@i = $p/@id) then 'a' else 0)",
           "for $p in //p return sum(for $s in //s, $b in $s/b return "
           "if ($b/@p = $p/@id) then 1 else 0)",
           "for $p in //p return for $s in //s return if ($s/b/@p = $p/@id) then $s else trace(1, "
           "'')",
       }) {
    EXPECT_EQ(joinsIn(text), 0U) << text;
    resultOf(text);
  }
}

// --- quantifiers ---------------------------------------------------------------------------------

TEST(QuantifierJoins, FindWhatSomeAsksFor) {
  constexpr const char* text =
      "for $p in //p where some $s in //s satisfies $s/b/@p = $p/@id "
      "return $p/@id";
  EXPECT_EQ(joinsIn(text), 1U);
  EXPECT_EQ(resultOf(text).size(), 13U);
  EXPECT_EQ(joinsIn("for $p in //p where some $s in //s, $i in //i satisfies $s/b/@p = $p/@id and "
                    "$s/@i = $i/@id and $i/@c = $p/@c return $p"),
            2U);
  resultOf(
      "for $p in //p where some $s in //s, $i in //i satisfies $s/b/@p = $p/@id and "
      "$s/@i = $i/@id and $i/@c = $p/@c return $p");
  resultOf("for $p in //p where some $s in //s, $b in $s/b satisfies $b/@p = $p/@id return $p");
}

TEST(QuantifierJoins, FindWhatContradictsEvery) {
  for (const char* text : {
           "for $p in //p where every $s in //s satisfies not($s/b/@p = $p/@id) return $p/@id",
           "for $p in //p where every $s in //s satisfies $s/b/@p != $p/@id return $p/@id",
           "for $p in //p where every $s in //s satisfies $s/@i != $p/@id return $p/@id",
           "for $p in //p where every $s in //s satisfies number($s/@v) != $p/@n return $p/@id",
           "for $p in //p where every $s in //s satisfies $s/@v >= $p/@n return $p/@id",
           "for $p in //p where every $s in //s satisfies number($s/@v) > number($p/@n) return $p",
           "for $p in //p where every $s in //s satisfies $s/@i ne $p/@id return $p/@id",
           "for $p in //p where every $s in //s satisfies $s/b/@p ne $p/@id return $p/@id",
       }) {
    EXPECT_EQ(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  EXPECT_EQ(joinsIn("for $p in //p where every $s in //s satisfies $s/@i = $p/@id return $p"), 0U);
}

TEST(QuantifierJoins, InConditionsAreKeysOfTheItem) {
  for (const char* text : {
           "for $p in //p, $s in //s where some $b in $s/b satisfies $b/@p = $p/@id return $s",
           "for $p in //p return //s[some $b in b satisfies $b/@p = $p/@id]",
           "for $p in //p return //s[some $b in b satisfies $b/@p eq $p/@id]",
       }) {
    EXPECT_GE(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  // The same for the probe.
  for (const char* text : {
           "for $s in //s for $p in //p where some $b in $s/b satisfies $b/@p = $p/@id return $p",
           "for $s in //s for $p in //p where some $b in $s/b satisfies $b/@p eq $p/@id return $p",
           "for $s in //s for $p in //p where $s/b[@p = $p/@id] return $p",
           "for $s in //s for $p in //p where exists($s/b[@p = $p/@id]) return $p",
       }) {
    EXPECT_GE(joinsIn(text), 1U) << text;
    resultOf(text);
  }
  // The probe reads the item as well.
  resultOf("for $p in //p return //s[some $b in b satisfies $b/@p = @i]");
  resultOf("for $p in //p return //s[b[@p = $p/@id]]");
  resultOf("for $p in //p return //s[exists(b[@p = $p/@id])]");
  resultOf("for $p in //p, $s in //s where $s/b[@p = $p/@id] return $s");
  resultOf("for $p in //p where every $s in //s satisfies not($s/b[@p = $p/@id]) return $p");
}

TEST(QuantifierJoins, FindNodes) {
  for (const char* text : {
           "let $l := //s[@v > 20] return //s[some $o in $l satisfies $o is .]/@v",
           "let $l := //s return //b[some $o in $l satisfies $o is ..]/@p",
           "let $l := //b return //s[some $o in $l satisfies $o/.. is .]/@v",
           "let $l := //b return //p[every $o in $l satisfies not($o/.. is .)]/@v",
           "for $s in //s, $b in //b where $b/.. is $s return $b",
           "for $s in //s, $b in //b where $s is $b/../self::s[@v = 3] return $b",
           "for $s in //s, $t in //s where $t is ($s, $s) return $t",
           "for $s in //s, $t in //s where $t is $s/b return $t",
           "for $s in //s, $t in (//s, 1) where $t is $s return $t",
           "for $s in //s, $t in //s where $t/b is $s/b[1] return $t",
       }) {
    EXPECT_GE(joinsIn(text), 1U) << text;
    resultOf(text);
  }
}

// The variable keeps the item that was looked at last.
TEST(QuantifierJoins, LeaveWhatThePlainWayLeaves) {
  resultOf("for $p in //p return ((some $s in //s satisfies $s/b/@p = $p/@id), $s)");
  resultOf("for $p in //p return ((every $s in //s satisfies not($s/b/@p = $p/@id)), $s)");
  resultOf(
      "for $p in //p return ((some $s in //s, $i in //i satisfies "
      "$s/b/@p = $p/@id and $s/@i = $i/@id), $s, $i)");
  resultOf(
      "for $p in //p return ((some $a in //nothing, $s in //s satisfies "
      "$s/b/@p = $p/@id), $s)");
  resultOf(
      "for $p in //p return ((some $s in //s, $a in //nothing[$s], $i in //i satisfies "
      "$s/b/@p = $p/@id), $s)");
}

// --- steps ---------------------------------------------------------------------------------------

TEST(StepJoins, TakeThePredicateThatJoinsBest) {
  EXPECT_EQ(joinsIn("for $p in //p return //s[b/@p = $p/@id]"), 1U);
  EXPECT_EQ(joinsIn("for $p in //p return //s[@v][b/@p = $p/@id]"), 1U);
  EXPECT_EQ(joinsIn("for $p in //p return //s[b/@p = $p/@id][@i = ('i1', 'i2')]"), 1U);
  resultOf("for $p in //p return //s[b/@p = $p/@id][@i = ('i1', 'i2')]");
  resultOf("for $p in //p return //s[@v > 10][b/@p = $p/@id]");
  resultOf("for $p in //p return //s[xs:integer(@v) > 10][b/@p = $p/@id]");
}

TEST(StepJoins, AreRefusedWhereAPositionCounts) {
  for (const char* text :
       {"for $p in //p return //s[b/@p = $p/@id][1]", "for $p in //p return //s[2][b/@p = $p/@id]",
        "for $p in //p return //s[b/@p = $p/@id and position() = 2]",
        "for $p in //p return //s[b/@p = $p/@id][count(b)]"}) {
    EXPECT_EQ(joinsIn(text), 0U) << text;
    resultOf(text);
  }
}

// --- sets ----------------------------------------------------------------------------------------

TEST(Sets, AnswerForManyItems) {
  for (const char* text : {
           "let $ids := //b/@p return //p[@id = $ids]/@id",
           "//p[@id = //b/@p]/@id",
           "//b/@p = //p/@id",
           "let $v := //s/@v return //p[@n < $v]",
           "let $v := //s/@v return //p[number(@n) < $v]",
           "let $v := //s[@v != 'x']/@v return //p[number(@n) >= $v]",
           "let $v := (//s/@v, 3) return //p[@n = $v]",
           "let $v := (1 to 30) return //p[@n = $v]",
           "let $v := //b/@p return //p[$v = @nothing]",
           "let $v := (//p/@n, xs:date('2004-01-01')) return //p[@n = $v]",
           "let $v := (1 to 100) return for $p in //p return count($p/@nothing = $v)",
           "let $v := (1 to 100) return for $p in //p return count($v = $p/@nothing)",
           "let $v := (1 to 100, xs:date('2004-01-01')) return //p[count(@nothing = $v) = 0]/@id",
           "let $v := ((1 to 99), 'x') return for $p in //p return count($v > $p/@nothing)",
       }) {
    EXPECT_EQ(setsIn(text), 1U) << text;
    resultOf(text);
  }
  EXPECT_EQ(setsIn("let $ids := //b/@p return //p[@id != $ids]"), 0U);
}

// Of a long list that is never seen again each item is looked up in a set of the other one, which
// has at least 64.
TEST(Sets, AreOfTheListThatComesAgain) {
  for (const char* few :
       {"for $i in 1 to 80 return concat('p', 3 * $i)", "for $i in 1 to 80 return $i div 2",
        "for $i in 1 to 80 return 1e0 * $i", "(xs:token('p3'), 1 to 80)"}) {
    for (const char* many : {"for $j in 1 to 210 return concat('p', $i * $j mod 7)",
                             "for $j in 1 to 210 return 1000 + $i * ($j mod 50)",
                             "(for $j in 1 to 210 return 'q', 'p3', xs:date('2000-01-01'))",
                             "(for $j in 1 to 210 return number('x'), 21)"}) {
      const std::string head = "let $few := (" + std::string(few) + ") for $i in 1 to 2 return ";
      const std::string list = "(" + std::string(many) + ")";
      resultOf(head + "(" + list + " = $few)");
      resultOf(head + "($few >= " + list + ")");
    }
  }
}

// --- the switch ----------------------------------------------------------------------------------

TEST(Joins, ThereAreNoneInThePlainWay) {
  const auto query =
      compiled("for $p in //p, $s in //s[@i = $p/@id] where $s/@v = $p/@n return $s");
  const XQueryProgram program = programOf(*query);
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* clause = dyn_cast<XQueryBindingExpr>(program[place].expr);
    EXPECT_FALSE(clause && clause->picker());
    EXPECT_FALSE(isa<XQueryPlannedExpr>(program[place].expr));
  }
}

}  // namespace
}  // namespace xquery
