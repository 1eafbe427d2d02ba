#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedTypes, ThatNoValueHas) {
  expectWarnings({
      {"typeswitch (count(//a))\n  case xs:string return 1\n  default return 2",
       "2 impossible-type"},
      {"'a' treat as xs:integer", "1 impossible-type"},
      {"let $x as xs:string := 1 return $x", "1 impossible-type"},
      {"//@a instance of element()", "1 impossible-type"},
      {"() instance of xs:integer", "1 impossible-type"},
      {"1 instance of empty()", "1 impossible-type"},
      {"for $n as element() in (1, 2) return $n", "1 impossible-type"},
      {"() instance of xs:integer?, //a[1] instance of element(), //a instance of empty()", ""},
      {"for $n in (1, 'a') return typeswitch ($n) case xs:integer return 1 default return 2", ""},
      {"1 instance of xs:decimal, 1 instance of item(), xs:token('a') instance of xs:string", ""},
      {"1 instance of xs:positiveInteger", ""},
  });
}

TEST(CheckedTypes, ThatMeanSomethingElse) {
  expectWarnings({
      {"for $a in //a return data($a) instance of xdt:untypedAtomic+", "1 plus-type"},
      {"(1, 2) instance of xs:integer+", ""},
      {"declare function local:f($a as item()+) { $a }; local:f(1)", ""},
      {"//a instance of element()*", "1 node-sequence-type"},
      {"let $x as node()* := //a return count($x)", "1 node-sequence-type"},
      {"typeswitch (//a)\ncase element()* return 1 default return 2", "2 node-sequence-type"},
      {"(//a)[1] instance of element()*, //a instance of item()*", ""},
      {"for $x as element() in //a return $x", ""},
      {"(1, 'a')[1] instance of xdt:untypedAtomic", "1 untyped-type"},
      {"data(//a[1]) instance of xdt:untypedAtomic", ""},
      {". instance of document-node(element(a))", "1 document-test"},
      {". instance of document-node()", ""},
      {"for $x at $i in //a return $i instance of xs:integer", "1 position-is-double"},
      {"for $x at $i in //a return ($i instance of xs:double, $x instance of element())", ""},
      {"concat('a', 'b') instance of xs:string", "1 untyped-text"},
      {"string('a') instance of xs:string", ""},
  });
}

}  // namespace
}  // namespace xquery
