// Joins answer what the plain way answers: every query is run both ways, over generated data with
// everything odd that a key or a probe can be.
#include "Expr/RandomChoices.h"
#include "Functions/FunctionsTesting.h"
#include "Plan/PlainAnswer.h"
#include "xquery/xquery.h"

#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace xquery {
namespace {

using functiontest::answer;
using plantest::plainAnswer;

class Generator : public RandomChoices {
 public:
  using RandomChoices::RandomChoices;

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
    return oneOf({item + "/@k",
                  item + "/c",
                  "string(" + item + "/@k)",
                  item + "/c[1]",
                  item + "/@k * 1",
                  "xs:integer(" + item + "/@k)",
                  "xs:decimal(" + item + "/c[1])",
                  "number(" + item + "/@k)",
                  item + "/(@k, c)",
                  "xs:token(" + item + "/@k)",
                  "5 * " + item + "/c",
                  item + "/@*",
                  "(" + item + "/@k, 1)",
                  "(" + item + "/@k, 'z')",
                  "name(" + item + "/c[1])",
                  "-" + item + "/c[1]",
                  "xs:float(" + item + "/@k)",
                  "xs:byte(" + item + "/@k)",
                  "boolean(" + item + "/@k)",
                  "xs:anyURI(" + item + "/@k)",
                  item,
                  "count(" + item + "/c)",
                  item + "/text()",
                  item + "/c[2]",
                  item + "/c[. = '1']",
                  "concat(" + item + "/@k, '')",
                  item + "/descendant::c",
                  item + "/descendant-or-self::*/@k",
                  item + "/../i/@k",
                  "count(" + item + "[/])",
                  item + "/@k + 0.1"});
  }
  std::string comparison(const std::string& key, const std::string& probe) {
    const std::string sign =
        oneOf({"=", "=", "=", "<", "<=", ">", ">=", "eq", "lt", "le", "gt", "ge", "!="});
    if (below(12) == 0) return "starts-with(" + key + ", " + probe + ")";
    return below(2) ? key + " " + sign + " " + probe : probe + " " + sign + " " + key;
  }
  std::string items() {
    return oneOf({"/r/i", "//i", "$all", "$all[@k]", "(/r/i)", "/r/*[c]", "$r/i", "/r/i/..",
                  "$made", "$made", "$tree/i", "$tree//i", "unordered { /r/i }", "$tree/*/c/..",
                  "$many", "$tree/descendant::i", "$all/../i", "$made/descendant::c"});
  }
};

Value parsed(const std::string& text) {
  return NSXMLDocument::documentWithData(text, NSXMLNodePreserveWhitespace);
}

const std::string prolog =
    "let $r := /r let $all := /r/i let $one := <one/> "
    "let $made := for $i in /r/i return <i>{$i/@*, $i/node()}</i> "
    "let $tree := <r>{for $i in /r/i return <i>{$i/@*, $i/node()}</i>}</r> "
    "let $many := ($made, $made, $all, $made/c, $made/@k) ";

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
    if (more == 5) where += " and (some $v in ($x/c, 1) satisfies $v = $p)";
    if (more == 6) where = "(some $v in ($x/c, 1) satisfies $v = $p) and " + where;
    if (more == 7) where = "count($one/..) = 0 and " + where;
    const std::string position = generate.below(3) == 0 ? " at $i" : "";
    // Constructors take in nodes that have no parent yet.
    const std::string wrapped =
        generate.oneOf({"", "", "", ", count(<w>{$x}</w>/*)", ", count(<w>{$x, $one}</w>/*)",
                        ", count(<q><z><w>{$x}</w></z><d><c>1</c></d></q>)",
                        ", count(document { <w>{$x, $tree}</w> })"});
    const std::string number =
        "(if ($x instance of element()) then string($x/@n) else $x)" + wrapped;
    const std::string value = position.empty() ? "(" + number + ")" : "($i, " + number + ")";
    const std::string clause = "for $x" + position + " in " + generate.items();
    const std::string order = generate.below(4) == 0 ? " order by string($x)" : "";
    const std::string outer = prolog + "for $p in " + generate.probes() + " return (";
    const std::string joined = clause + " where " + where + order + " return " + value;
    EXPECT_EQ(answer(outer + joined + ", '|')", document),
              plainAnswer(outer + joined + ", '|')", document))
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
    const size_t more = generate.below(14);
    if (more == 4) predicate = "deep-equal(c, reverse(c)) and " + predicate;
    if (more == 5) predicate += " and matches(@n, '[0-4]')";
    if (more == 6) predicate += " and position() < 4";
    if (more == 7) predicate += " and last() > 9";
    if (more == 8) predicate = "position() > 2 and " + predicate;
    if (more == 9) predicate += " and (some $v in (c, 1) satisfies $v = $p)";
    if (more == 10) predicate = "(some $v in (@n) satisfies $v = '3') and " + predicate;
    if (more == 11) predicate += " and count(<w>{$one, .}</w>) = 1";
    if (more == 12) predicate = "@k = 1 to 5 and " + predicate;
    if (more == 13) predicate += " and count($one/..) = 0";
    if (more == 0) predicate += " and @n > 3";
    if (more == 1) predicate = "@n != 3 and " + predicate;
    if (more == 3) predicate = "c > 1 and " + predicate + " and $p = ('1', 1)";
    if (more == 2) predicate = "(" + predicate + ")";
    const std::string path = generate.items();
    const std::string rest =
        generate.oneOf({"", "", "/c", "/@n", "/..", "//c", "/following-sibling::*"});
    const std::string outer = prolog + "for $p in " + generate.probes() + " return (";
    const std::string joined = path + "[" + predicate + "]" + rest;
    EXPECT_EQ(answer(outer + joined + ", '|')", document),
              plainAnswer(outer + joined + ", '|')", document))
        << "seed " << seed << ": " << outer << joined << ")\n"
        << text;
  }
}

// Often enough that each comparison has a table of its own.
TEST(Join, SeveralComparisonsAnswerAsThePlainWay) {
  for (unsigned seed = 1; seed <= 600; ++seed) {
    Generator generate(seed);
    const std::string text = generate.document(seed % 3 == 0);
    const Value document = parsed(text);
    const bool isPredicate = generate.below(3) == 0;
    const std::string item = isPredicate ? "." : "$x";
    std::string conditions;
    for (size_t count = 2 + generate.below(2); count > 0; --count) {
      const std::string probe = generate.oneOf({"$p", "$p", "$q", "string($q)", "($p, $q)", "'1'"});
      conditions += generate.comparison(generate.key(item), probe);
      if (generate.below(6) == 0) conditions += " and " + item + "/@n > 3";
      if (generate.below(6) == 0) conditions += " and $q != '2'";
      if (count > 1) conditions += " and ";
    }
    const std::string items = generate.items();
    const std::string negated =
        "(every $x in " + items + " satisfies not(" + conditions + ")), $x/@n/string()";
    const std::string joined =
        isPredicate
            ? items + "[" + conditions + "]"
            : generate.oneOf({"for $x in " + items + " where " + conditions + " return $x",
                              "for $x at $i in " + items + " where " + conditions + " return $i",
                              "(some $x in " + items + " satisfies (" + conditions + ")), $x",
                              negated});
    const std::string query = prolog + "for $q in " + generate.probes() + ", $p in (" +
                              generate.probes() + ", " + generate.probes() + ") return (" + joined +
                              ", '|')";
    EXPECT_EQ(answer(query, document), plainAnswer(query, document))
        << "seed " << seed << ": " << query << "\n"
        << text;
  }
}

// A condition that reads no item may stand behind a probe that fails.
TEST(Join, ProbesFailBeforeTheConditionsBehindThem) {
  const Value document = parsed("<r><a x='1' k='1'/><a x='1' k='2'/><a x='2' k='3'/><b/><b/></r>");
  const std::string query =
      "for $o in //a[1] return for $u in (//b, 7), $z in //a"
      " where $o/@x = $z/@x and $u/@y = $z/@k and $u = $o/@none return $z/@k/string()";
  EXPECT_EQ(answer(query, document), plainAnswer(query, document));
  EXPECT_EQ(answer(query, document), "error 20 line 0 context item not a node");
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

// --- what must not differ ------------------------------------------------------------------------

const char* const twoLists =
    "<r><s><i k='1' n='1'><c>1</c></i><i k='1' n='2'><c>2</c></i><i k='2' n='3'/>"
    "<i k='1' n='4'><c>3</c></i></s><s><i k='1' n='5'><c>1</c></i><i k='2' n='6'/>"
    "<i k='1' n='7'><c>1</c></i><i k='1' n='8'/><i k='9' n='9'/></s></r>";

void expectPredicateAsPlain(const std::string& path, const std::string& predicate,
                            const std::string& rest = "") {
  const std::string rounds = "let $all := //i for $p in (1, 1, 2, 1) return ('|', ";
  const std::string filtered = rounds + path + "[" + predicate + "]";
  EXPECT_EQ(answer(filtered + rest + ")", parsed(twoLists)),
            plainAnswer(filtered + rest + ")", parsed(twoLists)))
      << path << "[" << predicate << "]" << rest;
}

TEST(Join, PredicatesSeeThePositionAndTheSizeOfTheirLists) {
  for (const char* path : {"//s/i", "$all", "//i", "/r/s/i"}) {
    for (const char* condition : {"position() = 2", "position() = last()", "last() = 9"}) {
      expectPredicateAsPlain(path, std::string("@k = $p and ") + condition, "/@n");
      expectPredicateAsPlain(path, std::string(condition) + " and @k = $p", "/@n");
    }
  }
}

TEST(Join, PredicatesSeeTheVariablesThatConditionsBeforeThemLeave) {
  for (const char* path : {"//s/i", "$all"}) {
    expectPredicateAsPlain(path, "(some $v in @n satisfies true()) and @k = $v", "/@n");
    expectPredicateAsPlain(path, "(some $v in @n satisfies true()) and @k = $p", "/c[. = $v]");
    expectPredicateAsPlain(path, "@k = $p and (some $v in @n satisfies true())", "/c[. = $v]");
  }
}

// "label=value;" for every trace, in order.
class Tracer : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value& value, const Ref<NSString>& label,
                              XQueryContext&) override {
    text += label->utf8() + "=" + functiontest::show(value) + ";";
  }
  std::string text;
};

std::string traces(const std::string& query, XQueryWay way = XQueryWay::Planned) {
  const auto compiled = XQuery::xqueryWithSource(query, XQueryLoading(), XQueryLimits(), way);
  const auto context = XQueryContext::xqueryContext();
  const auto tracer = std::make_shared<Tracer>();
  context->contextSetClient(tracer);
  Ref<XQueryError> error;
  const auto result = context->evaluateXQuery(*compiled, {}, parsed(twoLists), &error);
  return tracer->text + (error ? error->description()->utf8() : "");
}

TEST(Join, TracesComeInTheirOrder) {
  const std::string rounds = "for $p in (1, 1, 2, 1) return ";
  for (const char* predicate :
       {"trace(string(@n), 'a') and @k = $p", "@k = $p and trace(string(@n), 'a')",
        "@n and trace(string(@n), 'a') != '3' and @k = $p"}) {
    const std::string filtered = rounds + "//s/i[" + predicate + "]";
    const std::string rest = "/c[trace(string(.), 'b')]";
    EXPECT_NE(traces(filtered + rest), "");
    EXPECT_EQ(traces(filtered + rest), traces(filtered + rest, XQueryWay::Plain)) << predicate;
    const std::string list = "let $all := //i " + rounds + "$all[" + predicate + "]";
    EXPECT_EQ(traces(list + rest), traces(list + rest, XQueryWay::Plain)) << predicate;
  }
  for (const char* where :
       {"trace(string($x/@n), 'a') and $x/@k = $p", "$x/@k = $p and trace(string($x/@n), 'a')"}) {
    const std::string end = std::string(" where ") + where + " return trace($x/@n/string(), 'b')";
    EXPECT_EQ(traces(rounds + "for $x in //i" + end),
              traces(rounds + "for $x in //i" + end, XQueryWay::Plain))
        << where;
  }
}

TEST(Join, AProbeThatLooksOutSeesWhatTheRoundConstructs) {
  const std::string rounds =
      "let $e := <e/> let $all := (0, 0, 0, 0, 0, 0, 0, 0, 1, 1) for $p in 1 to 4 return"
      " for $x in $all ";
  const std::string end =
      "where $x = count($e/..) return ($x, if ($p = 3) then count(<w>{$e}</w>) else ())";
  EXPECT_EQ(answer(rounds + end), plainAnswer(rounds + end));
  const std::string guarded =
      "where count($e/..) = 0 and $x = 0 return ($x, if ($p = 3) then count(<w>{$e}</w>) else ())";
  EXPECT_EQ(answer(rounds + guarded), plainAnswer(rounds + guarded));
}

void expectAsPlain(const std::string& rounds, const std::string& clause, const std::string& rest,
                   const Value& document = Value()) {
  EXPECT_EQ(answer(rounds + clause + " where " + rest, document),
            plainAnswer(rounds + clause + " where " + rest, document))
      << clause << " where " << rest;
}

// The descendant axis of a last child of a last child goes on behind it, once it is one.
TEST(Join, DescendantsAreThoseOfTheRound) {
  const std::string made =
      "let $made := for $n in 1 to 9 return <i n='{$n}'><i/></i> "
      "for $p in 1 to 4 return ('|', ";
  const std::string wrap =
      "if ($p = 2) then count(<q><z><w>{$made[3]}</w></z><d><i>1</i></d></q>) else ())";
  expectAsPlain(made, "for $x in $made", "$x/descendant::i = 1 return string($x/@n), " + wrap);
  expectAsPlain(made, "for $x in $made",
                "$x/descendant::i = '1' and $x/@n > 0 return string($x/@n), " + wrap);
  expectAsPlain(made, "for $x in $made//i", "string($x) = ('', '1') return string($x), " + wrap);
  expectAsPlain(made, "for $x in (0, 0, 0, 0, 0, 0, 0, 0, 2)",
                "$x = count($made[3]//i) return ($x, " + wrap + ")");
  for (const char* path : {"$made[descendant::i = '1'", "$made//i[string(.) = ('', '1')"}) {
    const std::string filtered = made + "count(" + path;
    EXPECT_EQ(answer(filtered + "]), " + wrap), plainAnswer(filtered + "]), " + wrap)) << path;
  }
}

TEST(Join, ARootIsThatOfTheRound) {
  expectAsPlain(
      "let $e := <e/> let $all := (0, 0, 0, 0, 0, 0, 0, 0, 1, 1) for $p in 1 to 4 return ",
      "for $x in $all",
      "$x = count($e[/]) return ($x, if ($p = 3) then count(document { $e }) else ())");
  expectAsPlain("let $all := for $n in 1 to 9 return <e n='{$n}'/> for $p in 1 to 4 return ('|', ",
                "for $x in $all",
                "count($x[/]) = 1 return string($x/@n),"
                " if ($p = 2) then count(document { $all[5] }) else ())");
}

TEST(Join, WhatIsAroundTheNodesOfADocumentStays) {
  std::string text = "<r>";
  for (int i = 0; i < 5000; ++i) {
    const std::string n = std::to_string(i);
    text += "<g k='" + n + "'><i n='" + n + "'/></g>";
  }
  const Value document = parsed(text + "</r>");
  // Each of these would take a minute the plain way.
  for (const char* query : {"count(for $n in 1 to 5000 return //i[../@k = $n])",
                            "count(for $n in 1 to 5000 return //g[descendant::i/@n = $n])",
                            "count(for $n in 1 to 5000, $x in //g/i/../i where $x/../@k = $n"
                            " return $x)"}) {
    EXPECT_EQ(answer(query, document), answer("4999")) << query;
  }
}

// So nobody can tell of which items the predicate was asked.
TEST(Join, AnErrorInAPathLeavesTheSizeAsItWas) {
  for (const char* condition : {"c/xs:date(.) = '3'", "c[1]/xs:date(.) = '3'", "not(c/xs:date(.))",
                                "count((c[1], 1)[. = 1]/c) = 0", "@n"}) {
    expectPredicateAsPlain("$all", std::string(condition) + " and @k = $p and last() = 9", "/@n");
    expectPredicateAsPlain("$all", "last() = 9 and @k = $p and " + std::string(condition), "/@n");
  }
}

TEST(Join, TheVariableIsLeftAtTheLastItem) {
  const std::string rounds = "let $r := (for $p in (1, 1, 1) return for $x at $i in //i ";
  const std::string end =
      "where $x/@k = $p return 1) return"
      " ((some $v in (), $w in () satisfies true()), string($v/@n), $w)";
  EXPECT_EQ(answer(rounds + end, parsed(twoLists)), plainAnswer(rounds + end, parsed(twoLists)));
}

TEST(Join, RangesAreNotListed) {
  const Value document = parsed(twoLists);
  EXPECT_EQ(answer("for $p in 1 to 4 return count(//i[@k = 1 to 1000000000000])", document),
            answer("9, 9, 9, 9"));
  EXPECT_EQ(answer("for $p in 1 to 4 return count(//i[$p = (@k to 1000000000000)])", document),
            answer("6, 8, 8, 8"));
  EXPECT_EQ(answer("for $p in 1 to 4 return count(for $x in //i where $x/@k = 1 to 1000000000000"
                   " return 1)",
                   document),
            answer("9, 9, 9, 9"));
}

TEST(Join, LimitsOfAKeyComeUpWhereTheyAlwaysDo) {
  const Value document = parsed(twoLists);
  const std::string tooMany = "count(1 to $x/@n * 1000000000000)";
  for (const std::string& where :
       {tooMany + " = $p", "$p = 2 and " + tooMany + " = $p",
        "$p = 2 and " + tooMany + " = 1 and $x/@k = $p",
        std::string("$x/@n = 0 and count(1 to $p * 1000000000000) = 1 and $x/@k = $p")}) {
    expectAsPlain("for $p in (1, 1, 1) return ", "for $x in //i", where + " return 1", document);
  }
  const std::string filtered =
      "for $p in (1, 1, 1) return //i[$p = 2 and count(1 to @n * 1000000000000) = $p]";
  EXPECT_EQ(answer(filtered, document), plainAnswer(filtered, document));
}

// A deadline is no error of a key.
TEST(Join, ALimitOfTheEvaluationEndsTheMakingOfATable) {
  std::string text = "<r>";
  for (int i = 0; i < 100; ++i) text += "<i k='1'/>";
  const auto compiled = XQuery::xqueryWithSource(
      "for $p in (1, 2) return count(for $x in //i"
      " where $p = 2 and sum(1 to 100000) + $x/@k = $p return 1)");
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.duration = std::chrono::milliseconds(1);
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  EXPECT_FALSE(context->evaluateXQuery(*compiled, {}, parsed(text + "</r>"), &error));
  ASSERT_TRUE(error);
  EXPECT_EQ(error->msg()->utf8(), "limit: deadline passed");
}

// The error, or the first item, where values may take a quarter of a megabyte.
std::string answerInLittleMemory(const std::string& query, const Value& document = Value()) {
  const auto compiled = XQuery::xqueryWithSource(query);
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = size_t{1} << 18;
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  const auto result = context->evaluateXQuery(*compiled, {}, document, &error);
  return error ? error->description()->utf8() : functiontest::show(result->objects().front());
}

TEST(Join, NoLimitIsReachedForATable) {
  EXPECT_EQ(answerInLittleMemory("count(for $p in 1 to 3, $x in 1 to 20000 where $x = $p"
                                 " return 1)"),
            "integer 3");
  std::string text = "<r>";
  for (int i = 0; i < 2000; ++i)
    text += "<i k='" + std::to_string(i) + std::string(100, 'x') + "'/>";
  EXPECT_EQ(answerInLittleMemory("count(for $p in 1 to 5, $x in //i where concat($x/@k, 'y') ="
                                 " string($p) return 1)",
                                 parsed(text + "</r>")),
            "integer 0");
}

// Hands out documents and writes down what it was asked for.
class Shelf : public XQueryLoader {
 public:
  std::optional<XQueryResource> load(const NSURL& URL, XQueryLoadPurpose) override {
    asked += URL.absoluteString()->utf8() + ";";
    return XQueryResource{"<r k='1'/>", {}, "application/xml", {}};
  }
  std::string asked;
};

std::string loaded(const std::string& query, XQueryWay way = XQueryWay::Planned) {
  const auto compiled = XQuery::xqueryWithSource(query, XQueryLoading(), XQueryLimits(), way);
  const auto context = XQueryContext::xqueryContext();
  const auto shelf = std::make_shared<Shelf>();
  XQueryLoading loading;
  loading.loader = shelf;
  context->contextSetLoading(loading);
  Ref<XQueryError> error;
  const auto result = context->evaluateXQuery(*compiled, {}, parsed(twoLists), &error);
  return shelf->asked + (error ? error->description()->utf8() : "");
}

TEST(Join, NoDocumentIsFetchedThatThePlainWayDoesNotAskFor) {
  const std::string rounds = "for $p in (3, 3, 3) return ";
  const std::string page = "doc(concat('http://h/', ";
  const std::string predicates[] = {
      "@k = 9 and " + page + "@n))/r/@k = $p",
      "@k = $p and " + page + "@n))/r/@k",
      page + "@n, $p))/r/@k and @k = $p",
      page + "@n))/r/@k = $p and @k = $p",
  };
  for (const auto& predicate : predicates) {
    const std::string filtered = rounds + "//i[" + predicate + "]";
    EXPECT_EQ(loaded(filtered), loaded(filtered, XQueryWay::Plain)) << predicate;
  }
  const std::string clauses = page + "$x/@n))/r/@k";
  for (const auto& where : {"$x/@k = 9 and " + clauses + " = $p", "$p = 4 and " + clauses + " = $p",
                            clauses + " = $p", clauses + " = 1 and $x/@k = $p"}) {
    const std::string end = " where " + where + " return 1";
    EXPECT_EQ(loaded(rounds + "for $x in //i" + end),
              loaded(rounds + "for $x in //i" + end, XQueryWay::Plain))
        << where;
  }
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

}  // namespace
}  // namespace xquery
