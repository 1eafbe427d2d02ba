// Each rule that is not about paths: where it takes over, where it does not, and that nobody can
// tell.
#include "Plan/Operators/XQueryKeptExpr.h"
#include "Plan/Operators/XQueryNameComparison.h"
#include "Plan/RulesTesting.h"

#include <cstdlib>
#include <memory>
#include <set>

namespace xquery {
namespace {

using namespace plantest;

TEST(Rules, HaveNamesOfTheirOwn) {
  std::set<std::string_view> names;
  for (const XQueryRule& rule : XQueryRules()) EXPECT_TRUE(names.insert(rule.name).second);
  EXPECT_GE(names.size(), 3U);
}

TEST(Switch, OfTheCallLeavesTheQueryAsItIsWritten) {
  const auto plain = compiled("for $i in 1 to 3 return count(//a)", XQueryWay::Plain);
  EXPECT_TRUE(OperatorList(*_internal(*plain).body()).operators.empty());
}

TEST(Switch, OfTheEnvironmentLeavesTheQueryAsItIsWritten) {
  const auto operators = [] {
    const auto query = compiled("for $i in 1 to 3 return count(//a)", XQueryWay::Planned);
    return OperatorList(*_internal(*query).body()).operators.size();
  };
  ::setenv("XQUERY_PLAN", "0", 1);
  const size_t without = operators();
  ::unsetenv("XQUERY_PLAN");
  EXPECT_EQ(without, 0U);
  EXPECT_EQ(operators(), 1U);
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
            (std::vector<std::string>{"error 6 line 2 Division by zero", "at 2:3+7"}));
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

// A sum that fails at its beginning fails as a whole, as all but its last operand, and so on.
TEST(FoldConstants, TriesPartsOfWhatFailsInProportionToTheProgram) {
  const auto sum = [](size_t operands) {
    std::string text = "if (1) then 2 else 1 = ('x'";
    while (operands-- > 0) text += " + 1";
    return text + ")";
  };
  const auto failed = [](const std::string& text) {
    size_t count = 0;
    const auto query = compiled(text, XQueryWay::Explained);
    for (const auto& entry : _internal(*query).planReport()->entries()) {
      for (const auto& note : entry.notes) {
        count += note.text == "it fails, which it may do only when it is reached" ? 1 : 0;
      }
    }
    return count;
  };
  EXPECT_EQ(failed(sum(40)), 40U);
  EXPECT_LE(failed(sum(4000)), 300U);
  resultOf(sum(400));
  // What lies elsewhere is folded all the same.
  const std::string folded = bodyOf(sum(400) + ", 1 + 1 = $g");
  EXPECT_TRUE(folded.ends_with("xs:integer 1;xs:integer 2;")) << folded.substr(folded.size() - 40);
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
           "let $l := $g/line return $h[not(@sku = $l/sku)]",
           "declare variable $l := $g/line; $h[not(@sku = $l/sku)]",
           "declare function local:f($p, $l) { $p/@sku = $l/sku }; let $l := $g/line return "
           "$h[local:f(., $l)]",
           "let $l := $g/line for $p in $h where $p/@sku != $l/@sku return $p",
           "$g[number(price) = max($h/a/price[1])]",
           "$g/(//a)",
           "declare function local:f($a) { //a[. = 1] }; for $i in 1 to 9 return local:f($i)",
           "for $i in 1 to 9 return string-join(for $k in 1 to 9 return string(7), '')",
           // built-in functions that go through a list
           "let $d := (1, 2, 3) return $d[. > 2 * avg($d)]",
           "let $d := (1, 2, 3) for $i in $d where $i > sum($d) idiv 3 return $i",
           "let $d := (1, 2, 3) return every $i in $d satisfies $i <= max($d)",
           "declare variable $n := ('u', 'v'); for $i in 1 to 9 return "
           "string-length(string-join($n, '-'))",
       }) {
    EXPECT_EQ(operatorsIn(text), 1U) << text;
  }
}

TEST(KeepInvariants, LeavesOthersAlone) {
  for (const char* text :
       {"count(//a)",                                  // no loop
        "for $i in //a return 1",                      // evaluated once
        "for $i in 1 to 9 return $i//a",               // another one each time
        "for $i in 1 to 9 let $k := $i return $k//a",  // the same in two steps
        "$g[.//a = 1]",                                // of the item
        "for $i in 1 to 9 return <a>{//b/<c/>}</a>",   // makes nodes
        "for $i in 1 to 9 return trace(//a, 'a')",     // the trace, but see below
        "$g[count(//a[position() = 1]) = position()]/b",
        "for $k in $g for $i in 1 to 9 return $k/a/b",  // as quickly done as looked up
        "for $i in $g let $l := $i/line return $l/sku",
        "for $i in 1 to 9 return 1 to 100",                // never made
        "let $d := (1, 2) for $i in $d return count($d)",  // without looking at any item
        "let $d := 1 for $i in 1 to 9 return max($d)",     // one item
        "for $i in 1 to 9 return avg(($i, 2))"}) {
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
           "let $d := (3, 1, 2) return $d[. > avg($d)]",
           "let $d := (3, 1, 'u') for $i in (1, 2) return ($d[. = max($d)], $i)",
           "let $d := //product return $d[price = max($d/price)]/@sku/string()",
           "let $d := (1, 2) for $i in $d return index-of((reverse($d), $i), sum($d) - $i)",
           "for $i in (1, 2) return distinct-values(//@sku)[$i]",
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
