// Lists, sorts, joins, numbers in bulk.
#include "LimitRows.h"

namespace bench {

std::vector<LimitRow> sequenceRows() {
  return {
      {"list: range", "for $i in 1 to 100000000 where $i < 0 return $i"},
      {"list: range made", "count((1 to 200000000, 1))"},
      {"list: of decimals", "let $s := for $i in 1 to 100000000 return 1.5 return count($s)"},
      {"list: of texts",
       "let $s := for $i in 1 to 100000000 return concat('a', $i) return count($s)"},
      {"list: doubling", "declare function local:f($s) { local:f(($s, $s)) }; local:f((1, 2))"},
      {"list: reverse",
       "declare function local:f($s) { local:f(reverse(($s, $s))) }; local:f((1, 2))"},
      {"list: growing by one",
       "declare function local:f($s, $i) { if ($i = 0) then $s else local:f(($s, $i), $i - 1) }; "
       "count(local:f((), 90000))"},
      {"list: insert-before",
       "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 return count(insert-before($s, 9, $s))"},
      {"list: remove",
       "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 return count(remove($s, 7))"},
      {"list: subsequence",
       "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 return count(subsequence($s, 5))"},
      {"list: predicate", "for $i in 1 to 1000000 return (1 to 1000000)[. < 0]"},
      {"list: failing predicate", "for $i in 1 to 1000000 return (1 to 1000000)[. < 'a']"},
      {"list: sum", "for $i in 1 to 1000000 return sum((1 to 3000000, 1))"},
      {"list: extremes", "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 return max($s)"},
      {"list: average of durations",
       "let $s := for $i in 1 to 300000 return xdt:dayTimeDuration('P1D') "
       "for $i in 1 to 1000000 return avg($s)"},
      {"list: index-of",
       "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 return count(index-of($s, -1))"},
      {"list: distinct-values",
       "count(distinct-values(for $i in 1 to 30000000 return $i mod 10000019))"},
      {"list: distinct texts",
       "count(distinct-values(for $i in 1 to 30000000 return concat('a', $i)))"},
      {"list: distinct durations",
       "count(distinct-values(for $i in 1 to 3000000 return xdt:dayTimeDuration(concat('P', $i, "
       "'D'))))"},
      {"list: deep-equal",
       "let $s := (1 to 3000000, 1) for $i in 1 to 1000000 where not(deep-equal($s, $s)) return "
       "$i"},
      {"list: unordered", "for $i in 1 to 1000000 return count(unordered((1 to 3000000, 1)))"},
      {"list: instance of",
       "let $s := (1 to 3000000, 'a') for $i in 1 to 1000000 return $s instance of xs:integer*"},
      {"list: quantifier", "some $i in 1 to 1000000, $j in 1 to 1000000 satisfies $i + $j < 0"},
      {"sort: integers",
       "count(for $i in 1 to 20000000 order by ($i * 7919) mod 1000003 return $i)"},
      {"sort: texts",
       "count(for $i in 1 to 20000000 order by concat('a', ($i * 7919) mod 1000003) return $i)"},
      {"sort: long equal beginnings",
       [] {
         return doubledText("0123456789abcdef", 12) +
                "return count(for $i in 1 to 3000 order by concat($s, ($i * 7919) mod 1003) return "
                "$i)";
       }},
      {"sort: several keys",
       "count(for $i in 1 to 20000000 order by $i mod 2, $i mod 3, $i mod 5, -$i return $i)"},
      {"sort: stable", "count(for $i in 1 to 20000000 stable order by 1 return $i)"},
      {"sort: dates",
       "count(for $i in 1 to 5000000 order by xs:date('2004-01-01') + "
       "xdt:dayTimeDuration(concat('P', ($i * 7919) mod 10007, 'D')) return $i)"},
      {"join: loops", "for $i in 1 to 1000000, $j in 1 to 1000000 where $i + $j < 0 return 1"},
      {"join: equal",
       "let $a := for $i in 1 to 1000000 return concat('a', $i) return "
       "count(for $x in $a, $y in $a where $x = $y return 1)"},
      {"join: all alike",
       "let $a := for $i in 1 to 100000 return 'a' return count(for $x in $a, $y in $a where $x = "
       "$y return 1)"},
      {"join: less than", "count(for $x in 1 to 100000, $y in 1 to 100000 where $x < $y return 1)"},
      {"join: general comparison",
       "let $a := for $i in 1 to 300000 return concat('a', $i), "
       "$b := for $i in 1 to 300000 return concat('b', $i) for $i in 1 to 1000000 where $a = $b "
       "return 1"},
      {"join: mixed types",
       "let $a := for $i in 1 to 30000 return xs:date('2004-01-01') + "
       "xdt:dayTimeDuration(concat('P', $i, 'D')) for $i in 1 to 1000000 where $a = $a[1] + "
       "xdt:dayTimeDuration('-P1D') return 1"},
      {"join: negated",
       "count(for $x in 1 to 1000000 where not(some $y in 1 to 1000000 satisfies $x + $y = 0) "
       "return 1)"},
  };
}

}  // namespace bench
