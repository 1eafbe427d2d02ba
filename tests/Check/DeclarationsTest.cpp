#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedDeclarations, ArgumentsThatWouldBeConverted) {
  expectWarnings({
      {"declare function local:f($a as xs:string) { <b>{ $a }</b> };\nlocal:f(<a>x</a>)",
       "2 not-converted"},
      {"declare function local:f($a as xs:integer) { $a * 2 }; local:f(data(<a>1</a>))",
       "1 not-converted"},
      {"declare function local:f($a as xs:double) { $a instance of xs:double }; local:f(1)",
       "1 not-converted"},
      {"declare function local:f($a as xdt:anyAtomicType*) { $a }; local:f(//a)",
       "1 not-converted"},
      {"declare function local:f($a as xs:string) { $a }; local:f(namespace-uri(/*))",
       "1 not-converted"},
      {"declare function local:f($a as xs:integer) { $a }; local:f(1)", ""},
      {"declare function local:f($a as xs:decimal) { $a }; local:f(1)", ""},
      {"declare function local:f($a as element()) { $a }; local:f(<a/>)", ""},
      {"declare function local:f($a as item()*) { $a }; local:f(//a)", ""},
      {"declare function local:f($a) { $a }; local:f(//a)", ""},
      {"declare function local:f($a as xs:string) { string($a) }; local:f(<a>x</a>)", ""},
      {"declare function local:f($a as xs:integer) { xs:integer($a) + 1 }; local:f(<a>1</a>)", ""},
      {"declare function local:f($a as xs:integer) { $a }; for $x in (1, 'a') return local:f($x)",
       ""},
      {"declare function local:f($a as xdt:untypedAtomic) { $a }; local:f(data(<a>1</a>))", ""},
  });
}

TEST(CheckedDeclarations, WhatWouldBeRefused) {
  expectWarnings({
      {"declare function local:f($a as xs:integer) { $a }; local:f('x')", "1 not-checked"},
      {"declare function local:f($a as xs:integer) { $a }; local:f((1, 2))", "1 not-checked"},
      {"declare function local:f($a as xs:integer) { $a }; local:f(())", "1 not-checked"},
      {"declare function local:f($a as element()) { $a }; local:f(attribute b { 1 })",
       "1 not-checked"},
      {"declare function local:f()\nas xs:integer { 'a' }; local:f()", "2 not-checked"},
      {"declare function local:f() as element() { 1 }; local:f()", "1 not-checked"},
      {"declare variable $x as xs:integer := 'a'; $x", "1 not-checked"},
      {"declare function local:f($a as xs:integer?) { $a }; local:f(())", ""},
      {"declare function local:f($a as xs:integer+) { $a }; local:f(1)", ""},
      {"declare function local:f($a as xs:integer*) { $a }; local:f((1, 2))", ""},
      {"declare variable $x as xs:integer := 1; $x", ""},
      {"declare variable $x as element()* := //a; $x", ""},
      {"declare function local:f($n) as xs:integer { if ($n le 1) then 1 else $n * local:f($n - 1)"
       " }; local:f(5)",
       ""},
  });
  EXPECT_EQ(textOf("declare function local:f($a as xs:integer) { $a }; local:f('x')"),
            "argument 1 of local:f is declared as xs:integer, is a string, and nobody checks it");
}

TEST(CheckedDeclarations, ExternalsAndContext) {
  expectWarnings({
      {"declare variable $a := 1;\ndeclare variable $n as xs:integer external;\n$n + $a",
       "2 external-type"},
      {"declare variable $n external; declare variable $m as item()* external; $n, $m", ""},
      {"declare function local:f() {\n  name()\n};\n//a/local:f()", "2 reads-context"},
      {"declare function local:f() { /a }; local:f()", "1 reads-context"},
      {"declare function local:f() { count(a) }; local:f()", "1 reads-context"},
      {"declare function local:f($n) { name($n), $n/a[. = 1], $n/string() }; local:f(/)", ""},
      {"declare function local:f() { <a/>/name() }; local:f()", ""},
  });
}

}  // namespace
}  // namespace xquery
