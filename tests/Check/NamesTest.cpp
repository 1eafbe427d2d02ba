#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedNames, FunctionsThatDoNotExist) {
  expectWarnings({
      {"counts((1, 2))", "1 unknown-function"},
      {"if (count(//a) = 1) then\n  1\nelse\n  local:missing()", "4 unknown-function"},
      {"declare function local:f($x) {\n  local:g($x)\n};\nlocal:f(1)", "2 unknown-function"},
      {"nowhere:f()", "1 unknown-function"},
      {"//a[misspelt(.)]", "1 unknown-function"},
      {"count((1, 2))", ""},
      {"declare function local:f($x) { $x }; local:f(1)", ""},
      {"<a xmlns:p='urn:p'>{ p:f() }</a>", "1 unknown-function"},
  });
  EXPECT_EQ(textOf("counts(1)"), "there is no function counts that takes 1 argument");
  EXPECT_EQ(textOf("counts()"), "there is no function counts that takes 0 arguments");
}

TEST(CheckedNames, NumbersOfArguments) {
  expectWarnings({
      {"1,\ncount(1, 2)", "2 argument-count"},
      {"true(1)", "1 argument-count"},
      {"concat('a')", "1 argument-count"},
      {"declare function local:f($x) { $x };\nlocal:f(1, 2)", "2 argument-count"},
      {"concat('a', 'b', 'c', 'd', 'e')", ""},
      {"substring('abc', 2), substring('abc', 2, 1)", ""},
      {"declare function local:f($x) { $x }; declare function local:f($x, $y) { $x + $y };"
       "local:f(1), local:f(1, 2)",
       ""},
  });
  EXPECT_EQ(textOf("substring('abc')"), "function substring takes 2 to 3 arguments, not 1");
  EXPECT_EQ(textOf("concat('a')"), "function concat takes 2 or more arguments, not 1");
  EXPECT_EQ(textOf("declare function local:f($x) { $x }; local:f(1, 2)"),
            "function local:f takes 1 argument, not 2");
}

TEST(CheckedNames, FunctionsOfLaterLanguages) {
  expectWarnings({
      {"codepoint-equal('a', 'b')", "1 absent-function"},
      {"doc-available('a.xml')", "1 absent-function"},
      {"iri-to-uri('a'), escape-html-uri('a')", "1 absent-function, 1 absent-function"},
      {"prefix-from-QName(node-name(<a/>))", "1 absent-function"},
      {"xs:untypedAtomic('a'), xs:yearMonthDuration('P1Y')",
       "1 absent-function, 1 absent-function"},
      {"collection('urn:c')", "1 absent-function"},
      {"declare function local:doc-available($u) { $u }; local:doc-available('a')", ""},
      {"xdt:untypedAtomic('a')", ""},
      {"declare namespace fn = 'http://www.w3.org/2005/xpath-functions';\nfn:count(1)",
       "2 functions-namespace"},
      {"fn:count(1)", ""},
      {"declare function local:f() external;\n1", "1 external-function"},
  });
}

TEST(CheckedNames, Variables) {
  expectWarnings({
      {"1 +\n$total", "2 unknown-variable"},
      {"if (count(//a) = 1) then 1 else $missing", "1 unknown-variable"},
      {"(for $x in //a return $x), $x", "1 unknown-variable"},
      {"declare variable $a := $b;\ndeclare variable $b := 1;\n$a", "1 later-variable"},
      {"declare variable $a := $a; $a", "1 later-variable"},
      {"declare function local:f() { $b }; declare variable $b := 1; local:f()", ""},
      {"declare variable $a := $b; declare variable $b external; $a", ""},
      {"declare variable $local:a := 1; $local:a", ""},
      {"<a xmlns:p='urn:p'>{ $p:x }</a>", ""},
      {"(some $x in (1, 2) satisfies $x = 2),\n$x", "2 leaked-variable"},
      {"(typeswitch (//a) case $t as element() return $t default return ()), $t",
       "1 leaked-variable"},
      {"let $x := 1 return ((some $x in (1, 2) satisfies $x = 2), $x)",
       "1 unused-variable, 1 leaked-variable"},
      {"some $x in (1, 2), $y in ($x, 3) satisfies $x = $y", ""},
      {"typeswitch (//a) case $t as element() return $t default $d return $d", ""},
  });
}

TEST(CheckedNames, Prefixes) {
  expectWarnings({
      {"<p:a/>", "1 undeclared-prefix"},
      {"<a p:b='1'/>", "1 undeclared-prefix"},
      {"//a,\n//p:b, //p:*", "2 undeclared-prefix, 2 undeclared-prefix"},
      {"//a[. instance of element(p:b)]", "1 undeclared-prefix"},
      {"<p:a xmlns:p='urn:p'/>, //xml:a, <a/>, //a, <a xml:lang='en'/>", ""},
      {"declare namespace p = 'urn:p'; //p:a/@p:b, <p:c/>", ""},
  });
  const auto warnings = XQueryWarnings(*explained("//p:b"));
  ASSERT_EQ(warnings.size(), 1U);
  EXPECT_EQ(warnings.front().name->utf8(), "p");
}

// What the caller makes known does not help them.
TEST(CheckedNames, PrefixesOfComputedNames) {
  expectWarnings({
      {"<a xmlns:p='urn:p'>{\nattribute p:b { 1 } }</a>", "2 cast-fails"},
      {"<a xmlns:p='urn:p'>{ attribute { 'p:b' } { 1 } }</a>", "1 cast-fails"},
      {"<a xmlns:p='urn:p'>{ element { ('p:b') } { 1 } }</a>", "1 cast-fails"},
      {"<a xmlns:p='urn:p'>{ xs:QName('p:b'), 'p:b' cast as xs:QName }</a>",
       "1 cast-fails, 1 cast-fails"},
      {"<a xmlns:p='urn:p'>{ element p:b { 1 } }</a>", ""},
      {"declare namespace p = 'urn:p'; attribute p:b { 1 }, element { 'p:b' } { 1 },"
       "xs:QName('p:b')",
       ""},
      {"attribute b { 1 }, attribute { 'b' } { 1 }, xs:QName('b'), xs:QName('xs:b')", ""},
      {"for $n in //@name return element { $n } { 1 }", ""},
  });
  EXPECT_EQ(textOf("attribute p:b { 1 }"), "\"p:b\" cannot be cast to xs:QName");
}

TEST(CheckedNames, TestsInsideConstructorsWithANamespace) {
  expectWarnings({
      {"<a xmlns='urn:a'>{\n//b }</a>", "2 constructor-namespace"},
      {"<a xmlns='urn:a'><b>{ //c[d]/e }</b>\n{ //f }</a>", "1 constructor-namespace"},
      {"<a xmlns='urn:a'>{ //c }<b xmlns='urn:b'>\n{ //d }</b></a>",
       "1 constructor-namespace, 2 constructor-namespace"},
      {"<a xmlns='urn:a' b='{ //b }'/>", "1 constructor-namespace"},
      {"<a xmlns='urn:a'>{ //*[. instance of element(b)] }</a>", "1 constructor-namespace"},
      {"declare default element namespace 'urn:d'; <a xmlns=''>{ //b }</a>",
       "1 constructor-namespace"},
      {"declare default element namespace 'urn:a'; <a xmlns='urn:a'>{ //b }</a>", ""},
      {"<a xmlns='urn:a'><b xmlns=''>{ //c }</b></a>", ""},
      {"<a xmlns='urn:a'>{ //@b, //*, //text() }</a>, //c", ""},
      {"<a xmlns:p='urn:a'>{ //b }</a>", ""},
      {"declare function local:f($d) { $d//b }; <a xmlns='urn:a'>{ local:f(/) }</a>", ""},
  });
  EXPECT_EQ(textOf("<a xmlns='urn:a'>{ //b }</a>"),
            "name test b does not take the namespace of the constructor around it");
}

TEST(CheckedNames, Types) {
  expectWarnings({
      {"5 instance of xs:foo", "1 unknown-type"},
      {"5 cast as xs:anyAtomicTyp", "1 unknown-type"},
      {"5 instance of xs:anyAtomicType", "1 unknown-type"},
      {"declare function local:f($a as xs:foo) {\n$a }; local:f(1)", "1 unknown-type"},
      {"declare function local:f() as xs:foo { 1 }; local:f()", "1 unknown-type"},
      {"declare variable $x as xs:foo := 1; $x", "1 unknown-type"},
      {"5 instance of xdt:anyAtomicType, 5 instance of xs:integer", ""},
      {"declare function local:f($a as xs:integer) as xs:integer { $a }; local:f(1)", ""},
  });
}

}  // namespace
}  // namespace xquery
