#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedUse, Variables) {
  expectWarnings({
      {"for $a in //a\nlet $b := $a/b\nreturn $a", "2 unused-variable"},
      {"for $a at $i in //a return $a", "1 unused-variable"},
      {"some $a in //a satisfies count(//b) = 1", "1 unused-variable"},
      {"typeswitch (//a) case $t as element() return 1 default $d return $d", "1 unused-variable"},
      {"declare variable $x := 1;\ndeclare variable $y := 2;\n$x", "2 unused-variable"},
      {"declare variable $x external; 1", "1 unused-variable"},
      // The inner one is read.
      {"let $a := 1 return for $a in //a return $a", "1 unused-variable"},
      {"let $a := 1 let $b := $a return $b", ""},
      {"for $a in //a return 1", ""},
      {"declare function local:f($a) { 1 }; local:f(2)", ""},
      {"let $_a := //a return 1", ""},
      {"declare variable $local:_x := 1; 2", ""},
      {"let $a := trace(//a, 'a') return 1", ""},
      {"some $a in //a satisfies true()", ""},
      {"let $a := //a return //b[@c = $a]", ""},
      {"let $a := 1 return <b c='{ $a }'/>", ""},
      {"for $a in //a let $k := $a/@k order by $k return $a", ""},
      {"declare variable $x := 1; declare function local:f() { $x }; local:f()", ""},
  });
}

TEST(CheckedUse, Functions) {
  expectWarnings({
      {"declare function local:f() { 1 };\n\ndeclare function local:g() { 2 };\nlocal:f()",
       "3 unused-function"},
      {"declare function local:f() { local:f() }; 1", "1 unused-function"},
      {"declare function local:f() { local:g() }; declare function local:g() { local:f() }; 1",
       "1 unused-function, 1 unused-function"},
      {"declare function local:f($x) { 1 }; declare function local:f() { 2 }; local:f()",
       "1 unused-function"},
      {"declare function local:f() { local:g() }; declare function local:g() { 1 }; local:f()", ""},
      {"declare function local:f() { 1 }; declare variable $x := local:f(); $x", ""},
      {"declare function local:f() { 1 }; //a[. = local:f()]", ""},
      {"declare function local:_f() { 1 }; 2", ""},
      // A library module is there for others.
      {"module namespace m = 'urn:m'; declare function m:f() { 1 }; declare variable $m:x := 1;",
       ""},
  });
}

}  // namespace
}  // namespace xquery
