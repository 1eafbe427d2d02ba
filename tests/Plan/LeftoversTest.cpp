// What loops leave in their variables. The variables of loops that follow one another share their
// places, and some can be read where nothing has set them: that of a quantifier whose list was
// empty, and that of a case behind its typeswitch. What is there then is what an earlier loop left,
// which no shortcut may change.
#include "Plan/RulesTesting.h"

#include <string>

namespace xquery {
namespace {

using namespace plantest;

// Each leaves something in the first variable or the first two.
constexpr const char* loops[] = {"exists(for $k in (1 to 5) return $k)",
                                 "empty(for $k in (1 to 5), $m in (6, 7) return $k)",
                                 "(for $k in (1 to 5) return $k)[1]",
                                 "(for $k in (1 to 5) where $k > 2 return $k)[1]",
                                 "subsequence(for $k in (1 to 5) return $k, 1, 2)",
                                 "count(for $k in (3, 4, 5) return 1)",
                                 "(for $a in (1, 2) for $b in (5, 6) where $a = 3 return 1)",
                                 "(for $a in //a for $b in //b where $a/@k = $b/@k return 1)",
                                 "(for $a in //a for $b in //b[@k = $a/@k] return $b)[2]",
                                 "(let $k := (for $m in (1, 2) return $m) return count($k))",
                                 "(let $l := //a return $l/@k)",
                                 "(let $l := //a return (exists($l), $l[1]))",
                                 "(let $l := //a, $m := 7 where () return 1)",
                                 "(for $w in . for $v in 1 where () return 1)",
                                 "(some $q in (1, 2, 3) satisfies $q = 2)",
                                 "(every $q in //a satisfies //b/@k = $q/@k)",
                                 "(some $q in //a, $p in //b satisfies $q/@k = $p/@k)",
                                 "count((//b)/..[some $u in @k satisfies 1])",
                                 "count(//a[some $u in @k satisfies $u > 2][1])",
                                 "(//a[some $u in (2, 1) satisfies @k = $u])[1]",
                                 "(let $l := //b return $l/..[some $u in @k satisfies 1])",
                                 "sum(for $k at $i in (4, 5) return $k * $i)",
                                 "(for $k in (2, 1) order by $k return $k)[1]",
                                 "local:f(3)"};

// Each reads what is there.
constexpr const char* readers[] = {
    "((typeswitch (9) case $x as xs:integer return $x default return 0), $x)",
    "((typeswitch (9) case $x as xs:string return 1 default return 0), $x)",
    "(typeswitch (9) case $x as xs:string return $x default return $x)",
    "(typeswitch (9) case $x as xs:string return $x default $y return ($x, $y))",
    "((typeswitch (()) case $y as item()+ return 1 default $v return 1), $v, $y)",
    "(typeswitch (9) case $x as xs:string return $x default return "
    "($x, (typeswitch (9) case $z as xs:string return $z default return $z)))",
    "(1, 2)[typeswitch (.) case $x as xs:string return $x default return $x = 5]",
    "((some $x in () satisfies 1), $x)",
    "(some $x in (), $z in 1, $w in $x satisfies $w = 5)",
    "(every $x in 1, $z in (), $w in $z satisfies 1)"};

const Value& tree() {
  static const Value parsed = document(
      "<r k='9'><a k='1'><b k='2'/><b k='3'/></a><a k='2'><c><b k='1'/></c></a><b k='2'/></r>");
  return parsed;
}

constexpr const char* prolog =
    "declare function local:f($n) { count(for $k in 1 to $n return $k) }; ";

TEST(Leftovers, AreThoseOfTheQueryAsWritten) {
  for (const std::string loop : loops) {
    for (const std::string reader : readers) {
      resultOf(prolog + loop + ", " + reader, tree());
      resultOf(prolog + ("let $o := 1 return (" + loop + ", " + reader + ")"), tree());
      resultOf(prolog + ("for $o in (1, 2) return (" + reader + ", " + loop + ")"), tree());
    }
  }
}

TEST(Leftovers, OfGlobalVariablesReachTheBody) {
  for (const std::string loop : loops) {
    for (const std::string reader : readers) {
      resultOf(prolog + ("declare variable $g := (" + loop + "); $g, " + reader), tree());
      resultOf(prolog + ("declare variable $g := (" + loop + "); declare variable $h := (" +
                         reader + "); $h, $g"),
               tree());
    }
  }
}

TEST(Leftovers, OfFunctionsStayThere) {
  for (const std::string loop : loops) {
    for (const std::string reader : readers) {
      resultOf(prolog + ("declare function local:g($p) { " + loop + ", " + reader + ", $p }; " +
                         "local:g(1), " + reader + ", " + loop),
               tree());
    }
  }
}

}  // namespace
}  // namespace xquery
