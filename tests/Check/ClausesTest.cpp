#include "CheckTesting.h"

namespace xquery {
namespace {

using namespace checktest;

TEST(CheckedClauses, Ordering) {
  expectWarnings({
      {"for $n in //a order by $n/b descending,\n$n/c return $n", "2 order-directions"},
      {"for $n in //a order by $n/b empty least, $n/c empty greatest return $n", "1 order-empty"},
      {"for $n in //a order by $n/b collation 'urn:c' return $n", "1 collation"},
      {"for $n in //a order by xs:date($n) return $n", "1 order-key"},
      {"for $n in //a order by namespace-uri($n) return $n", "1 order-key"},
      {"for $n in //a order by $n/b descending, $n/c descending return $n", ""},
      {"for $n in //a order by $n/b, $n/c empty least, number($n/d) return $n", ""},
      {"for $n in //a order by string(xs:date($n)), count($n/b), $n/@c = 1 return $n",
       "1 empty-comparison"},
  });
}

TEST(CheckedClauses, Quantifiers) {
  expectWarnings({
      {"every $x in //a,\n$y in //b satisfies $x = $y", "1 quantifier-clauses"},
      {"some $_x in //a, $y in //b satisfies $y = 1", "1 quantifier-clauses"},
      {"some $x in //a, $y in //b satisfies $x = $y", ""},
      {"some $x in //a, $y in $x/b satisfies $y = 1", ""},
      {"every $x in (1, 2), $y in //b satisfies $x = $y", ""},
      {"every $x in //a satisfies (every $y in //b satisfies $x = $y)", ""},
  });
}

}  // namespace
}  // namespace xquery
