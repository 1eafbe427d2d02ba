// The rules about paths, each: where it takes over, where it does not, and that nobody can tell.
#include "Expr/Paths/XQueryPath.h"
#include "Expr/RandomChoices.h"
#include "Plan/Paths/XQueryWalkedPath.h"
#include "Plan/RulesTesting.h"

#include <functional>
#include <iterator>

namespace xquery {
namespace {

using namespace plantest;

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
  for (const char* text : {"let $a := //a[b] return count($a[@x = 'none'])",
                           "let $a := //a[b] return count($a[b and not(@x = 'none')][@z])"}) {
    EXPECT_LT(stepsOf(text), 100) << text;
    resultOf(text, manyNames());
  }
  EXPECT_GT(stepsOf("let $a := //a[b] return count($a[string(@x) = 'none'])"), 200);
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

// Chains within chains, with conditions that only evaluating tells.
TEST(JoinConditions, AreJoinedInAnyForm) {
  constexpr const char* leaves[] = {"b",        "@x",           "@x = '1'",    "@x > 1",
                                    "not(@y)",  "name() = 'a'", "ancestor::c", "string(@x)",
                                    "count(b)", "b = 't'",      "@x > 'u'",    "self::b"};
  const std::function<std::string(RandomChoices&, int)> condition = [&](RandomChoices& random,
                                                                        int depth) {
    if (depth == 0 || random.below(4) == 0)
      return std::string(leaves[random.below(std::size(leaves))]);
    if (random.below(4) == 0) return "not(" + condition(random, depth - 1) + ")";
    const std::string joint = random.oneOf({" and ", " or "});
    std::string text = "(" + condition(random, depth - 1);
    for (size_t count = random.below(4); count > 0; --count) {
      text += joint + condition(random, depth - 1);
    }
    return text + ")";
  };
  for (unsigned seed = 0; seed < 300; ++seed) {
    RandomChoices random(seed);
    const std::string text = condition(random, 1 + static_cast<int>(seed % 4));
    resultOf("//node()[" + text + "]", names());
    resultOf("let $l := //* for $e in $l where $e[" + text + "] return count($l[" + text + "])",
             names());
  }
}

// Nested further than they are asked of a node, and chains as long as queries are.
TEST(JoinConditions, CostNoMoreTheDeeperTheyAre) {
  std::string nested = "@x > 'u'";
  std::string chain = "@x > 'u'";
  for (int i = 0; i < 100; ++i) nested = (i % 2 != 0 ? "(b and " : "not(b or ") + nested + ")";
  for (int i = 0; i < 5000; ++i) chain += i % 7 == 0 ? " and @x > 'u'" : " and not(@z)";
  for (const std::string& condition : {nested, chain}) {
    EXPECT_GE(choicesOf("conditions", "//a[" + condition + "]"), 1U);
    resultOf("//node()[" + condition + "]", names());
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
  for (const char* path : {"/r/a[$n + 1]",
                           "//b[$n + 1]/@y",
                           "//a/b[$n - 5]",
                           "//a/b[$n * 1.4]",
                           "//a[$n + 1][1]",
                           "//c/ancestor::*[$n + 0]",
                           "//b/preceding-sibling::*[$n + 0]",
                           "//a[b]/c[$n idiv 0]",
                           "//none[$n idiv 0]",
                           "//b[xs:integer('x') + $n]",
                           "//a/b[count($i)]",
                           "//*[self::a][$n + 1]",
                           "(//b/../*[$n + 1], 'x')",
                           "count(//a/b[$n + 1])",
                           "exists(//b[$n + 0])",
                           "(//b)[$n + 1]",
                           "(//b, 1)[$n]/@y",
                           "//a/b[@y][$n + 1]",
                           "(1, 'x', //a)[$n]",
                           "(//b)[@y][$n]/..",
                           "(1 to 5)[$n][$n]",
                           "()[$n]",
                           "'u'[$n]",
                           "(//a)[$n idiv 0]",
                           "(1, 2)[count($i) * 1.9]",
                           "(//a)[$n + 0]/last()"}) {
    EXPECT_EQ(choicesOf("positions", loop + path), 1U) << path;
    resultOf(loop + path, names());
    resultOf(loop + path, manyNames());
  }
  for (const char* path : {"//b[$n + last()]", "//a/b[position() + 0]", "//b[count(@y)]",
                           "//b[$n = 1]", "//b[if ($n = 1) then 1 else @y]", "(1, 2)[$n = 1]",
                           "(//b)[trace($n, 'n')]", "(1, 2)[. + $n]", "(//b, 1)/a[$n + 1]"}) {
    EXPECT_EQ(choicesOf("positions", loop + path), 0U) << path;
    resultOf(loop + path, names());
    resultOf(loop + path, manyNames());
  }
}

// What may be a number, and may be something else, is asked once whichever it is.
TEST(TakePositions, AsksWhatMayBeAnythingOnce) {
  const std::string loop =
      "declare function local:at($l, $i) { ($l[$i], $l[$i]/self::a, //b[$i]/@y, //a[@x][$i]) }; "
      "for $i in (0, 1, 2, 2.7, -1, 1e0, 3e9, number('u'), 'text', '', true(), false(), "
      "xs:date('2004-01-01'), xs:float('2'), (//a)[1], //a/@x, 123456789012345678901234567890) "
      "for $l in (1, 2) return ";
  for (const char* list :
       {"(//a)", "(1, //a)", "//b/@y", "(1 to 4)", "(7)", "()", "('p', 'q', 'r')"}) {
    const std::string text = loop + "local:at(" + list + ", $i)";
    EXPECT_GE(choicesOf("positions", text), 1U) << text;
    resultOf(text, names());
    resultOf(text, manyNames());
    resultOf(loop + "local:at(" + list + ", ($i, 2))", names());
    resultOf(loop + "local:at(" + list + ", ())", manyNames());
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

}  // namespace
}  // namespace xquery
