// Items that are only counted: FLWORs, filters and variables.
#include "Plan/PlanTesting.h"
#include "Platform/Base/WorkMeter.h"

#include <string>
#include <utility>

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

// Elements of four names, of which one is written with two prefixes; at any depth, in two parts.
const Value& manyNames(bool withInstruction = false) {
  static const auto parsed = [](const std::string& head) {
    std::string part;
    for (int i = 0; i < 70; ++i) {
      part += "<a n='" + std::to_string(i) + "'><b/><p:c xmlns:p='u'><a/></p:c>";
      part += i % 3 ? "<q:c xmlns:q='u'/></a>" : "<c/></a>";
    }
    return document("<r>" + head + "<x>" + part + "</x><y>" + part + "</y><z><b/></z></r>");
  };
  static const Value plain = parsed("");
  static const Value instructed = parsed("<?a b?><?c?>");
  return withInstruction ? instructed : plain;
}

TEST(Counting, NodesOfSeveralNames) {
  for (const char* text : {
           "count(//a | //b)",
           "count(//(a | b | none))",
           "count(//*[self::a or self::b])",
           "count(//*[name() = ('a', 'p:c')])",
           "count(//*[name() = 'c'])",
           "count(//*[local-name() = 'c'])",
           "count(//*[local-name() = 'c' and namespace-uri() = 'u'])",
           "count(//node()[local-name() = 'c'])",
           "count(//node()[name() = ('a', 'c')])",
           "count(//*:c)",
           "count(/r//(a | b))",
           "count(/r/x//(b | a))",
           "count(/r/*//a)",
           "count(/r/*//(a | b))",
           "count(/r/*/descendant::a)",
           "count(/r/*/*//b)",
           "count(/r/(x | z)//*:c)",
           "count(/*/*//@n)",
           "count(//x//a)",
           "count(//a//a)",
           "count(//*//a)",
           "count(/r/x/..//a)",
           "count(/r/z/preceding-sibling::*//a)",
           "count(/r/x/descendant-or-self::*//a)",
           "count((//a, //b))",
           "count((//a, //a))",
           "count(((//a), (//b, //none), //*:c))",
           "count((//a, 1, //b[. = 1], 'x', ()))",
           "exists((//none, //b))",
           "empty((//none, //none))",
           "count((//b, //a)) > 200",
           "2 >= count((//none, //z/b))",
           "boolean((//none, //none/b))",
           "not((//a, //b))",
       }) {
    EXPECT_GE(choicesOf("counts", text), 1U) << text;
    // Once more where the index is there.
    for (const bool withInstruction : {false, true}) {
      const Value& nodes = manyNames(withInstruction);
      sameBothWays("for $t in 1 to 3 return (" + std::string(text) + ")", nodes);
      sameBothWays(text, nodes);
    }
  }
}

TEST(Counting, NodesOfAnyKind) {
  for (const char* text : {
           "count(//node())",
           "count(//text())",
           "count(//comment())",
           "count(//processing-instruction())",
           "count(//processing-instruction('a'))",
           "count(//*)",
           "count(//@*)",
           "count(/r//node())",
           "count(/r/*//node())",
           "count(/r/*/descendant::*)",
           "count(/r/x/descendant-or-self::node())",
           "count(//x//node())",
           "count(/r/*//text())",
           "count(//node()/..)",
           "count(//node()) > 5",
           "3 > count(//text())",
           "exists(//comment())",
           "count(/descendant::node())",
           "count(//none:*)",
           "count(//none:a)",
       }) {
    for (const bool withInstruction : {false, true}) {
      const Value& nodes = manyNames(withInstruction);
      sameBothWays("for $t in 1 to 3 return (" + std::string(text) + ")", nodes);
      sameBothWays(text, nodes);
    }
  }
}

TEST(Counting, NodesBelowOneAreNotKept) {
  constexpr int count = 100'000;
  std::string text = "<r>";
  for (int i = 0; i < count; ++i) text += "<a/>x";
  const Value nodes = document(text + "</r>");
  const auto context = XQueryContext::xqueryContext();
  XQueryLimits limits;
  limits.memoryCeiling = size_t{count} * sizeof(void*);
  context->contextSetLimits(limits);
  Ref<XQueryError> error;
  const auto query = XQuery::xqueryWithSource("count(//node())");
  const auto items = context->evaluateXQuery(*query, {}, nodes, &error);
  ASSERT_FALSE(error) << error->description()->utf8();
  EXPECT_EQ(XQueryItemStringValue(*items->objectAtIndex(0)), std::to_string(2 * count + 1));
}

// From the last child of a last child, descendants go on to the end of the document.
TEST(Counting, NodesThatSeveralWalksReachAreCountedOnce) {
  std::string text;
  for (int i = 0; i < 6; ++i) {
    text += "<x><y><z><c><d/><d/></c></z><z><c><d/></c><c/></z></y><k><c/></k></x>";
    text += "<x><y><z><c e=''/><!----></z></y></x>";
  }
  const Value one = document("<r>" + text + "</r>");
  const Value other = document("<!--a--><r>" + text + "</r><?b?>");
  for (const Value& tree : {one, other}) {
    for (const char* path :
         {"/r//c", "/r/x//c", "/r/x/y//c", "/r/x/y/z//c", "/r/x/y/z/c//d", "/r/x/y/descendant::c",
          "/r/x/y/z/descendant::c", "/r/*/*/*//*", "/r/x/y/z/descendant::node()",
          "/r/x/y/z//comment()", "/r/x/y/z//@e", "/r/x/y/z//(c | d)", "(/r/x/y/z)//c", "r/x/y/z//c",
          "/r/x/y/z//c | /r/x/y/z//d", "for $a in /r/x/y/z//c return $a",
          "for $a in /r/x/y/z/c//d return $a", "for $a in /r/x/y/z//c, $b in $a/d return $b"}) {
      sameBothWays(std::string("count(") + path + ")", tree);
      sameBothWays(std::string("for $i in 1 to 4 return count(") + path + ") > $i", tree);
    }
    sameBothWays("for $r in /r return (count($r/x/y//c), count($r/x/y/z//c))", tree);
    sameBothWays("for $x in //x return (count($x/y//c), count($x/y/z//c))", tree);
    sameBothWays("let $d := document { /r, /r } return (count($d/r/x//c), count($d/r/x/y//c))",
                 tree);
  }
}

TEST(Counting, WhatStandsBetweenCommasFailsInItsTurn) {
  for (const char* text : {
           "count((//a, error()))",
           "count((//a, xs:integer('x'),\n //b))",
           "exists((//b, xs:integer('x')))",
           "exists((//none, xs:integer('x'), //b))",
           "count((1 idiv 0, //a, error()))",
           "count((//a, zero-or-one((1, 2))))",
           "count((.//a, position()))",
           "count((//a, trace(1, 't')))",
           "count((./a, ./b))",
       }) {
    sameBothWays(text, manyNames());
    sameBothWays(text);
  }
  // Of a list that a host gives, an array is one item alone and its items among others.
  const auto inner = NSArray::array();
  for (int i = 0; i < 3; ++i) inner->objects().push_back(NSNumber::numberWithLongLong(i));
  const auto outer = NSArray::array();
  for (int i = 0; i < 2; ++i) outer->objects().push_back(inner);
  for (const char* text : {"count(($v, //a))", "count((//none, $v))", "count((//z/b, $v))"}) {
    const std::string query = std::string("declare variable $v external; ") + text;
    sameBothWays(query, manyNames(), {{"v", outer}});
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

TEST(Counting, CallsOfFunctionsThatFilter) {
  const std::string prolog =
      "declare function local:of($l, $k) { $l[@k = $k] };"
      "declare function local:below($l, $k) { ($l/q[. < $k]) };"
      "declare function local:both($l, $k) { local:of($l, $k)[q] };"
      "declare function local:bad($l, $k) { $l[xs:integer(q[1]) = $k] };"
      "declare function local:each($l, $k) { for $i in $l where $i/@k = $k return $i };"
      "declare function local:error($l, $k) { some $q as xs:integer in 'a' satisfies 1 };"
      "declare function local:errors($l, $k) { ($k, local:error(1, 1), $l)[2][. = $k] };"
      "declare function local:focus($l, $k) { . };"
      "declare function local:again($l, $k) { if ($k = 3) then local:again($l, 4) else $l[q = $k] "
      "};";
  for (const char* call :
       {"of(//i, $x)", "below(//i, $x)", "both(//i, $x)", "bad(//i, $x)", "each(//i, $x)",
        "again(//i, $x)", "of((1, 2), $x)", "of((), $x)", "of($x)", "none($x)", "error(1, 2)",
        "errors(//i, $x)", "focus(1, 2)", "of(//i, xs:integer('x'))", "of((1 to 9, 'a'), $x)"}) {
    for (const char* question : {"count(#)", "exists(#)", "empty((#))", "2 < count(#)", "not(#)",
                                 "(let $l := # return count($l))"}) {
      std::string text = question;
      text.replace(text.find('#'), 1, "local:" + std::string(call));
      sameBothWays(prolog + "for $x in (0 to 20, '3', 'x', 2.5, ()) return " + text, items());
    }
  }
  const std::string filter = "declare function local:of($l, $k) { $l[@k = $k] };";
  EXPECT_EQ(choicesOf("counts", filter + "count(local:of(//i, 3))"), 1U);
  EXPECT_EQ(choicesOf("counts", filter + "count(local:of(//i))"), 0U);
  EXPECT_EQ(choicesOf("counts", filter + "count(local:none(//i))"), 0U);
}

// Of two comparisons, both asked often, the items that meet both are found at once.
TEST(Counting, ItemsThatMeetTwoConditions) {
  for (const char* condition :
       {"@k = $y/@k and @n > $y/@n", "number(@n) < number($y/@n) and $y/@k = @k",
        "@k = $y/@k and xs:decimal(@n) >= xs:decimal($y/@n) div 10", "@k = $y/@k and @n = $y/@n",
        "@k = ($y/@k, '3') and q = $y/q", "q = $y/q and p < $y/p", "@k = $y/@k and p < $y/p",
        "@k = $y/@k and starts-with(@n, $y/@k)", "@k = $y/@k and number(p[1]) < number($y/p[1])",
        "@k = $y/@k and @n > $y/@n and q = $y/q"}) {
    const std::string text(condition);
    for (const char* question :
         {"count(//i[#])", "//i[#]/@n", "//i[#][1]", "count((//i, //i)[#])"}) {
      std::string query = question;
      query.replace(query.find('#'), 1, text);
      sameBothWays("for $y in (//i)[position() <= 20] return " + query, items());
    }
  }
  for (const char* condition :
       {"$i/@k = $y/@k and $i/@n > $y/@n", "number($i/@n) < number($y/@n) and $y/@k = $i/@k",
        "$i/@k = $y/@k and xs:integer($i/@n) > xs:integer($y/@n) + 3"}) {
    const std::string text(condition);
    for (const char* question :
         {"count(for $i in //i where # return $i)", "for $i in //i where # return $i/@n",
          "sum(for $i in //i return if (#) then 1 else 0)", "some $i in //i satisfies (#)",
          "every $i in //i satisfies not(#)", "for $i at $p in //i where # return $p"}) {
      std::string query = question;
      query.replace(query.find('#'), 1, text);
      sameBothWays("for $y in (//i)[position() <= 20] return (" + query + ")", items());
    }
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
  _internal(*context).setContextItem(items(), 1);
  const int64_t before = workMeter.stepsLeft;
  EXPECT_TRUE(_internal(*query).body()->evaluateWithContext(*context));
  EXPECT_LT(before - workMeter.stepsLeft, 200);
}

// The number of nodes of a name below a node is known without looking at them.
TEST(Counting, TakesNumbersFromTheIndex) {
  const auto tree = [](int count) {
    std::string text = "<r><s>";
    for (int i = 0; i < count; ++i) text += i % 2 ? "<e x='1'/>" : "<f><e/></f>";
    return document(text + "</s></r>");
  };
  const Value many = tree(20000);
  for (const auto& [query, expected] :
       {std::pair("count(//e)", "20000"), std::pair("count(//@x)", "10000"),
        std::pair("count(descendant::f)", "10000"), std::pair("exists(//e)", "true"),
        std::pair("count(//none)", "0"), std::pair("count(//e) > 19999", "true")}) {
    const auto planned = compiled(query, XQueryWay::Planned);
    const auto context = XQueryContext::xqueryContext();
    _internal(*context).setContextItem(many, 1);
    int64_t steps = 0;
    for (int turn = 0; turn < 4; ++turn) {
      const int64_t before = workMeter.stepsLeft;
      const Value value = _internal(*planned).body()->evaluateWithContext(*context);
      steps = before - workMeter.stepsLeft;
      ASSERT_TRUE(value);
      EXPECT_EQ(XQueryItemStringValue(*value), expected) << query;
    }
    EXPECT_LT(steps, 20) << query;
  }
  const Value few = tree(400);
  for (const char* each :
       {"count((//s, //r)//e)", "count(r/s//e)", "count(//f//e)", "count((//e, //f)/descendant::e)",
        "count(//e[@x])", "count(r/(s, s)//e)", "count(//s/f[200]//e)",
        "(count(r/s/f[last()]/descendant::e), count(//f[1]//e | //e))",
        "for $f in //f[position() mod 50 = 0] return count($f//e)",
        "for $f in //f[last()] return (count($f/descendant::e), exists($f//@x))",
        "unordered { count(//e) }", "count((//e, 1)//e)"}) {
    sameBothWays("for $turn in 1 to 4 return (" + std::string(each) + ")", few);
  }
}

// A predicate that asks for a number of nodes keeps all or none.
TEST(Counting, NodesOfWhichThereHaveToBeSome) {
  for (const char* condition :
       {"last() > 1", "last() >= 2", "1 < last()", "2 le last()", "last() gt 1", "last() > 0",
        "last() > -1", "last() > 1.5", "last() = 2", "last() < 2", "last() > @n", "last() > 'x'",
        "last() != 1", "last() > 1 and @n", "(last()) > (1)"}) {
    for (const char* nodes : {"p[#]", "q[#]", "following-sibling::i[#]", "$x/p[#]", "p/text()[#]",
                              "self::i[#]", "p[#]/..", "@*[#]", "ancestor::*[#]"}) {
      std::string text(nodes);
      text.replace(text.find('#'), 1, condition);
      sameBothWays("//i[" + text + "]/@n", items());
      sameBothWays("for $x in //i return (exists(" + text + "), count($x[" + text + "]))", items());
      sameBothWays("//i[not(" + text + ") or q = 'x']/@n", items());
    }
  }
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
