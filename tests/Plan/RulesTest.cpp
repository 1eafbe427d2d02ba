// Each rule: where it takes over, where it does not, and that nobody can tell.
#include "Expr/Paths/XQueryPath.h"
#include "Expr/XQueryLeaves.h"
#include "Plan/Operators/XQueryKeptExpr.h"
#include "Plan/Operators/XQueryNameComparison.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/Plan.h"
#include "Plan/PlanTesting.h"
#include "Plan/Rules.h"
#include "Platform/Base/WorkMeter.h"

#include <cstdlib>
#include <memory>
#include <set>

namespace xquery {
namespace {

using namespace plantest;

// Of the rules that have no tests of their own.
size_t operatorsIn(std::string_view text) {
  static const std::set<std::string_view> others = {
      "texts", "short paths", "constants",    "counts", "sets",
      "walks", "operands",    "constructors", "lists",  "nearby nodes"};
  return choicesIn(text, [](std::string_view rule) {
    return !others.contains(rule) && !rule.ends_with("-joins");
  });
}

// How many operators one rule puts into a query, behind those that are about every path.
size_t operatorsOf(std::string_view rule, std::string_view text) {
  std::vector<XQueryRule> rules;
  for (const XQueryRule& each : XQueryRules()) {
    if (each.name == "paths" || each.name == "walks" || each.name == rule) rules.push_back(each);
  }
  EXPECT_EQ(rules.size(), 3U) << rule;
  const auto query = compiled(text);
  const auto& internal = query->_internal();
  const auto planned = XQueryPlanned(*internal.prolog(), Ref<XQueryExpr>(internal.body()), rules);
  return OperatorList(*planned).operators.size();
}

std::vector<std::string> resultOf(std::string_view text, const Value& contextItem = {}) {
  return sameBothWays(text, contextItem).lines;
}

const Value& shop() {
  static const Value parsed = document(
      "<shop><product sku='1'><price>5</price></product><product sku='2'><price>7</price>"
      "</product><product sku='3'><price>x</price></product><line><sku>2</sku></line>"
      "<line><sku>3</sku></line></shop>");
  return parsed;
}

TEST(Rules, HaveNamesOfTheirOwn) {
  std::set<std::string_view> names;
  for (const XQueryRule& rule : XQueryRules()) EXPECT_TRUE(names.insert(rule.name).second);
  EXPECT_GE(names.size(), 3U);
}

TEST(Switch, OfTheCallLeavesTheQueryAsItIsWritten) {
  const auto plain = compiled("for $i in 1 to 3 return count(//a)", XQueryWay::Plain);
  EXPECT_TRUE(OperatorList(*plain->_internal().body()).operators.empty());
}

TEST(Switch, OfTheEnvironmentLeavesTheQueryAsItIsWritten) {
  const auto operators = [] {
    const auto query = compiled("for $i in 1 to 3 return count(//a)", XQueryWay::Planned);
    return OperatorList(*query->_internal().body()).operators.size();
  };
  ::setenv("XQUERY_PLAN", "0", 1);
  const size_t without = operators();
  ::unsetenv("XQUERY_PLAN");
  EXPECT_EQ(without, 0U);
  EXPECT_EQ(operators(), 1U);
}

std::string bodyOf(std::string_view text) {
  const auto query = compiled(text, XQueryWay::Planned);
  const XQueryProgram program = programOf(*query);
  std::string literals;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* literal = dyn_cast<XQueryLiteral>(program[place].expr);
    if (literal) literals += shownItem(*literal->literalValue()) + ";";
  }
  return literals;
}

// --- name tests ----------------------------------------------------------------------------------

// How many steps of the paths of a query have a choice of names, after planning.
size_t choicesIn(std::string_view text) {
  const auto query = compiled(text, XQueryWay::Planned);
  const XQueryProgram program = programOf(*query);
  size_t count = 0;
  for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
    const auto* planned = dyn_cast<XQueryPlannedExpr>(program[place].expr);
    const XQueryWalkedPath* path = planned ? planned->walkedPath() : nullptr;
    if (!path) continue;
    for (const XQueryWalkedStep& step : path->steps()) count += step.choice ? 1 : 0;
  }
  return count;
}

// Names with and without prefixes, and instructions, which have names too.
const Value& names() {
  static const Value parsed = document(
      "<r xmlns:p='u'><a x='1' y='2'><b/><p:a/><?a b?></a><c><a/>t<b z='3'/></c><?b c?>"
      "<d xmlns='v'><a/></d></r>");
  return parsed;
}

// The same with so many nodes that they are indexed.
const Value& manyNames() {
  static const Value parsed = [] {
    std::string xml = "<r xmlns:p='u'>";
    for (int i = 0; i < 200; ++i) xml += "<a x='1'><b/><p:a/><c><b y='2'/></c></a>";
    return document(xml + "</r>");
  }();
  return parsed;
}

TEST(TakeNames, TakesOverFiltersAndUnions) {
  for (const char* path :
       {"//*[self::a]",
        "//*[self::a or self::b]",
        "//*[name() = 'a']",
        "//*['a' eq local-name(.)]",
        "//node()[name() = ('a', 'b')]",
        "//element()[self::a or name(.) = 'c'][2]",
        "//(a | b)",
        "/r/(a | (b | c))",
        "//a/(@x | @y)[1]",
        "//(a | b)[@x]/..",
        "//*[(self::a) or (self::b)]",
        "//*/(parent::a | parent::c)",
        "//@*/(self::x | self::y)",
        "//*[self::a and self::b]",
        "//*:a",
        "//@*:x",
        "//node()[. instance of element(a)]",
        "//*[string(node-name(.)) = 'a']",
        "//*[local-name() = 'a' and string(namespace-uri()) = 'u']",
        "//*[self::a or (string(namespace-uri(.)) = ('u', 'v') and name() = ('a', 'p:a'))]",
        "/r/*/*[name() = 'b']/@z",
        "//a | //b",
        "(/r/a | /r/b) | /r/c"}) {
    EXPECT_EQ(choicesIn(path), 1U) << path;
    for (const Value& tree : {names(), manyNames()}) {
      resultOf(path, tree);
      resultOf(std::string("for $i in 1 to 3 return count(") + path + ")", tree);
    }
  }
}

TEST(TakeNames, LeavesOthersAlone) {
  for (const char* path : {"//*[name() != 'a']",
                           "//*[name() = '']",
                           "//*[self::a and @x]",
                           "//*[namespace-uri() = 'u']",
                           "//*[string(namespace-uri()) = '']",
                           "//*[string(node-name()) = 'a']",
                           "//*[. instance of element()]",
                           "//*[. instance of element(a)*][2]/last()",
                           "//*[b instance of element(b)]",
                           "//a[. instance of element(a)]",
                           "//p:*",
                           "//a[self::a]",
                           "//*[self::p:a]",
                           "//*[self::*]",
                           "//*[child::a]",
                           "//*[@x][self::a]",
                           "//(a | @x)",
                           "//(a | b[1])",
                           "//(a | b)/position()",
                           "//*[self::a]/position()",
                           "//*[name() = 'a']/last()",
                           "(//a, 1)/*[self::b]",
                           "(//a, 1)/(a | b)",
                           "//a/data(.)/(a | b)",
                           "//(a | ..)",
                           "//(a, b)",
                           "//(p:a | a)",
                           "//*[name() = $g]",
                           "//*[name() eq ('a', 'b')]",
                           "//*[self::a or 1]",
                           "//a | /r/b",
                           "//a | //@x",
                           "//a | //b[1]",
                           "a | b",
                           "//a, //b",
                           "unordered {//a | //b}"}) {
    EXPECT_EQ(choicesIn(path), 0U) << path;
    if (std::string_view(path).find("$g") == std::string_view::npos) resultOf(path, manyNames());
  }
}

TEST(TakeNames, FindsWhatTheConditionFinds) {
  for (const Value& tree : {names(), manyNames()}) {
    for (const char* test : {"*", "node()", "element()"}) {
      for (const char* condition :
           {"self::a", "name() = 'a'", "name() = 'p:a'", "local-name() = 'a'", "name() = ':a'",
            "name() = ('p:a', 'b')", "self::a or local-name() = 'b'", "name() = 'x'",
            ". instance of element(a)", ". instance of element(b)+", "string(node-name(.)) = 'a'",
            "'u' = string(namespace-uri())", "self::a and string(namespace-uri(.)) = 'u'",
            "local-name(.) = 'a' and string(namespace-uri(.)) = 'u' or self::b"}) {
        const std::string filter = std::string(test) + "[" + condition + "]";
        resultOf("(//" + filter + ", count(//" + filter + "))", tree);
        resultOf("/r/a[1]//" + filter + "[2]", tree);
        if (tree == names()) resultOf("//b/ancestor::" + filter, tree);
        resultOf("//a/descendant-or-self::" + filter + "[last()]", tree);
        resultOf("//@" + std::string(test) + "[" + condition + "]", tree);
        if (tree == names()) resultOf("//*/following::" + filter, tree);
      }
    }
  }
}

TEST(TakeNames, FindsWhatAWildcardFinds) {
  for (const Value& tree : {names(), manyNames()}) {
    for (const char* step : {"*:a", "*:b", "q:*", "@*:x", "@q:*", "descendant::*:c", "*:a[2]",
                             "q:*[last()]", "*:a[@x]/..", "preceding::*:b", "*:a/position()"}) {
      const std::string prolog = "declare namespace q = 'u'; ";
      resultOf(prolog + "(//" + step + ", count(//" + step + "))", tree);
      resultOf(prolog + "for $i in //* return name(($i/" + step + ")[1])", tree);
    }
  }
}

// The context may have a default namespace, of which names without a prefix then are.
TEST(TakeNames, ResolvesNamesInTheContext) {
  constexpr const char* prolog = "declare default element namespace 'v'; ";
  EXPECT_EQ(resultOf(std::string(prolog) + "count(//*[self::a or self::d])", names()).front(),
            "xs:integer 2");
  EXPECT_EQ(resultOf("<e xmlns='v'>{count(//(a | d))}</e>", names()).size(), 2U);
  resultOf("declare namespace q = 'u'; //(q:a | b)", names());
  resultOf("//*[self::p:a]", names());
  EXPECT_EQ(resultOf(std::string(prolog) + "count(//*[. instance of element(d)])", names()).front(),
            "xs:integer 1");
  resultOf("<e xmlns='v'>{count(//*[. instance of element(d)])}</e>", names());
}

// --- counts --------------------------------------------------------------------------------------

TEST(CountPaths, TakesOverWhereOnlyTheNumberMatters) {
  for (const char* text : {"count(//a)", "exists(//a/b)", "empty((//a))", "not(//x)",
                           "boolean(//a[b]/@x)", "exists(//a[position() < 2])"}) {
    EXPECT_GE(operatorsOf("counts", text), 1U) << text;
    resultOf(text, names());
  }
  for (const char* condition : {"count(*) > 0",
                                "count(*) >= 2",
                                "2 > count(*)",
                                "count(*) = 0",
                                "0 ne count(*)",
                                "count(*) le 1",
                                "b",
                                "b and @x",
                                "b or @z",
                                "not(b)",
                                "ancestor::c",
                                "*[2]",
                                "not(b[2])",
                                "b[1] or c[2]",
                                "ancestor::node()[3]",
                                "@*[2]",
                                "*[2.7]",
                                "*[0]",
                                "exists(./*[2])",
                                "count(*[2]) > 0",
                                "count(*[2]) > 1",
                                "*/b[2]",
                                "*[2]/b",
                                "*[2][1]",
                                "*[last()]"}) {
    const std::string text = std::string("//*[") + condition + "]";
    EXPECT_GE(operatorsOf("counts", text), 1U) << text;
    resultOf(text, names());
    resultOf(text, manyNames());
  }
  EXPECT_EQ(operatorsOf("counts", "if (//a) then 1 else 2"), 1U);
  EXPECT_EQ(operatorsOf("counts", "for $a in //a where $a/b return 1"), 1U);
  resultOf("for $a in (//a, 1, 'x', (//a, //b)) where exists($a/*[2]) return 1", names());
  resultOf("for $a in //a where $a/*[2] return $a/@x", manyNames());
}

TEST(CountPaths, LeavesOthersAlone) {
  for (const char* text :
       {"count((//a/string(.), 1))", "count((//a, <a/>))", "not((//a, 1))", "count(//a/string(.))",
        "exists($g)", "exists(//a/(1, 2))", "count(//a[<x/>])", "exists(//p:a)",
        "not(//a[trace(., '')])", "string(//a)"}) {
    EXPECT_EQ(operatorsOf("counts", text), 0U) << text;
  }
}

// The number of an integer is not that of a node, nor is the truth of what may be none.
TEST(CountPaths, LeavesErrorsWhereTheyArise) {
  for (const char* text :
       {"count((//a, 1)/b)", "exists((<a><b/></a>, 1)/b)", "not((1, <a/>)/b)", "exists(./a)",
        "for $i in (//a, 1) where $i/b return 2", "//a[exists((., 1)/b)]", "empty(1/a)"}) {
    resultOf(text, names());
    resultOf(text);
  }
}

// How much is walked shows in how often predicates are asked: each evaluation is a step of work.
int64_t stepsOf(const char* text) {
  const auto query = compiled(text, XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContext();
  context->_internal().setContextItem(manyNames(), 1);
  (void)query->_internal().body()->evaluateWithContext(*context);  // has the tree indexed
  const int64_t before = workMeter.stepsLeft;
  (void)query->_internal().body()->evaluateWithContext(*context);
  return before - workMeter.stepsLeft;
}

TEST(CountPaths, EndAsSoonAsTheAnswerIsCertain) {
  for (const char* text :
       {"exists(//a[not(@y)])", "empty(//b[..])", "not(/r/a[c]/c[b])", "count(//a[string(@x)]) > 2",
        "boolean(//(a | b)[not(string(@z))])", "exists(/r/*[self::a]/*[name() = 'b'])"}) {
    EXPECT_LT(stepsOf(text), 60) << text;
  }
  EXPECT_GT(stepsOf("count(//a[not(string(@y))])"), 200);
}

// Asking a node counts no step, as evaluating an expression does.
TEST(JoinConditions, AreAskedOfTheNodesOfAVariable) {
  for (const char* text : {"let $a := //a return count($a[@x = 'none'])",
                           "let $a := //a return count($a[b and not(@x = 'none')][@z])"}) {
    EXPECT_LT(stepsOf(text), 100) << text;
    resultOf(text, manyNames());
  }
  EXPECT_GT(stepsOf("let $a := //a return count($a[string(@x) = 'none'])"), 200);
}

TEST(TakeFirst, EndsAtTheLastNodeThatIsAskedFor) {
  for (const char* text :
       {"subsequence(//a[c], 1, 3)", "(//a[@x])[1]", "(/r/a[c]/b)[position() <= 2]",
        "(//a[b])[2]/c", "(/r/a[b])[position() = 1]"}) {
    EXPECT_LT(stepsOf(text), 60) << text;
    resultOf(text, manyNames());
    resultOf(text, names());
  }
  EXPECT_GT(stepsOf("subsequence(//a[string(@x)], 2)"), 200);
}

TEST(TakeFirst, KnowsWhatIsAskedOfAVariableAndByAPosition) {
  for (const char* text :
       {"let $l := //a[c] return ($l[1], $l[position() <= 3], subsequence($l, 2, 2))",
        "let $l := (//a[c]) return ($l)[2]/b", "for $x at $i in //a[c] where $i <= 2 return $x",
        "for $x at $i in //a[c] let $b := $x/b where 3 > $i and $b return ($b, $i)",
        "for $x at $i in //a[c], $y in $x/b where ($i eq 2) return $y"}) {
    EXPECT_EQ(operatorsOf("first", text), 1U) << text;
    EXPECT_LT(stepsOf(text), 100) << text;
    resultOf(text, manyNames());
    resultOf(text, names());
  }
  for (const char* text :
       {"let $l := //a[c] return ($l[1], count($l))", "let $l := //a[c] return $l[last()]",
        "let $l as item()* := //a[c] return $l[1]", "for $x at $i in //a[c] return ($x, $i)",
        "for $x at $i in //a[c] where $x/b and $i < 3 return $x",
        "for $x at $i in //a[c] let $b := $x/b + 1 where $i < 3 return $b",
        "for $x as element() at $i in //a[c] where $i < 3 return $x",
        "for $x at $i in //a[c] where $i < 3 or $i > 5 return $x",
        "(for $x at $i in //a[c] where $i < 3 return $x, some $y in //none satisfies $y, $y)"}) {
    EXPECT_EQ(operatorsOf("first", text), 0U) << text;
    resultOf(text, names());
  }
}

TEST(TakeFirst, SortsNoMoreThanIsAskedFor) {
  for (const char* text :
       {"(for $a in //* order by name($a) descending return $a)[position() <= 4]",
        "subsequence(for $a in //* order by string($a/@x) return ($a/@x, name($a)), 2, 3)",
        "let $s := for $a in //* order by count($a/*), name($a) return <n>{$a/@x}</n> return $s[1]",
        "for $a at $i in (for $a in //* order by $a/@x empty greatest return $a) where $i < 5 "
        "return $a",
        "(for $a in //* order by if ($a/@x) then 1 else 'a' return $a)[1]",
        "(for $a in //* order by xs:date('2004-10-29') return $a)[2]",
        "(for $a in //* order by xs:integer($a/@x) return $a)[2]",
        "(for $a in //* order by $a/b return $a)[. = 3]"}) {
    EXPECT_LE(operatorsOf("first", text), 1U) << text;
    resultOf(text, manyNames());
    resultOf(text, names());
  }
}

TEST(TakeFirst, EndsWithTheTuplesThatAreAskedFor) {
  for (const char* text :
       {"(for $a in //a where $a/c return $a/b)[1]",
        "subsequence(for $a in //a, $b in $a/b return ($b, $a), 2, 3)",
        "let $l := for $a in //a return ($a/@x, $a) return ($l[1], $l[position() < 3])",
        "(for $a in //a where $a/@x = ('1', '3') and $a/@x ne 'u' return $a/b)[1]"}) {
    EXPECT_EQ(operatorsOf("first", text), 1U) << text;
    EXPECT_LT(stepsOf(text), 100) << text;
    resultOf(text, manyNames());
    resultOf(text, names());
  }
  for (const char* text :
       {"(for $a in //a return xs:integer($a/@x))[1]", "(for $a in //a return <n/>)[1]",
        "(for $a in //a return trace($a, 't'))[1]", "(for $a in //a return $a)[last()]",
        "(for $a in //a where $a/@x = 1 return $a)[1]",
        "let $t := xs:token('1') return (for $a in //a where $a/@x = $t return $a)[1]",
        "((for $a in //a return $a)[1], some $y in //none satisfies $y, $y)"}) {
    EXPECT_EQ(operatorsOf("first", text), 0U) << text;
    resultOf(text, names());
  }
}

TEST(TakeFirst, LeavesAloneWhatMayComeInAnotherOrder) {
  for (const char* text :
       {"(//a/b)[1]", "(//a/ancestor::*)[1]", "subsequence(//a//b, 1, 1)", "(//b/..)[1]",
        "(a/preceding-sibling::*)[1]", "(//b//a[2])[1]", "(//a)[last()]", "(//a)[0]",
        "(//*/following::b)[1]", "subsequence(//a, 1.5, 1)"}) {
    EXPECT_EQ(operatorsOf("first", text), 0U) << text;
    resultOf(text, names());
  }
}

// --- walks ---------------------------------------------------------------------------------------

TEST(KeepTrails, CountsSiblingsBelowOneNode) {
  const Value nested = document(
      "<r><a><a x='1'/><b><a/><a y='2'/></b><a x='3'/></a><b/><a><b/><a/><b><b/></b></a><a/></r>");
  for (const char* step :
       {"a[1]", "a[2]", "a[3]", "*[2]", "b[1]", "a[2][@y]", "a[1][@x]/..", "a[0]", "a[2.5]",
        "(a | b)[2]", "*[self::b][2]", "node()[2]", "a[1]//a[1]", "a[2]/@x", "a[1][b or @x]",
        "a[2][1]", "a[1][position() = 1]", "a[1]/last()", "a[position() = 2]"}) {
    for (const Value& tree : {names(), manyNames(), nested}) {
      resultOf(std::string("//") + step, tree);
      resultOf(std::string("count(//") + step + ")", tree);
      resultOf(std::string("exists(//") + step + ")", tree);
      resultOf(std::string("(//") + step + ")[1]", tree);
      resultOf(std::string("for $i in //*[3] return $i//") + step, tree);
      resultOf(std::string("//b//") + step, tree);
      resultOf(std::string("unordered {//") + step + "}", tree);
    }
    resultOf(std::string("let $t := <r><a/><b><a/></b><a/></r> return ($t//") + step +
             ", <q>{$t}</q>//" + step + ")");
  }
  EXPECT_EQ(choicesOf("walks", "//a[2]"), 1U);
  EXPECT_EQ(choicesOf("walks", "//a[last()]"), 0U);
  EXPECT_EQ(choicesOf("walks", "//a[string(.)][2]"), 0U);
}

TEST(KeepTrails, KnowsQuantifiersAndFunctionsInPredicates) {
  for (const char* text :
       {"//a[some $x in b satisfies $x = 't']", "//a[every $x in * satisfies $x/@y]/..",
        "declare function local:f($n) {exists($n/b)}; //*[local:f(.)]",
        "//*[exists(for $x in b where $x/@x return $x)]"}) {
    EXPECT_EQ(choicesOf("walks", text), 1U) << text;
    resultOf(text, names());
    resultOf(text, manyNames());
  }
}

// --- conditions ----------------------------------------------------------------------------------

TEST(JoinConditions, TakesOverWhatCanBeAskedOfANode) {
  for (const char* condition :
       {"b and @x", "b or not(@z)", "not(b and c)", "(name() = 'a') or (b = 't')",
        "not(not(ancestor::c))", "not(@x = '1') and (.. or b)"}) {
    const std::string text = std::string("//node()[") + condition + "]";
    EXPECT_GE(choicesOf("conditions", text), 1U) << text;
    for (const std::string behind : {"", "/concat(position(), last())", "[2]", "[last()]", "/@x"}) {
      resultOf(text + behind, names());
      resultOf("/r/*/.." + text.substr(1) + behind, names());
    }
  }
  for (const char* condition : {"string(@x) and b", "b and 1", "not($g)", "b and p:c"}) {
    EXPECT_EQ(choicesOf("conditions",
                        std::string("declare variable $g external; //a[") + condition + "]"),
              0U)
        << condition;
  }
}

// An error that comes up later shows the focus that the last predicate left.
TEST(JoinConditions, LeaveTheFocusOfTheLastNodeAsked) {
  for (const char* text : {"//node()[b and @x]/nobody:a", "(/r/*[@x], 1)/b", "/r/*[b]/nobody:a",
                           "//b[@x = 1]/nobody:a", "//b[. = 1][@z]/nobody:b",
                           "/r/node()[name() = 'a']/nobody:a", "(//a, 1)[@x]/b"}) {
    resultOf(text, names());
  }
}

TEST(TakePositions, MakesTheNumberThePredicate) {
  EXPECT_EQ(bodyOf("//a[position() = 2]"), "xs:integer 2;");
  EXPECT_EQ(bodyOf("//a[2 eq position()]"), "xs:integer 2;");
  for (const char* text :
       {"//a[position() = 1]/@x", "/r/*[self::a][position() = 1]", "//b[@y][2 = position()]",
        "//a[position() = 0]", "//a[position() = 1.0]", "//a[position() >= 2]", "//a[position()]",
        "(//a)[position() = 2]", "//a[position() = (1, 2)]", "(//a, 1)/b[position() = 1]",
        "(//a, 1)[position() = 1]/b", "//a[position() = 1]/last()"}) {
    resultOf(text, names());
    resultOf(text, manyNames());
  }
}

// Worked out once for the nodes of a step, at the first of them.
TEST(TakePositions, TakesNumbersThatAreTheSameForAllNodes) {
  const std::string loop = "for $i at $n in (1, 2) return ";
  for (const char* path :
       {"/r/a[$n + 1]", "//b[$n + 1]/@y", "//a/b[$n - 5]", "//a/b[$n * 1.4]", "//a[$n + 1][1]",
        "//c/ancestor::*[$n + 0]", "//b/preceding-sibling::*[$n + 0]", "//a[b]/c[$n idiv 0]",
        "//none[$n idiv 0]", "//b[xs:integer('x') + $n]", "//a/b[count($i)]",
        "//*[self::a][$n + 1]", "(//b/../*[$n + 1], 'x')", "count(//a/b[$n + 1])",
        "exists(//b[$n + 0])"}) {
    EXPECT_EQ(choicesOf("positions", loop + path), 1U) << path;
    resultOf(loop + path, names());
    resultOf(loop + path, manyNames());
  }
  for (const char* path : {"//b[$n + last()]", "//a/b[position() + 0]", "//b[count(@y)]",
                           "//b[($n, 2)]", "//b[$n = 1]", "//a/b[@y][$n + 1]", "(//b)[$n + 1]",
                           "//b[if ($n = 1) then 1 else @y]", "(//b, 1)/a[$n + 1]"}) {
    EXPECT_EQ(choicesOf("positions", loop + path), 0U) << path;
    resultOf(loop + path, names());
    resultOf(loop + path, manyNames());
  }
}

// Children are walked from the last; of other nodes and items there is a list.
TEST(TakePositions, CountsFromTheBack) {
  for (const char* text : {"//a[last()]",
                           "//a/b[last()]/@y",
                           "/r/a[last() - 1]",
                           "//c/b[position() = last()]",
                           "//a/*[last() - 1 eq position()]",
                           "/r/node()[(last())]",
                           "//a/b[last() - 5]",
                           "//none[last()]",
                           "//a/text()[last()]",
                           "//a[b][last()]/@x",
                           "//a/b[last()][@y]",
                           "//a/b[last()][1]",
                           "//a/b[last()][last()]",
                           "/r/*[self::a][last()]",
                           "//b/@*[last()]",
                           "//c/ancestor::*[last()]",
                           "//b/preceding-sibling::*[last() - 1]",
                           "/r//b[last()]",
                           "/descendant::b[last()]",
                           "(//a)[last()]",
                           "(//b)[last() - 3]/..",
                           "(//a, 1)[last()]",
                           "(//a/b, 1)[position() = last()]",
                           "()[last()]",
                           "(1)[last() - 0]",
                           "(1)[last() - 1]",
                           "(//b)[@y][last()]",
                           "let $l := (//b, 'x') return $l[last() - 1]",
                           "let $l := //b return ($l[last()]/.., count($l[last()]))",
                           "count(//a/b[last()])",
                           "exists(//a[last() - 1])",
                           "(//a/b[last()])[1]",
                           "for $a in //a return $a/b[last()]",
                           "//a/(b)[last()]",
                           "//a[b[last()]/@y = 2]",
                           "(//a, 1)[last()][. = 1]",
                           "(//a)[last()]/last()"}) {
    EXPECT_GE(choicesOf("positions", text), 1U) << text;
    resultOf(text, names());
    resultOf(text, manyNames());
  }
  for (const char* text :
       {"//a[last() + 1]", "//a[last() - 1.5]", "//a[last() - @x]", "//a[last(1)]",
        "//a[position() != last()]", "//a[position() = last() - -1]", "(//a, 1)[last()]/b",
        "//a[(last(), 1)]", "//a[last() = 1]", "//a[not(last())]"}) {
    EXPECT_EQ(choicesOf("positions", text), 0U) << text;
    resultOf(text, names());
    resultOf(text, manyNames());
  }
}

// A recursion that ends where there are no nodes.
TEST(TakePositions, AsksNothingWithoutNodes) {
  const char* text =
      "declare function local:f($e) { count($e/*[local:f($e/*[1]) + 1]) }; local:f(/*)";
  resultOf(text, names());
  resultOf(text, manyNames());
}

// --- nearby nodes --------------------------------------------------------------------------------

TEST(FindNearbyNodes, TakesOverWhereAShortPathMeetsAVariable) {
  for (const char* condition :
       {"ancestor::a intersect $a", "$a intersect ancestor::a", "exists(b/text() intersect $a)",
        "not(ancestor-or-self::c intersect ($a))", "../b intersect $a", "@y and (.. intersect $a)",
        "empty($a/b intersect $a)", "ancestor::node() intersect $a"}) {
    const std::string text = std::string("for $a in //a return //b[") + condition + "]";
    EXPECT_EQ(operatorsOf("nearby nodes", text), 1U) << text;
    for (const char* items : {"//a", "(//a, //b, //c)", "(/, //@y, //text())", "(//a, 1)", "()"}) {
      const std::string other =
          std::string("for $a in ") + items + " return //*[" + condition + "]";
      resultOf(other, names());
      resultOf("let $a := " + std::string(items) + " return //*[" + condition + "]", manyNames());
    }
  }
}

TEST(FindNearbyNodes, AnswersTheNode) {
  for (const char* text : {"for $a in //a return //b/(ancestor::a intersect $a)",
                           "for $a in //a, $b in //b return count($b/ancestor::a intersect $a)",
                           "let $a := <a><b/></a> return $a/b/(.. intersect $a)",
                           "for $a in //a return (1, 2)/(ancestor::a intersect $a)",
                           "for $a in //a return ('x')[ancestor::a intersect $a]"}) {
    resultOf(text, names());
    resultOf(text, manyNames());
  }
}

TEST(FindNearbyNodes, LeavesOthersAlone) {
  for (const char* text : {"for $a in //a return //b[ancestor::a except $a]",
                           "for $a in //a return //b[. intersect $a]",
                           "for $a in //a return //b[following::a intersect $a]",
                           "for $a in //a return //b[ancestor::a[1] intersect $a]",
                           "declare variable $a := //a; //b[ancestor::a intersect $a]"}) {
    EXPECT_EQ(operatorsOf("nearby nodes", text), 0U) << text;
    resultOf(text, names());
  }
}

// --- members -------------------------------------------------------------------------------------

TEST(AskMembers, TakesOverWhereOneNodeMeetsASet) {
  for (const char* condition :
       {"exists(. intersect $set)", ". except $set", "count(. | $set) = count($set)",
        "count($set | .) > 200", "some $x in $set satisfies $x is .",
        "some $x in $set satisfies . is $x", "exists(@z intersect $set)"}) {
    const std::string text = std::string("let $set := //c/b return //b[") + condition + "]";
    EXPECT_EQ(operatorsOf("members", text), 1U) << text;
    resultOf(text, manyNames());
    resultOf(text, names());
  }
  EXPECT_EQ(operatorsIn("for $b in //b where exists($b intersect //c/b) return $b"), 2U);
  resultOf("for $b in //b where exists($b intersect //c/b) return $b", manyNames());
}

TEST(AskMembers, LeavesOthersAlone) {
  for (const char* text :
       {"let $set := //b return //a[exists(b intersect $set)]", "//b[exists(. intersect ../c)]",
        "let $set := //b return //b[every $x in $set satisfies $x is .]",
        "let $set := //b return //b[some $x in $set satisfies $x << .]",
        "let $set := //b return //b[some $x as item() in $set satisfies $x is .]",
        "let $set := //b return //b[some $x in $set satisfies $x is $x/.]",
        "let $set := //b return //b[exists(<b/> intersect $set)]",
        "let $set := //b return count(//b | $set)"}) {
    EXPECT_EQ(operatorsOf("members", text), 0U) << text;
    resultOf(text, names());
  }
}

// What is no node is an error, and a quantifier leaves its variable where it ended.
TEST(AskMembers, LeavesErrorsAndVariablesAsTheyAre) {
  for (const char* text :
       {"let $set := (//c/b, 1) return //b[exists(. intersect $set)]",
        "let $set := (//c/b, 1) for $b in //b return $b except $set",
        "let $set := (//b, //b) for $b in //b return count($b | $set)",
        "let $set := (//c/b, 1) for $b in //a/b return some $x in $set satisfies $x is $b",
        "for $b in //a[1]/b return some $x in //c/b, $y in () satisfies $x is $b",
        "let $set := //c/b for $b in //a return (some $x in $set satisfies $x is $b, "
        "some $y in (), $z in (1, 2) satisfies $y = 1)"}) {
    resultOf(text, manyNames());
    resultOf(text, names());
  }
}

// --- names ---------------------------------------------------------------------------------------

TEST(CompareNames, TakesOverFourForms) {
  for (const char* condition : {"name() = 'product'", "local-name(.) eq 'product'",
                                "'product' = name(.)", "('product') eq (local-name())"}) {
    const std::string text = std::string("count(//*[") + condition + "])";
    EXPECT_EQ(operatorsIn(text), 1U) << text;
    EXPECT_EQ(resultOf(text, shop()).front(), "xs:integer 3") << text;
  }
}

TEST(CompareNames, LeavesOthersAlone) {
  for (const char* condition : {"name() != 'a'", "name(..) = 'a'", "name() = 1", "name() = $g",
                                "name() = ('a', 'b')", "name() is 'a'", "node-name() = 'a'"}) {
    EXPECT_EQ(operatorsOf("names", std::string("//*[") + condition + "]"), 0U) << condition;
  }
}

TEST(CompareNames, LooksAtNamesAsTheyAreWritten) {
  const Value names = document("<p:a xmlns:p='u'><a/><?a b?><p:a a='1' p:a='2'/>a</p:a>");
  for (const char* which : {"name()", "local-name()"}) {
    for (const char* constant : {"'a'", "'p:a'", "''", "'p'"}) {
      resultOf(std::string("//node()[") + which + " = " + constant + "]", names);
      resultOf(std::string("//@*[") + which + " eq " + constant + "]", names);
    }
  }
  resultOf("(1, 2)[name() = 'a']");
  resultOf("declare function local:f() { name() = 'a' }; local:f()");
}

// --- constants -----------------------------------------------------------------------------------

TEST(FoldConstants, MakesOneLiteralOfWhatIsConstant) {
  EXPECT_EQ(bodyOf("$g = 2 * (3 + 4)"), "xs:integer 14;");
  EXPECT_EQ(bodyOf("$g < xs:date('2004-10-29')"), "xs:date 2004-10-29;");
  EXPECT_EQ(bodyOf("if (1 = 2 or 3 > 2) then () else ()").substr(0, 16), "xs:boolean true;");
  EXPECT_EQ(bodyOf("$g + ('5' cast as xs:double)"), "xs:double 5;");
  EXPECT_EQ(bodyOf("//a[-1]"), "xs:integer -1;");
}

TEST(FoldConstants, LeavesWhatFailsWhereItStands) {
  resultOf("if (1) then 2 else 1 idiv 0");
  EXPECT_EQ(resultOf("1 = \n (1 div 0)"),
            (std::vector<std::string>{"error 6 line 2 Division by zero"}));
  EXPECT_EQ(bodyOf("1 = (1 div 0)"), "xs:integer 1;xs:integer 1;xs:integer 0;");
}

// Objects that are equal and not the same are two results of a path.
TEST(FoldConstants, LeavesWhatIsHandedOn) {
  EXPECT_EQ(resultOf("count(//product/(1 + 1))", shop()).front(), "xs:integer 3");
  EXPECT_EQ(resultOf("for $i in 1 to 2 return 1 + 1").size(), 2U);
  EXPECT_EQ(resultOf("for $i in 1 to 2 return 1 + 1")[1], "xs:integer 2");
  resultOf("let $a := 1 + 1 return ($a, $a)");
  resultOf("declare function local:f() { 1 + 1 }; (local:f(), local:f())");
  resultOf("(for $i in 1 to 2 return zero-or-one(1 + 1))");
}

TEST(FoldConstants, WorksNothingLongOut) {
  EXPECT_EQ(operatorsIn("count(1 to 1000000000) = 1"), 0U);
  EXPECT_EQ(bodyOf("$g = xs:QName('a')"), "xs:string a;");
}

// --- invariants ----------------------------------------------------------------------------------

TEST(KeepInvariants, TakesOverWhateverTheFormOfTheLoop) {
  for (const char* text : {
           "for $i in 1 to 9 return count(//a)",
           "for $i in 1 to 9 where count(//a) = $i return $i",
           "for $i in 1 to 9 order by count(//a) return $i",
           "for $i in 1 to 9 for $a in //a return 1",
           "for $i in 1 to 9 let $a := //a return 1",
           "some $i in 1 to 9 satisfies //a = $i",
           "every $i in 1 to 9, $a in //a satisfies $i",
           "for $i in 1 to 9 return (some $a in //a satisfies $a = $i)",
           "$g[@sku = //line/sku]",
           "$g[number(price) = max($h/a/price[1])]",
           "$g/(//a)",
           "declare function local:f($a) { //a[. = 1] }; for $i in 1 to 9 return local:f($i)",
           "for $i in 1 to 9 return string-join(for $k in 1 to 9 return string(7), '')",
       }) {
    EXPECT_EQ(operatorsIn(text), 1U) << text;
  }
}

TEST(KeepInvariants, LeavesOthersAlone) {
  for (const char* text : {
           "count(//a)",                                  // no loop
           "for $i in //a return 1",                      // evaluated once
           "for $i in 1 to 9 return $i//a",               // another one each time
           "for $i in 1 to 9 let $k := $i return $k//a",  // the same in two steps
           "$g[.//a = 1]",                                // of the item
           "for $i in 1 to 9 return <a>{//b/<c/>}</a>",   // makes nodes
           "for $i in 1 to 9 return trace(//a, 'a')",     // the trace, but see below
           "$g[count(//a[position() = 1]) = position()]/b",
           "for $i in 1 to 9 return $k/a/b",   // as quickly done as looked up
           "for $i in 1 to 9 return 1 to 100"  // never made
       }) {
    const std::string_view query = text;
    const bool hasInner = query.find("trace") != query.npos || query.find("position") != query.npos;
    EXPECT_EQ(operatorsOf("invariants", text), hasInner ? 1U : 0U) << text;
  }
}

// One in the other: the inner loop leaves the outer variable as it is.
TEST(KeepInvariants, KeepsForTheInnermostLoopThatChangesNothing) {
  const char* text =
      "for $a in //product return for $b in //line return ($a//price[. > 0], $b//sku[. > 0])";
  EXPECT_EQ(operatorsIn(text), 2U);
  resultOf(text, shop());
}

TEST(KeepInvariants, AnswersTheSame) {
  for (const char* text : {
           "//product[@sku = //line/sku]/@sku/string()",
           "//product[number(price) = max(//price[. castable as xs:integer])]",
           "for $p in //product where some $l in //line satisfies $l/sku = $p/@sku return $p/price",
           "for $i in 1 to 3 return (//product)[$i]",
           "for $i in 1 to 3 return count(//product[@sku >= 2])",
           "for $i in 1 to 3 return exactly-one(//product)",
           "//product[exactly-one(//product) = 1]",
           "//product[exactly-one(//line[1]) = 2]",
           "//product/(for $k in (1, 2) return $k)",
           "declare function local:f($n) { if ($n = 0) then () else (//sku/text(), "
           "local:f($n - 1)) }; local:f(3)",
           "declare variable $g := //line; for $i in 1 to 3 return ($g//sku)[2]",
           "for $i in 1 to 3 return unordered {//product/@sku}",
           "for $i in (1, 2) return if ($i = 2) then //product/a:b else ()",
       }) {
    sameBothWays(text, shop());
  }
}

// The tree that the expression looks at grows while the loop runs.
TEST(KeepInvariants, SeeWhatIsTakenIn) {
  const char* text =
      "let $a := <a/> for $i in 1 to 3 return (<b>{$a}</b>, count($a/ancestor::node()))";
  EXPECT_EQ(operatorsIn(text), 1U);
  EXPECT_EQ(resultOf(text)[1], "xs:integer 1");
  sameBothWays(
      "let $d := document {<a><b/></a>} for $i in 1 to 3 "
      "return (<c>{$d/a/b}</c>, $d//b[1], count($d//node()))");
  sameBothWays("<a>{for $i in 1 to 3 return (<b/>, count(root(.)//b))}</a>", shop());
  sameBothWays("for $x in <a/> return <b>{for $i in 1 to 3 return ($x, count($x/../*))}</b>");
}

// A quantifier leaves its variables set, and so does one whose outcome was kept.
TEST(KeepInvariants, LeaveTheVariablesThatTheyLeave) {
  sameBothWays("for $i in 1 to 3 return ((some $q in (1, 2, 3) satisfies $q = 2), $q)");
  sameBothWays(
      "for $i in 1 to 3 return ((every $q in //sku satisfies $q = 2), $q, "
      "for $k in ($i, 7) return $q)",
      shop());
  sameBothWays(
      "for $i in 1 to 2 return ((for $k in (5, 6) return string($k)) = '6', "
      "some $a in (), $b in 1 satisfies $a = 6)");
}

// After an error the context keeps the focus in which it arose.
TEST(KeepInvariants, LeaveTheFocusOfAFailure) {
  const char* text =
      "for $i in 1 to 3 return if ($i < 3) then count((1, 2)[//a]) else "
      "//product/exactly-one(a)";
  sameBothWays(text, shop());
  sameBothWays("(1, 2)[exactly-one(//product/exactly-one(a))], //product/exactly-one(b)", shop());
}

class Tracer : public XQueryClient {
 public:
  void XQueryClientTraceValue(const Value&, const Ref<NSString>&, XQueryContext&) override {
    ++count;
  }
  int count = 0;
};

TEST(KeepInvariants, TraceAsOftenAsWritten) {
  const auto query =
      compiled("for $i in 1 to 5 return count(trace(for $k in //product return $k, 'a'))",
               XQueryWay::Planned);
  const auto context = XQueryContext::xqueryContext();
  const auto tracer = std::make_shared<Tracer>();
  context->contextSetClient(tracer);
  EXPECT_EQ(context->evaluateXQuery(*query, {}, shop())->count(), 5U);
  EXPECT_EQ(tracer->count, 5);
}

// A function that calls itself keeps other outcomes while the first one is found.
TEST(KeepInvariants, SeeRecursion) {
  const char* text =
      "declare function local:f($n, $m) { if ($n = 0) then count($m) else "
      "for $i in (1, 2) return count((local:f($n - 1, ($m, $m)), local:f($n - 1, $m))) };"
      "local:f(3, 1), local:f(2, 1)";
  EXPECT_EQ(operatorsIn(text), 1U);
  sameBothWays(text);
  sameBothWays(
      "declare function local:g($d, $x) { if ($d = 0) then 1 else for $i in (1, 2) return "
      "count((for $k in 1 to $x return 'a', local:g($d - 1, 2), local:g($d - 1, $x))) };"
      "local:g(3, 3), local:g(2, 2)");
}

// Two threads share a plan: what is kept is kept in the context.
TEST(KeepInvariants, KeepNothingFromOneEvaluationToTheNext) {
  const auto query = compiled("for $i in 1 to 3 return count(//a)", XQueryWay::Planned);
  EXPECT_EQ(outcomeOf(*query, document("<a/>")).lines.front(), "xs:integer 1");
  EXPECT_EQ(outcomeOf(*query, document("<a><a/></a>")).lines.front(), "xs:integer 2");
}

// --- joins ---------------------------------------------------------------------------------------

// Keys may pass through what checks how many there are.
TEST(Joins, FindKeysBehindCardinalityChecks) {
  for (const char* key :
       {"$p/@sku", "exactly-one($p/@sku)", "zero-or-one($p/@sku)", "data(exactly-one($p/@sku))",
        "string($p/@sku)", "exactly-one($p/price/text())", "one-or-more($p/b)"}) {
    sameBothWays(
        std::string("for $l in //line for $p in //product where $l/sku = ") + key + " return $p",
        shop());
    sameBothWays(std::string("for $l in //line for $p in //product where 2 * number($l/sku) > ") +
                     key + " return $p",
                 shop());
  }
}

}  // namespace
}  // namespace xquery
