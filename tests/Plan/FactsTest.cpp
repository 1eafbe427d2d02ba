// What is known of each class of expressions, from a table.
#include "Expr/Operators/XQueryOperatorExpr.h"
#include "Plan/PlanTesting.h"

namespace xquery {
namespace {

using namespace plantest;

struct Known {
  const char* query;
  const char* items;
  const char* deeds;
};

// Of the body of each query.
void expectKnown(std::span<const Known> table) {
  for (const Known& each : table) {
    const auto query = compiled(each.query);
    const XQueryProgram program = programOf(*query);
    const XQueryFactTable facts(program);
    const XQueryFacts& body = facts[program.bodies().back().place];
    EXPECT_EQ(shownItems(body), each.items) << each.query;
    EXPECT_EQ(shownDeeds(body), each.deeds) << each.query;
  }
}

TEST(Facts, OfLeaves) {
  constexpr auto table = std::to_array<Known>({
      {"1", "1 integer", ""},
      {"1.5", "1 decimal", ""},
      {"1e0", "1 double", ""},
      {"'a'", "1 string", ""},
      {"()", "none", ""},
      {".", "* item", "item"},
      {"$g", "* item", "globals|fails"},
  });
  expectKnown(table);
}

TEST(Facts, OfListsAndOperators) {
  constexpr auto table = std::to_array<Known>({
      {"(1, 'a')", "2+ string|integer", ""},
      {"(1, ())", "1 integer", ""},
      {"(1)", "1 integer", ""},
      {"1 + 2", "0-1 number", "fails"},
      {"-1", "0-1 number", "fails"},
      {"xs:date('2004-10-29') + $g",
       "0-1 integer|decimal|float|double|dateTime|date|time|duration|yearMonth|dayTime",
       "globals|fails"},
      {"1 = 2", "1 boolean", ""},
      {"1 = ()", "0-1 boolean", ""},
      {"1 eq 2", "1 boolean", ""},
      {". is .", "0-1 boolean", "item|fails"},
      {"1 or 2", "1 boolean", ""},
      {"'u' = 'v' and 1 eq 2", "1 boolean", ""},
      {"'u' = 'v' or 'u' = 1", "1 boolean", "fails"},
      {"1 and $g", "1 boolean|other", "globals|fails"},
      {"1 to 3", "2+ integer", ""},
      {"(2) to 2", "1 integer", ""},
      {"3 to 1", "none", ""},
      {"1 to 65536", "2+ integer", ""},
      {"1 to 65537", "* integer", "fails"},
      {"1 to 1.5", "* integer", "fails"},
      {"1 to $g", "* integer", "globals|fails"},
      {"(/) | (/)", "1+ document in order", "root|fails"},
      {"/a union $g", "* node", "root|globals|fails"},
      {"/a intersect (/)", "none", "root|fails"},
      {"/a except (/)", "* element in order", "root|fails"},
  });
  expectKnown(table);
}

// What is untyped becomes a double before a number and the other's type before a string, which
// fails for most types, but never for strings as such; a value comparison takes it as a string.
TEST(Facts, OfComparisons) {
  struct Compared {
    const char* condition;  // on an element $e
    bool mayFail;
  };
  constexpr auto table = std::to_array<Compared>({
      {"$e/@a = $e/@b", false},
      {"$e/@a = 'u'", false},
      {"'u' != $e/b", false},
      {"$e/b < ('u', 'v')", false},
      {"string($e) >= $e/b", false},
      {"concat('u', 'v') = 'u'", false},
      {"name($e) = 'u'", false},
      {"$e/@a = ('u', $e/@b, data($e))", false},
      {"xs:token('u') = 'v'", false},
      {"xs:token('u') < xs:NCName('v')", false},
      {"$e/@a = ()", false},
      {"$e/@a = xs:token('u')", true},
      {"xs:NCName('u') = $e", true},
      {"('u', xs:token('v')) != $e/b", true},
      {"$e/@a = lower-case(xs:token('u'))", false},
      {"$e/@a = string-join('u', '')", true},  // hands on a token as it is
      {"$e/@a = 1", true},
      {"$e/@a < 1.5", true},
      {"$e/@a = ('u', 1)", true},
      {"'u' = 1", true},
      {"$e/@a = true()", true},
      {"$e/@a = current-date()", true},
      {"$e/@a = $g", true},
      {"1 = (2, 2.5, 1e0)", false},
      {"$e/@a eq 'u'", false},
      {"'u' ne string($e)", false},
      {"$e/@a lt $e/@b", false},
      {"$e/@a eq xs:token('u')", false},
      {"1 le 2.5", false},
      {"() eq 1", false},
      {"$e/b eq 'u'", true},
      {"'u' gt $e/b", true},
      {"('u', 'v') eq 'u'", true},
      {"$e/@a eq 1", true},
      {"'u' eq 1", true},
      {"true() eq false()", true},
      {"$e is $e/@a", false},
      {"$e/@a << $e/@b", false},
      {"$e >> ()", false},
      {"$e is $e/b", true},
      {"$e << 1", true},
  });
  for (const Compared& each : table) {
    const auto query = compiled("let $e := <e/> return " + std::string(each.condition));
    const XQueryProgram program = programOf(*query);
    const XQueryFactTable facts(program);
    XQueryPlaceID answer = 0;
    while (!isa<XQueryOperatorExpr>(program[answer].expr)) ++answer;
    const auto& comparison = *cast<XQueryOperatorExpr>(program[answer].expr);
    const XQueryPlaceID left = program.firstPart(answer);
    const XQueryPlaceID right = program.nextPart(left);
    EXPECT_EQ(XQueryOperatorMayFail(comparison.operatorType(), facts[left], facts[right]),
              each.mayFail)
        << each.condition;
  }
}

TEST(Facts, OfTypeExpressions) {
  constexpr auto table = std::to_array<Known>({
      {"$g instance of item()", "1 boolean", "globals|fails"},
      {"$g castable as xs:date", "1 boolean", "globals|fails"},
      {"$g cast as xs:date", "1 date", "globals|fails"},
      {"$g cast as xs:token?", "0-1 derived", "globals|fails"},
      {"$g cast as xs:float", "1 float|double", "globals|fails"},
      {"$g cast as xs:QName", "1 QName", "globals|static|fails"},
      {"$g treat as element()", "1 element", "globals|fails"},
      {"$g treat as xs:decimal*", "* integer|decimal", "globals|fails"},
      {"$g treat as node()+", "1+ node", "globals|fails"},
      {"1 treat as item()?", "1 integer", "fails"},
  });
  expectKnown(table);
}

TEST(Facts, OfPaths) {
  constexpr auto table = std::to_array<Known>({
      {"/", "1 document", "root|fails"},
      {"/a", "* element in order", "root|fails"},
      {"/a/@b", "* attribute in order", "root|fails"},
      {"//a", "* element in order", "root|outside|fails"},
      {"a", "* element", "item|fails"},
      {"/a/text()", "* text in order", "root|fails"},
      {"/a/node()", "* element|instruction|comment|text in order", "root|fails"},
      {"/a/..", "* document|element", "root|outside|fails"},
      {"/a/ancestor::*", "* element", "root|outside|fails"},
      {"/..", "0-1 document|element", "root|outside|fails"},
      {"/*", "* element|instruction in order", "root|fails"},
      {"/.", "0-1 node", "root|fails"},
      {"(1, 2)/.", "* integer", "fails"},
      {"(1, 2)[1]", "0-1 integer", ""},
      {"(1, 2)[. = $g]", "* integer", "globals"},
      {"/a[1]", "0-1 element", "root|fails"},
      {"/a[b]/c", "* element in order", "root|fails"},
      {"/a[/b]", "* element in order", "root|outside|fails"},
      {"/a[f()]", "* element in order", "root|fails"},
      {"/a/(1)", "* integer", "root|fails"},
      {"/a/(b, c)", "* element", "root|fails"},
      {"declare ordering unordered; /a/b", "* element", "root|fails"},
  });
  expectKnown(table);
}

TEST(Facts, OfClauses) {
  constexpr auto table = std::to_array<Known>({
      {"for $a in (1, 2) return $a", "1+ integer", " :1"},
      {"for $a in /a return $a", "* element in order", "root|fails :1"},
      {"for $a in /a order by 1 return $a", "* element", "root|fails :1"},
      {"for $a at $p in /a return $p", "* number", "root|fails :1 :2"},
      {"for $a in /a where 1 return 'b'", "* string", "root|fails :1"},
      {"for $a in 1 return ($a, 'b')", "2+ string|integer", " :1"},
      {"for $a in 1 where 2 return $a", "0-1 integer", " :1"},
      {"let $a := /a return $a", "* element in order", "root|fails :1"},
      {"let $a as element() := $g return $a", "1 element", "globals|fails :1"},
      {"let $a as xs:integer+ := $g return $a", "1+ integer", "globals|fails :1"},
      {"for $a as text() in $g return $a", "* item", "globals|fails :1"},
      {"some $a in /a satisfies $a", "1 boolean", "root|fails :1"},
      {"some $a as item() in /a satisfies $a", "1 boolean|other", "root|fails :1"},
      {"some $a in (), $b in 1 satisfies $a", "1 boolean|other", "fails $1 :1 :2"},
      {"(some $a in 1 satisfies 1, $a)", "1+ item", "fails $1 :1"},
      {"some $a in 1, $b in 2 satisfies $a = $b", "1 boolean", " :1 :2"},
      {"every $a in (1, 2), $b in $a, $c in () satisfies $b", "1 boolean", " :1 :2 :3"},
      {"every $a in 1, $b in /a, $c in () satisfies $b", "1 boolean|other",
       "root|fails $2 :1 :2 :3"},
      {"if (1) then 2 else 'a'", "1 string|integer", ""},
      {"if ($g) then 2 else 'a'", "1 string|integer", "globals|fails"},
      {"if (1) then . else ()", "* item", "item|fails"},
      {"if (1) then /a else ()", "* element in order", "root|fails"},
      {"typeswitch ($g) case $a as text() return $a default $b return 1", "1 text|integer|other",
       "globals|fails :1 :2"},
      {"unordered {/a}", "* element", "root|fails"},
  });
  expectKnown(table);
}

// "/" fails where there is no document above the context item, but not a second time.
TEST(Facts, OfLaterRoots) {
  struct Roots {
    const char* query;
    const char* mayFail;  // for each "/" in turn, as written
  };
  constexpr auto table = std::to_array<Roots>({
      {"(/, /)", "yn"},
      {"/a = /b", "yn"},
      {"/a and (/b or /c)", "ynn"},
      {"concat(/a, 'u', /b)", "yn"},
      {"for $a in /a, $b in /b where /c return /d", "ynnn"},
      {"for $a in /a order by /b return /c", "ynn"},
      {"for $a in 1 order by /b return /c", "yy"},
      {"for $a in $g where /b return /c", "yn"},
      {"for $a in $g where 1 and /b return /c", "yy"},
      {"let $a := 1, $b := //a return count(//b)", "yn"},
      {"some $a in /a, $b in /b satisfies /c", "ynn"},
      {"if (/a) then /b else /c", "ynn"},
      {"if ($g) then /b else /c", "yy"},
      {"(if ($g) then /b else (), /c)", "yy"},
      {"typeswitch (/a) case element() return /b default return /c", "ynn"},
      {"typeswitch ($g) case element() return /b default return /c", "yy"},
      {"(for $a in $g return /b, /c)", "yy"},
      {"(for $a in /a return 1, some $b in /b satisfies 1, /c)", "ynn"},
      {"(let $a := 1 for $b in /b return 1, /c)", "yn"},
      {"(for $a in $g, $b in /b return 1, /c)", "yy"},
      // A focus inside the same tree.
      {"/a[/b]", "yn"},
      {"/a/b[c[/d]/..[//e]]", "ynn"},
      {"//a/(/b)", "yn"},
      {"(/a | /b)[/c]", "ynn"},
      {"a[/b]", "y"},
      {"(/a, a[/b])", "yn"},
      {"let $a := /a return $a[/b]", "yn"},
      {"let $a := /a return $a/b[/c]", "yn"},
      // Another tree, or no node at all.
      {"(/a, $g[/b])", "yy"},
      {"(/a, <e/>[/b])", "yy"},
      {"/a/string()[/b]", "yy"},
      {"/a/(<e/>)[/b]", "yy"},
      {"/a/(<e/>)/b[/c]", "yy"},
      {"(/a, (1, 2)[/b])", "yy"},
      // The caller's focus.
      {"declare function local:f() { /a }; (local:f(), /b)", "yn"},
      {"declare function local:f() { (/a, /b) }; 1", "yn"},
      {"declare function local:f($a) { if ($a) then /a else () }; (local:f(1), /b)", "yy"},
  });
  for (const Roots& each : table) {
    const auto query = compiled(each.query);
    const XQueryProgram program = programOf(*query);
    const XQueryFactTable facts(program);
    std::string mayFail;
    for (XQueryPlaceID place = 0; place < program.placeCount(); ++place) {
      if (program[place].expr->kind() != Kind::RootStepExpr) continue;
      mayFail += facts[place].does(XQueryDeeds::MayFail) ? 'y' : 'n';
    }
    EXPECT_EQ(mayFail, each.mayFail) << each.query;
  }
}

TEST(Facts, OfConstructors) {
  constexpr auto table = std::to_array<Known>({
      {"<a>{/b}</a>", "1 element", "root|static|makes|fails"},
      {"element a {1}", "1 element", "static|makes|fails"},
      {"attribute a {1}", "1 attribute", "static|makes|fails"},
      {"text {1}", "0-1 text", "static|makes|fails"},
      {"comment {1}", "1 comment", "static|makes|fails"},
      {"processing-instruction a {1}", "1 instruction", "static|makes|fails"},
      {"document {1}", "1 document", "static|makes|fails"},
      {"<!--a-->", "1 comment", ""},
  });
  expectKnown(table);
}

TEST(Facts, OfCalls) {
  constexpr auto table = std::to_array<Known>({
      {"true()", "1 boolean", ""},
      {"string()", "1 string", "item|fails"},
      {"string(1)", "1 string", "fails"},
      {"position()", "1 integer", "position|fails"},
      {"last()", "1 integer", "size|fails"},
      {"count(/a)", "1 integer", "root|fails"},
      {"count(1)", "1 integer", ""},
      {"count()", "1 integer", "fails"},
      {"root(1)", "0-1 node", "outside|fails"},
      {"exactly-one(/a)", "1 element", "root|fails"},
      {"zero-or-one((1, 2))", "1 integer", "fails"},
      {"unordered(/a)", "* element in order", "root|fails"},
      {"reverse(/a)", "* element", "root|fails"},
      {"subsequence(/a, 1, 2)", "* element in order", "root|fails"},
      {"insert-before(/a, 1, 'a')", "* element|string|integer", "root|fails"},
      {"data(/a)", "* untyped", "root|fails"},
      {"distinct-values(/a)", "* untyped|string", "root|fails"},
      {"trace(1, 'a')", "1 integer", "traces|fails"},
      {"doc('a')", "0-1 document", "documents|fails"},
      {"current-date()", "1 date", "static"},
      {"ext:eval('1')", "* item", "outside|makes|unrepeatable|fails"},
      {"f()", "* item", "fails"},
  });
  expectKnown(table);
}

TEST(Facts, OfDeclaredFunctions) {
  constexpr auto table = std::to_array<Known>({
      {"declare function local:f($a) { 1 }; local:f(/a)", "1 integer", "root|fails"},
      {"declare function local:f() { . }; local:f()", "* item", "item|fails"},
      {"declare function local:f($a) { for $b in $a return <c/> }; local:f(1)", "* element",
       "static|makes|fails"},
      // A recursion answers what its end answers.
      {"declare function local:f($a) { if ($a) then 1 else local:f($a) }; local:f(1)", "1 integer",
       "fails"},
      {"declare function local:f($a) { if ($a) then 1 else ('a', local:f($a)) }; local:f(1)",
       "1+ string|integer", "fails"},
      {"declare function local:f($a) { local:g($a) };"
       "declare function local:g($a) { if ($a) then /b else local:f($a) }; local:f(1)",
       "* element in order", "root|fails"},
      {"declare function local:f() { trace(1, 'a') };"
       "declare function local:g($a) { if ($a) then local:f() else local:g($a) }; local:g(1)",
       "1 integer", "traces|fails"},
  });
  expectKnown(table);
}

TEST(Facts, OfKindsOfValues) {
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeDecimal)), "integer|decimal");
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeString)), "string|derived");
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeToken)), "derived");
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeByte)), "integer");
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeDuration)), "duration|yearMonth|dayTime");
  EXPECT_EQ(kindNames(XQueryKindsOfType(XQueryTypeGMonth)), "gregorian");
  EXPECT_EQ(XQueryKindsOfType(XQueryTypeAnyAtomicType) & XQueryItems::Atomic, XQueryItems::Atomic);
  EXPECT_EQ(XQueryKindsOfType(XQueryTypeNone), XQueryItems::None);
  EXPECT_EQ(XQueryAtomizedKinds(XQueryItems::Text | XQueryItems::Date),
            XQueryItems::Untyped | XQueryItems::Date);
}

}  // namespace
}  // namespace xquery
