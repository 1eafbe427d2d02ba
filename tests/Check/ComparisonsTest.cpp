#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedComparisons, ThatFailByTheirTypes) {
  expectWarnings({
      {"1 = '1'", "1 comparison-fails"},
      {"//a[count(b) = 'x']", "1 comparison-fails"},
      {"for $a in //a\nwhere $a/@n eq 1\nreturn $a", "2 comparison-fails"},
      {"current-date() = 2004", "1 comparison-fails"},
      {"true() = 'true'", "1 comparison-fails"},
      {"(1, 'a') = 'b'", ""},
      {"//a/@n = 1 or false()", "1 constant-condition"},
      {"//a[@n eq '1']", ""},
      {"//a[@n = current-date()]", ""},
      {"for $x in (1, 2) return $x eq 1.5", ""},
      {"declare function local:f($x) { $x eq 1 }; local:f(2)", ""},
      {"'a' lt 'b', 1 lt 2e0, true() lt false()", ""},
  });
  EXPECT_EQ(textOf("1 = '1'"), "a number cannot be compared with a string by =");
}

TEST(CheckedComparisons, OfURIs) {
  expectWarnings({
      {"namespace-uri(/*) = 'urn:x'", "1 uri-comparison"},
      {"namespace-uri(/*) eq /*/@ns", "1 uri-comparison"},
      {"xs:anyURI('a') lt xs:anyURI('b')", "1 uri-comparison"},
      {"//a[namespace-uri(.) = @ns]", ""},
      {"namespace-uri(/*) = xs:anyURI('urn:x')", ""},
      {"string(namespace-uri(/*)) = 'urn:x'", ""},
  });
}

TEST(CheckedComparisons, OfDatesAndDurations) {
  expectWarnings({
      {"xs:duration('P1Y') = xs:duration('P12M')", "1 duration-comparison"},
      {"xdt:yearMonthDuration('P1Y') = xdt:dayTimeDuration('P1D')", "1 duration-comparison"},
      {"xdt:yearMonthDuration('P1Y') = xdt:yearMonthDuration('P12M')", ""},
      {"current-date() lt current-time()", "1 date-and-time"},
      {"current-date() lt xs:gYear('2004')", "1 date-and-time"},
      {"xs:gYear('2004') lt current-date()", "1 comparison-fails"},
      {"current-date() lt xs:date(//a[1])", ""},
      {"current-date() = current-time()", "1 comparison-fails"},
  });
}

TEST(CheckedComparisons, OfTruthValuesByOrder) {
  expectWarnings({
      {"true() lt 1", "1 truth-order"},
      {"exists(//a) <\n'b'", "1 truth-order"},
      {"true() gt //a[1]", "1 truth-order"},
      {"0 lt true(), count(//a) > false()", "1 truth-order, 1 truth-order"},
      {"'a' lt true(), current-date() > true()", "1 comparison-fails, 1 comparison-fails"},
      {"true() < //a or false() lt true()", ""},
      {"true() lt number(//a[1]), true() = //a[1] and true() eq false()", "1 truth-order"},
      {"for $x in (1, true()) return $x lt 1", ""},
  });
  EXPECT_EQ(textOf("true() lt 1"), "lt orders a truth value and a number");
}

// What is no float is another number as a double than as a float.
TEST(CheckedComparisons, OfFloatsAndDecimals) {
  expectWarnings({
      {"xs:float(0.1) = 0.1", "1 float-as-double"},
      {"0.3 lt (//a[1] cast as xs:float)", "1 float-as-double"},
      {"//a[xs:float(.) > 16777217]", "1 float-as-double"},
      {"xs:float(0.5) = 0.5, xs:float(1) lt 16777216, xs:float(0.1) = 0.1e0", ""},
      {"xs:double(0.1) = 0.1, xs:float(0.1) = xs:float(0.1), number(//a[1]) = 0.1", ""},
  });
  EXPECT_EQ(textOf("xs:float(0.1) = 0.1"), "= compares a float with 0.1 as doubles");
}

TEST(CheckedComparisons, WithNaN) {
  expectWarnings({
      {"number(//a[1]) != 1", "1 nan-comparison"},
      {"for $n in (1, 2) return $n ne $n", "1 nan-comparison"},
      {"number(//a[1]) = 1 or number(//b[1]) > 2", ""},
      {"number(1) != 2", ""},
      {"for $n in (1, 2) for $m in (1, 2) return $n ne $m", ""},
  });
}

TEST(CheckedComparisons, WithNothing) {
  expectWarnings({
      {"//a = 1", "1 empty-comparison"},
      {"<a>{\n  //a = 1 }</a>", "2 empty-comparison"},
      {"count(//a = 1)", "1 empty-comparison"},
      {"for $a in //a return $a/@n = 1", "1 empty-comparison"},
      {"let $t := //a = 1 return $t", "1 empty-comparison"},
      {"declare function local:f($a) { $a/@n = 1 }; local:f(//a)", "1 empty-comparison"},
      {"(//a/@n = 1) = true()", "1 empty-comparison"},
      {"//b[a = 1]", ""},
      {"if (//a = 1) then 1 else 2", ""},
      {"for $b in //b where $b/a = 1 and not($b/c = 2) return $b", ""},
      {"some $b in //b satisfies $b/a = 1", ""},
      {"boolean(//a = 1)", ""},
      {"let $t := //a = 1 return if ($t) then 1 else 2", ""},
      {"declare function local:f($a) { $a/@n = 1 }; //a[local:f(.)]", ""},
      {"declare function local:f($t) { if ($t) then 1 else 2 }; local:f(//a = 1)", ""},
      {"declare variable $t := //a = 1; //b[$t]", ""},
      {"(if (//c) then //a = 1 else ()) or //b = 2", ""},
      {"count(//a) = 1, string(//a[1]) = 'x'", ""},
      {"declare variable $n external; $n = 1", ""},
      {"//c[for $b in . return $b/a = 1]", ""},
  });
}

TEST(CheckedComparisons, OfTextsThatAreUntyped) {
  expectWarnings({
      {"concat('1', '2') = 12", "1 untyped-text"},
      {"//a[replace(., 'x', '') > 9]", "1 untyped-text"},
      {"concat('1', '2') + 1", "1 untyped-text"},
      {"//a[comment() = 1]", "1 untyped-text"},
      {"1 < <?p 2?>", "1 untyped-text"},
      {"in-scope-prefixes(/*) instance of xs:string*", "1 untyped-text"},
      {"//a[comment() = '1'], //a[text() = 1], //a[node() = 1]", ""},
      {"concat('1', '2') = '12', concat('a', 'b') = //a/@b or //c", ""},
  });
}

TEST(CheckedOperators, Arithmetic) {
  expectWarnings({
      {"'1' + 1", "1 operand-fails"},
      {"2 * count(//a) div string(//b[1])", "1 operand-fails"},
      {"-'a'", "1 operand-fails"},
      {"//a[1] + //b[1], -//a[1], current-date() - xdt:dayTimeDuration('P1D')", ""},
      {"//a[1] is 3", "1 operand-fails"},
      {"//a union\n(1, 2)", "2 operand-fails"},
      {"//a[1] is //b[1], //a union //b, () union //a, //a[1] << $unknown/b", "1 unknown-variable"},
      {"//a[1] idiv 2", "1 untyped-idiv"},
      {"number(//a[1]) idiv 2, 7 idiv 2", ""},
      {"1.5 to 3", "1 range-of-fractions"},
      {"1 to count(//a), 1 to //a[1]", ""},
      {"for $a at $i in //a return 1 to $i", ""},
  });
}

}  // namespace
}  // namespace xquery
