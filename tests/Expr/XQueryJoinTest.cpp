// Joins answer what the plain way answers: every query is run in a form that may find its items in
// a table and in one that may not, over generated data with everything odd that a key or a probe
// can be.
#include "Expr/XQueryJoinTable.h"
#include "Functions/FunctionsTesting.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::answer;
using functiontest::boolean;
using functiontest::empty;
using functiontest::integer;
using functiontest::nan;
using functiontest::number;
using functiontest::sequence;
using functiontest::string;
using functiontest::untyped;

class Generator {
 public:
  explicit Generator(unsigned seed) : _random(seed) {}

  size_t below(size_t bound) {
    return std::uniform_int_distribution<size_t>(0, bound - 1)(_random);
  }
  std::string oneOf(const std::vector<std::string>& choices) {
    return choices[below(choices.size())];
  }

  // Elements "i" with any number of keys, as attributes and as children.
  std::string document(bool isRegular) {
    const std::vector<std::string> regular = {"1", "2", "3", "10", "7"};
    const std::vector<std::string> odd = {"1",   "01",   " 1 ", "1.0", "x",   "",
                                          "NaN", "INF",  "-0",  "0",   "2e0", "a b",
                                          "2",   "true", "é",   "10",  "9",   "1e400"};
    const auto& keys = isRegular ? regular : odd;
    std::string text = "<r>";
    for (size_t i = 0, count = 6 + below(20); i < count; ++i) {
      const bool hasAttribute = below(8) > 0;
      text += "<i n='" + std::to_string(i) + "'";
      if (hasAttribute) text += " k='" + oneOf(keys) + "'";
      text += ">";
      for (size_t k = isRegular ? 1 : below(3); k > 0; --k) text += "<c>" + oneOf(keys) + "</c>";
      text += "</i>";
    }
    return text + "</r>";
  }

  std::string probes() {
    return oneOf({"//i/@k", "//c", "('1', '2', 'x')", "(1, 2, 3)", "(1e0, 2e0, 1e0 div 0)",
                  "(1.0, 2.5, 0.1)", "(xs:float('1'), xs:float('0.1'))", "('NaN', number('x'))",
                  "(xs:date('2004-10-29'), 1)", "(true(), false())", "(xs:token('1'), 'x')",
                  "(xdt:untypedAtomic('1'), xdt:untypedAtomic('y'))",
                  "(9007199254740993, 9007199254740992)", "(1, 'x', 2.5e0)", "(-0e0, 0)",
                  "(1.00000000000000000001, 1)", "//nothing", "//i"});
  }
  std::string key(const std::string& item) {
    return oneOf({item + "/@k", item + "/c", "string(" + item + "/@k)", item + "/c[1]",
                  item + "/@k * 1", "xs:integer(" + item + "/@k)", "xs:decimal(" + item + "/c[1])",
                  "number(" + item + "/@k)", item + "/(@k, c)", "xs:token(" + item + "/@k)",
                  "5 * " + item + "/c", item + "/@*", "(" + item + "/@k, 1)",
                  "(" + item + "/@k, 'z')"});
  }
  std::string comparison(const std::string& key, const std::string& probe) {
    const std::string sign =
        oneOf({"=", "=", "=", "<", "<=", ">", ">=", "eq", "lt", "le", "gt", "ge", "!="});
    return below(2) ? key + " " + sign + " " + probe : probe + " " + sign + " " + key;
  }
  std::string items() {
    return oneOf({"/r/i", "//i", "$all", "$all[@k]", "(/r/i)", "/r/*[c]", "$r/i", "/r/i/.."});
  }

 private:
  std::mt19937 _random;
};

Value parsed(const std::string& text) {
  return NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
}

const std::string prolog = "let $r := /r let $all := /r/i ";

TEST(Join, ForClausesAnswerAsThePlainWay) {
  for (unsigned seed = 1; seed <= 1500; ++seed) {
    Generator generate(seed);
    const std::string text = generate.document(seed % 3 == 0);
    const Value document = parsed(text);
    const std::string probe = generate.oneOf({"$p", "$p", "$p", "($p, 2)", "string($p)", "$p/@k"});
    std::string where = generate.comparison(generate.key("$x"), probe);
    const size_t more = generate.below(9);
    if (more == 0) where += " and $x/@n > 3";
    if (more == 1) where = "$x/@n != 3 and " + where;
    if (more == 3) where = "$p = ('1', 1) and " + where + " and $x/c";
    if (more == 4) where = "$x/c > 1 and ($p != '2' and " + where + ")";
    if (more == 2) where = "(" + where + ")";
    const std::string position = generate.below(3) == 0 ? " at $i" : "";
    const std::string value = position.empty() ? "string($x/@n)" : "($i, string($x/@n))";
    const std::string clause = "for $x" + position + " in " + generate.items();
    const std::string order = generate.below(4) == 0 ? " order by $x/@n" : "";
    const std::string outer = prolog + "for $p in " + generate.probes() + " return (";
    const std::string joined = clause + " where " + where + order + " return " + value;
    const std::string plain = clause + " let $u := 1 where " + where + order + " return " + value;
    EXPECT_EQ(answer(outer + joined + ", '|')", document),
              answer(outer + plain + ", '|')", document))
        << "seed " << seed << ": " << outer << joined << ")\n"
        << text;
  }
}

TEST(Join, PredicatesAnswerAsThePlainWay) {
  for (unsigned seed = 1; seed <= 1500; ++seed) {
    Generator generate(seed);
    const std::string text = generate.document(seed % 3 == 0);
    const Value document = parsed(text);
    const std::string probe = generate.oneOf({"$p", "$p", "$p", "($p, 2)", "string($p)", "$p/@k"});
    std::string predicate = generate.comparison(generate.key("."), probe);
    const size_t more = generate.below(6);
    if (more == 0) predicate += " and @n > 3";
    if (more == 1) predicate = "@n != 3 and " + predicate;
    if (more == 3) predicate = "c > 1 and " + predicate + " and $p = ('1', 1)";
    if (more == 2) predicate = "(" + predicate + ")";
    const std::string path = generate.items();
    const std::string rest =
        generate.oneOf({"", "", "/c", "/@n", "/..", "//c", "/following-sibling::*"});
    const std::string outer = prolog + "for $p in " + generate.probes() + " return (";
    const std::string joined = path + "[" + predicate + "]" + rest;
    const std::string plain = path + "[" + predicate + "][true()]" + rest;
    EXPECT_EQ(answer(outer + joined + ", '|')", document),
              answer(outer + plain + ", '|')", document))
        << "seed " << seed << ": " << outer << joined << ")\n"
        << text;
  }
}

// --- what joins are and are not ------------------------------------------------------------------

TEST(Join, ARoundMayBeginAnotherOneOfTheSameExpression) {
  EXPECT_EQ(answer("declare function local:f($k, $n) {"
                   " for $x in //i where $x/@k = $k"
                   " return ($n, if ($n < 3) then local:f($x/@next, $n + 1) else ()) };"
                   "for $k in ('1', '2', '1', '2') return (local:f($k, 1), '|')",
                   parsed("<r><i k='1' next='2'/><i k='2' next='1'/><i k='3'/><i k='4'/>"
                          "<i k='5'/><i k='6'/><i k='7'/><i k='8'/><i k='9'/></r>")),
            answer("for $k in 1 to 4 return (1, 2, 3, '|')"));
}

TEST(Join, ConstructedItemsAreMadeAnewForEveryRound) {
  EXPECT_EQ(answer("count(for $p in (1, 1, 1) return"
                   " for $x in (<a/>, <a/>, <a/>, <a/>, <a/>, <a/>, <a/>, <a/>)"
                   " where count($x/b) = $p - 1 return $x)"),
            answer("24"));
}

TEST(Join, TheItemsAreThoseOfTheRound) {
  const Value document = parsed("<r><s><i k='1' n='a'/></s><s><i k='1' n='b'/></s></r>");
  EXPECT_EQ(answer("for $s in (//s, //s) return (for $x in $s/i where $x/@k = 1 return"
                   " string($x/@n), $s/i[@k = '1']/string(@n))",
                   document),
            answer("'a', 'a', 'b', 'b', 'a', 'a', 'b', 'b'"));
}

TEST(Join, TwoEvaluationsHaveTablesOfTheirOwn) {
  const auto compiled = XQuery::xqueryWithSource(
      "count(for $p in ('1', '2', '3') return for $x in //i where $x/@k = $p return $x)");
  const auto context = XQueryContext::xqueryContext();
  const auto count = [&](const std::string& text) {
    const auto result = context->evaluateXQuery(*compiled, {}, parsed(text));
    return cast<NSNumber>(result->objects().front())->longLongValue();
  };
  const std::string tail = "<i/><i/><i/><i/><i/><i/><i/></r>";
  EXPECT_EQ(count("<r><i k='1'/><i k='3'/><i k='3'/>" + tail), 3);
  EXPECT_EQ(count("<r><i k='1'/>" + tail), 1);
}

TEST(Join, AnErrorOfTheReturnClauseComesUpInItsTurn) {
  const Value document = parsed("<r><i k='1'/><i k='2'/><i k='1'/><i k='x'/><i/><i/><i/><i/></r>");
  const std::string round = "for $p in (3, 2, 1) return for $x in //i where $x/@k = $p return ";
  EXPECT_EQ(answer(round + "error((), 'met')", document).substr(0, 6), "error ");
}

// Each of these would take a minute the plain way.
TEST(Join, TakesTimeInProportionToItsItems) {
  std::string text = "<r>";
  for (int i = 0; i < 10000; ++i) {
    text += "<i k='" + std::to_string(i) + "'><v>" + std::to_string(i * 7 % 10000) + "</v></i>";
  }
  const Value document = parsed(text + "</r>");
  for (const char* query :
       {"count(for $a in //i, $b in //i where $a/v = $b/@k return $b)",
        "count(for $a in //i for $b in //i where $b/@k eq string($a/v) return $b)",
        "count(for $a in //i, $b in //i where $b/v >= 0 and $a/v = $b/@k and $b return $b)",
        "count(for $a in //i, $b in //i where $a/v >= 0 and $b/@k = $a/v return $b)",
        "count(for $a in //i return //i[@k = $a/v])",
        "count(for $a in //i return /r/i[v = $a/@k]/@k)",
        "count(let $all := //i for $a in $all return $all[v = $a/@k and @k])",
        "count(for $a in 0 to 9999 return //i[v = $a])"}) {
    EXPECT_EQ(answer(query, document), answer("10000")) << query;
  }
}

// --- tables --------------------------------------------------------------------------------------

XQueryJoinCondition condition(XQueryRelation::Test test, bool negated = false,
                              bool isValueComparison = false) {
  XQueryJoinCondition made;
  made.relation = {test, negated};
  made.isValueComparison = isValueComparison;
  return made;
}

// The positions that a table of the keys selects, those that have to be asked with a "?"; "plain"
// for the plain way. A null key stands for one that cannot be read.
std::string selected(const XQueryJoinCondition& by, const std::vector<Value>& keys,
                     const Value& probe) {
  XQueryJoinTable table(by, keys, [&](size_t position) { return keys[position]; });
  XQueryJoinTable::Selection selection;
  if (!table.select(probe, selection)) return "plain";
  std::string text;
  for (const auto& match : selection) {
    text += (text.empty() ? "" : " ") + std::to_string(match.position) + (match.isSure ? "" : "?");
  }
  return text;
}

constexpr auto equal = XQueryRelation::Equal;
constexpr auto less = XQueryRelation::Less;

TEST(JoinTable, TextsMeetEqualTexts) {
  const std::vector<Value> keys = {untyped("a"), string("b"), untyped("b"), untyped("")};
  EXPECT_EQ(selected(condition(equal), keys, untyped("b")), "1 2");
  EXPECT_EQ(selected(condition(equal), keys, sequence({string("a"), string("b")})), "0 1 2");
  EXPECT_EQ(selected(condition(equal), keys, string("c")), "");
}

TEST(JoinTable, AnItemOfManyKeysIsSelectedOnce) {
  const std::vector<Value> keys = {sequence({untyped("a"), untyped("b")}), untyped("b")};
  EXPECT_EQ(selected(condition(equal), keys, sequence({untyped("b"), untyped("a")})), "0 1");
}

TEST(JoinTable, UntypedKeysMeetNumbersAsNumbersAndOthersAreAsked) {
  const std::vector<Value> keys = {untyped("1"), untyped("01"), untyped("x"), string("1")};
  EXPECT_EQ(selected(condition(equal), keys, integer(1)), "0 1 2? 3?");
  EXPECT_EQ(selected(condition(less), {untyped("5"), untyped("50")}, integer(10)), "0");
}

TEST(JoinTable, NaNMeetsNothing) {
  EXPECT_EQ(selected(condition(less, true), {number(1), nan()}, number(1)), "0");
  EXPECT_EQ(selected(condition(equal), {number(1), nan()}, nan()), "");
}

TEST(JoinTable, DecimalsThatAreNoDoublesAreComparedThePlainWay) {
  const std::vector<Value> keys = {integer(9007199254740993), integer(1)};
  EXPECT_EQ(selected(condition(equal), keys, integer(1)), "plain");
  EXPECT_EQ(selected(condition(equal), keys, number(1)), "1");
  EXPECT_EQ(selected(condition(equal), {integer(1)}, integer(9007199254740993)), "plain");
}

TEST(JoinTable, KeysThatCannotBeReadOrMixKindsAreAsked) {
  const std::vector<Value> keys = {untyped("1"), Value(), integer(1), boolean(true), empty()};
  EXPECT_EQ(selected(condition(equal), keys, untyped("1")), "0 1? 2? 3?");
  EXPECT_EQ(selected(condition(equal), keys, empty()), "1? 2? 3?");
}

TEST(JoinTable, OtherProbesAreComparedThePlainWay) {
  EXPECT_EQ(selected(condition(equal), {untyped("true")}, boolean(true)), "plain");
  EXPECT_EQ(selected(condition(equal), {untyped("1")}, sequence({untyped("1"), integer(1)})),
            "plain");
  EXPECT_EQ(selected(condition(equal), {untyped("1")}, Value()), "plain");
}

TEST(JoinTable, AValueComparisonTakesOneKeyAndOneProbe) {
  const auto eq = condition(equal, false, true);
  EXPECT_EQ(selected(eq, {sequence({untyped("a"), untyped("b")}), untyped("a")}, string("a")),
            "0? 1");
  EXPECT_EQ(selected(eq, {untyped("a")}, sequence({string("a"), string("b")})), "plain");
  EXPECT_EQ(selected(eq, {untyped("1")}, integer(1)), "plain");
}

}  // namespace
}  // namespace xquery
